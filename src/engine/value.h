// SPDX-License-Identifier: Apache-2.0
// Digests that stand for values: what a key and a name are known by, and what makes two tuples
// equal. Comparing two digests costs the same however large the tags are, and a table finds an
// equal tuple among thousands without looking at the others. Two values that shared a digest would
// count as one; SHA-256 is what rules that out.
#ifndef VESK2_SRC_ENGINE_VALUE_H
#define VESK2_SRC_ENGINE_VALUE_H

#include "src/engine/tuple.h"

namespace ZvVesk2::Engine {

// The SHA-256 of a chain's canonical form, which its first element keeps: the chain never changes
// from then on.
[[nodiscard]] spki_status spki_chain_value(spki_engine* engine, spki_elem* chain, Digest& out);
// The SHA-256 of the principal's digest and the canonical name.
[[nodiscard]] spki_status spki_name_value(spki_engine* engine, const spki_principal* principal,
                                          const spki_atom* name, Digest& out);
// That of a name (its value) as defined for a subject.
[[nodiscard]] spki_status spki_definition_value(spki_engine* engine, const Digest& name,
                                                const spki_principal* subject, Digest& out);
// Strings are equal by spki_atom_equal when their values are: by the hint, and the bytes up to the
// first 0.
[[nodiscard]] spki_status spki_string_value(spki_engine* engine, const spki_atom* string,
                                            Digest& out);
// Tuples are equal when their values are: the principals and the threshold are the same, and the
// canonical bytes of the lists and strings. By pointer or by the relation of their tags, delegation
// in a circle would never end.
[[nodiscard]] spki_status spki_tuple_value(spki_engine* engine, const spki_tuple* tuple,
                                           Digest& out);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_VALUE_H
