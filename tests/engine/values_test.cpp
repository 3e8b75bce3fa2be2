// Values of ranges: syntax and order, with the rules that stored ranges rely on.
#include "src/engine/tag_forms.h"
#include "tests/engine/engine_fixture.h"

namespace ZvVesk2::Engine {
namespace {

class Values : public EngineTest {
 protected:
  spki_atom* Atom(const std::string& text) { return Elem(text)->value.atom; }
};

TEST_F(Values, Syntax) {
  const struct {
    int32_t ordering;
    std::vector<std::string> valid;
    std::vector<std::string> invalid;
  } cases[] = {
      // A lone sign is a number.
      {SPKI_KW_NUMERIC,
       {"0", "7", "+5", "-5", "-0", "+", "-", "100", "12345678901234567890"},
       {"007", "-07", "00", "1a", "a", "--1", "1-", "1.5", "[h]1"}},
      {SPKI_KW_TIME,
       {"00", "23", "23:59", "23:59:59", "00:00:00"},
       {"24", "2", "23:6", "23:60", "23:59:60", "23:59:5", "23-59", "23:59:59:", "23:", "[h]23"}},
      {SPKI_KW_DATE,
       {"2010", "0000", "2010-01", "2010-12", "2010-03", "2010-01-31", "2010-04-30", "2012-02-29",
        "2000-02-29", "2010-12-31_23", "2010-12-31_23:59", "2010-12-31_23:59:59"},
       // No day of March is a date.
       {"2010-03-15",
        "2010-03-01_12",
        "2012-03-31_12:30:00",
        "2010-00",
        "2010-13",
        "2010-00-15",
        "2010-13-15",
        "2010-01-00",
        "2010-01-32",
        "2010-04-31",
        "2010-02-29",
        "1900-02-29",
        "2012-02-30",
        "2010-12-31_24",
        "2010-12-31_23:60",
        "2010-12-31_23:59:60",
        "2010-12-31_23:59:590",
        "201",
        "2010-",
        "2010-1",
        "2010-12-31T23",
        "2010/12",
        "[h]2010"}},
      {SPKI_KW_ALPHA, {"", "x", "[h]x"}, {}},
      {SPKI_KW_BINARY, {"x", "[h]x"}, {}},
      {SPKI_KW_SET, {}, {"x"}},
      {-1, {}, {"x"}},
  };
  for (const auto& c : cases) {
    for (const std::string& text : c.valid) {
      if (text.empty()) continue;
      EXPECT_TRUE(spki_valid_value(Atom(text), c.ordering)) << text;
    }
    for (const std::string& text : c.invalid) {
      EXPECT_FALSE(spki_valid_value(Atom(text), c.ordering)) << text;
    }
  }
  const std::pair<int, bool> years[] = {{2000, true}, {1900, false}, {2012, true}, {2011, false}};
  for (const auto& [year, leap] : years) EXPECT_EQ(leap, spki_is_leap_year(year)) << year;
}

TEST_F(Values, Order) {
  const struct {
    int32_t ordering;
    std::string a, b;
    int order;
  } cases[] = {
      {SPKI_KW_ALPHA, "10", "9", 1},
      {SPKI_KW_ALPHA, "[h]a", "[h]b", 1},
      {SPKI_KW_ALPHA, "[h]a", "a", 3},
      {SPKI_KW_ALPHA, "[h]a", "[i]a", 3},
      {SPKI_KW_DATE, "2010-02", "2010-01-31", 2},
      {SPKI_KW_TIME, "12", "12:00", 1},
      {SPKI_KW_BINARY, "b", "aa", 1},
      {SPKI_KW_BINARY, "[h]b", "b", 3},
      {SPKI_KW_NUMERIC, "9", "10", 1},
      {SPKI_KW_NUMERIC, "+5", "5", 0},
      {SPKI_KW_NUMERIC, "-9", "-10", 2},
      {SPKI_KW_NUMERIC, "-10", "3", 1},
      {SPKI_KW_NUMERIC, "-0", "0", 1},  // by the sign
      {SPKI_KW_NUMERIC, "-", "0", 1},
      {SPKI_KW_NUMERIC, "+", "0", 0},
      {SPKI_KW_NUMERIC, "[h]1", "1", 3},
      {SPKI_KW_SET, "a", "a", 3},
      {-1, "a", "a", 3},
  };
  const int mirrored[] = {0, 2, 1, 3};
  for (const auto& c : cases) {
    EXPECT_EQ(c.order, spki_cmp_ordered(Atom(c.a), Atom(c.b), c.ordering)) << c.a << " " << c.b;
    EXPECT_EQ(mirrored[c.order], spki_cmp_ordered(Atom(c.b), Atom(c.a), c.ordering))
        << c.a << " " << c.b;
  }
  const spki_atom* padded = Parse(std::string("(1:x3:\0\0a)", 10))->next->value.atom;
  EXPECT_EQ(0, spki_cmp_ordered(padded, Atom("a"), SPKI_KW_BINARY)) << "leading zero bytes";
  EXPECT_EQ(3, spki_cmp_ordered(nullptr, padded, SPKI_KW_ALPHA));
}

}  // namespace
}  // namespace ZvVesk2::Engine
