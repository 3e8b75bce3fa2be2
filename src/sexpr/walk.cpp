// SPDX-License-Identifier: Apache-2.0
// Depth-first steps with an explicit stack of Limits::kMaxDepth frames.
#include "src/sexpr/walk.h"

namespace ZvVesk2 {

Walk::Step Walk::Next() {
  if (step_ == Step::TooDeep || step_ == Step::End) return step_;
  if (level_ == 0) return step_ = Enter(value_);  // the first step
  if (step_ == Step::Close && --level_ == 0) return step_ = Step::End;
  Frame& frame = open_[level_ - 1];
  if (!frame.rest) {
    value_ = frame.list;
    return step_ = Step::Close;
  }
  isFirst_ = step_ == Step::Open;
  DExpression* value = frame.rest.Value();
  frame.rest.Next();
  return step_ = Enter(value);
}

Walk::Step Walk::Enter(DExpression* value) {
  value_ = value;
  if (!value->IsSExpression()) return Step::Atom;
  if (level_ == Limits::kMaxDepth) return Step::TooDeep;
  open_[level_++] = {value, static_cast<SExpression*>(value)->Begin()};
  return Step::Open;
}

}  // namespace ZvVesk2
