// SPDX-License-Identifier: Apache-2.0
// Large sets: the index must give what comparing each with each gives, in the same order.
#include "src/engine/set_index.h"

#include <random>

#include "src/engine/tag_forms.h"
#include "tests/engine/engine_fixture.h"

namespace ZvVesk2::Engine {
namespace {

class LargeSets : public EngineTest {
 protected:
  // Few words, so that they meet; the members that are no string allow some of them.
  std::string Member() {
    const std::string word = "w" + std::to_string(random_() % 600);
    switch (random_() % 40) {
      case 0:
        return "[h]" + word;
      case 1:
        return Raw(word + std::string(1, '\0') + "tail");
      case 2:
        return "(* prefix " + word + "9)";
      case 3:
        return "(* range alpha (ge " + word + ") (le " + word + "9))";
      case 4:
        return "(" + word + " (*))";
      case 5:
        return "(" + word + " a)";
      case 6:
        return "(* set " + word + " x" + word + ")";
      default:
        return word;
    }
  }
  spki_elem* Set(size_t members) {
    std::string text = "(* set";
    for (size_t i = 0; i < members; ++i) text += " " + Member();
    return Elem(text + ")");
  }

  // The plain intersection, whose members are compared one by one.
  std::string Plain(spki_elem* set, spki_elem* other) {
    std::vector<spki_elem*> found;
    for (const spki_elem* m = spki_form_arguments(set); m != nullptr; m = m->next) {
      auto* member = const_cast<spki_elem*>(m);
      const spki_relation relation = spki_cmp_elem(&engine_, m, other);
      if (relation == SPKI_REL_DISJOINT) continue;
      spki_elem* common =
          relation == SPKI_REL_OVERLAP
              ? spki_intersect_elem(&engine_, member, other)
              : spki_copy(&engine_, relation == SPKI_REL_WIDER ? other : m).release();
      if (Keep(common) != nullptr) Collect(common, found);
    }
    std::string text;
    for (spki_elem* each : found) text = Bytes(each) + text;
    return found.size() > 1 ? "(1:*3:set" + text + ")" : text;
  }

 private:
  void Collect(spki_elem* common, std::vector<spki_elem*>& found) {
    if (spki_classify(common) == SPKI_TAG_SET) {
      for (const spki_elem* m = spki_form_arguments(common); m != nullptr; m = m->next) {
        Collect(Keep(spki_copy(&engine_, m).release()), found);
      }
      return;
    }
    for (const spki_elem* present : found) {
      if (spki_cmp_elem(&engine_, common, present) == SPKI_REL_EQUAL) return;
    }
    found.push_back(common);
  }
  // A single element, without the parentheses that its list is written in.
  static std::string Bytes(const spki_elem* elem) {
    spki_elem alone = *elem;
    alone.next = nullptr;
    const std::string text = Text(&alone);
    return text.substr(1, text.size() - 2);
  }

  std::mt19937 random_{20261123};
};

TEST_F(LargeSets, AreIntersectedAsByComparing) {
  size_t indexed = 0;
  for (const size_t a : {1U, 100U, 129U, 400U}) {
    for (const size_t b : {1U, 128U, 129U, 400U}) {
      for (int round = 0; round < 4 && !HasFailure(); ++round) {
        spki_elem* const left = Set(a);
        spki_elem* const right = Set(b);
        engine_.budget.comparisons = 0;
        spki_elem* made = Keep(spki_intersect_set(&engine_, left, right));
        const uint32_t paid = engine_.budget.comparisons;
        engine_.budget.comparisons = 0;
        std::string text = made == nullptr ? "" : Text(made);
        if (made != nullptr) text = text.substr(1, text.size() - 2);
        EXPECT_EQ(Plain(left, right), text) << a << " and " << b;
        indexed += a > kPlainMembers && b > kPlainMembers;
        EXPECT_LT(paid, 2 * a * b + 200 * (a + b));
      }
    }
  }
  EXPECT_EQ(16U, indexed);
}

// Disjoint sets are the worst case of a comparison: nothing ends it early.
TEST_F(LargeSets, ThatHaveNothingInCommonArePaidByTheirSum) {
  std::string odd;
  std::string even;
  for (int i = 0; i < 4000; ++i) (i % 2 == 0 ? even : odd) += " " + std::to_string(i);
  spki_elem* const left = Elem("(* set" + odd + ")");
  spki_elem* const right = Elem("(* set" + even + ")");
  EXPECT_EQ(SPKI_REL_DISJOINT, spki_cmp_elem(&engine_, left, right));
  EXPECT_LT(engine_.budget.comparisons, 500'000U);
}

// Wherever the budget ends, nothing is granted and nothing is left over.
TEST_F(LargeSets, AreNoTagWhenTheBudgetEnds) {
  spki_elem* const left = Set(200);
  spki_elem* const right = Set(200);
  engine_.budget.comparisons = 0;
  ASSERT_NE(nullptr, Keep(spki_intersect_set(&engine_, left, right)));
  const uint32_t whole = engine_.budget.comparisons;
  for (uint32_t left_over = 0; left_over < whole; left_over += 97) {
    engine_.budget.spent = 0;
    engine_.budget.comparisons = Limits::kMaxComparisons - left_over;
    EXPECT_EQ(nullptr, Keep(spki_intersect_set(&engine_, left, right))) << left_over;
    EXPECT_EQ(SPKI_ERR_NO_MEM, engine_.budget.spent) << left_over;
  }
  engine_.budget.spent = 0;
}

}  // namespace
}  // namespace ZvVesk2::Engine
