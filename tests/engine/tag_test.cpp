// Relation and intersection of tags.
#include "tests/engine/engine_fixture.h"

namespace ZvVesk2::Engine {
namespace {

using Tags = EngineTest;

// a, b, cmp(a, b), cmp(b, a).
TEST_F(Tags, Relations) {
  const struct {
    const char* a;
    const char* b;
    int forth, back;
  } cases[] = {
      {"(ftp)", "(ftp)", 0, 0},
      {"(ftp host)", "(ftp)", 1, 2},  // the shorter list is the wider tag
      {"(ftp host)", "(http host)", 3, 3},
      {"(ftp host)", "(ftp other)", 3, 3},
      {"(tag a)", "(set a)", 3, 3},
      {"([h]ftp)", "(ftp)", 3, 3},
      {"(ftp [h]host)", "(ftp host)", 3, 3},
      {"(ftp a (*))", "(ftp (*) b)", 4, 4},
      {"(ftp a)", "(ftp (*) b)", 4, 4},
      {"(ftp (x) b)", "(ftp (x y))", 4, 4},
      {"x", "x", 0, 0},
      {"x", "(x)", 3, 3},
      {"(*)", "(*)", 0, 0},
      {"x", "(*)", 1, 2},
      {"(* set a)", "(*)", 1, 2},
      {"(* prefix a)", "(*)", 1, 2},
      {"a", "(* set a b)", 1, 2},
      {"c", "(* set a b)", 3, 3},
      {"(x y)", "(* set a (x))", 1, 2},
      {"(x)", "(* set (x y))", 3, 3},
      {"a", "(* set)", 3, 3},
      // Sets are never equal to, nor within, one another.
      {"(* set a b)", "(* set a b)", 4, 4},
      {"(* set a)", "(* set a b)", 4, 4},
      {"(* set a)", "(* set b)", 3, 3},
      {"(* set (*))", "(* set a)", 4, 3},
      {"(* set abc)", "(* set (* prefix ab))", 3, 4},
      {"(* set abc)", "(* prefix ab)", 4, 4},
      {"(* set (* prefix abc))", "(* prefix ab)", 4, 4},
      {"(* set ab)", "(* prefix abc)", 3, 3},
      {"(* set 7)", "(* range numeric (ge 5))", 4, 4},
      {"abc", "(* prefix ab)", 1, 2},
      {"a", "(* prefix ab)", 3, 3},
      {"[h]abc", "(* prefix ab)", 3, 3},
      {"[h]abc", "(* prefix [h]ab)", 1, 2},
      {"(abc)", "(* prefix ab)", 3, 3},
      {"(* prefix abc)", "(* prefix ab)", 1, 2},
      {"(* prefix ab)", "(* prefix ab)", 1, 1},  // the second test is not reached
      {"(* prefix ab)", "(* prefix ac)", 3, 3},
      {"ab", "(* prefix ab more)", 3, 3},
      {"ab", "(* prefix (ab))", 3, 3},
      {"(* prefix)", "(* prefix ab)", 3, 3},
      // Malformed star forms compare word by word.
      {"(* foo a)", "(* foo)", 1, 2},
      {"(* foo a)", "(* foo b)", 3, 3},
      {"(* foo a)", "(* set a)", 3, 3},
      {"(* [h]set a)", "a", 3, 3},
      {"([h]* set a)", "a", 3, 3},
      {"(* (set) a)", "a", 3, 3},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(c.forth, spki_cmp_elem(&engine_, Elem(c.a), Elem(c.b))) << c.a << " to " << c.b;
    EXPECT_EQ(c.back, spki_cmp_elem(&engine_, Elem(c.b), Elem(c.a))) << c.b << " to " << c.a;
  }
  spki_elem* set = Elem("(* set a)");
  EXPECT_EQ(SPKI_REL_EQUAL, spki_cmp_elem(&engine_, set, set)) << "the same record";
  EXPECT_EQ(SPKI_REL_DISJOINT, spki_cmp_elem(&engine_, set, nullptr));
  EXPECT_EQ(SPKI_REL_DISJOINT, spki_cmp_elem(&engine_, nullptr, set));
  // What follows a 0 byte is not seen.
  EXPECT_EQ(SPKI_REL_EQUAL,
            spki_cmp_elem(&engine_, Parse(std::string("(1:x6:read\0x)", 13))->next, Elem("read")));
}

TEST_F(Tags, Intersections) {
  const struct {
    const char* a;
    const char* b;
    const char* forth;
    const char* back;
  } cases[] = {
      {"(ftp host)", "(ftp)", "(ftp host)", "(ftp host)"},
      {"(ftp host)", "(http)", nullptr, nullptr},
      {"(*)", "(ftp host)", "(ftp host)", "(ftp host)"},
      {"(*)", "a", "a", "a"},
      {"(ftp a (*) c)", "(ftp (*) b)", "(ftp a b c)", "(ftp a b c)"},
      {"(ftp (x (*)) y)", "(ftp (x z))", "(ftp (x z) y)", "(ftp (x z) y)"},
      {"(ftp (x) b)", "(ftp (y) (*))", nullptr, nullptr},
      // Nothing in common below is nothing at all, and no empty list.
      {"(ftp (* set a) (*))", "(ftp (* set b) c)", nullptr, nullptr},
      {"(* set a b)", "a", "a", "a"},
      {"(* set a b)", "c", nullptr, nullptr},
      // The members come out in the reverse order of discovery, a single one alone.
      {"(* set a b c)", "(* set c b)", "(* set c b)", "(* set b c)"},
      {"(* set a b)", "(* set b c)", "b", "b"},
      {"(* set (x) (x y))", "(x (*))", "(* set (x y) (x (*)))", "(* set (x y) (x (*)))"},
      {"(* set abc)", "(* set (* prefix ab))", "abc", "abc"},
      {"(* set a a)", "(* set a (*))", "a", "a"},
      // Members that are sets are taken apart, and equal ones dropped.
      {"(* set a (* set b (* set c a)))", "(*)", "(* set a (* set b (* set c a)))",
       "(* set a (* set b (* set c a)))"},
      {"(* set (* set a b) c)", "(* set c (*))", "c", "(* set b a c)"},
      {"(* prefix ab)", "(* prefix abc)", "(* prefix abc)", "(* prefix abc)"},
      {"(* prefix ab)", "(* prefix ac)", nullptr, nullptr},
      {"(* prefix ab)", "(* set abc abd x)", "(* set abd abc)", "(* set abd abc)"},
      {"(* foo a)", "(* foo)", nullptr, nullptr},  // malformed forms have no intersection
      {"(ftp (* foo a))", "(ftp (* foo))", "(ftp (* foo a))", "(ftp (* foo a))"},
  };
  const auto expected = [](const char* text) {
    return text == nullptr ? "nothing" : Canonical("(* " + std::string(text) + ")");
  };
  // Wraps an element in a list, to be written.
  const auto result = [this](spki_elem* a, spki_elem* b) -> std::string {
    spki_elem* elem = spki_intersect_elem(&engine_, a, b);
    if (elem == nullptr) return "nothing";
    spki_elem* list = Keep(spki_elem_new(&engine_));
    list->kind = SPKI_ELEM_KEYWORD;
    list->value.keyword = SPKI_KW_STAR;
    list->next = elem;
    return Text(list);
  };
  for (const auto& c : cases) {
    EXPECT_EQ(expected(c.forth), result(Elem(c.a), Elem(c.b))) << c.a << " and " << c.b;
    EXPECT_EQ(expected(c.back), result(Elem(c.b), Elem(c.a))) << c.b << " and " << c.a;
  }
  EXPECT_EQ(nullptr, spki_intersect_set(&engine_, Elem("(x)"), Elem("(*)")));
  EXPECT_EQ(nullptr, spki_intersect_elem(&engine_, nullptr, Elem("(*)")));
}

// Inputs come back as they are, new lists without a reference.
TEST_F(Tags, ChainResultsAreBorrowedOrUncounted) {
  spki_elem* narrow = Chain("(tag (ftp host))");
  spki_elem* wide = Chain("(tag (ftp))");
  EXPECT_EQ(narrow, spki_intersect_chain(&engine_, narrow, wide));
  EXPECT_EQ(narrow, spki_intersect_chain(&engine_, wide, narrow));
  EXPECT_EQ(1u, narrow->refcount);
  EXPECT_EQ(nullptr, spki_intersect_chain(&engine_, narrow, Chain("(tag (http))")));

  // Two sets in one order have something in common and in the other nothing.
  spki_elem* word = Chain("(tag (* set abc))");
  spki_elem* beginning = Chain("(tag (* set (* prefix ab)))");
  EXPECT_EQ(nullptr, spki_intersect_chain(&engine_, word, beginning));
  spki_elem* common = nullptr;
  spki_elem_assign(&engine_, &common, spki_intersect_chain(&engine_, beginning, word));
  EXPECT_EQ(Canonical("(tag abc)"), Consume(common));

  spki_elem* made =
      spki_intersect_chain(&engine_, Chain("(tag (x a (*)))"), Chain("(tag (x (*) b))"));
  ASSERT_NE(nullptr, made);
  EXPECT_EQ(0u, made->refcount);
  EXPECT_EQ(nullptr, made->text);
  spki_elem* slot = nullptr;
  spki_elem_assign(&engine_, &slot, made);
  EXPECT_EQ(Canonical("(tag (x a b))"), Consume(slot));
}

TEST_F(Tags, GreaterAndLesser) {
  spki_elem* narrow = Elem("(ftp host)");
  spki_elem* wide = Elem("(ftp)");
  EXPECT_EQ(wide, spki_elem_max(&engine_, narrow, wide));
  EXPECT_EQ(wide, spki_elem_max(&engine_, wide, narrow));
  EXPECT_EQ(narrow, spki_elem_min(&engine_, narrow, wide));
  EXPECT_EQ(narrow, spki_elem_min(&engine_, wide, narrow));
  EXPECT_EQ(wide, spki_elem_max(&engine_, nullptr, wide));
  EXPECT_EQ(wide, spki_elem_min(&engine_, wide, nullptr));
}

std::string Words(const std::string& before, int count, const std::string& after) {
  std::string text = before;
  for (int i = 0; i < count; ++i) text += " " + std::to_string(i);
  return text + after;
}

TEST_F(Tags, TooManyMembersAreNoTag) {
  spki_elem* many = Elem(Words("(* set", Limits::kMaxSetMembers + 1, ")"));
  EXPECT_EQ(nullptr, spki_intersect_set(&engine_, many, Elem("(*)")));
  EXPECT_EQ(SPKI_ERR_NO_MEM, engine_.budget.spent);
}

TEST_F(Tags, TooManyComparisonsAreNoRelation) {
  spki_elem* list = Elem("(ftp)");
  spki_elem* same = Elem("(ftp)");
  engine_.budget.comparisons = Limits::kMaxComparisons - 2;
  EXPECT_EQ(SPKI_REL_EQUAL, spki_cmp_elem(&engine_, list, same)) << "one for the list, one inside";
  EXPECT_EQ(SPKI_REL_DISJOINT, spki_cmp_elem(&engine_, list, list));
  EXPECT_EQ(SPKI_ERR_NO_MEM, engine_.budget.spent);
  EXPECT_EQ(SPKI_REL_DISJOINT, spki_cmp_chain(&engine_, list, list)) << "and stays so";
  EXPECT_EQ(nullptr, spki_intersect_chain(&engine_, list, list));
  EXPECT_EQ(nullptr, spki_intersect_elem(&engine_, list, list));
}

TEST_F(Tags, LongListsAreIntersectedInALoop) {
  const spki_elem* made = spki_intersect_chain(&engine_, Chain(Words("(x a (*)", 3000, ")")),
                                               Chain(Words("(x (*) a", 3000, " more)")));
  ASSERT_NE(nullptr, made);
  spki_elem_release(&engine_, const_cast<spki_elem*>(made));
}

// Whatever allocation fails, the answer is nothing and is known to be a failure.
TEST_F(Tags, MissingMemoryAllowsNothing) {
  const std::string a = Canonical("(x (* set (* prefix ab) b (y (*) z)) (* range alpha (ge a)))");
  const std::string b = Canonical("(x (* set abc b (y z)) (* prefix \x01\xff))");
  int failures = 0;
  for (bool spent = true; spent; ++failures) {
    FailingEngine failing;
    spki_elem* lists[2] = {};
    ASSERT_EQ(0, ParseBytes(&failing.engine, a, &lists[0]));
    ASSERT_EQ(0, ParseBytes(&failing.engine, b, &lists[1]));
    failing.allocator.fail_after = failures;
    const spki_elem* made = spki_intersect_elem(&failing.engine, lists[1]->next, lists[0]->next);
    spent = failing.engine.budget.spent != 0;
    EXPECT_EQ(spent, made == nullptr) << failures;
  }
  EXPECT_GT(failures, 5);
}

}  // namespace
}  // namespace ZvVesk2::Engine
