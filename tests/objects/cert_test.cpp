// SPDX-License-Identifier: Apache-2.0
// Cert: the elements that it reads, in their order, and the certificates that it builds. Subjects:
// the choice of a class, and k-of-n.
#include <vesk2/cert.h>
#include <vesk2/public_key.h>

#include <tuple>

#include "tests/support/test_read.h"
#include "tests/support/test_text.h"

namespace vesk2test {
namespace {

using namespace ZvVesk2;
using namespace std::string_literals;
using CertObject = ZvVesk2::Cert;

const std::string kKey = "(10:public-key(3:rsa(1:e[bin]1:\3)(1:n[bin]2:\1\1)))";
const std::string kKey2 = "(10:public-key(3:rsa(1:e1:\3)(1:n1:m)))";
const std::string kThreshold = "(6:k-of-n[num]1:\1[num]1:\2" + kKey + kKey + ")";

// A certificate over two short hash principals, with `middle` between subject and end.
std::string Short(const std::string& middle, const std::string& version = "") {
  return "(4:cert" + version + List({Str("issuer"), HashOf("i", "sha1")}) +
         List({Str("subject"), HashOf("s", "sha1")}) + middle + ")";
}

CertText Full() {
  return {.issuer = kKey,
          .subject = kThreshold,
          .tag = Tag("(ftp host)"),
          .propagate = true,
          .notBefore = "2005-01-01_00:00:00",
          .notAfter = "2006-01-01_00:00:00",
          .comment = "why",
          .revocation = "(10:revocation(6:revoke1:x))",
          .version = true};
}

TEST(CertTest, ReadsWhatItPrints) {
  ExpectRead<CertObject>(Short("", "(7:version1:1)"));
  ExpectRead<CertObject>(Short("(3:foo)"));  // any keyword of three characters makes a tag
  ExpectRead<CertObject>(Short("(5:valid)"));
  ExpectRead<CertObject>(Short("(5:valid(10:not-before3:abc))"));  // stamps are not judged
  ExpectRead<CertObject>(Short("(5:valid(9:not-after0:))"));
  ExpectRead<CertObject>(Short("(7:comment[utf-8]3:why)"));
  ExpectRead<CertObject>(Short("(1:x(3:abc))"));  // "(1" makes a revocation element
  ExpectRead<CertObject>(Cert(Full()));
  ExpectDamageIsSeen<CertObject>(Cert(Full()));
  const std::string refused[] = {
      Short("", "(7:version1:2)"),
      Short("", "(7:version1:1)(7:version1:1)"),
      Short("(3:tag)(9:propagate)"),
      Short("(3:tag)(3:tag)"),
      Short("(5:valid(9:not-after1:a)(10:not-before1:b))"),
      Short("(7:comment1:c)(5:valid)"),
      Short("(2:ab)"),
      "(4:cert" + List({Str("issuer"), HashOf("i")}) + ")",
  };
  for (const auto& text : refused) ExpectRead<CertObject>(text, VESK2_ERR_PARSE_FILE);
  ExpectRead<CertObject>(Cert({.issuer = kThreshold, .subject = kKey}), VESK2_ERR_PRINCIPAL);
}

// And always have a version.
TEST(CertTest, ClonesShareEveryPart) {
  const CertText least = {.issuer = HashOf("i"), .subject = HashOf("s")};
  for (auto parts : {Full(), least}) {
    parts.version = false;
    Ref<CertObject> source = Read<CertObject>(Cert(parts));
    const Ref<CertObject> clone(new CertObject(nullptr));
    ASSERT_EQ(clone->Clone(source.get()), 0);
    EXPECT_EQ(clone->GetIssuer(), source->GetIssuer());
    EXPECT_EQ(clone->Clone(source.get()), VESK2_ERR_INVALID_PARAM);
    source.Reset();  // the clone has references of its own
    parts.version = true;
    EXPECT_EQ(Canonical(clone), Cert(parts));
    EXPECT_EQ(Bytes(clone->GetComment()), parts.comment);
  }
}

// ---- Subjects ----

std::string Threshold(const std::string& k, const std::string& n, const std::string& members) {
  return "(6:k-of-n" + k + n + members + ")";
}

TEST(SubjectTest, ChoosesTheClassByTwoCharacters) {
  // The answers of Subject and of Principal.
  const std::tuple<std::string, int, int> cases[] = {
      {kKey, 0, 0},
      {HashOf("x"), 0, 0},
      {Threshold("[num]1:\1", "[num]1:\1", kKey), 0, VESK2_ERR_PRINCIPAL},
      {"(4:name3:abc)", VESK2_ERR_PARSE_FILE, VESK2_ERR_PARSE_FILE},
      {"(1:x)", VESK2_ERR_PARSE_FILE, VESK2_ERR_PARSE_FILE},
      {"(5:other)", VESK2_ERR_PRINCIPAL, VESK2_ERR_PRINCIPAL},
      {"(", VESK2_ERR_PRINCIPAL, VESK2_ERR_PRINCIPAL},
  };
  for (const auto& [text, subjectCode, principalCode] : cases) {
    Ref<Subject> subject;
    Ref<Principal> principal;
    EXPECT_EQ(Subject::Import(subject.Out(), Wrap(text).get(), nullptr), subjectCode) << text;
    EXPECT_EQ(Principal::Import(principal.Out(), Wrap(text).get(), nullptr), principalCode);
    EXPECT_EQ(static_cast<bool>(principal), principalCode == 0);
    ASSERT_EQ(static_cast<bool>(subject), subjectCode == 0);
    if (!subject) continue;
    EXPECT_EQ(subject->IsHash(), text == HashOf("x"));
    EXPECT_EQ(subject->IsThresholdSubject(), principalCode != 0);
    EXPECT_EQ(subject->GetStorageType(), StoragePath);
    EXPECT_EQ(Canonical(subject), text);
  }
}

TEST(SubjectTest, NamesAreBuiltAndNeverRead) {
  const Ref<Name> name(new Name(nullptr));
  EXPECT_EQ(name->Set(""), VESK2_ERR_INVALID_PARAM);
  ASSERT_EQ(name->Set("bob"), 0);
  EXPECT_EQ(Canonical(name), "(4:name3:bob)");
  EXPECT_EQ(Bytes(name->GetName()), "bob");
  Read<Name>("(4:name3:bob)", VESK2_ERR_NOT_IMPLEMENTED);
}

TEST(ThresholdTest, ReadsRawCountsAndExactlyNKeys) {
  const std::string two = kKey + kKey2;
  // Counts come out as Set writes them: of their text only the first byte is read.
  const std::pair<std::string, std::string> read[] = {
      {kThreshold, kThreshold},
      {Threshold("[num]1:\1", "1:\2", two), Threshold("[num]1:\1", "[num]1:\2", two)},
      {Threshold("2:\1x", "[bin]3:\2yz", two), Threshold("[num]1:\1", "[num]1:\2", two)},
      {Threshold("1:\2", "1:\1", kKey), Threshold("[num]1:\2", "[num]1:\1", kKey)},  // 2 of 1
      {Threshold(Str({"\0", 1}), Str({"\0", 1}), ""), "(6:k-of-n[num]1:\0[num]1:\0)"s}};
  for (const auto& [text, written] : read) {
    EXPECT_EQ(Canonical(Read<ThresholdSubject>(text)), written);
    ExpectRead<ThresholdSubject>(written);
  }
  const std::string refused[] = {
      Threshold("1:1", "1:2", two),  // digits
      Threshold("0:", "1:\2", two),           Threshold("1:\2", "0:", two),
      Threshold("1:\1", "1:\2", kKey),        Threshold("1:\1", "1:\1", two),
      Threshold("1:\1", "1:\1", HashOf("x")),
  };
  for (const auto& text : refused) ExpectRead<ThresholdSubject>(text, VESK2_ERR_PARSE_FILE);
}

TEST(ThresholdTest, OfAnEmptyObject) {
  const Ref<ThresholdSubject> empty(new ThresholdSubject(nullptr));
  EXPECT_EQ(empty->Import(static_cast<ZvBuffer*>(nullptr)), VESK2_ERR_INVALID_PARAM);
  EXPECT_FALSE(empty->HasMember(nullptr) || empty->HasMember(Read<PublicKey>(kKey).get()));
  Ref<SExpression> members;
  EXPECT_EQ(empty->GetSubjects(members.Out()), 0);
  SExpression* taken = members.get();
  EXPECT_EQ(empty->GetSubjects(taken), VESK2_ERR_INVALID_PARAM);
  EXPECT_EQ(Canonical(members), "()");
}

TEST(ThresholdTest, SetWritesLowBytesAndSharesMembers) {
  const Ref<ThresholdSubject> subject(new ThresholdSubject(nullptr));
  ASSERT_EQ(subject->Set(2, 300), 0);
  EXPECT_EQ(Canonical(subject), "(6:k-of-n[num]1:\2[num]1:,)");
  EXPECT_EQ(subject->GetK(), 2u);
  EXPECT_EQ(subject->GetN(), 300u);
  EXPECT_EQ(subject->Set(1, 1), VESK2_ERR_INVALID_PARAM);

  const Ref<PublicKey> member = Read<PublicKey>(kKey);
  ASSERT_EQ(subject->Insert(Ref<PublicKey>::Share(member.get()).Release()), 0);
  EXPECT_TRUE(subject->HasMember(member.get()));
  EXPECT_FALSE(subject->HasMember(Read<PublicKey>(kKey2).get()));
  EXPECT_FALSE(subject->HasMember(nullptr));
  Ref<SExpression> members;
  ASSERT_EQ(subject->GetSubjects(members.Out()), 0);
  EXPECT_EQ(Canonical(members), "(" + kKey + ")");
  EXPECT_EQ(member->GetRefCount(), 3);
}

}  // namespace
}  // namespace vesk2test
