// The canonical parser and writer.
#include "src/engine/digest.h"
#include "src/platform/text.h"
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
  const std::pair<std::string, int> cases[] = {
      {"", SPKI_ERR_BAD_SEXP_START},
      {"3:abc", SPKI_ERR_BAD_SEXP_START},
      {"(", SPKI_ERR_BAD_LTH_FORMAT},
      {"()", SPKI_ERR_BAD_LTH_FORMAT},
      {"((1:x))", SPKI_ERR_BAD_LTH_FORMAT},
      {"(0:)", SPKI_ERR_BAD_LTH_FORMAT},
      {"(03:abc)", SPKI_ERR_BAD_LTH_FORMAT},
      {"(3", SPKI_ERR_COLON_EXPECTED},
      {"(3abc)", SPKI_ERR_COLON_EXPECTED},
      {"(3:abc", SPKI_ERR_SEXP_NOT_CLOSED},
      {"(3:abc(1:x)", SPKI_ERR_SEXP_NOT_CLOSED},
      {"(3:abc x)", SPKI_ERR_BAD_SEXP_FORMAT},
      {"(3:abc0:)", SPKI_ERR_BAD_SEXP_FORMAT},
      {"(4:abc", SPKI_ERR_STRING_TOO_LONG},
      {"(2147483649:abc)", SPKI_ERR_STRING_TOO_LONG},
      {"(2147483650:abc)", SPKI_ERR_LTH_TOO_BIG},
      {"(99999999999999999999:abc)", SPKI_ERR_LTH_TOO_BIG},
      {"([4:text)3:acl)", SPKI_ERR_DISP_HINT_NOT_CLOSED},
      {"([4:text]", SPKI_ERR_DISP_HINT_TOO_LONG},
      {"([4:text)", SPKI_ERR_DISP_HINT_TOO_LONG},  // replaces the missing "]"
      {"([4:text", SPKI_ERR_DISP_HINT_TOO_LONG},
      {"([2147483649:text]3:acl)", SPKI_ERR_DISP_HINT_TOO_LONG},
      {"([0:]3:acl)", SPKI_ERR_BAD_LTH_FORMAT},
      {"([text]3:acl)", SPKI_ERR_BAD_LTH_FORMAT},
      {"([4:text]x)", SPKI_ERR_BAD_LTH_FORMAT},
      {Nested(Limits::kMaxDepth + 1), SPKI_ERR_BAD_SEXP},
      {Nested(100'000), SPKI_ERR_BAD_SEXP},
  };
  for (const auto& [text, code] : cases) {
    spki_elem* list = spki_elem_new(&engine_);
    spki_elem* const before = Keep(list);
    EXPECT_NE(nullptr, before);
    EXPECT_EQ(code, TryParse(text, &list)) << text.substr(0, 60);
    EXPECT_EQ(nullptr, list) << text.substr(0, 60);
  }
}

TEST_F(Parsing, NullArguments) {
  spki_elem* list = nullptr;
  spki_atom* atom = nullptr;
  spki_input input = {};
  EXPECT_EQ(SPKI_ERR_NULL_PARAM, spki_parse_list(&engine_, nullptr, &input));
  EXPECT_EQ(SPKI_ERR_NULL_PARAM, spki_parse_list(&engine_, &list, nullptr));
  EXPECT_EQ(SPKI_ERR_NULL_PARAM, spki_parse_atom(&engine_, nullptr, &input));
  EXPECT_EQ(SPKI_ERR_NULL_PARAM, spki_parse_atom(&engine_, &atom, nullptr));
  EXPECT_EQ(SPKI_ERR_NULL_PARAM, spki_parse_template(&engine_, &list, nullptr));
  EXPECT_EQ(SPKI_ERR_NULL_PARAM, spki_parse_template(&engine_, nullptr, "(1:x)"));
}

TEST_F(Parsing, KindsAndExtents) {
  const spki_elem* list = Parse("(1:a2:bc(3:foo)[1:h]3:acl)trailing");
  EXPECT_EQ(SPKI_ELEM_KEYWORD, list->kind);
  EXPECT_EQ(2, list->value.keyword);
  EXPECT_EQ(26u, list->text_length);
  const spki_elem* nested = list->next->next;
  EXPECT_EQ(SPKI_ELEM_STRING, list->next->kind);
  EXPECT_EQ(SPKI_ELEM_LIST, nested->kind);
  EXPECT_EQ(SPKI_ELEM_HEAD, nested->value.list->kind);
  EXPECT_EQ(list->text + 8, nested->value.list->text);
  EXPECT_EQ(7u, nested->value.list->text_length);
  EXPECT_EQ(-1, nested->next->value.atom->keyword);
  EXPECT_EQ(SPKI_ELEM_HEAD, Parse("([4:text]3:acl)")->kind) << "a hinted head is no keyword";
  EXPECT_EQ(SPKI_ELEM_HEAD, Parse("(3:rsa)")->kind);
  EXPECT_EQ(3, Parse("(1:x3:acl)")->next->value.atom->keyword);

  spki_elem* made = nullptr;
  ASSERT_EQ(0, spki_parse_template(&engine_, &made, "(1:*(3:set))"));
  Keep(made);
  EXPECT_EQ(nullptr, made->text);
  EXPECT_EQ(nullptr, made->next->value.list->text);
}

TEST_F(Parsing, EveryTruncationIsRefused) {
  const std::string text = "(3:acl[4:text]5:entry(7:subject(10:public-key12:abcdefghijkl))2:nb)";
  for (size_t length = 0; length < text.size(); ++length) {
    spki_elem* list = nullptr;
    EXPECT_NE(0, TryParse(text.substr(0, length), &list)) << length;
    EXPECT_EQ(nullptr, list);
  }
  EXPECT_EQ(text, Text(Parse(text)));
}

TEST_F(Parsing, EveryMissingAllocationIsReported) {
  for (long n = 0, status = SPKI_ERR_NO_MEM; status != 0; ++n) {
    FailingEngine failing;
    failing.allocator.fail_after = n;
    spki_elem* list = nullptr;
    status = ParseBytes(&failing.engine, "(1:x(1:y[1:h]1:z)(3:foo))", &list);
    EXPECT_EQ(status == 0, list != nullptr);
    EXPECT_EQ(status == 0 ? 0 : SPKI_ERR_NO_MEM, status);
    EXPECT_EQ(status == 0, n == 10) << "six elements and four atoms";
  }
}

TEST_F(Parsing, DeepestAndLongestLists) {
  EXPECT_EQ(Nested(Limits::kMaxDepth), Text(Parse(Nested(Limits::kMaxDepth))));
  std::string flat = "(1:x";
  for (int i = 0; i < 1'000'000; ++i) flat += "1:y";
  Parse(flat + ")");  // released at the end without deep recursion
}

TEST_F(Parsing, WritingGoesBackToTheBytes) {
  const std::pair<std::string, std::string> cases[] = {
      {"(3:acl(5:entry[4:text]3:foo))", "(3:acl(5:entry[4:text]3:foo))"},
      {"(10:abcdefghij)", "(10:abcdefghij)"},
      {"(4:hash6:sha2561:x)", "(4:hash6:sha2561:x)"},
      {"(6:sha2561:x)", "(3:???1:x)"},  // has a number and no name
  };
  for (const auto& [text, written] : cases) EXPECT_EQ(written, Text(Parse(text)));
}

std::string Hex(const unsigned char (&digest)[kSpkiDigestSize]) {
  char text[2 * kSpkiDigestSize + 1];
  ZVsysutil::zv_binhex(text, digest, kSpkiDigestSize);
  return text;
}

TEST_F(Parsing, DigestsAreOfTheCanonicalBytes) {
  spki_digest sha256;
  spki_digest sha1;
  ASSERT_EQ(0, spki_digest_start(&engine_, &sha256, ZVCLM_HASH_SHA256));
  ASSERT_EQ(0, spki_digest_start(&engine_, &sha1, ZVCLM_HASH_SHA1));
  ASSERT_EQ(0, spki_write_canonical(&engine_, Parse("(3:tag(1:*))"), &sha256, &sha1));
  unsigned char digest[32];
  ASSERT_EQ(0, spki_digest_finish(&sha256, digest));
  EXPECT_EQ("c995f05cc93b672907452d64a745b4af7b13db13dd6b8ad8cba8cc82ee05a360", Hex(digest));
  ASSERT_EQ(0, spki_digest_finish(&sha1, digest));
  EXPECT_EQ("c680b4356be189fad2c9c45b4fd168a67806e832000000000000000000000000", Hex(digest));
  spki_digest unknown;
  EXPECT_EQ(SPKI_ERR_UNKNOWN_HASH_ALG,
            spki_digest_start(&engine_, &unknown, static_cast<ZvclmHashID>(77)));
  EXPECT_EQ(0, spki_write_canonical(&engine_, Parse("(3:tag)"), nullptr, nullptr));
}

}  // namespace
}  // namespace ZvVesk2::Engine
