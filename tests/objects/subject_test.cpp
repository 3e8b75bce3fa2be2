// Subject, Principal, Name and ThresholdSubject: the choice of a class, and k-of-n.
#include <vesk2/subject.h>

#include <gtest/gtest.h>

#include <vesk2/public_key.h>

#include "tests/support/test_object.h"
#include "tests/support/test_text.h"

namespace vesk2test {
namespace {

using ZvVesk2::Name;
using ZvVesk2::Principal;
using ZvVesk2::PublicKey;
using ZvVesk2::Ref;
using ZvVesk2::SExpression;
using ZvVesk2::Subject;
using ZvVesk2::ThresholdSubject;

const std::string kKey = "(10:public-key(3:rsa(1:e1:\3)(1:n1:n)))";
const std::string kKey2 = "(10:public-key(3:rsa(1:e1:\3)(1:n1:m)))";

std::string Threshold(const std::string& k, const std::string& n, const std::string& members) {
  return "(6:k-of-n" + k + n + members + ")";
}

TEST(SubjectTest, ChoosesTheClassByTwoCharacters) {
  const struct {
    std::string text;
    int subjectCode;
    int principalCode;
  } cases[] = {
      {kKey, 0, 0},
      {HashOf("x"), 0, 0},
      {Threshold("1:\1", "1:\1", kKey), 0, VESK2_ERR_PRINCIPAL},
      {"(4:name3:abc)", VESK2_ERR_PARSE_FILE, VESK2_ERR_PARSE_FILE},
      {"(1:x)", VESK2_ERR_PARSE_FILE, VESK2_ERR_PARSE_FILE},
      {"(5:other)", VESK2_ERR_PRINCIPAL, VESK2_ERR_PRINCIPAL},
      {"(", VESK2_ERR_PRINCIPAL, VESK2_ERR_PRINCIPAL},
  };
  for (const auto& row : cases) {
    SCOPED_TRACE(row.text);
    Ref<Subject> subject;
    Ref<Principal> principal;
    EXPECT_EQ(Subject::Import(subject.Out(), Wrap(row.text).get(), nullptr), row.subjectCode);
    EXPECT_EQ(Principal::Import(principal.Out(), Wrap(row.text).get(), nullptr), row.principalCode);
    EXPECT_EQ(static_cast<bool>(principal), row.principalCode == 0);
    ASSERT_EQ(static_cast<bool>(subject), row.subjectCode == 0);
    if (!subject) continue;
    EXPECT_EQ(subject->IsHash(), row.text == HashOf("x"));
    EXPECT_EQ(subject->IsThresholdSubject(), row.principalCode != 0);
    EXPECT_EQ(subject->GetStorageType(), ZvVesk2::StoragePath);
    EXPECT_EQ(Canonical(subject), row.text);
    Subject* taken = subject.get();
    EXPECT_EQ(Subject::Import(taken, Wrap(row.text).get(), nullptr), VESK2_ERR_INVALID_PARAM);
  }
}

TEST(SubjectTest, NamesAreBuiltAndNeverRead) {
  const Ref<Name> name(new Name(nullptr));
  EXPECT_EQ(name->Set(""), VESK2_ERR_INVALID_PARAM);
  ASSERT_EQ(name->Set("bob"), 0);
  EXPECT_EQ(Canonical(name), "(4:name3:bob)");
  EXPECT_EQ(Bytes(name->GetName()), "bob");
  EXPECT_EQ(name->Import(Wrap("(4:name3:bob)").get()), VESK2_ERR_NOT_IMPLEMENTED);
}

TEST(ThresholdTest, ReadsRawCountsAndExactlyNKeys) {
  const std::string two = kKey + kKey2;
  const struct {
    const char* what;
    std::string text;
    int code;
    std::string printed;  // empty: as read
  } cases[] = {
      {"hints stay", Threshold("[num]1:\1", "1:\2", two), 0, ""},
      {"other hints stay", Threshold("1:\1", "[bin]1:\2", two), 0, ""},
      {"2 of 1", Threshold("1:\2", "1:\1", kKey), 0, ""},
      {"0 of 0", Threshold(Str({"\0", 1}), Str({"\0", 1}), ""), 0, ""},
      {"only the first byte counts", Threshold("2:\1x", "3:\2yz", two), 0,
       Threshold("1:\1", "1:\2", two)},
      {"text digits", Threshold("1:1", "1:2", two), VESK2_ERR_PARSE_FILE, ""},
      {"no k", Threshold("0:", "1:\2", two), VESK2_ERR_PARSE_FILE, ""},
      {"no n", Threshold("1:\2", "0:", two), VESK2_ERR_PARSE_FILE, ""},
      {"too few", Threshold("1:\1", "1:\2", kKey), VESK2_ERR_PARSE_FILE, ""},
      {"too many", Threshold("1:\1", "1:\1", two), VESK2_ERR_PARSE_FILE, ""},
      {"a hash member", Threshold("1:\1", "1:\1", HashOf("x")), VESK2_ERR_PARSE_FILE, ""},
  };
  for (const auto& row : cases) {
    SCOPED_TRACE(row.what);
    const Ref<ThresholdSubject> subject(new ThresholdSubject(nullptr));
    EXPECT_EQ(subject->Import(Wrap(row.text).get()), row.code);
    if (row.code != 0) continue;
    EXPECT_EQ(Canonical(subject), row.printed.empty() ? row.text : row.printed);
    EXPECT_EQ(subject->Import(Wrap(row.text).get()), VESK2_ERR_INVALID_PARAM);
  }
}

TEST(ThresholdTest, SetWritesLowBytesAndSharesMembers) {
  const Ref<ThresholdSubject> subject(new ThresholdSubject(nullptr));
  ASSERT_EQ(subject->Set(2, 300), 0);
  EXPECT_EQ(Canonical(subject), "(6:k-of-n[num]1:\2[num]1:,)");
  EXPECT_EQ(subject->GetK(), 2u);
  EXPECT_EQ(subject->GetN(), 300u);
  EXPECT_EQ(subject->Set(1, 1), VESK2_ERR_INVALID_PARAM);

  Ref<PublicKey> member(new PublicKey(nullptr));
  Ref<PublicKey> other(new PublicKey(nullptr));
  ASSERT_EQ(member->Import(Wrap(kKey).get()), 0);
  ASSERT_EQ(other->Import(Wrap(kKey2).get()), 0);
  ASSERT_EQ(subject->Insert(Ref<PublicKey>::Share(member.get()).Release()), 0);
  EXPECT_TRUE(subject->HasMember(member.get()));
  EXPECT_FALSE(subject->HasMember(other.get()));
  EXPECT_FALSE(subject->HasMember(nullptr));
  Ref<SExpression> members;
  ASSERT_EQ(subject->GetSubjects(members.Out()), 0);
  EXPECT_EQ(Canonical(members), "(" + kKey + ")");
  EXPECT_EQ(member->GetRefCount(), 3);
}

}  // namespace
}  // namespace vesk2test
