// SPDX-License-Identifier: Apache-2.0
// Laws of the algebra over random tags: what an intersection allows, both tags allow; and, without
// sets (which are judged more strictly than their members), what both allow, it allows. An oracle
// that takes only the parser from the engine says what a tag allows.
#include <random>

#include "tests/engine/engine_fixture.h"

namespace ZvVesk2::Engine {
namespace {

enum Forms { kAll, kNoSets, kNoRanges };  // the last is without sets too

// Empty for a list.
std::string Word(const spki_elem* elem) {
  if (elem->kind == SPKI_ELEM_LIST) return "";
  if (elem->kind == SPKI_ELEM_KEYWORD) return spki_keyword_row(elem->value.keyword)->name;
  return {elem->value.atom->data, elem->value.atom->data + elem->value.atom->length};
}

bool Allows(const spki_elem* tag, const spki_elem* asked) {
  const std::string word = Word(asked);
  if (tag->kind != SPKI_ELEM_LIST) return word == Word(tag);
  const spki_elem* item = tag->value.list;
  if (Word(item) != "*") {
    const spki_elem* other = word.empty() ? asked->value.list : nullptr;
    for (; item != nullptr && other != nullptr; item = item->next, other = other->next) {
      if (!Allows(item, other)) return false;
    }
    return item == nullptr;
  }
  if (item->next == nullptr) return true;
  const std::string form = Word(item->next);
  item = item->next->next;
  if (form == "set") {
    while (item != nullptr && !Allows(item, asked)) item = item->next;
    return item != nullptr;
  }
  if (word.empty()) return false;
  if (form == "prefix") return word.starts_with(Word(item));
  for (item = item->next; item != nullptr; item = item->next) {
    const std::string op = Word(item->value.list);
    const int order = word.compare(Word(item->value.list->next));
    if (order == 0 ? op.size() == 1 : (order > 0) != (op[0] == 'g')) return false;
  }
  return true;
}

class Laws : public EngineTest {
 protected:
  void Check(Forms forms);

 private:
  bool Within(const spki_elem* a, const spki_elem* b) {
    const spki_relation relation = spki_cmp_elem(&engine_, a, b);
    return relation == SPKI_REL_EQUAL || relation == SPKI_REL_NARROWER;
  }
  int Below(int limit) { return static_cast<int>(random_() % static_cast<unsigned>(limit)); }
  std::string AnyWord() {
    std::string word;
    for (int i = 1 + Below(3); i > 0; --i) word += Below(2) ? 'a' : 'b';
    return word;
  }
  template <typename Item>
  std::string List(std::string text, Item item) {
    for (int i = Below(4); i > 0; --i) text += " " + item();
    return text + ")";
  }
  std::string Request(int depth) {
    if (depth == 0 || Below(3) == 0) return AnyWord();
    return List(Below(4) ? "(x" : "(y", [&] { return Request(depth - 1); });
  }
  std::string Tag(int depth, Forms forms) {
    const auto nested = [&] { return Tag(std::max(depth - 1, 0), forms); };
    const char* operators[] = {"(g ", "(ge ", "(l ", "(le "};
    const auto bound = [&] { return operators[Below(4)] + AnyWord() + ")"; };
    const int kind = Below(depth == 0 ? 5 : 9);
    if (kind == 0) return "(*)";
    if (kind == 1) return AnyWord();
    if (kind == 2) return "(* prefix " + AnyWord() + ")";
    if (kind == 3 && forms != kNoRanges) return List("(* range alpha", bound);
    if (kind == 4 && forms == kAll) return List("(* set", nested);
    const std::string head = Below(4) ? "(x" : "(y";
    return depth == 0 ? head + ")" : List(head, nested);
  }

  std::mt19937 random_{20240229};
};

void Laws::Check(Forms forms) {
  int allowed = 0;
  for (int round = 0; round < 1000 && !HasFailure(); ++round) {
    spki_elem* const a = Elem(Tag(3, forms));
    spki_elem* const b = Elem(Tag(3, forms));
    const spki_elem* const both = Keep(spki_intersect_elem(&engine_, a, b));
    SCOPED_TRACE(Text(a) + " and " + Text(b));
    const bool lies_within = both == nullptr || (Within(both, a) && Within(both, b));
    EXPECT_TRUE(forms != kNoRanges || lies_within);
    for (int i = 0; i < 20; ++i) {
      const spki_elem* const asked = Elem(Request(3));
      const bool by_each = Allows(a, asked) && Allows(b, asked);
      const bool by_both = both != nullptr && Within(asked, both);
      EXPECT_EQ(Allows(a, asked), Within(asked, a)) << Text(asked);
      EXPECT_TRUE(by_both ? by_each : forms == kAll || !by_each) << Text(asked);
      allowed += by_both;
    }
  }
  EXPECT_GT(allowed, 300) << "the law was hardly tried";
}

TEST_F(Laws, IntersectionsAllowWhatBothAllow) { Check(kNoSets); }
TEST_F(Laws, IntersectionsLieWithinBoth) { Check(kNoRanges); }
TEST_F(Laws, IntersectionsWithSetsAllowNoMore) { Check(kAll); }

}  // namespace
}  // namespace ZvVesk2::Engine
