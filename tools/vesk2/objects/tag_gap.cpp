// SPDX-License-Identifier: Apache-2.0
// tag_gap.cpp: where one tag reaches beyond another.
#include "tools/vesk2/objects/tag_gap.h"

#include "tools/vesk2/objects/expression.h"

namespace vesk2_command {
namespace {

// What an element of a tag allows: a word, what a list describes, or one of the star forms.
enum Form { kWord, kList, kAll, kSet, kPrefix, kRange };

// Members of a set, and bounds of a range, that are asked about one by one.
constexpr size_t kMostTried = 64;

std::vector<DExpression*> ElementsOf(const SExpression& list) {
  std::vector<DExpression*> elements;
  for (auto it = list.Begin(); it; it.Next()) elements.push_back(it.Value());
  return elements;
}

const ByteString* WordAt(const std::vector<DExpression*>& elements, size_t index) {
  return index < elements.size() ? dynamic_cast<ByteString*>(elements[index]) : nullptr;
}

// A star form that is none of the four is an ordinary list.
Form FormOf(const DExpression& expression) {
  const auto* list = dynamic_cast<const SExpression*>(&expression);
  if (list == nullptr) return kWord;
  const std::vector<DExpression*> elements = ElementsOf(*list);
  const ByteString* star = WordAt(elements, 0);
  if (star == nullptr || !star->IsEqual("*")) return kList;
  if (elements.size() == 1) return kAll;
  const ByteString* word = WordAt(elements, 1);
  if (word == nullptr) return kList;
  if (word->IsEqual("set")) return kSet;
  if (word->IsEqual("prefix")) return kPrefix;
  return word->IsEqual("range") ? kRange : kList;
}

// The library's answer about two elements, each as a tag of its own.
bool Within(DExpression& asked, DExpression& granted) {
  return ListOf({&asked}, "tag")->IsSubset(ListOf({&granted}, "tag").get());
}

std::vector<DExpression*> MembersOf(const DExpression& set) {
  const auto elements = ElementsOf(static_cast<const SExpression&>(set));
  return {elements.begin() + 2, elements.end()};
}

// ---- Words for two elements that do not meet ----

struct Why {
  std::string reason;
  std::string words;
};

Why Explain(DExpression& asked, DExpression& granted);

// The set that is asked for has a member too many, or is only not compared member by member.
Why ExplainSet(DExpression& asked, DExpression& granted) {
  size_t tried = 0;
  for (DExpression* member : MembersOf(asked)) {
    if (++tried > kMostTried) break;
    if (FormOf(*member) != kSet && !Within(*member, granted)) {
      return {"set-member", "of the asked set, " + Explain(*member, granted).words};
    }
  }
  return {"set-strict", "a set lies within an equal set only; ask for its members one by one"};
}

std::string BoundText(const DExpression& bound, bool& upper, bool& open) {
  const auto elements = ElementsOf(static_cast<const SExpression&>(bound));
  const ByteString* op = WordAt(elements, 0);
  if (op == nullptr || elements.size() != 2) return "";
  upper = op->IsEqual("l") || op->IsEqual("le");
  open = op->IsEqual("l") || op->IsEqual("g");
  return InlineText(*elements[1]);
}

Why ExplainBound(const std::string& text, bool word, const DExpression& bound) {
  bool upper = false;
  bool open = false;
  const std::string limit = BoundText(bound, upper, open);
  const std::string name = (upper ? "the upper bound " : "the lower bound ") + limit;
  const std::string reason = upper ? "above-bound" : "below-bound";
  if (!word) return {reason, text + " reaches " + (upper ? "above " : "below ") + name};
  if (open) return {reason, text + " is not " + (upper ? "below " : "above ") + name};
  return {reason, text + " is " + (upper ? "above " : "below ") + name};
}

// The bound that is not kept, found by asking about each alone.
Why ExplainRange(DExpression& asked, DExpression& granted) {
  const auto elements = ElementsOf(static_cast<SExpression&>(granted));
  const std::string text = InlineText(asked);
  const bool word = FormOf(asked) == kWord;
  const ByteString* ordering = WordAt(elements, 2);
  if (ordering == nullptr) return {"no-range", InlineText(granted) + " has no ordering"};
  const Ref<SExpression> open = ListOf({elements[0], elements[1], elements[2]});
  if (!Within(asked, *open)) {
    const std::string kind = InlineText(*elements[2]);
    const std::vector<DExpression*> own = FormOf(asked) == kRange
                                              ? ElementsOf(static_cast<SExpression&>(asked))
                                              : std::vector<DExpression*>();
    if (own.size() > 2 && InlineText(*own[2]) == kind) {
      return {"range-strict", text + " does not span two values of the ordering " + kind +
                                  ": it lies within an equal range only; ask for the value itself"};
    }
    return word ? Why{"no-value", text + " is no value of the ordering " + kind}
                : Why{"other-ordering", text + " is not of the ordering " + kind};
  }
  for (size_t i = 3; i < elements.size() && i < 3 + kMostTried; ++i) {
    if (!elements[i]->IsSExpression()) break;
    const Ref<SExpression> one = ListOf({elements[0], elements[1], elements[2], elements[i]});
    if (!Within(asked, *one)) return ExplainBound(text, word, *elements[i]);
  }
  return {"not-in-range", text + " is not in " + InlineText(granted)};
}

Why ExplainPrefix(DExpression& asked, DExpression& granted) {
  const auto members = MembersOf(granted);
  if (members.size() != 1 || members[0]->IsSExpression()) {
    return {"no-prefix", InlineText(granted) + " is no prefix of one word"};
  }
  const std::string start = " start with " + InlineText(*members[0]);
  if (FormOf(asked) == kWord) return {"other-prefix", InlineText(asked) + " does not" + start};
  return {"other-prefix", "not all of " + InlineText(asked) + start};
}

Why Explain(DExpression& asked, DExpression& granted) {
  const Form form = FormOf(asked);
  const std::string text = InlineText(asked);
  const std::string other = InlineText(granted);
  if (form == kAll) return {"everything", "everything is asked for, only " + other + " is granted"};
  if (form == kSet) return ExplainSet(asked, granted);
  switch (FormOf(granted)) {
    case kSet:
      return {"not-in-set", text + " is not in the set " + other};
    case kPrefix:
      if (form != kList) return ExplainPrefix(asked, granted);
      return {"list-for-word", text + " is a list, and words are granted"};
    case kRange:
      if (form != kList) return ExplainRange(asked, granted);
      return {"list-for-word", text + " is a list, and words are granted"};
    case kWord:
      if (form == kWord) return {"other-word", text + " is not " + other};
      if (form == kList) return {"list-for-word", text + " is a list, not the word " + other};
      return {"more-words", text + " allows more than the word " + other};
    default:
      if (form != kList) return {"word-for-list", text + " is not the list " + other};
      return {"not-comparable", text + " does not lie within " + other};
  }
}

// ---- The way to them ----

class Search {
 public:
  // Goes down to the smallest two parts that do not meet. The readers bound the depth of a tag.
  TagGap Find(SExpression& asked, SExpression& granted) {
    Descend(ElementsOf(asked), ElementsOf(granted), 1);
    if (gap_.words.empty()) Settle(asked, granted);
    gap_.place = Place();
    return std::move(gap_);
  }

 private:
  // Elements before `first`, the tag's keyword, are equal.
  void Descend(const std::vector<DExpression*>& asked, const std::vector<DExpression*>& granted,
               size_t first) {
    for (size_t i = first; i < granted.size(); ++i) {
      if (i < asked.size() && Within(*asked[i], *granted[i])) continue;
      gap_.path.push_back(i + 1 - first);
      if (first == 0) lists_.push_back(InlineText(*asked[0]));
      if (i == asked.size()) return EndsEarly(*granted[i]);
      if (FormOf(*asked[i]) != kList || FormOf(*granted[i]) != kList) {
        return Settle(*asked[i], *granted[i]);
      }
      Descend(ElementsOf(static_cast<SExpression&>(*asked[i])),
              ElementsOf(static_cast<SExpression&>(*granted[i])), 0);
      if (gap_.words.empty()) Settle(*asked[i], *granted[i]);
      return;
    }
  }

  void EndsEarly(DExpression& missing) {
    gap_.granted = InlineText(missing);
    gap_.reason = "too-short";
    gap_.words = "the list ends where " + gap_.granted + " must follow: a shorter list is wider";
  }

  void Settle(DExpression& asked, DExpression& granted) {
    const Why why = Explain(asked, granted);
    gap_.asked = InlineText(asked);
    gap_.granted = InlineText(granted);
    gap_.reason = why.reason;
    gap_.words = why.words;
  }

  // The lists that were entered, each by its head, down to the one that holds the gap.
  std::string Place() const {
    const bool atHead = !lists_.empty() && gap_.path.back() == 1;
    if (lists_.empty() || (atHead && lists_.size() == 1)) return "";
    std::string text = atHead ? "(...)" : "(" + lists_.back() + " ...)";
    for (size_t i = lists_.size() - 1; i-- > 0;) {
      const bool skips = gap_.path[i + 1] > 2;
      text = "(" + lists_[i] + (skips ? " ... " : " ") + text + ")";
    }
    return text;
  }

  TagGap gap_;
  std::vector<std::string> lists_;
};

}  // namespace

std::string TagGap::Text() const { return place.empty() ? words : "at " + place + ": " + words; }

TagGap FindGap(SExpression& asked, SExpression& granted) { return Search().Find(asked, granted); }

}  // namespace vesk2_command
