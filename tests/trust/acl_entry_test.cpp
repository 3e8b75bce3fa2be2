// SPDX-License-Identifier: Apache-2.0
// AclEntry: as text, in the files of the store, and asked for.
#include <sys/stat.h>

#include "src/platform/clock.h"
#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

std::string Entry(const std::string& elements) { return List({Str("entry"), elements}); }

const std::string kHash = HashOf("some key");
const std::string kSubject = List({Str("subject"), kHash});
const std::string kFull = Entry("(7:version1:1)" + kSubject + "(9:propagate)" + Tag("ftp") +
                                Valid(kPast, kFuture) + "(10:generation1:\x07)(7:comment4:text)");

TEST(AclEntry, ReadsWhatItWrites) {
  ExpectRead<AclEntry>(kFull);
  ExpectRead<AclEntry>(Entry(kSubject + Tag("ftp")), 0, 1);  // leaves its ")"
  ExpectRead<AclEntry>(Entry(kSubject + "(3:foo)(5:valid)(7:comment0:)"));
  ExpectRead<AclEntry>(Entry(kSubject + Tag("") + Valid("", kFuture)));
  ExpectRead<AclEntry>(Entry("(7:version1:2)" + kSubject + Tag("")), kBad);
  ExpectRead<AclEntry>(Entry(kSubject + Tag("") + "(10:generation0:)"), kBad);
  ExpectRead<AclEntry>(Entry(kSubject + Tag("") + "(7:comment0:)(5:valid)"), kBad);
  // A part without its text is none that was left out: a period that nobody can read is no period.
  for (const char* part :
       {"(5:valid(10:not-before))", "(5:valid(9:not-after))", "(10:generation)", "(7:comment)"}) {
    ExpectRead<AclEntry>(Entry(kSubject + Tag("") + part), kBad);
  }
  ExpectDamageIsSeen<AclEntry>(kFull);
}

TEST(AclEntry, CreateTakesItsPartsOver) {
  Ref<AclEntry> entry;
  // Of the generation 0x107 the low byte is written.
  ASSERT_EQ(
      AclEntry::Create(entry.Out(), Read<Hash>(kHash).Release(), true, Parse(Tag("ftp")).Release(),
                       Stamp(kPast).Release(), Stamp(kFuture).Release(), 0x107,
                       Read<ByteString>(Str("text")).Release()),
      0);
  EXPECT_EQ(Canonical(entry), kFull);
  EXPECT_EQ(entry->GetGeneration(), 7U);
  // What is refused stays the caller's.
  const Ref<SExpression> tag = Parse(Tag("ftp"));
  AclEntry* made = nullptr;
  EXPECT_EQ(AclEntry::Create(made, nullptr, true, tag.get(), nullptr, nullptr, 0, nullptr),
            kInvalid);
  EXPECT_EQ(tag->GetRefCount(), 1);
}

TEST(AclEntry, ParsesTheTagOfAReduction) {
  const std::pair<std::string, std::string> cases[] = {
      {kSubject + "(9:propagate)" + Tag("a"), Tag("a")},
      {kSubject + Tag("a"), Tag("a")},
      // With a version the subject is taken for the tag; any nine letters pass for (propagate).
      {"(7:version1:1)" + kSubject + Tag("a"), kSubject},
      {kSubject + "(9:delegates)" + Tag("a"), Tag("a")},
  };
  for (const auto& [elements, expected] : cases) {
    std::string text = "(3:acl" + Entry(elements);  // the end is not read
    auto* const data = reinterpret_cast<unsigned char*>(text.data());
    Ref<SExpression> tag;
    ASSERT_EQ(AclEntry::ParseTagCanonical(tag.Out(), data, unsigned(text.size()), nullptr), 0);
    EXPECT_EQ(Canonical(tag), expected);
  }
}

std::string Named(char name) { return AclEntryText(kHash, Tag({&name, 1})); }
std::string Loaded(const std::string& names) {
  std::string entries;
  for (const char name : names) entries += Named(name);
  return List({Str("acl"), entries});
}

class AclStore : public TrustTest {
 protected:
  // What Import loads, or the number of its error.
  static std::string Load(const char* extra = nullptr) {
    Ref<SExpression> list;
    const int code = AclEntry::Import(list.Out(), nullptr, extra);
    return code == 0 ? Canonical(list) : std::to_string(code);
  }
  static int Install(const std::string& dir) { return AclEntry::InstallAcls(dir.c_str(), nullptr); }
};

TEST_F(AclStore, Import) {
  const std::string notFound = std::to_string(kNoFile);
  const char* const extra = other.Path().c_str();
  EXPECT_EQ(Load(), notFound);
  WriteAcl("b", Named('b'));
  WriteAcl("a", Named('a'));
  other.Write("0.acl", Named('x'));
  other.Write("1.acl", "broken");
  EXPECT_EQ(Load("/nonexistent"), Loaded("ab"));
  // What cannot be read is passed over; but as the last file it fails the load, unless there is an
  // extra directory.
  ASSERT_EQ(mkfifo(global.File("acl/aa.acl").c_str(), 0600), 0);
  EXPECT_EQ(Load(), Loaded("ab"));
  WriteAcl("c", "broken");
  EXPECT_EQ(Load(), notFound);
  EXPECT_EQ(Load(extra), Loaded("abx"));
  VeskConf::SetGlobalDirectory("");
  EXPECT_EQ(Load(), notFound);
  EXPECT_EQ(Load(extra), Loaded("x"));
}

// A name with a "/" is a path, which needs no store and never leads out of one.
TEST_F(AclStore, AnEntryByItsPath) {
  const std::string text = AclEntryText(KeyText(0), Tag("(ftp)"));
  const std::string path = other.Write("x.acl", text);
  VeskConf::SetGlobalDirectory("");
  const Ref<AclEntry> entry(new AclEntry(nullptr));
  ASSERT_EQ(entry->Import(path.c_str()), 0);
  EXPECT_EQ(Canonical(entry), text);
  EXPECT_EQ(entry->GetStorageType(), StoragePath);
}

TEST_F(AclStore, InstallAddsWhatIsMissing) {
  WriteAcl("a", Named('a'));
  other.Write("a.acl", Named('n'));     // the name is another trust root's
  other.Write("same.acl", Named('a'));  // the tag is there
  other.Write("x.acl", Named('x'));
  for (const std::string& dir : {other.Path(), other.Path() + "/", std::string("/none")}) {
    EXPECT_EQ(Install(dir), 0);
    EXPECT_EQ(Load(), Loaded("ax"));
  }
  EXPECT_EQ(global.Read("acl/a.acl") + global.Read("acl/x.acl"), Named('a') + Named('x'));
  // Only entries of the store are compared: two new ones of one tag are both installed.
  other.Write("twins/t.acl", Named('t'));
  other.Write("twins/u.acl", Named('t'));
  for (const char* root : {"", "/nonexistent", global.Path().c_str()}) {
    VeskConf::SetGlobalDirectory(root);
    EXPECT_EQ(Install(other.File("twins")), 0);
  }
  EXPECT_FALSE(std::filesystem::exists("acl"));
  EXPECT_EQ(Names("acl").size(), 28U);  // four files and nothing else
  EXPECT_EQ(Load(), Loaded("attx"));
}

// ---- Asking the store ----

constexpr int kEqual = VESK2_ERR_AUTH_TAGS_ARE_EQUAL;
constexpr int kNoKey = VESK2_ERR_ACL_KEY_NOT_FOUND;

std::string Threshold(char k, std::initializer_list<unsigned> keys) {
  const std::string n(1, static_cast<char>(keys.size()));
  std::string members;
  for (const unsigned key : keys) members += KeyText(key);
  return List({Str("k-of-n"), Str({&k, 1}), Str(n), members});
}

class AclFind : public TrustTest {
 protected:
  // Nobody in particular when `index` is below 0.
  static Ref<PublicKey> Key(int index) {
    return index < 0 ? Ref<PublicKey>() : Read<PublicKey>(KeyText(static_cast<unsigned>(index)));
  }
  int Find(int key, const std::string& tag, const char* from = "", const char* to = "") {
    return AclEntry::Find(Key(key).get(), Parse(tag).get(), Stamp(from).get(), Stamp(to).get(), k_);
  }
  int FindThreshold(int key, const std::string& tag, const char* from = "") {
    return AclEntry::FindThresholdEntry(Key(key).get(), signers_.get(), Parse(tag).get(),
                                        Stamp(from).get(), nullptr, k_);
  }

  unsigned int k_ = 99;
  Ref<SExpression> signers_;
};

TEST_F(AclFind, PrincipalTagAndPropagation) {
  global.Write("acl/0.acl", "not an entry");
  WriteAcl("a", AclEntryText(KeyText(0), Tag("(ftp host)")));
  WriteAcl("b", AclEntryText(KeyText(1), Tag("(ftp host)"), false));
  WriteAcl("c", AclEntryText(Threshold(2, {2, 3}), Tag("(web)")));
  WriteAcl("d", AclEntryText(KeyText(2), Tag("(web page)")));  // "c" is asked first
  const std::string signer = Cert({.issuer = KeyText(0), .subject = KeyText(0)});
  signers_ = Acls({});  // whoever they are, they change nothing
  ASSERT_EQ(signers_->Insert(Read<CertObject>(signer).Release()), 0);
  // What Find answers, and FindThresholdEntry, which remembers members only; and k.
  const std::tuple<int, std::string, int, int, unsigned> cases[] = {
      {0, Tag("(ftp host)"), kEqual, kNoKey, 0},
      {0, Tag("(ftp host dir)"), 0, kNoKey, 0},
      {0, Tag("(ftp)"), kNoEntry, kNoKey, 0},
      {1, Tag("(ftp host)"), kNoEntry, kNoKey, 0},
      {2, Tag("(web)"), kEqual, kEqual, 2},
      {2, Tag("(web page)"), 0, 0, 2},
      {3, Tag("(mail)"), kNoEntry, kNoEntry, 0},
      {4, Tag("(web)"), kNoKey, kNoKey, 0},
      {-1, Tag("(ftp host)"), kEqual, VESK2_ERR_PARAM_NULL, 0},
      {-1, Tag("(mail)"), kNoKey, VESK2_ERR_PARAM_NULL, 0},
  };
  for (const auto& [key, tag, code, thresholdCode, k] : cases) {
    EXPECT_EQ(Find(key, tag), code) << key << tag;
    EXPECT_EQ(k_, k);
    EXPECT_EQ(FindThreshold(key, tag), thresholdCode) << key << tag;
    EXPECT_EQ(k_, k);
  }
}

// In the very second of its ends an entry holds for FindThresholdEntry and not for Find.
TEST_F(AclFind, Period) {
  // The entry's period, the start that is asked for, and the answers of both. Both ends are
  // compared with that start; the end that is asked for is not consulted.
  const std::tuple<std::string, std::string, const char*, int, int> cases[] = {
      {kPast, kFuture, "", kEqual, kEqual},
      {kPast, kFuture, kPast, kEqual, kEqual},
      {kPast, kFuture, kFuture, kNoEntry, kNoEntry},
      {kMiddle, "", kPast, kNoEntry, kNoEntry},
      {kFuture, "", kFarFuture, kNoEntry, kNoEntry},  // has not begun now
      {"", kMiddle, kPast, kNoEntry, kNoEntry},       // has ended now
      {"now", "", "", kNoEntry, kEqual},
      {"", "now", "", kNoEntry, kEqual},
  };
  for (const auto& [begin, end, from, strict, inclusive] : cases) {
    int answers[2] = {};
    long now = 0;
    do {  // again when the clock moved on meanwhile
      now = ZVsysutil::zv_time(nullptr);
      const Ref<TimeStamp> stamp(new TimeStamp(nullptr));
      ASSERT_EQ(stamp->Set(now), 0);
      const auto at = [&](const auto& text) { return text == "now" ? Bytes(stamp.get()) : text; };
      WriteAcl("a", AclEntryText(Threshold(1, {0}), Tag("(ftp)"), true, at(begin), at(end)));
      answers[0] = Find(0, Tag("(ftp)"), from, kFarFuture);
      answers[1] = FindThreshold(0, Tag("(ftp)"), from);
    } while (ZVsysutil::zv_time(nullptr) != now);
    EXPECT_EQ(answers[0], strict) << begin << "/" << end << "/" << from;
    EXPECT_EQ(answers[1], inclusive) << begin << "/" << end << "/" << from;
  }
}

TEST_F(AclFind, TagLookUps) {
  WriteAcl("a", AclEntryText(KeyText(0), Tag("(ftp)"), true, "", kPast));  // time is not asked
  WriteAcl("b", AclEntryText(KeyText(0), Tag("(web)"), false));
  WriteAcl("c", AclEntryText(KeyText(0), Tag("sym list")));
  constexpr int kNoRevocation = VESK2_ERR_INVALID_REVOCATION_TAG;
  using Question = int (*)(SExpression*);
  const Question find = &AclEntry::Find;
  const Question revocation = &AclEntry::FindRevocationEntry;
  const Question contained = [](SExpression* tag) { return AclEntry::FindSuperSet(tag, false); };
  const Question passedOn = [](SExpression* tag) { return AclEntry::FindSuperSet(tag, true); };
  const std::tuple<Question, std::string, int> cases[] = {
      {find, Tag("(ftp)"), 0},
      {find, Tag("(ftp host)"), kNoEntry},
      {find, Tag("(web)"), kNoEntry},
      {passedOn, Tag("(ftp host)"), 0},
      {contained, Tag("(web page)"), 0},
      {passedOn, Tag("(web page)"), kNoEntry},
      {revocation, Tag("sym list (revoke x)"), 0},
      {revocation, "(10:revocation3:sym4:list(6:revoke))", 0},  // the keyword does not count
      {revocation, Tag("sym (revoke x)"), kNoEntry},
      {revocation, Tag("(revoke x)"), kNoEntry},  // asks for the empty (tag)
      {revocation, Tag("sym list (revoked x)"), kNoRevocation},
      {revocation, Tag("sym list revoke"), kNoRevocation},
      {revocation, "(3:tag((6:revoke)))", kNoRevocation},
      {revocation, "()", kNoRevocation},
  };
  for (const auto& [ask, tag, code] : cases) EXPECT_EQ(ask(Parse(tag).get()), code) << tag;

  EXPECT_EQ(find(nullptr), VESK2_ERR_PARAM_NULL);
  k_ = 7;  // of an earlier question
  EXPECT_EQ(FindThreshold(0, Tag("(ftp)")), kNoKey);
  EXPECT_EQ(k_, 0U);
  EXPECT_EQ(AclEntry::FindThresholdEntry(Key(0).get(), nullptr, nullptr, nullptr, nullptr, k_),
            VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(contained(nullptr), kInvalid);
  VeskConf::SetGlobalDirectory("/nonexistent");
  EXPECT_EQ(Find(-1, Tag("(ftp)")), VESK2_ERR_FIND_DIR);
}

}  // namespace
}  // namespace vesk2test
