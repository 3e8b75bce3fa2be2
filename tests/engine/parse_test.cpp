// SPDX-License-Identifier: Apache-2.0
// The canonical parser and writer.
#include "tests/engine/engine_fixture.h"

namespace ZvVesk2::Engine {
namespace {

using Parsing = EngineTest;

std::string Nested(size_t levels) {
  std::string text;
  for (size_t i = 0; i < levels; ++i) text += "(1:x";
  return text + std::string(levels, ')');
}

TEST_F(Parsing, MalformedListsHaveTheirCodes) {
  const struct {
    int code;
    std::vector<std::string> texts;
  } cases[] = {
      {SPKI_ERR_BAD_SEXP_START, {"", "3:abc"}},
      {SPKI_ERR_BAD_LTH_FORMAT,
       {"(", "()", "((1:x))", "(0:)", "(03:abc)", "([0:]3:acl)", "([4:text]x)"}},
      {SPKI_ERR_COLON_EXPECTED, {"(3", "(3abc)", "(3 :abc)", "(3a:" + std::string(80, 'x') + ")"}},
      {SPKI_ERR_SEXP_NOT_CLOSED, {"(3:abc", "(3:abc(1:x)"}},
      {SPKI_ERR_BAD_SEXP_FORMAT, {"(3:abc x)", "(3:abc 1:x)", "(3:abc0:)", "(3:abcx)"}},
      {SPKI_ERR_STRING_TOO_LONG, {"(4:abc", "(2147483649:abc)"}},
      {SPKI_ERR_LTH_TOO_BIG, {"(2147483650:abc)", "(99999999999999999999:abc)"}},
      {SPKI_ERR_DISP_HINT_NOT_CLOSED, {"([4:text)3:acl)"}},
      // At the end of the input that replaces the missing "]".
      {SPKI_ERR_DISP_HINT_TOO_LONG,
       {"([4:text]", "([4:text)", "([4:text", "([2147483649:text]3:acl)"}},
      {SPKI_ERR_BAD_SEXP, {Nested(Limits::kMaxDepth + 1), Nested(100'000)}},
  };
  for (const auto& c : cases) {
    for (const std::string& text : c.texts) {
      spki_elem* list = Chain("(x)");
      EXPECT_EQ(c.code, TryParse(text, &list)) << text.substr(0, 60);
      EXPECT_EQ(nullptr, list) << text.substr(0, 60);
    }
  }
  const std::string text = "(3:acl[4:text]5:entry(7:subject(10:public-key12:abcdefghijkl))2:nb)";
  EXPECT_EQ(text, Text(Parse(text)));
  for (size_t length = 0; length < text.size(); ++length) {
    spki_elem* list = nullptr;
    EXPECT_NE(0, TryParse(text.substr(0, length), &list)) << length;
  }
}

TEST_F(Parsing, NothingIsReadWithoutAPlaceForIt) {
  const auto* text = reinterpret_cast<const unsigned char*>("3:abc");
  spki_input input = {text, text, text + 5};
  uint32_t length = 7;
  EXPECT_EQ(SPKI_ERR_NULL_PARAM, spki_parse_length(nullptr, &input));
  EXPECT_EQ(SPKI_ERR_NULL_PARAM, spki_parse_length(&length, nullptr));
  EXPECT_EQ(SPKI_ERR_NULL_PARAM, spki_parse_atom(&engine_, nullptr, &input));
  EXPECT_EQ(7u, length);
  EXPECT_EQ(text, input.position);
}

TEST_F(Parsing, KindsAndExtents) {
  const spki_elem* list = Parse("(1:a2:bc(3:foo)[1:h]3:acl)trailing");
  EXPECT_EQ(SPKI_ELEM_KEYWORD, list->kind);
  EXPECT_EQ(2, list->value.keyword);
  EXPECT_EQ(26u, list->text_length);
  const spki_elem* nested = list->next->next;
  EXPECT_EQ(SPKI_ELEM_HEAD, nested->value.list->kind);
  EXPECT_EQ(list->text + 8, nested->value.list->text);
  EXPECT_EQ(7u, nested->value.list->text_length);
  EXPECT_EQ(-1, nested->next->value.atom->keyword) << "a hinted word is no keyword";
  EXPECT_EQ(SPKI_ELEM_HEAD, Chain("([text]acl)")->kind);
  EXPECT_EQ(3, Atom("acl")->keyword);

  spki_elem* made = nullptr;
  ASSERT_EQ(0, spki_parse_template(&engine_, &made, "(1:*(3:set))"));
  EXPECT_EQ(nullptr, Keep(made)->text);
  EXPECT_EQ(nullptr, made->next->value.list->text);
}

TEST_F(Parsing, WritingGoesBackToTheBytes) {
  const std::string texts[] = {"(3:acl(5:entry[4:text]3:foo))", "(4:hash6:sha2561:x)",
                               "(10:abcdefghij)", Nested(Limits::kMaxDepth)};
  for (const std::string& text : texts) EXPECT_EQ(text, Text(Parse(text)));
  EXPECT_EQ("(3:???1:x)", Text(Parse("(6:sha2561:x)"))) << "it has a number and no name";
  std::string flat = "(1:x";
  for (int i = 0; i < 1'000'000; ++i) flat += "1:y";
  Parse(flat + ")");  // released at the end without deep recursion
}

// Whichever piece cannot be written, the writer says so.
TEST_F(Parsing, WritingEndsWithTheFirstRefusal) {
  struct RefusingSink final : spki_sink {
    int pieces = 0;
    int refused = -1;
    spki_status Put(const void*, size_t) override {
      return pieces++ == refused ? SPKI_ERR_NO_MEM : 0;
    }
  };
  const spki_elem* list = Chain("(acl (entry [text]foo) x)");
  RefusingSink all;
  ASSERT_EQ(0, spki_write_pieces(list, &all));
  for (int i = 0; i < all.pieces; ++i) {
    RefusingSink sink;
    sink.refused = i;
    EXPECT_EQ(SPKI_ERR_NO_MEM, spki_write_pieces(list, &sink)) << i;
    EXPECT_EQ(i + 1, sink.pieces);
  }
}

}  // namespace
}  // namespace ZvVesk2::Engine
