// Equality of values for callers that must tell "different" from "could not be compared".
#ifndef VESK2_SRC_SEXPR_SAME_H
#define VESK2_SRC_SEXPR_SAME_H

#include <vesk2/expression.h>

namespace ZvVesk2 {

// CompareValues is DExpression::IsEqual with the failures of hashing reported: where "not equal"
// would mean "not revoked", a lack of memory must not pass for it. Null equals nothing.
[[nodiscard]] int CompareValues(bool& equal, DExpression* a, DExpression* b);

}  // namespace ZvVesk2

#endif  // VESK2_SRC_SEXPR_SAME_H
