// SPDX-License-Identifier: Apache-2.0
// tag_bounds.cpp: finding what was probably meant otherwise.
#include "tools/vesk2/objects/tag_bounds.h"

#include "tools/vesk2/objects/crl_file.h"
#include "tools/vesk2/objects/expression.h"
#include "tools/vesk2/say/shell_words.h"

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

// The one list that the items of a tag were probably meant to be.
std::string MeantList(SExpression& tag, const std::string& text) {
  auto it = tag.Begin();
  it.Next();  // the keyword
  return it.Value()->IsSExpression() ? "(* set " + text + ")" : "(" + text + ")";
}

}  // namespace

void RequirePlainBounds(SExpression* tag) {
  DExpression* odd = tag != nullptr ? FindOdd(*tag) : nullptr;
  if (odd == nullptr) return;
  throw Trouble("tag \"" + TagText(tag) + "\": the bound " + InlineText(*odd) +
                    " of a range is not one operator and one value, as (le 5) is",
                "usage");
}

Ref<SExpression> ParseIssuedTag(const std::string& text) {
  Ref<SExpression> tag = ParseTypedTag(text);
  RequirePlainBounds(tag.get());
  const std::string why = WhyNotOneList(*tag, text);
  if (!why.empty()) throw Trouble(why, "usage");
  return tag;
}

std::string WhyNotOneList(SExpression& tag, const std::string& text) {
  const bool oneList = tag.Count() == 2 && tag.Last()->IsSExpression();
  if (oneList || IsRevocationTag(&tag)) return "";
  return "tag \"" + Escape(text) + "\": not one list in parentheses; did you mean " +
         ShellWord(MeantList(tag, text)) + "?";
}

}  // namespace vesk2_command
