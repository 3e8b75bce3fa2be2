// SPDX-License-Identifier: Apache-2.0
// Periods of validity. Dates are compared as byte strings: "####-##-##_##:##:##" orders by time,
// anything else as it happens to. A bound that is absent bounds nothing, and both bounds belong to
// the period: one that begins and ends in the same second is not empty.
#ifndef VESK2_SRC_ENGINE_VALIDITY_H
#define VESK2_SRC_ENGINE_VALIDITY_H

#include "src/engine/tuple.h"

namespace ZvVesk2::Engine {

// Narrows a tuple to the period of another. Whether anything is left; nothing is when the budget is
// spent.
bool spki_validity_meet(spki_engine* engine, spki_tuple* tuple, const spki_tuple* other);

// Narrows a tuple by a constraint: (not-before d), (not-after d), or a (valid ...) of those and of
// bare strings, each an instant that must lie in the period. SPKI_ERR_DATE_INTERSECTION when
// nothing is left.
[[nodiscard]] spki_status spki_validity_narrow(spki_engine* engine, spki_tuple* tuple,
                                               const spki_elem* constraint);

// The date of a (not-before d) or (not-after d), borrowed. A list without one is SPKI_ERR_BAD_SEXP:
// a bound that was meant must not be read as no bound.
[[nodiscard]] spki_status spki_validity_date(const spki_elem* list, spki_atom** date);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_VALIDITY_H
