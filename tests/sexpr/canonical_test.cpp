// The canonical form: readers from memory and from buffers, writers, digests. Many rows pin what a
// stricter reader would refuse: stored texts rely on it.
#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include <cstdio>
#include <memory>
#include <string>
#include <tuple>
#include <utility>

#include <gtest/gtest.h>

#include "src/frame/check.h"
#include "tests/support/temp_dir.h"
#include "tests/support/test_object.h"
#include "tests/support/test_text.h"

namespace ZvVesk2 {
namespace {

using namespace std::string_literals;
using vesk2test::Canonical;
using vesk2test::Parse;
using vesk2test::Wrap;

// A copy of exactly the bytes, so that a sanitizer sees a read beyond them.
struct Input {
  explicit Input(const std::string& text) : size(static_cast<unsigned>(text.size())) {
    text.copy(reinterpret_cast<char*>(bytes.get()), size);
  }
  unsigned size;
  std::unique_ptr<unsigned char[]> bytes = std::make_unique<unsigned char[]>(size);
};

TEST(Expect, ComparesFromThePositionOnward) {
  const std::tuple<const char*, const char*, unsigned, int, unsigned> cases[] = {
      {"(", "x", 0, VESK2_ERR_UNEXPECTED_CHAR, 0},
      {"(", "ax", 1, 0, 2},  // one character is compared at position 0 only
      {"ab", "ab", 0, 0, 2},
      {"ab", "a", 0, VESK2_ERR_BUFFER_OVERFLOW, 0},
      {"ab", "--b", 1, 0, 3},  // the index starts at the position
      {"ab", "-a-", 1, VESK2_ERR_UNEXPECTED_CHAR, 1},
      {"(", "a", 1, VESK2_ERR_BUFFER_OVERFLOW, 1},
      {"(", "a", 0xffffffff, VESK2_ERR_BUFFER_OVERFLOW, 0xffffffff},
  };
  for (const auto& [text, bytes, before, code, after] : cases) {
    const Input input(bytes);
    unsigned pos = before;
    EXPECT_EQ(DExpression::Expect(text, input.bytes.get(), input.size, pos), code)
        << text << " in " << bytes << " at " << before;
    EXPECT_EQ(pos, after);
  }
}

TEST(ReadMemory, Lists) {
  const std::string big = "(9000:" + std::string(9000, 'x') + ")";
  const std::tuple<std::string, int, unsigned, std::string> cases[] = {
      {"(3:abc(1:x)1:y)", 0, 15, "(3:abc(1:x)1:y)"},
      {"()", 0, 1, "()"},            // the ")" stays
      {"(1:a())", 0, 6, "(1:a())"},  // and closes the list around
      {"((1:a))", 0, 6, "(0:1:a)"},  // the first element is always a byte string
      {"(3;abc)", 0, 7, "(3:abc)"},  // any separator after a length
      {" (1:a)", 0, 6, "(1:a)"},     // white space before
      {" x1:a)", 0, 6, "(1:a)"},     // and any "(" behind it
      {"(1:a 1:b\n( 1:c\t) )", 0, 18, "(1:a1:b(1:c))"},
      {"(:)", 0, 3, "(0:)"},
      {"(0000000001:a)", 0, 14, "(1:a)"},
      {big, 0, 9007, big},  // no limit on a length
      {"x1:a)", VESK2_ERR_UNEXPECTED_CHAR, 0, ""},
      {"(\0"s, VESK2_ERR_INVALID_S_EXPRESSION, 0, ""},
      {"(1:a\0)"s, VESK2_ERR_INVALID_S_EXPRESSION, 0, ""},
      {"", VESK2_ERR_BUFFER_OVERFLOW, 0, ""},
      {"(1:a", VESK2_ERR_BUFFER_OVERFLOW, 0, ""},
      {"(5:abc)", VESK2_ERR_BUFFER_OVERFLOW, 0, ""},
      {"(4294967297:a)", VESK2_ERR_BUFFER_OVERFLOW, 0, ""},            // 1, with 32 bits
      {"(18446744073709551617:a)", VESK2_ERR_BUFFER_OVERFLOW, 0, ""},  // 1, with 64 bits
  };
  for (const auto& [text, code, end, canonical] : cases) {
    const Input input(text);
    Ref<DExpression> list;
    unsigned pos = 0;
    EXPECT_EQ(SExpression::ParseCanonical(list.Out(), input.bytes.get(), input.size, pos, nullptr),
              code)
        << text;
    EXPECT_EQ(list ? Canonical(list) : "", canonical);
    EXPECT_EQ(list ? pos : 0, end) << text;
  }
}

TEST(FindSubExpression, TheLastListToCloseWins) {
  const std::tuple<const char*, int, const char*> cases[] = {
      {"(4:cert(6:issuer1:a)(7:subject(6:issuer1:b)))", 0, "(6:issuer1:b)"},
      {"(1:r(6:issuer(6:issuer1:b)))", 0, "(6:issuer(6:issuer1:b))"},
      {"(6:issuer1:a)", 0, ""},  // the outermost list is never tested
      {"(1:r(6:issuer1:a)", VESK2_ERR_BUFFER_OVERFLOW, ""},
  };
  for (const auto& [text, code, expected] : cases) {
    const Input input(text);
    Ref<SExpression> found;
    EXPECT_EQ(SExpression::FindSubExpression(found.Out(), input.bytes.get(), input.size, "issuer",
                                             nullptr),
              code)
        << text;
    EXPECT_EQ(found ? Canonical(found) : "", expected);
    if (found) {
      EXPECT_EQ(found->GetRefCount(), 1) << "the tree around it is gone";
    }
  }
}

TEST(ReadBuffer, Lists) {
  const std::string longest = "(8192:" + std::string(8192, 'x') + ")";
  const std::tuple<std::string, int, std::string> cases[] = {
      {"(3:abc(1:x)1:y)", 0, "(3:abc(1:x)1:y)"},
      {"((1:a)())", 0, "((1:a)())"},
      {"([bin]3:abc[utf-8]1:b[num]1:c1:d)", 0, "([bin]3:abc[utf-8]1:b[num]1:c1:d)"},
      {"(0008:12345678)", 0, "(8:12345678)"},
      {"(:)", 0, "(0:)"},
      {longest, 0, longest},
      {"([binary]3:abc)", VESK2_ERR_PARSE_FILE, ""},
      {"([1234567890]1:a)", VESK2_ERR_PARSE_FILE, ""},
      {"([12345678901]1:a)", VESK2_ERR_PARSE_FILE, ""},
      {"(12345:", VESK2_ERR_MAX_BYTE_STRING, ""},
      {"(00001:a)", VESK2_ERR_MAX_BYTE_STRING, ""},
      {"(8193:", VESK2_ERR_MAX_BYTE_STRING, ""},
      {"(3;abc)", VESK2_ERR_PARSE_FILE, ""},
      {"(1:a 1:b)", VESK2_ERR_PARSE_FILE, ""},
      {" (1:a)", VESK2_ERR_PARSE_FILE, ""},
      {"(1:a", VESK2_ERR_PARSE_FILE, ""},
  };
  for (const auto& [text, code, canonical] : cases) {
    Ref<SExpression> list;
    EXPECT_EQ(SExpression::Import(list.Out(), Wrap(text).get(), nullptr), code) << text;
    EXPECT_EQ(list ? Canonical(list) : "", canonical);
  }
}

TEST(ReadBuffer, AByteStringIsEmptyAfterAFailure) {
  const Ref<ByteString> string(TryNew<ByteString>(nullptr));
  ASSERT_EQ(string->Import(Wrap("[bin]3:abc").get()), 0);
  EXPECT_EQ(string->GetType(), ByteString::BsBin);
  ASSERT_EQ(string->Import(Wrap("1:x").get()), 0);
  EXPECT_EQ(string->GetType(), ByteString::BsNone) << "the hint of the value before";
  for (const char* input : {"[foo]1:a", "99999:", "3:ab", "3"}) {
    ASSERT_EQ(string->Import(Wrap("1:x").get()), 0);
    EXPECT_NE(string->Import(Wrap(input).get()), 0) << input;
    EXPECT_EQ(string->GetLength(), 0u);
    EXPECT_EQ(string->GetData(), nullptr);
  }
  EXPECT_EQ(string->Import(nullptr), VESK2_ERR_PARAM_NULL);
}

TEST(ReadBuffer, MisplacedArgumentsAndFiles) {
  const vesk2test::TempDir dir;
  const std::string path = dir.Write("x", "([bin]1:a)");
  Ref<SExpression> list;
  ASSERT_EQ(SExpression::Import(list.Out(), path.c_str(), nullptr), 0);
  EXPECT_EQ(Canonical(list), "([bin]1:a)");
  SExpression* taken = list.get();
  EXPECT_EQ(SExpression::Import(taken, path.c_str(), nullptr), VESK2_ERR_PARAM_NOT_NULL);
  EXPECT_EQ(SExpression::Import(taken, Wrap("()").get(), nullptr), VESK2_ERR_INVALID_PARAM);
  EXPECT_EQ(SExpression::Import(list.Out(), dir.File("y").c_str(), nullptr), VESK2_ERR_FILE_OPEN);
}

// ---- Writers and digests ----

TEST(Write, MemoryDropsHintsAndStreamsKeepThem) {
  const char* const kHinted = "(3:abc([num]1:x[utf-8]0:)[bin]2:de)";
  const Ref<SExpression> list = Parse(kHinted);
  EXPECT_EQ(Canonical(list), kHinted);

  const std::string plain = "(3:abc(1:x0:)2:de)";
  EXPECT_EQ(list->CanonicalLength(), plain.size());
  unsigned char* out = nullptr;
  unsigned length = 0;
  ASSERT_EQ(list->Export(out, length), 0);
  const std::unique_ptr<unsigned char[]> exported(out);
  EXPECT_EQ(std::string(reinterpret_cast<char*>(out), length), plain);
  EXPECT_EQ(list->Export(out, length), VESK2_ERR_INVALID_PARAM) << "the output is in use";
}

TEST(Write, RoomInACallersBuffer) {
  const std::tuple<const char*, unsigned, unsigned, int, const char*> cases[] = {
      {"(3:abc)", 0, 8, 0, "(3:abc)"},
      {"(3:abc)", 0, 7, VESK2_ERR_BUFFER_OVERFLOW, ""},  // one byte beyond the ")" is needed
      {"(1:a(1:b))", 2, 13, 0, "--(1:a(1:b))"},
      {"(1:a(1:b))", 2, 12, VESK2_ERR_BUFFER_OVERFLOW, ""},
      {"(9:aaaaaaaaa1:b)", 0, 10, 0, "(9:1:b)"},  // elements that do not fit are not reported
      {"()", 0, 1, VESK2_ERR_BUFFER_OVERFLOW, ""},
      {"()", 0xffffffff, 8, VESK2_ERR_BUFFER_OVERFLOW, ""},
  };
  for (const auto& [text, start, size, code, written] : cases) {
    std::string buffer(size, '-');
    unsigned pos = start;
    const Ref<SExpression> list = Parse(text);
    EXPECT_EQ(list->Export(reinterpret_cast<unsigned char*>(buffer.data()), pos, size), code)
        << text << " in " << size;
    if (code == 0) {
      EXPECT_EQ(buffer.substr(0, pos), written);
    }
  }
  // A byte string fits exactly.
  const Ref<SExpression> list = Parse("(3:abc)");
  unsigned char exact[5];
  unsigned pos = 0;
  EXPECT_EQ(list->First()->Export(exact, pos, 4), VESK2_ERR_BUFFER_OVERFLOW);
  pos = 0;
  EXPECT_EQ(list->First()->Export(exact, pos, 5), 0);
  EXPECT_EQ(pos, 5u);
}

TEST(Write, Streams) {
  const Ref<SExpression> list = Parse("(3:abc)");
  EXPECT_EQ(list->PrintCanonical(nullptr), VESK2_ERR_INVALID_PARAM);
  EXPECT_EQ(list->First()->PrintCanonical(nullptr), VESK2_ERR_PARAM_NULL);
  const std::unique_ptr<FILE, int (*)(FILE*)> full(std::fopen("/dev/full", "w"), std::fclose);
  ASSERT_NE(full, nullptr);
  EXPECT_EQ(list->PrintCanonical(full.get()), VESK2_ERR_WRITE_FILE) << "lost when flushed";
}

TEST(ComputeHash, IsOverTheCanonicalBytes) {
  const char* const kHinted = "([bin]3:abc([utf-8]1:x)[num]0:)";
  const std::pair<bool, const char*> cases[] = {{false, kHinted}, {true, "(3:abc(1:x)0:)"}};
  const std::pair<ZvclmHashID, const char*> algorithms[] = {
      {ZVCLM_HASH_SHA1, "sha1"}, {ZVCLM_HASH_SHA256, "sha256"}, {ZVCLM_HASH_RMD160, "rmd160"}};
  for (const auto& [ignoreHints, hashed] : cases) {
    for (const auto& [id, name] : algorithms) {
      unsigned char* digest = nullptr;
      unsigned length = 0;
      ASSERT_EQ(Parse(kHinted)->ComputeHash(digest, length, id, ignoreHints), 0);
      const std::unique_ptr<unsigned char[]> owned(digest);
      EXPECT_EQ(std::string(reinterpret_cast<char*>(digest), length),
                vesk2test::Digest(hashed, name))
          << hashed << " " << name;
    }
  }
  unsigned char* digest = nullptr;
  unsigned length = 0;
  EXPECT_EQ(Parse("()")->ComputeHash(digest, length, ZvclmHashID{1}, true), ZVCLM_ERR_UNKNOWN_HASH);
  EXPECT_EQ(digest, nullptr);
}

// ---- Every reader over damaged input ----

struct Reader {
  const char* name;
  int tooDeep;
  const char* open;  // one more level, with an element in first place
  Ref<SExpression> (*read)(const std::string& text, int& code);
};

const Reader kReaders[] = {
    {"memory", VESK2_ERR_INVALID_S_EXPRESSION, "(1:x",
     [](const std::string& text, int& code) {
       const Input input(text);
       DExpression* out = nullptr;
       unsigned pos = 0;
       code = SExpression::ParseCanonical(out, input.bytes.get(), input.size, pos, nullptr);
       EXPECT_LE(pos, input.size);
       return Ref(static_cast<SExpression*>(out));
     }},
    {"buffer", VESK2_ERR_PARSE_FILE, "(1:x",
     [](const std::string& text, int& code) {
       SExpression* out = nullptr;
       code = SExpression::Import(out, Wrap(text).get(), nullptr);
       return Ref(out);
     }},
    {"advanced", VESK2_ERR_INVALID_S_EXPRESSION, "(x", [](const std::string& text, int& code) {
       SExpression* out = nullptr;
       code = SExpression::ParseAdvanced(out, text.c_str(), nullptr);
       return Ref(out);
     }}};

// What a reader accepts is written in a form that reads back to the same; what it refuses leaves
// nothing.
void Check(const Reader& reader, const std::string& text) {
  int code = 0;
  const Ref<SExpression> list = reader.read(text, code);
  ASSERT_EQ(static_cast<bool>(list), code == 0) << reader.name << ": " << text;
  if (!list) return;
  const std::string written = Canonical(list);
  EXPECT_EQ(Canonical(Parse(written)), written) << reader.name << ": " << text;
}

TEST(Readers, EveryTruncationAndBitFlip) {
  const std::string original =
      "(4:cert[utf-8]3:abc(6:issuer(4:hash6:sha2564:\1\2\0\xff)) 0:(1:x))"s;
  for (const Reader& reader : kReaders) {
    for (size_t size = 0; size <= original.size(); ++size) Check(reader, original.substr(0, size));
    for (size_t bit = 0; bit < original.size() * 8; ++bit) {
      std::string flipped = original;
      flipped[bit / 8] = static_cast<char>(flipped[bit / 8] ^ (1 << bit % 8));
      Check(reader, flipped);
    }
  }
}

TEST(Readers, NestTo256Levels) {
  for (const Reader& reader : kReaders) {
    for (const unsigned levels : {256u, 257u, 100000u}) {
      std::string text;
      for (unsigned i = 0; i < levels; ++i) text += reader.open;
      text += std::string(levels, ')');
      int code = 0;
      const Ref<SExpression> list = reader.read(text, code);
      EXPECT_EQ(code, levels <= 256 ? 0 : reader.tooDeep) << reader.name << " " << levels;
      EXPECT_EQ(static_cast<bool>(list), code == 0);
    }
    Check(reader, std::string(100000, '('));
  }
}

}  // namespace
}  // namespace ZvVesk2
