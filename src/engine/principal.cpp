// SPDX-License-Identifier: Apache-2.0
// The principal table:
//
//   (public-key ...)              known by the SHA-256 and the SHA-1 digest of its canonical form
//   (hash sha1 <20 bytes>)        the key with that digest, else a principal of its own
//   (hash sha256 <32 bytes>)
#include "src/engine/principal.h"

#include <algorithm>
#include <cstring>

#include "src/engine/chain.h"
#include "src/engine/value.h"
#include "src/engine/write.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

constexpr size_t kSha1Size = 20;

// A new principal, known by `node`.
[[nodiscard]] spki_status NewPrincipal(spki_engine* engine, spki_node* node, spki_elem* key) {
  auto* principal = static_cast<spki_principal*>(spki_allocate(engine, sizeof(spki_principal)));
  VESK2_REQUIRE(principal != nullptr, SPKI_ERR_NO_MEM);
  *principal = {};
  principal->older = engine->newest;
  engine->newest = principal;
  std::memcpy(principal->digest, node->digest, sizeof principal->digest);
  spki_elem_assign(engine, &principal->key, key);
  node->principal = principal;
  return 0;
}

// The principal of a digest, made for `list` when there is none.
[[nodiscard]] spki_status FindPrincipal(spki_engine* engine, const Digest& digest, spki_elem* list,
                                        spki_principal** slot) {
  spki_node* node = nullptr;
  bool made = false;
  VESK2_TRY(spki_table_enter(engine, &engine->principals, digest, &node, &made));
  if (made) VESK2_TRY(NewPrincipal(engine, node, list));
  *slot = node->principal;
  return 0;
}

// Where another principal stands already, it stays: it was registered later, and the last one
// counts.
[[nodiscard]] spki_status EnterBySha1(spki_engine* engine, spki_principal* principal) {
  spki_digest_sink sink;
  Digest digest;
  VESK2_TRY(spki_digest_start(engine, &sink.digest, ZVCLM_HASH_SHA1));
  VESK2_TRY(spki_write_pieces(principal->key, &sink));
  VESK2_TRY(spki_digest_finish(&sink.digest, digest));
  spki_node* node = nullptr;
  bool made = false;
  VESK2_TRY(spki_table_enter(engine, &engine->principals, digest, &node, &made));
  if (made) node->principal = principal;
  return 0;
}

// Enters every key by its SHA-1 too, once a credential may name one so; few ever do. All keys are
// registered by then.
[[nodiscard]] spki_status EnterKeysBySha1(spki_engine* engine) {
  if (engine->keys_by_sha1) return 0;
  engine->keys_by_sha1 = true;
  for (spki_principal* key = engine->newest; key != nullptr; key = key->older) {
    if (HeadKeyword(key->key) == SPKI_KW_PUBLIC_KEY) VESK2_TRY(EnterBySha1(engine, key));
  }
  return 0;
}

// A SHA-1 is kept with zeros behind it, and so is a SHA-256 that ends in them: by either a key may
// be named.
bool MayBeSha1(const Digest& digest) {
  return std::all_of(digest + kSha1Size, std::end(digest), [](unsigned char c) { return c == 0; });
}

// The digest that (hash <algorithm> <value>) holds, zero-padded. The length must be that of the
// algorithm: a short one would be padded into a digest that nobody computed.
[[nodiscard]] spki_status ReadHash(const spki_elem* hash, Digest& digest) {
  VESK2_REQUIRE(HeadKeyword(hash) == SPKI_KW_HASH, SPKI_ERR_NOT_HASH_SEXP);
  const spki_atom* algorithm = StringOf(hash->next);
  VESK2_REQUIRE(algorithm != nullptr && algorithm->keyword >= 1, SPKI_ERR_UNKNOWN_HASH_ALG);
  const spki_atom* value = StringOf(hash->next->next);
  VESK2_REQUIRE(value != nullptr, SPKI_ERR_BAD_HASH_FORMAT);
  const bool sha1 = algorithm->keyword == SPKI_KW_SHA1;
  VESK2_REQUIRE(sha1 || algorithm->keyword == SPKI_KW_SHA256, SPKI_ERR_UNKNOWN_HASH_ALG);
  VESK2_REQUIRE(value->length == (sha1 ? kSha1Size : sizeof digest), SPKI_ERR_HASH_LTH_DIFFER);
  std::memset(digest, 0, sizeof digest);
  std::memcpy(digest, value->data, value->length);
  return 0;
}

}  // namespace

// The recursion is as deep as lists nest. A key within a key is registered too.
spki_status spki_register_keys(spki_engine* engine, spki_elem* list) {
  if (HeadKeyword(list) == SPKI_KW_PUBLIC_KEY) {
    spki_principal* principal = nullptr;
    VESK2_TRY(spki_principal_of_key(engine, list, &principal));
  }
  for (const spki_elem* elem = list; elem != nullptr; elem = elem->next) {
    if (spki_elem* nested = ListOf(elem)) VESK2_TRY(spki_register_keys(engine, nested));
  }
  return 0;
}

spki_status spki_principal_of_key(spki_engine* engine, spki_elem* key, spki_principal** slot) {
  Digest digest;
  VESK2_TRY(spki_chain_value(engine, key, digest));
  return FindPrincipal(engine, digest, key, slot);
}

// Entered, so that all credentials that name this hash mean one principal.
spki_status spki_principal_of_hash(spki_engine* engine, spki_elem* hash, spki_principal** slot) {
  Digest digest;
  VESK2_TRY(ReadHash(hash, digest));
  if (MayBeSha1(digest)) VESK2_TRY(EnterKeysBySha1(engine));
  return FindPrincipal(engine, digest, hash, slot);
}

spki_status spki_resolve_principal(spki_engine* engine, spki_elem* list, spki_principal** slot) {
  switch (HeadKeyword(list)) {
    case SPKI_KW_HASH:
      return spki_principal_of_hash(engine, list, slot);
    case SPKI_KW_PUBLIC_KEY:
      return spki_principal_of_key(engine, list, slot);
    default:
      return SPKI_ERR_KEY_OR_HASH_EXPECTED;
  }
}

void spki_principals_clear(spki_engine* engine) {
  for (spki_principal* principal = engine->newest; principal != nullptr;) {
    spki_principal* older = principal->older;
    spki_entries_clear(engine, &principal->issued);
    spki_entries_clear(engine, &principal->received);
    spki_elem_release(engine, principal->key);
    spki_free(engine, principal);
    principal = older;
  }
  engine->newest = nullptr;
  spki_table_clear(engine, &engine->principals);
}

}  // namespace ZvVesk2::Engine
