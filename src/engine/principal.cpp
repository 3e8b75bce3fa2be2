// The principal table:
//
//   (public-key ...)              known by the SHA-256 and the SHA-1 digest of its canonical form
//   (hash sha1 <20 bytes>)        the key with that digest, else a principal of its own
//   (hash sha256 <32 bytes>)
#include "src/engine/principal.h"

#include <cstring>

#include "src/engine/chain.h"
#include "src/engine/write.h"
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

spki_status DigestKey(spki_engine* engine, const spki_elem* key, ZvclmHashID id, Digest& digest) {
  spki_digest_sink sink;
  VESK2_TRY(spki_digest_start(engine, &sink.digest, id));
  VESK2_TRY(spki_write_pieces(key, &sink));
  return spki_digest_finish(&sink.digest, digest);
}

// The key's SHA-256, which its head keeps: keys are registered first and looked for later.
spki_status IdentifyKey(spki_engine* engine, spki_elem* key, Digest& digest) {
  if (key->digest == nullptr) {
    VESK2_TRY(DigestKey(engine, key, ZVCLM_HASH_SHA256, digest));
    key->digest = static_cast<unsigned char*>(spki_allocate(engine, sizeof digest));
    VESK2_REQUIRE(key->digest != nullptr, SPKI_ERR_NO_MEM);
    std::memcpy(key->digest, digest, sizeof digest);
  }
  std::memcpy(digest, key->digest, sizeof digest);
  return 0;
}

spki_status EnterBySha1(spki_engine* engine, spki_principal* principal) {
  Digest digest;
  VESK2_TRY(DigestKey(engine, principal->key, ZVCLM_HASH_SHA1, digest));
  return EnterPrincipal(engine, digest, principal);
}

// Enters every key by its SHA-1 too, once a credential names one so; few ever do.
spki_status EnterKeysBySha1(spki_engine* engine) {
  if (engine->keys_by_sha1) return 0;
  engine->keys_by_sha1 = true;
  for (const spki_bucket_entry* entry : engine->principals) {
    for (; entry != nullptr; entry = entry->next) {
      spki_principal* principal = entry->principal;
      const bool bySha256 =
          std::memcmp(entry->digest, principal->digest, sizeof entry->digest) == 0;
      if (!bySha256 || HeadKeyword(principal->key) != SPKI_KW_PUBLIC_KEY) continue;
      VESK2_TRY(EnterBySha1(engine, principal));
    }
  }
  return 0;
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
  Digest digest;
  VESK2_TRY(IdentifyKey(engine, key, digest));
  VESK2_TRY(FindPrincipal(engine, digest, slot));
  if (*slot != nullptr) return 0;
  VESK2_TRY(AddPrincipal(engine, digest, key, slot));
  return engine->keys_by_sha1 ? EnterBySha1(engine, *slot) : 0;
}

spki_status spki_principal_of_hash(spki_engine* engine, spki_elem* hash, spki_principal** slot) {
  Digest digest;
  VESK2_TRY(ReadHash(hash, digest));
  if (StringOf(hash->next)->keyword == SPKI_KW_SHA1) VESK2_TRY(EnterKeysBySha1(engine));
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
