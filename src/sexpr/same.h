// SPDX-License-Identifier: Apache-2.0
// Equality of values for callers that must tell "different" from "could not be compared".
#ifndef VESK2_SRC_SEXPR_SAME_H
#define VESK2_SRC_SEXPR_SAME_H

#include <vesk2/expression.h>

namespace ZvVesk2 {

// CompareValues is DExpression::IsEqual, but says when it cannot tell: where "not equal" would mean
// "not revoked", that must not pass for it. It allocates nothing and stops at the first difference;
// values that are the same down to lists nested too deeply give VESK2_ERR_BUFFER_OVERFLOW. Null
// equals nothing, not even null. Display hints do not count: adding one to a key must not make it
// another key that no list revokes. `equal` is false after a failure.
[[nodiscard]] int CompareValues(bool& equal, DExpression* a, DExpression* b);

}  // namespace ZvVesk2

#endif  // VESK2_SRC_SEXPR_SAME_H
