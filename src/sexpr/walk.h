// SPDX-License-Identifier: Apache-2.0
// The one walk over a list and all lists within it. Every operation on a whole expression (hashing,
// measuring, writing, comparing) is a loop over its steps, so none of them recurses: readers bound
// how deeply lists nest, but a caller can insert list into list without end.
//
// The steps of (a (b) c), with the level of each:
//
//   Open 1, Atom a 1, Open 2, Atom b 2, Close 2, Atom c 1, Close 1, End
//
// There are two forms of the walk. Next is pulled, so that two lists can be walked in step and a
// caller can stop anywhere. Through pushes; its visitor is compiled into the loop, which matters
// where whole chains of certificates are hashed. Both refuse at the same level. Nothing may be
// inserted or removed on the way: the frames point at nodes.
#ifndef VESK2_SRC_SEXPR_WALK_H
#define VESK2_SRC_SEXPR_WALK_H

#include <utility>

#include <vesk2/expression.h>

#include "src/frame/check.h"

namespace ZvVesk2 {

// Walks depth first, in reading order: Open and Close for each list, Atom for every other value.
// Below Limits::kMaxDepth levels it gives TooDeep, and must not go on.
class Walk {
 public:
  enum class Step { Open, Atom, Close, TooDeep, End };

  // The list is borrowed until the walk ends.
  explicit Walk(SExpression* root) : root_(root) {}
  // After End it stays End. An element of the open list comes before its Close, and that before the
  // elements behind it: so `rest_` is looked at first.
  Step Next() {
    closed_ = 0;
    if (rest_ != nullptr) {
      isFirst_ = opened_;
      return Enter(std::exchange(rest_, rest_->next)->value);
    }
    if (level_ != 0) return Leave();
    return root_ != nullptr ? Enter(std::exchange(root_, nullptr)) : Step::End;
  }

  // Takes the same walk from end to end: `on` is told of each step by Parenthesis(character, level)
  // and Atom(value), whose first code other than 0 ends it. VESK2_ERR_BUFFER_OVERFLOW for lists
  // nested too deeply; `on` has then been told of what stands before them.
  template <typename On>
  [[nodiscard]] static int Through(const SExpression* root, On& on) {
    const Node* behind[Limits::kMaxDepth + 1];  // by level: what follows each list within the root
    unsigned level = 1;
    VESK2_TRY(on.Parenthesis('(', level));
    for (const Node* node = root->first;;) {
      while (node == nullptr) {
        VESK2_TRY(on.Parenthesis(')', level));
        if (--level == 0) return 0;
        node = behind[level];
      }
      DExpression* const value = node->value;
      node = node->next;
      if (value->isList == 0) {
        VESK2_TRY(on.Atom(*value));
        continue;
      }
      VESK2_REQUIRE(level < Limits::kMaxDepth, VESK2_ERR_BUFFER_OVERFLOW);
      behind[level++] = node;
      VESK2_TRY(on.Parenthesis('(', level));
      node = static_cast<SExpression*>(value)->first;
    }
  }

  // The list opened or closed, or the atom.
  DExpression* Value() const { return value_; }
  // Lists open, the step's own included: 1 at the root's parentheses and at its elements that are
  // no lists. A Close has the level of its Open.
  unsigned Level() const { return level_ + closed_; }
  // Whether what is opened, or the atom, is the first of its list: writers put a blank before all
  // others. It says nothing at a Close.
  bool IsFirst() const { return isFirst_; }

 private:
  using Node = SExpression::Node;

  // Goes to one element. What follows a list waits in its frame; its own first element is next.
  Step Enter(DExpression* value) {
    value_ = value;
    opened_ = false;
    if (value->isList == 0) return Step::Atom;
    if (level_ == Limits::kMaxDepth) return Step::TooDeep;
    auto* const list = static_cast<SExpression*>(value);
    open_[level_++] = {list, std::exchange(rest_, list->first)};
    opened_ = true;
    return Step::Open;
  }

  // The list ends; what stood behind it in the list around it is next.
  Step Leave() {
    const Frame& frame = open_[--level_];
    value_ = frame.list;
    rest_ = frame.behind;
    closed_ = 1;
    opened_ = false;
    return Step::Close;
  }

  struct Frame {
    SExpression* list;
    const Node* behind;  // what follows it in the list around it
  };

  SExpression* root_;           // null once it was opened
  const Node* rest_ = nullptr;  // of the list that was opened last
  DExpression* value_ = nullptr;
  unsigned level_ = 0;
  unsigned closed_ = 0;
  bool opened_ = false;
  bool isFirst_ = true;
  Frame open_[Limits::kMaxDepth];  // not cleared: only those of open lists are looked at
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_SEXPR_WALK_H
