// SPDX-License-Identifier: Apache-2.0
// tag_bounds.cpp: finding the bounds that are none.
#include "tools/vesk2/objects/tag_bounds.h"

#include "tools/vesk2/objects/expression.h"

namespace vesk2_command {
namespace {

// Moves past (* range ORDERING to the first bound; false for a list that is no range.
bool SkipToBounds(SExpression::Iterator& it) {
  for (const char* expected : {"*", "range"}) {
    const auto* word = it ? dynamic_cast<ByteString*>(it.Value()) : nullptr;
    if (word == nullptr || !word->IsEqual(expected)) return false;
    it.Next();
  }
  if (it) it.Next();
  return true;
}

bool IsPlain(DExpression& bound) {
  const auto* list = dynamic_cast<SExpression*>(&bound);
  return list != nullptr && list->Count() == 2 && !list->First()->IsSExpression() &&
         !list->Last()->IsSExpression();
}

// The first bound that is none, anywhere in a list; null without one.
DExpression* FindOdd(SExpression& list) {
  auto it = list.Begin();
  const bool range = SkipToBounds(it);
  if (!range) it = list.Begin();
  for (; it; it.Next()) {
    if (range && !IsPlain(*it.Value())) return it.Value();
    auto* nested = dynamic_cast<SExpression*>(it.Value());
    DExpression* odd = nested != nullptr ? FindOdd(*nested) : nullptr;
    if (odd != nullptr) return odd;
  }
  return nullptr;
}

}  // namespace

void RequirePlainBounds(SExpression* tag) {
  DExpression* odd = tag != nullptr ? FindOdd(*tag) : nullptr;
  if (odd == nullptr) return;
  throw Trouble("tag \"" + TagText(tag) + "\": the bound " + InlineText(*odd) +
                    " of a range is not one operator and one value, as (le 5) is",
                "usage");
}

}  // namespace vesk2_command
