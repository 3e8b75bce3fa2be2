// SPDX-License-Identifier: Apache-2.0
// k-of-n subjects: a grant that k of n subjects must pass on to the same principal.
//
// Of (entry (subject (k-of-n 2 3 A B C)) (propagate) (tag t)), with certificates A -> P and C -> P,
// the member tuples of positions 1 and 3 get to P by combination. With the second of them two
// positions have, and the search makes the grant to P as if the entry had named it.
#ifndef VESK2_SRC_ENGINE_THRESHOLD_H
#define VESK2_SRC_ENGINE_THRESHOLD_H

#include "src/engine/reduction.h"

namespace ZvVesk2::Engine {

// One k-of-n subject. What it grants is issued by whoever issued the tuple that carried it; inside
// another k-of-n, it counts as one member of that.
struct spki_threshold {
  spki_threshold* next;  // of the reduction
  // Wider than any position: a number cut to fewer bits would ask for fewer members.
  uint32_t k;
  uint32_t n;
  int32_t member;             // position of the carrying tuple, or what it had instead
  spki_principal* issuer;     // of the carrying tuple
  spki_threshold* enclosing;  // that the carrying tuple belongs to
  spki_entry** chains;        // the member tuples that got to a principal, by position, 1 to n
};

// Searches k positions with a tuple to the subject of `arriving`, its own among them, that agree on
// a tag and a period. *made is what the threshold then grants to that subject; null for none.
[[nodiscard]] spki_status spki_threshold_search(spki_engine* engine,
                                                const spki_threshold* threshold,
                                                const spki_tuple* arriving, spki_tuple** made);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_THRESHOLD_H
