// SPDX-License-Identifier: Apache-2.0
// Byte strings and lists in memory: what Set takes, who owns what, equality, and what is written.
#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include <algorithm>
#include <cstdio>
#include <memory>
#include <string>
#include <tuple>
#include <utility>

#include <gtest/gtest.h>

#include "src/sexpr/same.h"
#include "tests/support/test_object.h"
#include "tests/support/test_text.h"

namespace ZvVesk2 {
namespace {

using namespace vesk2test;

const char* const kHinted = "([bin]3:abc([utf-8]1:x)[num]0:)";
const char* const kPlain = "(3:abc(1:x)0:)";

std::string Text(unsigned char* bytes, unsigned length) {
  const std::unique_ptr<unsigned char[]> owned(bytes);
  return {bytes, bytes + length};
}

Ref<ByteString> Make(const std::string& text, ByteString::BsType type = ByteString::BsNone) {
  Ref<ByteString> string(new ByteString(nullptr));
  EXPECT_EQ(string->Set(text.c_str(), type), 0);
  return string;
}

TEST(ByteString, SetTakes1To8192Bytes) {
  const std::string bytes(8193, 'x');
  const auto* data = reinterpret_cast<const unsigned char*>(bytes.data());
  const Ref<ByteString> string = Make("kept");
  EXPECT_EQ(string->Set(data, 0, ByteString::BsBin), VESK2_ERR_INVALID_PARAM);
  for (const unsigned length : {8193u, 0x80000001u}) {
    EXPECT_EQ(string->Set(data, length, ByteString::BsBin), VESK2_ERR_MAX_BYTE_STRING);
  }
  EXPECT_TRUE(string->IsEqual("kept")) << "a refused Set leaves the value";
  EXPECT_EQ(string->Set(data, 8192, ByteString::BsBin), 0);
}

TEST(ByteString, KeepsItsArrayForUpToSevenBytesLess) {
  const std::string text = "abcdefghijklmnopqrstuvwxyz0123456789";  // long enough for an array
  for (const auto& [length, kept] : {std::pair{29u, true}, {28u, false}, {37u, false}}) {
    const Ref<ByteString> string = Make(text);
    const unsigned char* before = string->GetData();
    ASSERT_EQ(string->Set(std::string(length, 'x').c_str(), ByteString::BsNone), 0);
    EXPECT_EQ(string->GetData() == before, kept) << length;
  }
  // The new bytes may be its own: within the array that is kept, and within one that is replaced.
  for (const std::string& whole : {text, text.substr(20)}) {
    for (const unsigned offset : {2u, 14u}) {
      const Ref<ByteString> string = Make(whole);
      const auto left = static_cast<unsigned>(whole.size()) - offset;
      ASSERT_EQ(string->Set(string->GetData() + offset, left, ByteString::BsNone), 0);
      EXPECT_TRUE(string->IsEqual(whole.c_str() + offset));
    }
  }
}

TEST(ByteString, AdoptsAnArrayAndComparesWithoutHints) {
  auto* array = new unsigned char[2]{'h', 0};
  const Ref<ByteString> string(new ByteString(array, 2u, ByteString::BsUtf8, nullptr));
  EXPECT_EQ(string->GetData(), array);
  EXPECT_FALSE(string->IsEqual("h")) << "the 0 byte counts";
  EXPECT_STREQ(std::unique_ptr<char[]>(string->ToString()).get(), "h") << "and cuts the text";
  const Ref<ByteString> plain = Make("abc");
  EXPECT_TRUE(plain->IsEqual(Make("abc", ByteString::BsBin).get()));
  EXPECT_FALSE(plain->IsEqual(Make("abd").get()) || plain->IsEqual((DExpression*)nullptr));
}

TEST(SExpression, ReferencesGoOverWithElements) {
  const Ref<SExpression> list = Parse("(1:x1:y1:z)");
  EXPECT_EQ(list->Remove(Make("x").get()), VESK2_ERR_NOT_IN_LIST);  // it goes by identity
  auto middle = list->Begin();
  middle.Next();
  const std::pair<DExpression*, const char*> cases[] = {
      {middle.Value(), "(1:x1:z)"}, {list->Last(), "(1:x)"}, {list->First(), "()"}};
  for (const auto& [element, left] : cases) {
    EXPECT_EQ(list->Remove(element), 0);
    EXPECT_EQ(Ref<DExpression>(element)->GetRefCount(), 1) << "the list's is the caller's now";
    EXPECT_EQ(Canonical(list), left);
  }
  EXPECT_TRUE(list->Insert("w") == 0 && list->Insert("") == VESK2_ERR_INVALID_PARAM);
  EXPECT_EQ(Canonical(list), "(1:w)");
  SExpression* none = nullptr;
  const Ref<ByteString> value = Make("v");
  EXPECT_EQ(SExpression::Create(none, "", value.get(), nullptr), VESK2_ERR_INVALID_PARAM);
  EXPECT_TRUE(none == nullptr && value->GetRefCount() == 1) << "still the caller's";
}

TEST(SExpression, ElementsAreShared) {
  const Ref<SExpression> list = Parse("(1:a(1:b(1:c)))");
  EXPECT_TRUE(list->Contains(Parse("([bin]1:b(1:c))").get()));
  EXPECT_FALSE(list->Contains(Parse("(1:c)").get()));
  const auto shared = Ref<SExpression>::Share(static_cast<SExpression*>(list->Last()));
  Ref<SExpression> rest(list->Rest());
  EXPECT_EQ(shared->GetRefCount(), 3);
  for (const char* expected : {"((1:b(1:c)))", "()", "()"}) {  // of nothing, nothing
    EXPECT_EQ(Canonical(rest), expected);
    rest.Reset(rest->Rest());
  }
  list->DeleteNodes();
  EXPECT_TRUE(list->Last() == nullptr && shared->GetRefCount() == 1);
  EXPECT_EQ(Canonical(shared), "(1:b(1:c))") << "it keeps its own elements";
}

// The digests of the texts without hints are the oracle.
TEST(SExpression, EqualityIsThatOfTheCanonicalTextWithoutHints) {
  const char* const texts[] = {kHinted,
                               kPlain,
                               "()",
                               "(0:)",
                               "(())",
                               "(()())",
                               "((()))",
                               "(1:a)",
                               "([num]1:a)",
                               "((1:a))",
                               "(1:b)",
                               "(2:ab)",
                               "(1:a1:b)",
                               "(1:a1:b())",
                               "(1:a(1:b))",
                               "((1:a)1:b)",
                               "((1:a1:b))",
                               "((1:a)(1:b))",
                               "([bin]1:a([utf-8]1:b))",
                               "(3:1:a)",
                               "(0:1:a)",
                               "(1:a0:)"};
  for (const char* left : texts) {
    for (const char* right : texts) {
      const Ref<SExpression> lists[] = {Parse(left), Parse(right)};
      std::string digests[2];
      for (const int i : {0, 1}) {
        unsigned char* out = nullptr;
        unsigned length = 0;
        ASSERT_EQ(lists[i]->ComputeHash(out, length, ZVCLM_HASH_SHA256, true), 0);
        digests[i] = Text(out, length);
      }
      EXPECT_EQ(lists[0]->IsEqual(lists[1].get()), digests[0] == digests[1]) << left << right;
    }
  }
  const Ref<SExpression> list = Parse("(1:a)");
  const Ref<ByteString> text = Make("(1:a)");
  EXPECT_FALSE(list->IsEqual(text.get()) || text->IsEqual(list.get()));
  EXPECT_FALSE(list->IsEqual(list->First()) || list->First()->IsEqual(list.get()));
  bool equal = true;
  EXPECT_EQ(CompareValues(equal, nullptr, nullptr), 0);
  EXPECT_FALSE(equal || list->IsEqual((DExpression*)nullptr)) << "null equals nothing";
}

// Whatever part of a text stands where a running hash's block ends.
TEST(SExpression, DigestsOfTextsThatFillABlock) {
  constexpr size_t kBlock = 16384;
  const std::string tail = "[bin]5:bytes(" + Str(std::string(30, 'y')) + ")[utf-8]0:()";
  for (size_t size = kBlock - tail.size() - 60; size < kBlock + 30; ++size) {
    std::string text = "(" + Str(std::string(8000, 'x')) + Str(std::string(8000, 'y'));
    text += Str(std::string(size - text.size() - 4, 'z')) + tail + ")";
    const Ref<SExpression> list = Parse(text);
    unsigned char* out = nullptr;
    unsigned length = 0;
    ASSERT_EQ(list->ComputeHash(out, length, ZVCLM_HASH_SHA256, false), 0);
    EXPECT_EQ(Text(out, length), Digest(text)) << size;
    out = nullptr;
    ASSERT_EQ(list->Export(out, length), 0);
    EXPECT_EQ(Canonical(Parse(Text(out, length))).size(), text.size() - 12) << size;
  }
}

TEST(SExpression, NestingThatACallerBuildsIsRefusedNotFollowed) {
  const Ref<SExpression> flat = Parse("(1:x)");
  for (const int levels : {256, 257, 100000}) {
    Ref<SExpression> list(new SExpression(nullptr));
    for (int i = 1; i < levels; ++i) {
      Ref<SExpression> outer(new SExpression(nullptr));
      ASSERT_EQ(outer->Insert(list.Release()), 0);
      list = std::move(outer);
    }
    unsigned char *out = nullptr, buffer[1024];
    unsigned length = 0, pos = 0;
    const int expected = levels == 256 ? 0 : VESK2_ERR_BUFFER_OVERFLOW;
    EXPECT_EQ(list->Export(buffer, pos, sizeof buffer), expected);
    EXPECT_EQ(list->Export(out, length), expected);
    delete[] out;
    // Not even itself; but what differs before the depth is different for certain.
    bool equal = true;
    EXPECT_EQ(CompareValues(equal, list.get(), list.get()), expected);
    EXPECT_EQ(equal, expected == 0);
    EXPECT_EQ(list->IsEqual(list.get()), expected == 0);
    for (const bool swapped : {false, true}) {
      equal = true;
      EXPECT_EQ(CompareValues(equal, (swapped ? flat : list).get(), (swapped ? list : flat).get()),
                0);
      EXPECT_FALSE(equal);
    }
    EXPECT_EQ(std::unique_ptr<char[]>(list->ExportTag(nullptr)) != nullptr, expected == 0);
    (void)list->PrintAdvanced([](const char*, unsigned, void*) { return 0; }, nullptr, 0);
  }  // freed here, however deep
}

TEST(Writers, MemoryDropsHintsAndStreamsKeepThem) {
  const Ref<SExpression> list = Parse(kHinted);
  EXPECT_EQ(Canonical(list), kHinted);
  unsigned char* out = nullptr;
  unsigned length = 0;
  ASSERT_EQ(list->Export(out, length), 0);
  EXPECT_EQ(Text(std::exchange(out, nullptr), length), kPlain);
  EXPECT_EQ(list->CanonicalLength(), length);
  for (const bool ignoreHints : {false, true}) {
    ASSERT_EQ(list->ComputeHash(out, length, ZVCLM_HASH_SHA256, ignoreHints), 0);
    EXPECT_EQ(Text(std::exchange(out, nullptr), length), Digest(ignoreHints ? kPlain : kHinted));
  }
  EXPECT_EQ(list->ComputeHash(out, length, ZvclmHashID{1}, true), ZVCLM_ERR_UNKNOWN_HASH);
  EXPECT_EQ(list->PrintCanonical(nullptr), VESK2_ERR_INVALID_PARAM);
  EXPECT_EQ(list->First()->PrintCanonical(nullptr), VESK2_ERR_PARAM_NULL);
  const std::unique_ptr<FILE, int (*)(FILE*)> full(std::fopen("/dev/full", "w"), std::fclose);
  EXPECT_EQ(list->PrintCanonical(full.get()), VESK2_ERR_WRITE_FILE) << "lost when flushed";
}

TEST(Writers, RoomInACallersBuffer) {
  const std::tuple<bool, const char*, unsigned, unsigned, std::string> cases[] = {
      // Canonical. One byte beyond the ")" is needed; elements that do not fit are not reported.
      {false, "(3:abc)", 2, 10, "--(3:abc)"},
      {false, "(3:abc)", 2, 9, ""},
      {false, "(9:aaaaaaaaa1:b)", 0, 10, "(9:1:b)"},
      {false, "()", 0xffffffff, 1, ""},
      // Advanced. Nothing is quoted, so this does not read back.
      {true, "(2:x 1:((1:a1:b))", 0, 64, "(x  ( (a b))"},
      {true, "(1:a)", 2, 7, "--(a)"},
      {true, "(1:a)", 2, 6, ""},
      {true, "(2:ab)", 0, 4, "()"},
      {true, "(1:a1:b1:c1:d1:e)", 0, 6, ""},
  };
  for (const auto& [advanced, text, start, size, written] : cases) {
    const auto buffer = std::make_unique<unsigned char[]>(size);
    std::fill_n(buffer.get(), size, '-');
    unsigned pos = start;
    const Ref<SExpression> list = Parse(text);
    const int code = advanced ? list->ExportAdvanced(buffer.get(), pos, size)
                              : list->Export(buffer.get(), pos, size);
    EXPECT_EQ(code, written.empty() ? VESK2_ERR_BUFFER_OVERFLOW : 0) << text << " in " << size;
    if (code != 0) continue;
    EXPECT_EQ(std::string(buffer.get(), buffer.get() + pos), written);
    EXPECT_EQ(buffer[pos], advanced ? '\0' : '-') << "a terminator does not count";
  }
  EXPECT_EQ(Parse("(1:a(1:b1:c))")->AdvancedLength(), 14u);  // more than is written
}

TEST(Writers, Tags) {
  const std::tuple<const char*, const char*, const char*> cases[] = {
      {"(3:tag(1:*3:set1:a))", "tag", "(* set a)"},
      {"(3:tag1:a)", nullptr, "(tag a)"},
      {"(3:tag1:a)", "ta", nullptr},
      {"(3:tag1:a)", "", "tag a"},
      {"(3:tag)", "tag", nullptr},
      {"(3:tag0:)", "tag", ""}};  // without a body, with an empty one
  for (const auto& [list, tag, text] : cases) {
    EXPECT_STREQ(std::unique_ptr<char[]>(Parse(list)->ExportTag(tag)).get(), text) << list;
  }
}

TEST(Writers, PrintAdvancedInPieces) {
  const std::tuple<const char*, int, std::string> cases[] = {
      {"(1:a(1:b1:c))", 0, "a| |(|b| |c|)|"},
      {"(1:a(1:b))", 1, "(|a| |(|b|)|)|"},
      {"(1:a(1:b(1:c)))", -1, "a| |b| |(|c|)|"},
      {"(1:\a2:a\200[bin]1:a[utf-8]2:\303\244)", 0, " | | |\303\244|"},
      {"([num]2:\1\2[num]1:\377[num]0:)", 0, "1| |255| |"},  // the first byte only
  };
  for (const auto& [list, depth, expected] : cases) {
    std::string pieces;
    const auto collect = [](const char* text, unsigned length, void* all) {
      static_cast<std::string*>(all)->append(text, length).append("|");
      return 1;  // ignored
    };
    EXPECT_EQ(Parse(list)->PrintAdvanced(collect, &pieces, depth), 0);
    EXPECT_EQ(pieces, expected) << list;
  }
}

}  // namespace
}  // namespace ZvVesk2
