// SPDX-License-Identifier: Apache-2.0
// Principals: who issues and who receives grants. A key and its hashes are one principal, found by
// the SHA-256 digest of the key's canonical form, by its SHA-1 digest, or by a hash that no known
// key has. What is the same principal is the same record, so all later questions compare pointers.
#ifndef VESK2_SRC_ENGINE_PRINCIPAL_H
#define VESK2_SRC_ENGINE_PRINCIPAL_H

#include "src/engine/tables.h"

namespace ZvVesk2::Engine {

// Tuples and tables point at principals without counting: the engine keeps all of them, and they
// outlive every tuple.
struct spki_principal {
  spki_principal* older;  // the one made before this one
  Digest digest;
  spki_elem* key;        // the (public-key ...) list, or the (hash ...) of an unknown one
  spki_entry* issued;    // tuples
  spki_entry* received;  // tuples
};

// Registers every (public-key ...) list at any depth, the list itself included. All lists come
// before the first principal of a hash: keys are entered by their SHA-1 when the first hash asks
// for it, and one that came later would be another principal than its hash.
[[nodiscard]] spki_status spki_register_keys(spki_engine* engine, spki_elem* list);

// Each finds the principal of a list, or enters a new one in the table. `*slot` is borrowed.
[[nodiscard]] spki_status spki_principal_of_key(spki_engine* engine, spki_elem* key,
                                                spki_principal** slot);
[[nodiscard]] spki_status spki_principal_of_hash(spki_engine* engine, spki_elem* hash,
                                                 spki_principal** slot);
// By the list's head; SPKI_ERR_KEY_OR_HASH_EXPECTED for any other.
[[nodiscard]] spki_status spki_resolve_principal(spki_engine* engine, spki_elem* list,
                                                 spki_principal** slot);

// Releases all principals, what they issued and received, and the table. No tuple may be used
// behind it.
void spki_principals_clear(spki_engine* engine);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_PRINCIPAL_H
