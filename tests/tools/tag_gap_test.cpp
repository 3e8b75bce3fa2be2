// SPDX-License-Identifier: Apache-2.0
// The place where one tag reaches beyond another is really one: whatever two random tags look like,
// the library refuses the two parts that are named as it refuses the whole.
#include "tools/vesk2/objects/tag_gap.h"

#include <gtest/gtest.h>

#include <random>

namespace vesk2_command {
namespace {

class Tags {
 public:
  std::string Make() { return "(f " + Element(0) + Rest(0) + ")"; }

 private:
  size_t Pick(size_t count) { return random_() % count; }
  std::string Word() {
    constexpr const char* kWords[] = {"a", "ab", "abc", "b", "5", "7", "12", "x-1"};
    return kWords[Pick(std::size(kWords))];
  }
  std::string Rest(int depth) { return Pick(3) == 0 ? "" : " " + Element(depth); }

  std::string Element(int depth) {
    switch (Pick(depth > 2 ? 3 : 9)) {
      case 3:
        return "(*)";
      case 4:
        return "(* set " + Element(depth + 1) + " " + Element(depth + 1) + ")";
      case 5:
        return "(* prefix " + Word() + ")";
      case 6:
        return std::string("(* range ") + (Pick(2) == 0 ? "numeric" : "alpha") + " (ge " + Word() +
               ") (" + (Pick(2) == 0 ? "l " : "le ") + Word() + "))";
      case 7:
      case 8:
        return "(" + Word() + " " + Element(depth + 1) + Rest(depth + 1) + ")";
      default:
        return Word();
    }
  }

  std::mt19937 random_{20261123};
};

DExpression* At(SExpression& list, size_t index) {
  auto it = list.Begin();
  for (; it && index != 0; --index) it.Next();
  return it ? it.Value() : nullptr;
}

// The part that a path leads to; null where a list ends before it.
DExpression* Part(SExpression& tag, const std::vector<size_t>& path) {
  DExpression* part = &tag;
  for (size_t i = 0; i < path.size(); ++i) {
    part = At(dynamic_cast<SExpression&>(*part), i == 0 ? path[i] : path[i] - 1);
  }
  return part;
}

Ref<SExpression> AsTag(DExpression& part) {
  auto* list = dynamic_cast<SExpression*>(&part);
  return ParseTag(list != nullptr ? AdvancedText(*list)
                                  : std::string(BytesOf(dynamic_cast<ByteString&>(part))));
}

TEST(TagGap, IsRefusedByTheLibraryToo) {
  Tags tags;
  int refused = 0;
  for (int i = 0; i < 5000; ++i) {
    const std::string texts[] = {tags.Make(), tags.Make()};
    const Ref<SExpression> asked = ParseTag(texts[0]);
    const Ref<SExpression> granted = ParseTag(texts[1]);
    if (asked->IsSubset(granted.get())) continue;
    ++refused;
    const TagGap gap = FindGap(*asked, *granted);
    SCOPED_TRACE(texts[0] + " within " + texts[1] + ": " + gap.Text());
    ASSERT_FALSE(gap.words.empty() || gap.reason.empty() || gap.granted.empty());
    DExpression* beyond = Part(*asked, gap.path);
    DExpression* allowed = Part(*granted, gap.path);
    ASSERT_NE(allowed, nullptr);
    ASSERT_EQ(beyond == nullptr, gap.asked.empty());
    if (beyond != nullptr && !gap.path.empty()) {
      ASSERT_FALSE(AsTag(*beyond)->IsSubset(AsTag(*allowed).get()));
    }
  }
  EXPECT_GT(refused, 1000);
}

}  // namespace
}  // namespace vesk2_command
