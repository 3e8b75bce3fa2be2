#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

const std::string kTag = Tag("sym (revoke x)");
const std::string kCrl = CrlText(Item(HashOf("cert")), Item(HashOf("key")));
std::string Root(unsigned key = 0) { return AclEntryText(KeyText(key), kTag); }

// `text` with its first `from` replaced.
std::string With(std::string text, const std::string& from, const std::string& to) {
  return text.replace(text.find(from), from.size(), to);
}

TEST(Crl, ReadsWhatItWrites) {
  const std::string plain =
      CrlText(Item(HashOf("a")) + Item(HashOf("b", "sha1"), "short"), Item(HashOf("c", "rmd160")));
  const struct {
    std::string text;
    int code;
  } cases[] = {
      {plain, 0},
      {CrlText("", ""), 0},
      {With(plain, "version1:1", "version1:2"), VESK2_ERR_PARSE_FILE},
      {With(plain, "5:list1", "5:list2"), VESK2_ERR_PARSE_FILE},
      {With(plain, "4:item", "4:hash"), VESK2_ERR_PARSE_FILE},
      {With(plain, "6:sha256", "3:md5"), VESK2_ERR_HASH_ID},
      {CrlText(List({Str("item"), HashOf("a")}), ""), VESK2_ERR_PARSE_FILE},
  };
  for (const auto& c : cases) {
    int code = 0;
    const Ref<Crl> crl = Read<Crl>(c.text, code);
    EXPECT_EQ(code, c.code) << c.text;
    EXPECT_EQ(code == 0 ? Canonical(crl) : c.text, c.text);
  }
}

TEST(CrlSequence, OpeningAndEndMayBeMissing) {
  const TempDir dir;
  const std::string text = CrlSequenceText(0, kTag, kCrl);
  const std::string inner = text.substr(11);
  for (const std::string& form : {text, inner, inner.substr(0, inner.size() - 1)}) {
    const std::string path = dir.Write("list", form);
    const Ref<CrlSequence> sequence(new CrlSequence(nullptr));
    EXPECT_EQ(sequence->Import((path + ".crl").c_str()), VESK2_ERR_FILE_NOT_FOUND);
    EXPECT_EQ(sequence->Import(path.c_str()), 0);
    EXPECT_EQ(Canonical(sequence), text);
    EXPECT_EQ(sequence->GetFileName(), path);
    EXPECT_EQ(sequence->Import(Wrap(text).get()), VESK2_ERR_INVALID_PARAM);
  }
}

// Nothing that differs from what was signed is ever verified.
TEST(CrlSequence, EveryTruncationAndBitFlipIsRefused) {
  const std::string text = CrlSequenceText(0, kTag, kCrl);
  const Ref<SExpression> acls = Acls({Root()});
  const auto passes = [&](const std::string& damaged) {
    int code = 0;
    const Ref<CrlSequence> sequence = Read<CrlSequence>(damaged, code);
    return code == 0 && sequence->VerifySelf(acls.get()) == 0 && Canonical(sequence) != text;
  };
  for (size_t length = 0; length < text.size(); ++length) {
    EXPECT_FALSE(passes(text.substr(0, length))) << length;
  }
  for (size_t bit = 0; bit < 8 * text.size(); ++bit) {
    std::string flipped = text;
    flipped[bit / 8] = static_cast<char>(flipped[bit / 8] ^ (1 << bit % 8));
    EXPECT_FALSE(passes(flipped)) << bit;
  }
}

TEST(CrlSequence, VerifySelf) {
  const std::string text = CrlSequenceText(0, kTag, kCrl);
  CertText key;
  key.issuer = key.subject = KeyText(0);
  key.tag = kTag;
  const std::string keyCert = Cert(key);
  const struct {
    std::string text;
    Ref<SExpression> acls;
    int code;
  } cases[] = {
      {text, Acls({Root()}), 0},
      // An entry counts whether it may propagate and whether its time is over or not.
      {text, Acls({AclEntryText(KeyText(0), kTag, false, "", kPast)}), 0},
      {text, Acls({AclEntryText(KeyText(0), Tag("sym"))}), VESK2_ERR_ACL_ENTRY_NOT_FOUND},
      // The last entry with the tag decides.
      {text, Acls({Root(1), Root()}), 0},
      {text, Acls({Root(), Root(1)}), VESK2_ERR_ACL_ENTRY_NOT_FOUND},
      {text, Acls({}), VESK2_ERR_ACL_ENTRY_NOT_FOUND},
      {text, Parse("()"), VESK2_ERR_INVALID_PARAM},
      {text, {}, VESK2_ERR_INVALID_PARAM},
      {List({Str("sequence"), kCrl, keyCert, TestKey::Rsa(0).Sign(keyCert)}), Acls({Root()}),
       VESK2_ERR_HASH_ID},
      // Changed after signing: the list, the certificate.
      {With(text, kMiddle, kPast), Acls({Root()}), VESK2_ERR_SIGNATURE},
      {With(text, kFuture, kFarFuture), Acls({Root()}), VESK2_ERR_HASH_MISMATCH},
  };
  for (const auto& c : cases) {
    const Ref<CrlSequence> sequence = Read<CrlSequence>(c.text);
    EXPECT_EQ(sequence->VerifySelf(c.acls.get()), c.code) << &c - cases;
    EXPECT_EQ(sequence->GetCrl()->GetIssuerTag() != nullptr, c.code == 0);
  }
}

TEST(CrlSequence, VerifyValidityReportsThePeriodInAnyCase) {
  constexpr long kBegin = 978307200;  // kPast
  constexpr long kEnd = 1293840000;   // kMiddle
  const Ref<CrlSequence> sequence =
      Read<CrlSequence>(CrlSequenceText(0, kTag, kCrl, kPast, kMiddle));
  const struct {
    long from, to;
    int code;
  } cases[] = {
      {0, 0, 0},        {kBegin, kEnd, 0}, {1, kBegin - 1, VESK2_ERR_NOT_AFTER},
      {kEnd + 1, 0, 0}, {0, 1, 0},         {kEnd + 1, kEnd + 2, VESK2_ERR_NOT_BEFORE},
  };
  for (auto c : cases) {
    EXPECT_EQ(sequence->VerifyValidity(&c.from, &c.to), c.code) << c.from << " " << c.to;
    EXPECT_EQ(c.from, kBegin);
    EXPECT_EQ(c.to, kEnd);
  }
}

}  // namespace
}  // namespace vesk2test
