// Principals: who issues and who receives grants. A key and its hashes are one principal, found by
// the SHA-256 digest of the key's canonical form, by its SHA-1 digest, or by a hash that no known
// key has.
#ifndef VESK2_SRC_ENGINE_PRINCIPAL_H
#define VESK2_SRC_ENGINE_PRINCIPAL_H

#include "src/engine/digest.h"
#include "src/engine/model.h"

namespace ZvVesk2::Engine {

// One link of the tables' chains, which grow at the front. An entry holds a principal or a tuple.
struct spki_bucket_entry {
  spki_bucket_entry* next;
  unsigned char digest[kSpkiDigestSize];  // of the principal or the name; its first byte is the
                                          // bucket. Unused in the lists of tuples.
  spki_principal* principal;              // counted
  spki_tuple* tuple;                      // counted
};

// Tuples point at principals without counting: the principal table outlives every tuple.
struct spki_principal {
  uint32_t refcount;  // one for each entry of the principal table
  unsigned char digest[kSpkiDigestSize];
  spki_elem* key;               // the (public-key ...) list, or the (hash ...) of an unknown one
  spki_bucket_entry* issued;    // tuples
  spki_bucket_entry* received;  // tuples
};

// The first entry of a chain under `digest`. Null at the end of the chain, and when the budget is
// spent.
spki_bucket_entry* spki_entry_find(spki_engine* engine, spki_bucket_entry* chain,
                                   const unsigned char (&digest)[kSpkiDigestSize]);
// A new entry at the front of a chain; null without memory.
spki_bucket_entry* spki_entry_push(spki_engine* engine, spki_bucket_entry** chain);
// Releases a chain and what its entries hold.
void spki_entries_clear(spki_engine* engine, spki_bucket_entry** chain);

// Registers every (public-key ...) list at any depth, the list itself included.
spki_status spki_register_keys(spki_engine* engine, spki_elem* list);

// Each finds the principal of a list, or enters a new one in the table. `*slot` is borrowed.
spki_status spki_principal_of_key(spki_engine* engine, spki_elem* key, spki_principal** slot);
spki_status spki_principal_of_hash(spki_engine* engine, spki_elem* hash, spki_principal** slot);
// By the list's head; SPKI_ERR_KEY_OR_HASH_EXPECTED for any other.
spki_status spki_resolve_principal(spki_engine* engine, spki_elem* list, spki_principal** slot);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_PRINCIPAL_H
