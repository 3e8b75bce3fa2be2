#include "src/platform/clock.h"
#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

constexpr int kEqual = VESK2_ERR_AUTH_TAGS_ARE_EQUAL;
constexpr int kNoEntry = VESK2_ERR_ACL_ENTRY_NOT_FOUND;
constexpr int kNoKey = VESK2_ERR_ACL_KEY_NOT_FOUND;

std::string Threshold(char k, std::initializer_list<unsigned> keys) {
  std::string members;
  for (const unsigned key : keys) members += KeyText(key);
  return List(
      {Str("k-of-n"), Str({&k, 1}), Str(std::string(1, static_cast<char>(keys.size()))), members});
}

class AclFind : public TrustTest {
 protected:
  // Asks for a key, or for nobody in particular when it is below 0.
  int Find(int key, const std::string& tag, const char* from = "", const char* to = "") {
    const Ref<Subject> principal = key < 0 ? Ref<Subject>() : ReadSubject(KeyText(unsigned(key)));
    return AclEntry::Find(dynamic_cast<Principal*>(principal.get()), Parse(tag).get(),
                          Stamp(from).get(), Stamp(to).get(), k_);
  }
  int FindThreshold(unsigned key, const std::string& tag, const char* from = "",
                    SExpression* signers = nullptr) {
    const Ref<Subject> principal = ReadSubject(KeyText(key));
    return AclEntry::FindThresholdEntry(dynamic_cast<Principal*>(principal.get()), signers,
                                        Parse(tag).get(), Stamp(from).get(), nullptr, k_);
  }

  unsigned int k_ = 99;
};

TEST_F(AclFind, PrincipalTagAndPropagation) {
  global.Write("acl/0.acl", "not an entry");
  WriteAcl("a", AclEntryText(KeyText(0), Tag("(ftp host)")));
  WriteAcl("b", AclEntryText(KeyText(1), Tag("(ftp host)"), false));
  WriteAcl("c", AclEntryText(Threshold(2, {2, 3}), Tag("(web)")));
  WriteAcl("d", AclEntryText(KeyText(2), Tag("(web page)")));  // "c" is asked first
  const struct {
    int key;
    std::string tag;
    int code;
    unsigned k;
  } cases[] = {
      {0, Tag("(ftp host)"), kEqual, 0}, {0, Tag("(ftp host dir)"), 0, 0},
      {0, Tag("(ftp)"), kNoEntry, 0},    {1, Tag("(ftp host)"), kNoEntry, 0},
      {2, Tag("(web)"), kEqual, 2},      {2, Tag("(web page)"), 0, 2},
      {4, Tag("(web)"), kNoKey, 0},      {-1, Tag("(ftp host)"), kEqual, 0},
      {-1, Tag("(mail)"), kNoKey, 0},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(Find(c.key, c.tag), c.code) << c.key << c.tag;
    EXPECT_EQ(k_, c.k);
  }
  // Only members are remembered, and the signers, whoever they are, change nothing.
  CertText signer;
  signer.issuer = signer.subject = KeyText(0);
  const Ref<SExpression> signers = Acls({});
  ASSERT_EQ(signers->Insert(Read<ZvVesk2::Cert>(Cert(signer)).Release()), 0);
  EXPECT_EQ(FindThreshold(3, Tag("(web page)")), 0);
  EXPECT_EQ(FindThreshold(2, Tag("(web)"), "", signers.get()), kEqual);
  EXPECT_EQ(k_, 2U);
  EXPECT_EQ(FindThreshold(2, Tag("(mail)")), kNoEntry);
  EXPECT_EQ(FindThreshold(0, Tag("(ftp host)")), kNoKey);
}

TEST_F(AclFind, Period) {
  const struct {
    const char *begin, *end, *from, *to;
    int code;
  } cases[] = {
      {kPast, kFuture, "", "", kEqual},
      {kPast, kFuture, kPast, "", kEqual},
      // Both ends are compared with the start that is asked for; its end is not consulted.
      {kPast, kFuture, kMiddle, kFarFuture, kEqual},
      {kPast, kFuture, kFuture, "", kNoEntry},
      {kMiddle, "", kPast, "", kNoEntry},
      {"", "", kPast, "", kEqual},
      {kFuture, "", kFarFuture, "", kNoEntry},  // has not begun now
      {"", kMiddle, kPast, "", kNoEntry},       // has ended now
  };
  for (const auto& c : cases) {
    WriteAcl("a", AclEntryText(Threshold(1, {0}), Tag("(ftp)"), true, c.begin, c.end));
    EXPECT_EQ(Find(0, Tag("(ftp)"), c.from, c.to), c.code) << &c - cases;
    EXPECT_EQ(FindThreshold(0, Tag("(ftp)"), c.from), c.code) << &c - cases;
  }
}

// In the very second of its ends an entry holds for FindThresholdEntry and not for Find.
TEST_F(AclFind, TheSecondsAtBothEnds) {
  for (const bool atBegin : {true, false}) {
    int strict = 0;
    int inclusive = 0;
    long now = 0;
    do {  // again when the clock moved on meanwhile
      now = ZVsysutil::zv_time(nullptr);
      const Ref<TimeStamp> stamp(new TimeStamp(nullptr));
      ASSERT_EQ(stamp->Set(now), 0);
      const std::string text = Bytes(stamp.get());
      WriteAcl("a", AclEntryText(Threshold(1, {0}), Tag("(ftp)"), true, atBegin ? text : "",
                                 atBegin ? "" : text));
      strict = Find(0, Tag("(ftp)"));
      inclusive = FindThreshold(0, Tag("(ftp)"));
    } while (ZVsysutil::zv_time(nullptr) != now);
    EXPECT_EQ(strict, kNoEntry);
    EXPECT_EQ(inclusive, kEqual);
  }
}

TEST_F(AclFind, TagLookUps) {
  WriteAcl("a", AclEntryText(KeyText(0), Tag("(ftp)"), true, "", kPast));  // time is not asked
  WriteAcl("b", AclEntryText(KeyText(0), Tag("(web)"), false));
  WriteAcl("c", AclEntryText(KeyText(0), Tag("sym list")));
  const auto find = [](const std::string& tag) { return AclEntry::Find(Parse(tag).get()); };
  const auto contained = [](const std::string& tag, bool needPropagate) {
    return AclEntry::FindSuperSet(Parse(tag).get(), needPropagate);
  };
  EXPECT_EQ(find(Tag("(ftp)")), 0);
  EXPECT_EQ(find(Tag("(ftp host)")), kNoEntry);
  EXPECT_EQ(find(Tag("(web)")), kNoEntry);
  EXPECT_EQ(contained(Tag("(ftp host)"), true), 0);
  EXPECT_EQ(contained(Tag("(web page)"), false), 0);
  EXPECT_EQ(contained(Tag("(web page)"), true), kNoEntry);
  const struct {
    std::string tag;
    int code;
  } revocations[] = {
      {Tag("sym list (revoke x)"), 0},
      {"(10:revocation3:sym4:list(6:revoke))", 0},  // the keyword does not count
      {Tag("sym (revoke x)"), kNoEntry},
      {Tag("(revoke x)"), kNoEntry},  // asks for the empty (tag)
      {Tag("sym list (revoked x)"), VESK2_ERR_INVALID_REVOCATION_TAG},
      {Tag("sym list revoke"), VESK2_ERR_INVALID_REVOCATION_TAG},
      {"(3:tag((6:revoke)))", VESK2_ERR_INVALID_REVOCATION_TAG},
      {"()", VESK2_ERR_INVALID_REVOCATION_TAG},
  };
  for (const auto& c : revocations) {
    EXPECT_EQ(AclEntry::FindRevocationEntry(Parse(c.tag).get()), c.code) << c.tag;
  }
}

TEST_F(AclFind, MissingArgumentsAndStores) {
  const Ref<SExpression> tag = Parse(Tag("(ftp)"));
  EXPECT_EQ(AclEntry::Find(nullptr, nullptr, nullptr, nullptr, k_), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(AclEntry::FindThresholdEntry(nullptr, nullptr, tag.get(), nullptr, nullptr, k_),
            VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(AclEntry::Find(nullptr), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(AclEntry::FindSuperSet(nullptr, false), VESK2_ERR_INVALID_PARAM);
  EXPECT_EQ(AclEntry::FindRevocationEntry(nullptr), VESK2_ERR_INVALID_PARAM);
  for (const char* root : {"", "/nonexistent"}) {
    VeskConf::SetGlobalDirectory(root);
    EXPECT_EQ(Find(-1, Tag("(ftp)")), VESK2_ERR_FIND_DIR);
    EXPECT_EQ(AclEntry::FindSuperSet(tag.get(), false), VESK2_ERR_FIND_DIR);
  }
}

}  // namespace
}  // namespace vesk2test
