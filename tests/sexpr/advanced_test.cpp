// The advanced form: text that people type and read, without quoting.
#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include <memory>
#include <string>
#include <tuple>
#include <vector>

#include <gtest/gtest.h>

#include "tests/support/test_object.h"

namespace ZvVesk2 {
namespace {

using vesk2test::Canonical;
using vesk2test::Parse;

TEST(ReadAdvanced, Lists) {
  const std::string longToken(9000, 'x');
  const std::string longText = "(" + longToken + ")";
  const std::string longList = "(9000:" + longToken + ")";
  const std::tuple<const char*, int, const char*> cases[] = {
      {"(a b (c d))", 0, "(1:a1:b(1:c1:d))"},
      {" \t( a   b )\n ", 0, "(1:a1:b)"},
      {"(a(b)c)", 0, "(1:a(1:b)1:c)"},
      {"((a) b)", 0, "(0:(1:a)1:b)"},  // the first element is a token, empty here
      {"()", 0, "(0:)"},
      {"(a ())", 0, "(1:a(0:))"},
      {longText.c_str(), 0, longList.c_str()},
      {"(a b) x", VESK2_ERR_UNEXPECTED_CHAR, ""},
      {"(a b", VESK2_ERR_INVALID_S_EXPRESSION, ""},
      {"", VESK2_ERR_UNEXPECTED_CHAR, ""},
      {nullptr, VESK2_ERR_INVALID_PARAM, ""},
  };
  for (const auto& [text, code, canonical] : cases) {
    Ref<SExpression> list;
    EXPECT_EQ(SExpression::ParseAdvanced(list.Out(), text, nullptr), code) << text;
    EXPECT_EQ(list ? Canonical(list) : "", canonical);
  }
}

TEST(ReadAdvanced, TagBodies) {
  const std::tuple<const char*, int, const char*> cases[] = {
      {"(* set a b) x", 0, "(3:tag(1:*3:set1:a1:b)1:x)"},
      {"a", 0, "(3:tag1:a)"},
      {"  ", 0, "(3:tag)"},
      {"a)b", VESK2_ERR_UNEXPECTED_CHAR, ""},  // and no loop without end
      {nullptr, VESK2_ERR_INVALID_PARAM, ""},
  };
  for (const auto& [text, code, canonical] : cases) {
    Ref<SExpression> list;
    EXPECT_EQ(SExpression::ParseTagAdvanced(list.Out(), text, "tag", nullptr), code);
    EXPECT_EQ(list ? Canonical(list) : "", canonical);
  }
}

TEST(WriteAdvanced, RoomInACallersBuffer) {
  const std::tuple<const char*, unsigned, int, const char*> cases[] = {
      {"(1:a(1:b1:c))", 64, 0, "(a (b c))"},
      {"(2:x 1:()", 64, 0, "(x  ()"},  // nothing is quoted: this does not read back
      {"(1:a)", 5, 0, "(a)"},
      {"(1:a)", 4, VESK2_ERR_BUFFER_OVERFLOW, nullptr},
      {"(9:aaaaaaaaa1:b)", 9, 0, "( b)"},  // elements that do not fit are not reported
      {"(1:a1:b1:c1:d1:e)", 6, VESK2_ERR_BUFFER_OVERFLOW, nullptr},
  };
  for (const auto& [list, size, code, text] : cases) {
    const auto buffer = std::make_unique<unsigned char[]>(size);
    unsigned pos = 0;
    EXPECT_EQ(Parse(list)->ExportAdvanced(buffer.get(), pos, size), code) << list;
    if (code != 0) continue;
    EXPECT_STREQ(reinterpret_cast<char*>(buffer.get()), text);
    EXPECT_EQ(pos, std::string(text).size()) << "the terminator does not count";
  }
  EXPECT_EQ(Parse("(1:a(1:b1:c))")->AdvancedLength(), 14u);
  EXPECT_EQ(Parse("()")->AdvancedLength(), 3u);
}

TEST(WriteAdvanced, Tags) {
  const std::tuple<const char*, const char*, const char*> cases[] = {
      {"(3:tag(1:*3:set4:read5:write))", "tag", "(* set read write)"},
      {"(3:tag1:a1:b)", nullptr, "(tag a b)"},
      {"(3:tag1:a)", "", "tag a"},
      {"(3:tag)", "tag", nullptr},  // no body
      {"(3:tag0:)", "tag", ""},
      {"(3:tag1:a)", "owner", nullptr},
      {"(3:tag1:a)", "ta", nullptr},
  };
  for (const auto& [list, tag, text] : cases) {
    EXPECT_STREQ(std::unique_ptr<char[]>(Parse(list)->ExportTag(tag)).get(), text) << list;
    EXPECT_STREQ(std::unique_ptr<char[]>(Parse(list)->ExportTagW(tag)).get(), text) << list;
  }
}

TEST(PrintAdvanced, OnePieceACall) {
  using Pieces = std::vector<std::string>;
  const std::tuple<const char*, int, Pieces> cases[] = {
      {"(1:a(1:b1:c))", 0, {"a", " ", "(", "b", " ", "c", ")"}},
      {"(1:a(1:b))", 1, {"(", "a", " ", "(", "b", ")", ")"}},
      {"(1:a(1:b(1:c)))", -1, {"a", " ", "b", " ", "(", "c", ")"}},
      {"(1:\a2:a\200)", 0, {" "}},  // not printable
      {"([bin]1:a[utf-8]2:\303\244)", 0, {" ", "\303\244"}},
      {"([num]2:\1\2[num]1:\377[num]0:)", 0, {"1", " ", "255", " "}},  // the first byte only
      {"(0:)", 0, {""}},
  };
  for (const auto& [list, depth, expected] : cases) {
    Pieces pieces;
    const auto collect = [](const char* text, unsigned length, void* user) {
      static_cast<Pieces*>(user)->emplace_back(text, length);
      return 1;  // ignored
    };
    EXPECT_EQ(Parse(list)->PrintAdvanced(collect, &pieces, depth), 0);
    EXPECT_EQ(pieces, expected) << list;
  }
}

}  // namespace
}  // namespace ZvVesk2
