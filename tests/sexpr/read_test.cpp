// SPDX-License-Identifier: Apache-2.0
// The readers: from memory, from buffers, and of the advanced text that people type. Many rows pin
// what a stricter reader would refuse: stored texts rely on it.
#include <vesk2/context.h>
#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include <string>
#include <thread>
#include <tuple>
#include <vector>

#include <gtest/gtest.h>

#include "tests/support/test_object.h"
#include "tests/support/test_text.h"

namespace ZvVesk2 {
namespace {

using namespace std::string_literals;
using namespace vesk2test;

// Exactly the bytes of a text, so that a sanitizer sees a read beyond them.
struct Input : std::vector<unsigned char> {
  explicit Input(const std::string& text) : vector(text.begin(), text.end()) {}
  unsigned Size() const { return static_cast<unsigned>(size()); }
};

using Reader = int (*)(Ref<SExpression>& list, const std::string& text);

const Reader kMemory = [](Ref<SExpression>& list, const std::string& text) {
  Input input(text);
  DExpression* out = nullptr;
  unsigned pos = 0;
  const int code = SExpression::ParseCanonical(out, input.data(), input.Size(), pos, nullptr);
  list.Reset(static_cast<SExpression*>(out));
  return code;
};
const Reader kBuffer = [](Ref<SExpression>& list, const std::string& text) {
  return SExpression::Import(list.Out(), Wrap(text).get(), nullptr);
};
const Reader kTyped = [](Ref<SExpression>& list, const std::string& text) {
  return SExpression::ParseAdvanced(list.Out(), text.c_str(), nullptr);
};
const Reader kTagBody = [](Ref<SExpression>& list, const std::string& text) {
  return SExpression::ParseTagAdvanced(list.Out(), text.c_str(), "tag", nullptr);
};
const Reader kFind = [](Ref<SExpression>& list, const std::string& text) {
  Input input(text);
  return SExpression::FindSubExpression(list.Out(), input.data(), input.Size(), "x", nullptr);
};

// What a reader makes of a text, or the text of its code.
std::string Outcome(Reader read, const std::string& text) {
  Ref<SExpression> list;
  const int code = read(list, text);
  EXPECT_TRUE(!list || (code == 0 && list->GetRefCount() == 1)) << text;
  return list ? Canonical(list) : V2Error(code);
}

const std::string kEnd = V2Error(VESK2_ERR_BUFFER_OVERFLOW);
const std::string kChar = V2Error(VESK2_ERR_UNEXPECTED_CHAR);
const std::string kList = V2Error(VESK2_ERR_INVALID_S_EXPRESSION);
const std::string kFile = V2Error(VESK2_ERR_PARSE_FILE);
const std::string kLong = V2Error(VESK2_ERR_MAX_BYTE_STRING);

std::string Of(size_t size) {
  return "(" + std::to_string(size) + ":" + std::string(size, 'x') + ")";
}

TEST(Readers, Lists) {
  const std::tuple<Reader, std::string, std::string> cases[] = {
      {kMemory, "()", "()"},
      {kMemory, "(1:a()", "(1:a())"},   // an empty list leaves its ")", which closes the next
      {kMemory, "((1:a))", "(0:1:a)"},  // the first element is always a byte string
      {kMemory, "(3;abc)", "(3:abc)"},  // any separator after a length
      {kMemory, " x1:a)", "(1:a)"},     // any "(" but the very first byte
      {kMemory, "x1:a)", kChar},
      {kMemory, "(0000000001:a :\n( 1:c\t) )", "(1:a0:(1:c))"},
      {kMemory, Of(9000), Of(9000)},  // no limit
      {kMemory, "(1:a\0)"s, kList},
      {kMemory, "(1:a", kEnd},
      {kMemory, "(5:abc)", kEnd},
      {kMemory, "(4294967297:a)", kEnd},                  // 1, with 32 bits
      {kMemory, "(18446744073709551617:a)", kEnd},        // 1, with 64 bits
      {kFind, "(1:r(1:x1:a)(1:s(1:x1:b)))", "(1:x1:b)"},  // the last to close
      {kFind, "(1:r(1:x(1:x1:b)))", "(1:x(1:x1:b))"},
      {kFind, "(1:x1:a)", V2Error(0)},  // the outermost list is never tested
      {kBuffer, "((1:a)())", "((1:a)())"},
      {kBuffer, "([bin]1:a[utf-8]1:b[num]1:c1:d)", "([bin]1:a[utf-8]1:b[num]1:c1:d)"},
      {kBuffer, "(:0008:12345678)", "(0:8:12345678)"},
      {kBuffer, "(00001:a)", kLong},
      {kBuffer, Of(8192), Of(8192)},
      {kBuffer, Of(8193), kLong},
      {kBuffer, "([binary]3:abc)", kFile},
      {kBuffer, "([12345678901]1:a)", kFile},
      {kBuffer, "(3;abc)", kFile},
      {kBuffer, "(1:a", kFile},
      {kTyped, " \t( a(b)   c )\n ", "(1:a(1:b)1:c)"},
      {kTyped, "((a) ())", "(0:(1:a)(0:))"},  // the first element is a token, empty here
      {kTyped, "(a b) x", kChar},
      {kTyped, "(a b", kList},
      {kTagBody, "(* set a b) x", "(3:tag(1:*3:set1:a1:b)1:x)"},
      {kTagBody, "a)b", kChar},  // and no loop without end
  };
  for (const auto& [reader, text, expected] : cases) {
    EXPECT_EQ(Outcome(reader, text), expected) << text.substr(0, 40);
  }
}

// One character is compared at position 0 only, since the index starts at the position.
TEST(Readers, ExpectComparesFromThePositionOnward) {
  constexpr int kNoRoom = VESK2_ERR_BUFFER_OVERFLOW, kOther = VESK2_ERR_UNEXPECTED_CHAR;
  const std::tuple<const char*, const char*, unsigned, int> cases[] = {
      {"(", "x", 0, kOther},           {"(", "ax", 1, 0},       {"ab", "--b", 1, 0},
      {"ab", "-a-", 1, kOther},        {"ab", "a", 0, kNoRoom}, {"(", "a", 1, kNoRoom},
      {"(", "a", 0xffffffff, kNoRoom}, {"ab", "-a", 1, kNoRoom}};
  for (const auto& [text, bytes, before, code] : cases) {
    const Input input(bytes);
    unsigned pos = before;
    EXPECT_EQ(DExpression::Expect(text, input.data(), input.Size(), pos), code) << bytes;
    EXPECT_EQ(pos, code == 0 ? before + std::string(text).size() : before) << bytes;
  }
}

// One token, and one list of typed text, at a place, which moves behind them: programs walk so.
TEST(Readers, ReadAtAPlace) {
  const std::tuple<std::string, unsigned, int, std::string, unsigned> tokens[] = {
      {"--3:abc1:x", 2, 0, "3:abc", 7},
      {"0:", 0, 0, "0:", 2},
      {"3:ab", 0, VESK2_ERR_BUFFER_OVERFLOW, "", 0},
      {"4294967299:abc", 0, VESK2_ERR_BUFFER_OVERFLOW, "", 0},
      {"1:a", 3, VESK2_ERR_BUFFER_OVERFLOW, "", 0},
      {"1:a", 0xffffffff, VESK2_ERR_BUFFER_OVERFLOW, "", 0}};
  for (const auto& [text, from, code, expected, to] : tokens) {
    Input input(text);
    DExpression* out = nullptr;
    unsigned pos = from;
    EXPECT_EQ(ByteString::ParseCanonical(out, input.data(), input.Size(), pos, nullptr), code);
    const Ref<DExpression> owned(out);
    EXPECT_EQ(owned ? Canonical(owned) : "", expected) << text;
    EXPECT_TRUE(code != 0 || pos == to) << text << pos;
  }
  DExpression* list = nullptr;
  unsigned pos = 3;
  ASSERT_EQ(SExpression::ParseAdvanced(list, "(a)(b (c)) x", pos, nullptr), 0);
  const Ref<DExpression> owned(list);
  EXPECT_EQ(Canonical(owned), "(1:b(1:c))");
  EXPECT_EQ(pos, 10U);
  EXPECT_EQ(SExpression::ParseAdvanced(list, "(a)", pos, nullptr), VESK2_ERR_INVALID_PARAM);
}

TEST(Readers, AByteStringIsEmptyAfterAFailure) {
  const Ref<ByteString> string(new ByteString(nullptr));
  for (const char* input : {"[foo]1:a", "99999:", "3:ab", "3"}) {
    ASSERT_EQ(string->Import(Wrap("[bin]1:x").get()), 0);
    EXPECT_NE(string->Import(Wrap(input).get()), 0) << input;
    EXPECT_TRUE(string->GetLength() == 0 && string->GetType() == ByteString::BsNone) << input;
  }
}

// What a reader accepts is written in a form that reads back to the same.
TEST(Readers, EveryTruncationAndBitFlip) {
  const std::string text = "(4:cert[utf-8]3:abc(1:x(4:hash6:sha2564:\1\2\0\xff)) 0:(1:x))"s;
  for (const Reader reader : {kMemory, kFind, kBuffer, kTyped, kTagBody}) {
    for (size_t bit = 0; bit < text.size() * 8; ++bit) {
      std::string flipped = text;
      flipped[bit / 8] = static_cast<char>(flipped[bit / 8] ^ (1 << bit % 8));
      for (const std::string& damaged : {flipped, text.substr(0, bit / 8)}) {
        const std::string outcome = Outcome(reader, damaged);
        if (!outcome.starts_with('(')) continue;
        EXPECT_EQ(Canonical(Parse(outcome)), outcome) << damaged;
      }
    }
  }
}

// What is read together lies together, which nobody may notice: parts outlive the whole, go in any
// order and in another thread, and lists are edited like those that were built.
TEST(Readers, PartsLiveAsLongAsTheyAreHeld) {
  std::string text = "(4:many";
  for (size_t i = 0; i < 2000; ++i) text += "(1:a" + Str(std::string(i % 40, 'x')) + "(0:)1:b)";
  text += ")";
  for (const Reader read : {kMemory, kBuffer}) {
    Ref<SExpression> list;
    ASSERT_EQ(read(list, text), 0);
    ASSERT_EQ(Canonical(list), text);
    std::vector<Ref<DExpression>> even, odd;
    int number = 0;
    for (auto it = list->Begin(); it; it.Next()) {
      (number++ % 2 == 0 ? even : odd).push_back(Ref<DExpression>::Share(it.Value()));
    }
    ASSERT_EQ(list->Remove(odd[7].get()), 0);
    odd[7]->Free();  // the list's
    ASSERT_EQ(list->Insert("new"), 0);
    EXPECT_EQ(list->Count(), 2001u);
    EXPECT_TRUE(static_cast<ByteString*>(list->Last())->IsEqual("new"));
    list.Reset();
    auto* const edited = static_cast<SExpression*>(odd[7].get());
    ASSERT_EQ(edited->Insert("new"), 0);
    EXPECT_EQ(Canonical(odd[7]), "(1:a" + Str(std::string(14, 'x')) + "(0:)1:b3:new)");
    std::thread other([&even] { even.clear(); });
    while (odd.size() > 8) odd.erase(odd.begin() + 8);
    other.join();
    EXPECT_EQ(odd[7]->GetRefCount(), 1);
    EXPECT_EQ(Canonical(odd[0]), "(1:a0:(0:)1:b)");
  }
}

TEST(Readers, NestTo256Levels) {
  for (const Reader reader : {kMemory, kBuffer, kTyped, kTagBody}) {
    const bool typed = reader == kTyped || reader == kTagBody;
    const size_t deepest = reader == kTagBody ? 255 : 256;  // in the list around the body
    for (const size_t levels : {deepest, deepest + 1, size_t{100000}}) {
      std::string text;
      for (size_t i = 0; i < levels; ++i) text += typed ? "(x" : "(1:x";
      const std::string outcome = Outcome(reader, text + std::string(levels, ')'));
      EXPECT_EQ(outcome == (reader == kBuffer ? kFile : kList), levels > deepest)
          << outcome.substr(0, 40) << " " << levels;
    }
    Outcome(reader, std::string(100000, '('));
  }
}

}  // namespace
}  // namespace ZvVesk2
