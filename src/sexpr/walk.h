// SPDX-License-Identifier: Apache-2.0
// The one walk over a list and all lists within it. Every operation on a whole expression (hashing,
// measuring, writing, comparing) is a loop over its steps, so none of them recurses: readers bound
// how deeply lists nest, but a caller can insert list into list without end.
#ifndef VESK2_SRC_SEXPR_WALK_H
#define VESK2_SRC_SEXPR_WALK_H

#include <vesk2/expression.h>

#include <array>

namespace ZvVesk2 {

// Walks depth first, in reading order: Open and Close for each list, Atom for every other value.
// Below Limits::kMaxDepth levels it stops with TooDeep.
class Walk {
 public:
  enum class Step { Open, Atom, Close, TooDeep, End };

  explicit Walk(SExpression* root) : value_(root) {}
  Step Next();

  // The list opened or closed, or the atom.
  DExpression* Value() const { return value_; }
  // Lists open, the step's own included: 1 at the root's parentheses.
  unsigned Level() const { return level_; }
  // Whether what is opened, or the atom, is the first of its list.
  bool IsFirst() const { return isFirst_; }

 private:
  Step Enter(DExpression* value);

  DExpression* value_;
  Step step_ = Step::Open;
  unsigned level_ = 0;
  bool isFirst_ = true;
  struct Frame {
    DExpression* list = nullptr;
    SExpression::Iterator rest{nullptr};
  };
  std::array<Frame, Limits::kMaxDepth> open_;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_SEXPR_WALK_H
