// SPDX-License-Identifier: Apache-2.0
// Tags: how they relate and what two of them leave; ranges, their values and members.
#include <sstream>

#include "src/engine/tag_forms.h"
#include "tests/engine/engine_fixture.h"

namespace ZvVesk2::Engine {
namespace {

std::vector<std::string> Split(const std::string& text, char separator) {
  std::vector<std::string> parts;
  std::istringstream stream(text);
  for (std::string part; std::getline(stream, part, separator);) parts.push_back(part);
  return parts;
}

class Tags : public EngineTest {
 protected:
  int Relation(spki_elem* a, spki_elem* b) { return spki_cmp_elem(&engine_, a, b); }

  // What `a` is to `b`, and what both allow.
  void Check(const std::string& a, const std::string& b, int relation, const std::string& both) {
    SCOPED_TRACE(a + " and " + b);
    EXPECT_EQ(relation, Relation(Elem(a), Elem(b)));
    spki_elem* made = Keep(spki_intersect_elem(&engine_, Elem(a), Elem(b)));
    const bool nothing = both.find("nothing") != both.npos;
    ASSERT_EQ(nothing, made == nullptr);
    if (nothing) return;
    EXPECT_EQ("(" + Canonical(both) + ")", Text(made));
    EXPECT_EQ(Relation(Elem(both), Elem(both)), Relation(made, Elem(both))) << "by its keywords";
  }
};

// The relation of a to b and of b to a; then a | b | what both allow | and the other way round.
// That is `a` when it is the narrower one and nothing when the relation is 3, unless given.
TEST_F(Tags, RelationsAndIntersections) {
  const struct {
    int forth, back;
    const char* rows;
  } cases[] = {
      {0, 0, "(ftp) | (ftp); x | x; (*) | (*); (* range numeric) | (* range numeric)"},
      // The shorter list is the wider tag.
      {1, 2,
       "(ftp host) | (ftp); x | (*); (ftp host) | (*); (* set a) | (*); (* prefix a) | (*);"
       "a | (* set a b); (x y) | (* set a (x)); abc | (* prefix ab); [h]abc | (* prefix [h]ab);"
       "(* prefix abc) | (* prefix ab)"},
      {3, 3,
       "(ftp host) | (http host); (ftp host) | (ftp other); (tag a) | (set a); ([h]ftp) | (ftp);"
       "(ftp [h]host) | (ftp host); x | (x); c | (* set a b); a | (* set);"
       "a | (* prefix ab); [h]abc | (* prefix ab); (abc) | (* prefix ab); ab | (* prefix ab more);"
       "ab | (* prefix (ab)); (* prefix) | (* prefix ab); (* prefix ab) | (* prefix ac);"
       "(* set a) | (* set b); (* set ab) | (* prefix abc)"},
      // Nothing in common below is nothing at all, and no empty list.
      {3, 3, "(x (y) b) | (x (z) (*)); (x) | (* set (x y)) | (x y)"},
      {4, 4,
       "(ftp a (*) c) | (ftp (*) b) | (ftp a b c); (ftp a) | (ftp (*) b) | (ftp a b);"
       "(x (y (*)) z) | (x (y a)) | (x (y a) z)"},
      // Equal prefixes, and equal bounds, count as narrower.
      {1, 1, "(* prefix ab) | (* prefix ab); (* range numeric (ge 5)) | (* range numeric (ge 5))"},
      // Sets are never equal to, nor within, one another. Their members come out in the reverse
      // order of discovery, a single one alone; members that are sets are taken apart.
      {4, 4,
       "(* set a b) | (* set a b) | (* set b a); (* set a) | (* set a b) | a;"
       "(* set a b c) | (* set c b) | (* set c b) | (* set b c); (* set a a) | (* set a (*)) | a;"
       "(* set abc) | (* prefix ab) | abc; (* set 7) | (* range numeric (ge 5)) | 7;"
       "(* set abc abd x) | (* prefix ab) | (* set abd abc);"
       "(* set (* set a b) c) | (* set c (*)) | c | (* set b a c)"},
      {4, 3, "(* set (*)) | (* set a) | a; (* set (* prefix ab)) | (* set abc) | abc"},
      {2, 1, "(* set (x) (x y)) | (x (*)) | (* set (x y) (x (*)))"},
      // Malformed star forms compare word by word, and alone have no intersection.
      {1, 2, "(* foo a) | (* foo) | nothing; (ftp (* foo a)) | (ftp (* foo))"},
      {3, 3,
       "(* foo a) | (* foo b); (* foo a) | (* set a); (* [h]set a) | a; ([h]* set a) | a;"
       "(* (set) a) | a"},
      // A single point is an overlap, not a narrower range.
      {4, 4,
       "(* range alpha (ge 5) (le 5)) | (* range alpha (ge 1)) | (* range alpha (ge 5) (le 5));"
       "(* range numeric (ge 5)) | (* range numeric (le 9)) | (* range numeric (ge 5) (le 9));"
       "(* range time (ge 01) (ge 02)) | (* range time (l 04) (l 03)) | (* range time (ge 02) (l "
       "03));"
       "(* prefix ab) | (* range alpha (ge abc)) | (* range alpha (ge abc) (l ac))"},
      {1, 2,
       "(* range numeric (ge 1) (le 3)) | (* range numeric (le 5 x));"
       "(* range numeric (g 5)) | (* range numeric (ge 5)); (* range date (ge 2010)) | (* range "
       "date);"
       "(* range binary (l 5)) | (* range binary (le 5)); (* range alpha (ge b)) | (* range alpha "
       "(ge a));"
       "(* prefix ab) | (* range alpha (ge a)) | (* range alpha (ge ab) (l ac));"
       "(* range alpha (ge ab) (le ac)) | (* prefix a);"
       "(* prefix [h]ab) | (* range alpha) | (* range alpha (ge [h]ab) (l [h]ac));"
       // The last byte below 255 makes the upper bound; 255s alone have none.
       "(* prefix a\xff\xff) | (* range alpha) | (* range alpha (ge a\xff\xff) (l b));"
       "(* prefix \xff\xff) | (* range alpha) | (* range alpha (ge \xff\xff))"},
      {3, 3,
       "(* range numeric (g 5) (le 5)) | (* range numeric); (* range) | (* range numeric);"
       "(* range date (ge 2010-03-15)) | (* range date); (* range date) | (* range numeric);"
       "(* range foo) | (* range foo); (* range foo) | (* range numeric (ge 5) (le 9));"
       "(* range numeric (ge 9)) | (* range numeric (le 5)); (* prefix 1 2) | (* range alpha);"
       "(* range alpha (ge a)) | (* range numeric (ge 1)); (* prefix 1) | (* range numeric);"
       "(* range alpha (ge a) x) | (* range alpha); (* range alpha (name 5)) | (* range alpha);"
       "(* prefix ab) | (* range alpha (ge b)); (* range alpha (ge [h]a)) | (* range alpha (ge "
       "a))"},
  };
  for (const auto& c : cases) {
    for (const std::string& row : Split(c.rows, ';')) {
      std::vector<std::string> column = Split(row, '|');
      if (column.size() == 2) column.push_back(c.forth < 2 ? column[0] : "nothing");
      Check(column[0], column[1], c.forth, column[2]);
      Check(column[1], column[0], c.back, column.back());
    }
  }
  spki_elem* set = Elem("(* set a)");
  EXPECT_EQ(SPKI_REL_EQUAL, Relation(set, set)) << "the same record";
  EXPECT_EQ(SPKI_REL_DISJOINT, Relation(set, nullptr));
  EXPECT_EQ(nullptr, spki_intersect_set(&engine_, Elem("(x)"), Elem("(*)")));
  EXPECT_EQ(nullptr, spki_intersect_elem(&engine_, nullptr, set));
}

// What the value of an element holds goes by its kind, whatever would fit the bits.
TEST_F(Tags, NoKeywordIsReadOutOfAnotherKind) {
  const spki_elem* set = Elem("(* set a)");
  spki_elem* word = set->value.list->next;
  word->kind = SPKI_ELEM_LIST;
  EXPECT_EQ(SPKI_TAG_LIST, spki_classify(set));
  word->kind = SPKI_ELEM_STRING;
  EXPECT_EQ(SPKI_TAG_SET, spki_classify(set));
  EXPECT_EQ(SPKI_TAG_NONE, spki_classify(nullptr));
  const spki_elem* bound = Elem("(ge 5)");
  bound->value.list->kind = SPKI_ELEM_HEAD;
  EXPECT_EQ(nullptr, spki_read_bound(bound).value);
  bound->value.list->kind = SPKI_ELEM_KEYWORD;
  EXPECT_EQ(SPKI_KW_GE, spki_read_bound(bound).op);
}

// Inputs come back as they are, new lists without a reference.
TEST_F(Tags, ChainResultsAreBorrowedOrUncounted) {
  spki_elem* narrow = Elem("(ftp host)");
  spki_elem* wide = Elem("(ftp)");
  EXPECT_EQ(narrow, spki_intersect_chain(&engine_, narrow, wide));
  EXPECT_EQ(narrow, spki_intersect_chain(&engine_, wide, narrow));
  EXPECT_EQ(1u, narrow->refcount);
  EXPECT_EQ(wide, spki_elem_max(&engine_, narrow, wide));
  EXPECT_EQ(narrow, spki_elem_min(&engine_, wide, narrow));
  // Two sets in one order have something in common and in the other nothing.
  spki_elem* word = Elem("(* set abc)");
  EXPECT_EQ(nullptr, spki_intersect_chain(&engine_, word, Elem("(* set (* prefix ab))")));

  spki_elem* made = spki_intersect_chain(&engine_, Chain("(x a (*))"), Chain("(x (*) b)"));
  ASSERT_NE(nullptr, made);
  EXPECT_EQ(0u, made->refcount);
  spki_elem* slot = nullptr;
  spki_elem_assign(&engine_, &slot, made);
  EXPECT_EQ(Canonical("(x a b)"), Consume(slot));
}

TEST_F(Tags, LongListsAndTooManyMembers) {
  std::string words;
  for (uint32_t i = 0; i <= Limits::kMaxSetMembers; ++i) words += " " + std::to_string(i);
  spki_elem* a = Chain("(x a (*)" + words + ")");
  spki_elem* b = Chain("(x (*) a" + words + " more)");
  EXPECT_NE(nullptr, Keep(spki_intersect_chain(&engine_, a, b)));
  EXPECT_EQ(nullptr, spki_intersect_set(&engine_, Elem("(* set" + words + ")"), Elem("(*)")));
  EXPECT_EQ(SPKI_ERR_NO_MEM, engine_.budget.spent);
}

TEST_F(Tags, TooManyComparisonsAreNoRelation) {
  engine_.budget.comparisons = Limits::kMaxComparisons - 3;  // enough for the first member
  spki_elem* set = Elem("(* set a b)");
  EXPECT_EQ(nullptr, spki_intersect_set(&engine_, set, Elem("(* set a b)")));
  engine_.budget.spent = 0;
  spki_elem* list = Elem("(ftp)");
  const spki_atom* word = Atom("x");
  engine_.budget.comparisons = Limits::kMaxComparisons - 2;
  EXPECT_EQ(SPKI_REL_EQUAL, Relation(list, Elem("(ftp)"))) << "one for the list, one inside";
  EXPECT_EQ(SPKI_REL_DISJOINT, Relation(list, list));
  EXPECT_EQ(SPKI_ERR_NO_MEM, engine_.budget.spent);
  EXPECT_EQ(nullptr, spki_intersect_chain(&engine_, list, list)) << "and stays so";
  // Nothing is equal then, and no value is one of a range.
  EXPECT_FALSE(spki_atom_equal(&engine_, word, word));
  EXPECT_FALSE(spki_valid_value(&engine_, word, SPKI_KW_ALPHA));
  EXPECT_EQ(SPKI_ORDER_NONE, spki_cmp_ordered(&engine_, word, word, SPKI_KW_ALPHA));
}

TEST_F(Tags, OrderOfValues) {
  const struct {
    int32_t ordering;
    int order;
    const char* pairs;
  } cases[] = {
      {SPKI_KW_ALPHA, 1, "10 9, [h]a [h]b"},
      {SPKI_KW_ALPHA, 3, "[h]a a, [h]a [i]a"},
      {SPKI_KW_TIME, 1, "12 12:00"},
      {SPKI_KW_DATE, 2, "2010-02 2010-01-31"},
      {SPKI_KW_BINARY, 1, "b aa"},
      {SPKI_KW_NUMERIC, 0, "+5 5, + 0"},
      {SPKI_KW_NUMERIC, 1, "9 10, -10 -9, -10 3, -0 0, - 0"},  // minus zero by its sign
      {SPKI_KW_NUMERIC, 3, "[h]1 1"},
      {SPKI_KW_SET, 3, "a a"},
      {-1, 3, "a a"},
  };
  const int mirrored[] = {0, 2, 1, 3};
  for (const auto& c : cases) {
    for (const std::string& pair : Split(c.pairs, ',')) {
      const spki_atom* a = Elem(pair)->value.atom;
      const spki_atom* b = Elem(pair)->next->value.atom;
      EXPECT_EQ(c.order, spki_cmp_ordered(&engine_, a, b, c.ordering)) << pair;
      EXPECT_EQ(mirrored[c.order], spki_cmp_ordered(&engine_, b, a, c.ordering)) << pair;
    }
  }
  const spki_atom* padded = Atom(Raw({"\0\0a", 3}));
  EXPECT_EQ(0, spki_cmp_ordered(&engine_, padded, Atom("a"), SPKI_KW_BINARY))
      << "leading zero bytes";
}

// A lone sign is a number, no day of March is a date.
TEST_F(Tags, MembersOfRanges) {
  const struct {
    const char *range, *in, *out;
  } cases[] = {
      {"(*)", "x", "(x)"},
      {"(* range numeric (ge 5) (l 9))", "5 8 +6", "4 9 007 a [h]6 (6)"},
      {"(* range numeric (g 5) (le 9))", "6 9", "5 10"},
      {"(* range numeric (ge -))", "-0 0", "-1"},
      {"(* range numeric)", "0 7 +5 -5 -0 + - 100 12345678901234567890",
       "007 -07 00 1a a --1 1- 1.5 [h]1"},
      {"(* range time)", "00 23 23:59 23:59:59 00:00:00",
       "24 2 23:6 23:60 23:59:60 23:59:5 23-59 23:59:59: 23: [h]23"},
      {"(* range date)",
       "2010 0000 2010-01 2010-12 2010-03 2010-01-31 2010-04-30 2012-02-29 2000-02-29 "
       "2010-12-31_23 2010-12-31_23:59 2010-12-31_23:59:59",
       "2010-03-15 2010-03-01_12 2012-03-31_12:30:00 2010-00 2010-13 2010-00-15 2010-13-15 "
       "2010-01-00 2010-01-32 2010-04-31 2010-02-29 1900-02-29 2012-02-30 2010-12-31_24 "
       "2010-12-31_23:60 2010-12-31_23:59:60 2010-12-31_23:59:590 201 2010- 2010-1 "
       "2010-12-31T23 2010/12 [h]2010"},
      {"(* range alpha)", "x [h]x", ""},
      {"(* range binary)", "x [h]x", ""},
      {"(* range alpha (ge [h]b))", "[h]c", "c [h]a"},
      {"(* range binary (le b))", "a", "aa"},
      {"(* range date (ge 2010))", "2010-01-15", "2009 2010-03-15"},
      {"(* range date (ge 2010-03-15))", "", "2010-04-15"},
      {"(* range time (l 12))", "11:59", "12:00 24"},
      {"(* range numeric (le 5 x))", "", "2"},  // of a range it takes the 5: see the relations
  };
  for (const auto& c : cases) {
    for (const bool in : {true, false}) {
      for (const std::string& word : Split(in ? c.in : c.out, ' ')) {
        EXPECT_EQ(in, spki_in_range(&engine_, Elem(word), Elem(c.range)))
            << word << " in " << c.range;
      }
    }
  }
  const char* empty =
      "(* range);(* range foo (ge a));(* range (alpha));(* range alpha ge a);(* set x);"
      "(* range alpha (ge a b));(* range alpha (ge));(* range alpha (ge (a)));(* range alpha (name "
      "a))";
  for (const std::string& range : Split(empty, ';')) {
    EXPECT_FALSE(spki_in_range(&engine_, Elem("x"), Elem(range))) << range;
  }
}

}  // namespace
}  // namespace ZvVesk2::Engine
