// The principal table:
//
//   (public-key ...)              known by the SHA-256 and the SHA-1 digest of its canonical form
//   (hash sha1 <20 bytes>)        the key with that digest, else a principal of its own
//   (hash sha256 <32 bytes>)
#include "src/engine/principal.h"

#include <cstring>

#include "src/engine/chain.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

using Digest = unsigned char[kSpkiDigestSize];

spki_status FindPrincipal(spki_engine* engine, const Digest& digest, spki_principal** slot) {
  const spki_bucket_entry* entry = spki_entry_find(engine, engine->principals[digest[0]], digest);
  *slot = entry == nullptr ? nullptr : entry->principal;
  return engine->budget.spent;
}

spki_status EnterPrincipal(spki_engine* engine, const Digest& digest, spki_principal* principal) {
  spki_bucket_entry* entry = spki_entry_push(engine, &engine->principals[digest[0]]);
  VESK2_REQUIRE(entry != nullptr, SPKI_ERR_NO_MEM);
  std::memcpy(entry->digest, digest, sizeof entry->digest);
  entry->principal = principal;
  ++principal->refcount;
  return 0;
}

// A new principal, in the table under its digest.
spki_status AddPrincipal(spki_engine* engine, const Digest& digest, spki_elem* key,
                         spki_principal** slot) {
  auto* principal = static_cast<spki_principal*>(spki_allocate(engine, sizeof(spki_principal)));
  VESK2_REQUIRE(principal != nullptr, SPKI_ERR_NO_MEM);
  if (const spki_status status = EnterPrincipal(engine, digest, principal)) {
    spki_free(engine, principal);
    return status;
  }
  std::memcpy(principal->digest, digest, sizeof principal->digest);
  spki_elem_assign(engine, &principal->key, key);
  *slot = principal;
  return 0;
}

spki_status DigestKey(spki_engine* engine, const spki_elem* key, Digest& sha256, Digest& sha1) {
  spki_digest first;
  spki_digest second;
  VESK2_TRY(spki_digest_start(engine, &first, ZVCLM_HASH_SHA256));
  VESK2_TRY(spki_digest_start(engine, &second, ZVCLM_HASH_SHA1));
  VESK2_TRY(spki_write_canonical(engine, key, &first, &second));
  VESK2_TRY(spki_digest_finish(&first, sha256));
  return spki_digest_finish(&second, sha1);
}

// The digest that (hash <algorithm> <value>) holds, zero-padded.
spki_status ReadHash(const spki_elem* hash, Digest& digest) {
  VESK2_REQUIRE(HeadKeyword(hash) == SPKI_KW_HASH, SPKI_ERR_NOT_HASH_SEXP);
  const spki_atom* algorithm = StringOf(hash->next);
  VESK2_REQUIRE(algorithm != nullptr && algorithm->keyword >= 1, SPKI_ERR_UNKNOWN_HASH_ALG);
  const spki_atom* value = StringOf(hash->next->next);
  VESK2_REQUIRE(value != nullptr, SPKI_ERR_BAD_HASH_FORMAT);
  const bool sha1 = algorithm->keyword == SPKI_KW_SHA1;
  VESK2_REQUIRE(sha1 || algorithm->keyword == SPKI_KW_SHA256, SPKI_ERR_UNKNOWN_HASH_ALG);
  VESK2_REQUIRE(value->length == (sha1 ? 20 : 32), SPKI_ERR_HASH_LTH_DIFFER);
  std::memset(digest, 0, sizeof digest);
  std::memcpy(digest, value->data, value->length);
  return 0;
}

}  // namespace

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
  Digest sha256;
  Digest sha1;
  VESK2_TRY(DigestKey(engine, key, sha256, sha1));
  VESK2_TRY(FindPrincipal(engine, sha256, slot));
  if (*slot != nullptr) return 0;
  VESK2_TRY(AddPrincipal(engine, sha256, key, slot));
  // Credentials name keys by SHA-1 too.
  return EnterPrincipal(engine, sha1, *slot);
}

spki_status spki_principal_of_hash(spki_engine* engine, spki_elem* hash, spki_principal** slot) {
  Digest digest;
  VESK2_TRY(ReadHash(hash, digest));
  VESK2_TRY(FindPrincipal(engine, digest, slot));
  // Entered, so that all credentials that name this hash mean one principal.
  return *slot != nullptr ? 0 : AddPrincipal(engine, digest, hash, slot);
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

}  // namespace ZvVesk2::Engine
