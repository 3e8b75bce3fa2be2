// SPDX-License-Identifier: Apache-2.0
// expression.h: any S-expression, whatever it stands for, as a tree for people and for machines.
#ifndef VESK2_TOOLS_EXPRESSION_H
#define VESK2_TOOLS_EXPRESSION_H

#include <string>
#include <vector>

#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {

// One word or list on one line, escaped: words as they are, in quotes where that would be
// ambiguous, bytes that are no text as #hexadecimal digits#, shortened.
std::string InlineText(DExpression& expression);
// An indented tree; what fits stands on one line.
std::vector<std::string> TreeLines(DExpression& expression);
// A list is an array. A byte string is its text, or {"hex": digits} where Escape would have to
// change it; one with a display hint is {"hint": name, "text" or "hex": ...}.
Json ExpressionJson(DExpression& expression);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_EXPRESSION_H
