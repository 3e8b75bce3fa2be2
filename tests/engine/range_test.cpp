// Ranges: membership, relation and what two of them leave.
#include "tests/engine/engine_fixture.h"

namespace ZvVesk2::Engine {
namespace {

using Ranges = EngineTest;

TEST_F(Ranges, Membership) {
  const struct {
    const char* range;
    std::vector<std::string> in;
    std::vector<std::string> out;
  } cases[] = {
      {"(*)", {"x"}, {"(x)"}},
      {"(* range numeric (ge 5) (l 9))", {"5", "8", "+6"}, {"4", "9", "007", "a", "[h]6", "(6)"}},
      {"(* range numeric (g 5) (le 9))", {"6", "9"}, {"5", "10"}},
      {"(* range numeric (ge -))", {"-0", "0"}, {"-1"}},
      {"(* range alpha)", {"x", "[h]x"}, {}},
      {"(* range alpha (ge [h]b))", {"[h]c"}, {"c", "[h]a"}},
      {"(* range binary (le b))", {"a"}, {"aa"}},
      {"(* range date (ge 2010))", {"2010-01-15"}, {"2009", "2010-03-15"}},
      {"(* range date (ge 2010-03-15))", {}, {"2010-04-15"}},  // no day of March is a date
      {"(* range time (l 12))", {"11:59"}, {"12:00", "24"}},
      {"(* range)", {}, {"x"}},
      {"(* range foo (ge a))", {}, {"x"}},
      {"(* range (alpha))", {}, {"x"}},
      {"(* range alpha ge a)", {}, {"x"}},
      {"(* range alpha (ge a b))", {}, {"x"}},
      {"(* range alpha (ge))", {}, {"x"}},
      {"(* range alpha (ge (a)))", {}, {"x"}},
      {"(* range alpha (name a))", {}, {"x"}},
      {"(* set x)", {}, {"x"}},
  };
  for (const auto& c : cases) {
    for (const auto& text : c.in) {
      EXPECT_TRUE(spki_in_range(Elem(text), Elem(c.range))) << text << " in " << c.range;
    }
    for (const auto& text : c.out) {
      EXPECT_FALSE(spki_in_range(Elem(text), Elem(c.range))) << text << " in " << c.range;
    }
  }
}

// a, b, cmp(a, b), cmp(b, a), what both leave (in either order, but for the order of `back`).
TEST_F(Ranges, RelationsAndIntersections) {
  const struct {
    const char* a;
    const char* b;
    int forth, back;
    const char* left;
  } cases[] = {
      {"(* range numeric (ge 5))", "(* range numeric (le 9))", 4, 4,
       "(* range numeric (ge 5) (le 9))"},
      {"(* range numeric (ge 5))", "(* range numeric (ge 1))", 1, 2, "(* range numeric (ge 5))"},
      {"(* range numeric (g 5))", "(* range numeric (ge 5))", 1, 2, "(* range numeric (g 5))"},
      {"(* range numeric (l 5))", "(* range numeric (le 5))", 1, 2, "(* range numeric (l 5))"},
      {"(* range numeric (ge 5) (ge 7))", "(* range numeric (le 9) (le 8))", 4, 4,
       "(* range numeric (ge 7) (le 8))"},
      {"(* range numeric (g 5))", "(* range numeric (g 5))", 1, 1, "(* range numeric (g 5))"},
      {"(* range numeric (ge 5))", "(* range numeric (ge 5))", 1, 1, "(* range numeric (ge 5))"},
      // A single point is an overlap, not a narrower range.
      {"(* range numeric (ge 5) (le 5))", "(* range numeric (ge 1))", 4, 4,
       "(* range numeric (ge 5) (le 5))"},
      {"(* range numeric (g 5) (le 5))", "(* range numeric)", 3, 3, nullptr},
      {"(* range numeric (ge 9))", "(* range numeric (le 5))", 3, 3, nullptr},
      {"(* range numeric)", "(* range numeric)", 0, 0, "(* range numeric)"},
      {"(* range numeric)", "(* range numeric (ge 5))", 2, 1, "(* range numeric (ge 5))"},
      {"(* range alpha (ge a))", "(* range numeric (ge 1))", 3, 3, nullptr},
      {"(* range date)", "(* range numeric)", 3, 3, nullptr},
      {"(* range)", "(* range numeric)", 3, 3, nullptr},
      {"(* range foo)", "(* range foo)", 3, 3, nullptr},
      {"(* range foo)", "(* range numeric)", 3, 3, nullptr},
      {"(* range date (ge 2010-03-15))", "(* range date)", 3, 3, nullptr},
      {"(* range numeric (ge 5) (le 5) (name 5))", "(* range numeric)", 3, 3, nullptr},
      {"(* range numeric (ge 5) x)", "(* range numeric)", 3, 3, nullptr},
      {"(* range alpha (ge [h]a))", "(* range alpha (ge a))", 3, 3, nullptr},
      // Prefixes.
      {"(* prefix ab)", "(* range alpha (ge a))", 1, 2, "(* range alpha (ge ab) (l ac))"},
      {"(* prefix a)", "(* range alpha (ge ab) (le ac))", 2, 1, "(* range alpha (ge ab) (le ac))"},
      {"(* prefix ab)", "(* range alpha (ge abc))", 4, 4, "(* range alpha (ge abc) (l ac))"},
      {"(* prefix ab)", "(* range alpha (ge b))", 3, 3, nullptr},
      {"(* prefix ab)", "(* range alpha)", 1, 2, "(* range alpha (ge ab) (l ac))"},
      {"(* prefix [h]ab)", "(* range alpha)", 1, 2, "(* range alpha (ge [h]ab) (l [h]ac))"},
      {"(* prefix 1)", "(* range numeric)", 3, 3, nullptr},
      {"(* prefix 1 2)", "(* range alpha)", 3, 3, nullptr},
      // The last byte below 255 makes the upper bound; 255s alone have none.
      {"(* prefix a\xff\xff)", "(* range alpha)", 1, 2, "(* range alpha (ge a\xff\xff) (l b))"},
      {"(* prefix \xff\xff)", "(* range alpha)", 1, 2, "(* range alpha (ge \xff\xff))"},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(c.forth, spki_cmp_elem(&engine_, Elem(c.a), Elem(c.b))) << c.a << " to " << c.b;
    EXPECT_EQ(c.back, spki_cmp_elem(&engine_, Elem(c.b), Elem(c.a))) << c.b << " to " << c.a;
    for (const auto& [a, b] : {std::pair(c.a, c.b), std::pair(c.b, c.a)}) {
      spki_elem* left = spki_intersect_elem(&engine_, Elem(a), Elem(b));
      if (c.left == nullptr) {
        EXPECT_EQ(nullptr, left) << a << " and " << b;
        continue;
      }
      ASSERT_NE(nullptr, left) << a << " and " << b;
      EXPECT_EQ(Canonical(c.left), Text(Keep(left)->value.list)) << a << " and " << b;
      EXPECT_EQ(spki_classify(left), SPKI_TAG_RANGE) << "the ordering is known by its word";
    }
  }
}

TEST_F(Ranges, InvalidBoundsStayInvalid) {
  spki_atom* five = Elem("5")->value.atom;
  spki_range_bounds bounds;
  spki_range_add_bound(&engine_, &bounds, five, SPKI_KW_GE, SPKI_KW_NUMERIC, 1);
  EXPECT_EQ(SPKI_REL_NARROWER, spki_range_relation(&bounds));
  spki_range_add_bound(&engine_, &bounds, five, SPKI_KW_GE, SPKI_KW_ALPHA, 2);
  EXPECT_EQ(SPKI_REL_DISJOINT, spki_range_relation(&bounds));
  spki_range_add_bound(&engine_, &bounds, five, SPKI_KW_GE, SPKI_KW_NUMERIC, 1);
  spki_range_add_bound(&engine_, &bounds, five, SPKI_KW_LE, SPKI_KW_NUMERIC, 2);
  EXPECT_EQ(SPKI_REL_DISJOINT, spki_range_relation(&bounds));
  EXPECT_EQ(nullptr, spki_range_build(&engine_, &bounds));
}

}  // namespace
}  // namespace ZvVesk2::Engine
