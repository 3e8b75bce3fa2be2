#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

std::string Entry(const std::string& elements) { return List({Str("entry"), elements}); }

const std::string kHash = HashOf("some key");
const std::string kSubject = List({Str("subject"), kHash});
const std::string kFull = Entry("(7:version1:1)" + kSubject + "(9:propagate)" + Tag("ftp") +
                                Valid(kPast, kFuture) + "(10:generation1:\x07)(7:comment4:text)");

TEST(AclEntry, ReadsWhatItWrites) {
  const struct {
    std::string text;
    int code;
    size_t unread;  // an entry that ends with its tag leaves its ")"
  } cases[] = {
      {kFull, 0, 0},
      {Entry(kSubject + Tag("ftp")), 0, 1},
      {Entry(kSubject + "(3:foo)(5:valid)(7:comment0:)"), 0, 0},
      {Entry(kSubject + Tag("") + Valid("", kFuture)), 0, 0},
      {Entry("(7:version1:2)" + kSubject + Tag("")), VESK2_ERR_PARSE_FILE, 0},
      {Entry(kSubject + Tag("") + "(10:generation0:)"), VESK2_ERR_PARSE_FILE, 0},
      {Entry(kSubject + Tag("") + "(7:comment0:)(5:valid)"), VESK2_ERR_PARSE_FILE, 0},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.text);
    const BufferPtr buffer = Wrap(c.text);
    const Ref<AclEntry> entry(new AclEntry(nullptr));
    ASSERT_EQ(entry->Import(buffer.get()), c.code);
    if (c.code != 0) continue;
    EXPECT_EQ(Canonical(entry), c.text);
    EXPECT_EQ(buffer->Remaining(), c.unread);
    EXPECT_EQ(entry->Import(Wrap(kFull).get()), VESK2_ERR_INVALID_PARAM);
  }
}

// A damaged entry is refused, or is another entry that reads back as itself.
TEST(AclEntry, SurvivesEveryTruncationAndBitFlip) {
  int code = 0;
  for (size_t length = 0; length < kFull.size(); ++length) {
    Read<AclEntry>(kFull.substr(0, length), code);
    EXPECT_NE(code, 0) << length;
  }
  for (size_t bit = 0; bit < 8 * kFull.size(); ++bit) {
    std::string text = kFull;
    text[bit / 8] = static_cast<char>(text[bit / 8] ^ (1 << bit % 8));
    const Ref<AclEntry> entry = Read<AclEntry>(text, code);
    if (code != 0) continue;
    EXPECT_EQ(Canonical(Read<AclEntry>(Canonical(entry))), Canonical(entry)) << bit;
  }
}

TEST(AclEntry, CreateTakesItsPartsOver) {
  Ref<AclEntry> entry;
  // Of the generation 0x107 the low byte is written.
  ASSERT_EQ(
      AclEntry::Create(entry.Out(), ReadSubject(kHash).Release(), true, Parse(Tag("ftp")).Release(),
                       Stamp(kPast).Release(), Stamp(kFuture).Release(), 0x107,
                       Read<ByteString>(Str("text")).Release()),
      0);
  EXPECT_EQ(Canonical(entry), kFull);
  EXPECT_EQ(Canonical(*entry->GetTag()), Tag("ftp"));
  EXPECT_EQ(Bytes(entry->GetNotBefore()), kPast);
  EXPECT_EQ(Bytes(entry->GetNotAfter()), kFuture);
  EXPECT_EQ(entry->GetGeneration(), 7U);

  // What is refused stays the caller's.
  const Ref<SExpression> tag = Parse(Tag("ftp"));
  AclEntry* used = entry.get();
  AclEntry* made = nullptr;
  for (AclEntry** out : {&used, &made}) {
    EXPECT_EQ(AclEntry::Create(*out, out == &made ? nullptr : used->GetSubject(), true, tag.get(),
                               nullptr, nullptr, 0, nullptr),
              VESK2_ERR_INVALID_PARAM);
  }
  EXPECT_EQ(tag->GetRefCount(), 1);
}

TEST(AclEntry, ParsesTheTagOfAReduction) {
  const struct {
    std::string text, tag;
    int code;
  } cases[] = {
      {"(3:acl" + Entry(kSubject + "(9:propagate)" + Tag("a")) + ")", Tag("a"), 0},
      {"(3:acl" + Entry(kSubject + Tag("a")), Tag("a"), 0},
      // With a version the subject is taken for the tag; any nine letters pass for (propagate).
      {"(3:acl" + Entry("(7:version1:1)" + kSubject + Tag("a")) + ")", kSubject, 0},
      {"(3:acl" + Entry(kSubject + "(9:delegates)" + Tag("a")) + ")", Tag("a"), 0},
      {"(3:acl)", "", VESK2_ERR_UNEXPECTED_CHAR},
      {"(3:acl", "", VESK2_ERR_BUFFER_OVERFLOW},
  };
  for (auto c : cases) {
    SCOPED_TRACE(c.text);
    auto* const data = reinterpret_cast<unsigned char*>(c.text.data());
    const auto size = static_cast<unsigned>(c.text.size());
    Ref<SExpression> tag;
    EXPECT_EQ(AclEntry::ParseTagCanonical(tag.Out(), data, size, nullptr), c.code);
    EXPECT_EQ(tag ? Canonical(tag) : "", c.tag);
  }
}

}  // namespace
}  // namespace vesk2test
