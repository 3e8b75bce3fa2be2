// SPDX-License-Identifier: Apache-2.0
// The fields of one credential, read into a tuple.
#ifndef VESK2_SRC_ENGINE_FIELDS_H
#define VESK2_SRC_ENGINE_FIELDS_H

#include "src/engine/tuple.h"

namespace ZvVesk2::Engine {

// Reads every field of an (entry ...) or (cert ...) list into a fresh tuple. Principals that it
// names are entered in the table. Stops at the first error, and leaves the tuple as far as it got.
[[nodiscard]] spki_status spki_tuple_fields(spki_engine* engine, spki_tuple* tuple,
                                            const spki_elem* credential, bool acl);
// Reads X of (subject X), or a member of a k-of-n subject. A name without a key is the issuer's,
// which must have been read before. A k-of-n subject leaves the tuple's subject as it was, null.
// SPKI_ERR_SUBJECT_SYNTAX for a null list and for any other form.
[[nodiscard]] spki_status spki_tuple_subject(spki_engine* engine, spki_tuple* tuple,
                                             spki_elem* list);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_FIELDS_H
