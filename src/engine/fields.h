// SPDX-License-Identifier: Apache-2.0
// The fields of one credential, read into a tuple.
#ifndef VESK2_SRC_ENGINE_FIELDS_H
#define VESK2_SRC_ENGINE_FIELDS_H

#include "src/engine/tuple.h"

namespace ZvVesk2::Engine {

// Reads every field of an (entry ...) or (cert ...) list. Principals that it names are entered in
// the table. Stops at the first error.
[[nodiscard]] spki_status spki_tuple_fields(spki_engine* engine, spki_tuple* tuple,
                                            const spki_elem* credential, bool acl);
// Reads X of (subject X), or a member of a k-of-n subject. A name without a key is the issuer's. A
// k-of-n subject leaves the tuple's subject null.
[[nodiscard]] spki_status spki_tuple_subject(spki_engine* engine, spki_tuple* tuple,
                                             spki_elem* list);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_FIELDS_H
