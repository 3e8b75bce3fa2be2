// SPDX-License-Identifier: Apache-2.0
// Revocation lists: read, verified, asked whether something was revoked, and kept in the store.
#include <sys/resource.h>
#include <sys/stat.h>

#include <csignal>
#include <vector>

#include "src/trust/revocation_lists.h"
#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

constexpr int kRevoked = VESK2_ERR_CERT_REVOKED;
constexpr int kEnded = VESK2_ERR_NOT_AFTER;

// Key 0 vouches for the lists of the source kTag; key 1 is a stranger.
const std::string kTag = Tag("sym (revoke x)");
const std::string kOther = Item(HashOf("other"));
const std::string kCrl =
    CrlText(kOther + Item(HashOf("b", "sha1"), "short"), Item(HashOf("c", "rmd160")));
std::string RootOf(const std::string& tag) { return AclEntryText(KeyText(0), tag); }
std::string Root(unsigned key = 0) { return AclEntryText(KeyText(key), kTag); }

// `text` with its first `from` replaced.
std::string With(std::string text, const std::string& from, const std::string& to) {
  return text.replace(text.find(from), from.size(), to);
}

TEST(Crl, ReadsWhatItWrites) {
  ExpectRead<Crl>(kCrl);
  ExpectRead<Crl>(CrlText("", ""));
  ExpectRead<Crl>(With(kCrl, "version1:1", "version1:2"), kBad);
  ExpectRead<Crl>(With(kCrl, "5:list1", "5:list2"), kBad);
  ExpectRead<Crl>(With(kCrl, "4:item", "4:hash"), kBad);
  ExpectRead<Crl>(With(kCrl, "6:sha256", "3:md5"), VESK2_ERR_HASH_ID);
  ExpectRead<Crl>(CrlText(List({Str("item"), HashOf("a")}), ""), kBad);
  // Of a sequence the opening and the end may be missing.
  const std::string text = CrlSequenceText(0, kTag, kCrl);
  const std::string inner = text.substr(11);
  for (const std::string& form : {text, inner, inner.substr(0, inner.size() - 1)}) {
    const Ref<CrlSequence> sequence = Read<CrlSequence>(form);
    EXPECT_EQ(Canonical(sequence), text);
    EXPECT_EQ(sequence->Import(Wrap(text).get()), kInvalid);
  }
  EXPECT_EQ(Ref(new CrlSequence(nullptr))->Import("/nonexistent"), kNoFile);
  EXPECT_EQ(Ref(new CrlSequence(nullptr))->Import(static_cast<const char*>(nullptr)), kNoFile);
  EXPECT_EQ(Ref(new Crl(nullptr))->Import(static_cast<ZvBuffer*>(nullptr)), kInvalid);
  // Each part is whole, and its own code is told.
  for (const char* const part : {"4:cert", "9:signature"}) {
    std::string odd = text;
    odd.replace(odd.find("6:sha256", odd.find(part)), 8, "3:md5");
    EXPECT_EQ(Ref(new CrlSequence(nullptr))->Import(Wrap(odd).get()), VESK2_ERR_HASH_ID) << part;
  }
}

// Nothing that differs from what was signed is ever verified.
TEST(CrlSequence, EveryTruncationAndBitFlipIsRefused) {
  const std::string text = CrlSequenceText(0, kTag, kCrl);
  const Ref<SExpression> acls = Acls({Root()});
  ForEachDamage(text, [&](const std::string& damaged) {
    const Ref<CrlSequence> sequence(new CrlSequence(nullptr));
    if (sequence->Import(Wrap(damaged).get()) != 0) return;
    EXPECT_TRUE(sequence->VerifySelf(acls.get()) != 0 || Canonical(sequence) == text);
  });
}

TEST(CrlSequence, VerifySelf) {
  const std::string text = CrlSequenceText(0, kTag, kCrl);
  const std::string key = Cert({.issuer = KeyText(0), .subject = KeyText(0), .tag = kTag});
  const std::string forKey = List({Str("sequence"), kCrl, key, TestKey::Rsa(0).Sign(key)});
  const std::tuple<std::string, Ref<SExpression>, int> cases[] = {
      {text, Acls({Root()}), 0},
      // An entry counts whether it may propagate and whether its time is over or not.
      {text, Acls({AclEntryText(KeyText(0), kTag, false, "", kPast)}), 0},
      {text, Acls({AclEntryText(KeyText(0), Tag("sym"))}), kNoEntry},
      // The last entry with the tag decides.
      {text, Acls({Root(1), Root()}), 0},
      {text, Acls({Root(), Root(1)}), kNoEntry},
      {text, Acls({}), kNoEntry},
      {text, Parse("()"), kInvalid},
      {text, Ref<SExpression>(), kInvalid},
      {forKey, Acls({Root()}), VESK2_ERR_HASH_ID},
      {CrlSequenceText(0, "", kCrl), Acls({Root()}), kNoEntry},  // no entry is for no tag
      // Changed after signing: the list, the certificate.
      {With(text, kMiddle, kPast), Acls({Root()}), VESK2_ERR_SIGNATURE},
      {With(text, kFuture, kFarFuture), Acls({Root()}), VESK2_ERR_HASH_MISMATCH},
  };
  for (const auto& [read, acls, code] : cases) {
    const Ref<CrlSequence> sequence = Read<CrlSequence>(read);
    EXPECT_EQ(sequence->VerifySelf(acls.get()), code) << read;
    EXPECT_EQ(sequence->GetCrl()->GetIssuerTag() != nullptr, code == 0);
  }
}

// The period is handed out in any case, and the names of the two codes are crossed.
TEST(CrlSequence, VerifyValidity) {
  constexpr long kBegin = 978307200;  // kPast
  constexpr long kEnd = 1293840000;   // kMiddle
  const Ref<CrlSequence> list = Read<CrlSequence>(CrlSequenceText(0, kTag, kCrl, kPast, kMiddle));
  const std::tuple<long, long, int> cases[] = {
      {0, 0, 0},        {kBegin, kEnd, 0}, {1, kBegin - 1, VESK2_ERR_NOT_AFTER},
      {kEnd + 1, 0, 0}, {0, 1, 0},         {kEnd + 1, kEnd + 2, VESK2_ERR_NOT_BEFORE},
  };
  for (auto [from, to, code] : cases) {
    EXPECT_EQ(list->VerifyValidity(&from, &to), code);
    EXPECT_EQ(from, kBegin);
    EXPECT_EQ(to, kEnd);
  }
}

// ---- Asking ----

// A certificate for key 3 that names the source kTag.
std::string Revocable() {
  return Cert({.issuer = KeyText(2),
               .subject = KeyText(3),
               .revocation = "(10:revocation3:sym(6:revoke1:x))"});
}

Ref<SExpression> Store(const std::vector<std::string>& sequences) {
  Ref<SExpression> store(new SExpression(nullptr));
  for (const auto& text : sequences) EXPECT_EQ(store->Insert(Read<CrlSequence>(text).Release()), 0);
  return store;
}

int AskCert(const Ref<SExpression>& store, unsigned root = 0, const char* from = "",
            const char* to = "") {
  return CrlSequence::CheckStatusNonCritical(Acls({Root(root)}).get(), store.get(),
                                             Parse(kTag).get(), Read<CertObject>(Revocable()).get(),
                                             Stamp(from).get(), Stamp(to).get());
}

TEST(CrlStatus, Certificates) {
  const std::string hash = HashOf(Revocable());
  const auto list = [&](const std::string& items, const char* begin = kPast,
                        const char* end = kFuture, unsigned key = 0) {
    return CrlSequenceText(key, kTag, CrlText(items, Item(hash)), begin, end);  // list2 is for keys
  };
  const std::string quiet = list(kOther);
  const std::string ended = list(kOther, kPast, kMiddle);
  const std::string revoking = list(Item(hash));
  const std::string forged = list(Item(hash), kPast, kFuture, 1);
  const std::string forgedQuiet = list(kOther, kPast, kFuture, 1);
  const std::string web = CrlSequenceText(0, Tag("web"), CrlText(Item(hash), ""));
  using Texts = std::vector<std::string>;
  const std::tuple<const char*, Texts, const char*, const char*, int> cases[] = {
      {"not listed, covered", {quiet}, kMiddle, kMiddle, 0},
      {"revoked at the start", {revoking}, kMiddle, kMiddle, kRevoked},
      {"revoked afterwards", {list(Item(hash, kFuture))}, kMiddle, kFarFuture, 0},
      {"no period", {list(Item(hash, kFuture))}, "", "", kRevoked},
      {"no start", {list(Item(hash, kFuture))}, "", kMiddle, kRevoked},
      {"a later item", {list(Item(hash, kFuture) + Item(hash))}, kMiddle, "", kRevoked},
      {"short date", {list(Item(hash, "3001"))}, kMiddle, "", kRevoked},
      {"no date", {list(Item(hash, "3001-01-01_00.00.00"))}, kMiddle, "", kRevoked},
      {"rmd160", {list(Item(HashOf(Revocable(), "rmd160")))}, "", "", kRevoked},
      // The period of the list itself.
      {"an empty list is absent", {list("")}, kMiddle, kMiddle, kNoCrl},
      {"ended", {ended}, kFuture, "", kEnded},
      {"ended at the start", {ended}, kMiddle, kMiddle, 0},
      {"ended, no period", {ended}, "", "", 0},
      {"not begun", {list(kOther, kFuture, kFarFuture)}, kPast, kMiddle, 0},
      {"without end", {list(kOther, kPast, "")}, kMiddle, kMiddle, kNoCrl},
      // Several lists.
      {"unverified match", {forged}, kMiddle, kMiddle, kNoCrl},
      {"unverified, then revoking", {forged, revoking}, kMiddle, kMiddle, kRevoked},
      {"quiet, then revoking", {quiet, revoking}, kMiddle, kMiddle, kRevoked},
      {"another source", {web}, kMiddle, kMiddle, kNoCrl},
      {"unverified does not stand in for ended", {forgedQuiet, ended}, kFuture, "", kEnded},
      {"the latest end counts", {quiet, ended}, kFuture, kFuture, 0},
  };
  for (const auto& [what, store, from, to, code] : cases) {
    EXPECT_EQ(AskCert(Store(store), 0, from, to), code) << what;
  }
  EXPECT_EQ(AskCert({}), kNoCrl);
  // Once verified a list stays so.
  const Ref<SExpression> store = Store({revoking});
  EXPECT_EQ(AskCert(store, 1), kNoCrl);
  EXPECT_EQ(AskCert(store, 0), kRevoked);
  EXPECT_EQ(AskCert(store, 1), kRevoked);
}

// What names a certificate says nothing of a key, whichever is asked about first.
TEST(CrlStatus, TellsCertificatesFromKeys) {
  const Ref<SExpression> roots = Acls({Root()}), tag = Parse(kTag);
  const Ref<SExpression> store =
      Store({CrlSequenceText(0, kTag, CrlText(Item(HashOf(Revocable())), ""))});
  const Ref<CertObject> cert = Read<CertObject>(Revocable());
  for (const bool keysFirst : {false, true}) {
    RevocationLists lists(roots.get(), store.get());
    for (const bool keys : {keysFirst, !keysFirst}) {
      RevocationLists::Decision decision;
      EXPECT_EQ(keys ? lists.AskCritical(decision, tag.get(), cert.get())
                     : lists.AskNonCritical(decision, tag.get(), cert.get(), nullptr),
                keys ? 0 : kRevoked);
    }
  }
}

TEST(CrlStatus, Keys) {
  const std::string key = KeyText(3);
  std::string hinted = key;
  hinted.insert(hinted.find("3:", hinted.find("1:e")), "[bin]");
  const auto list = [&](const std::string& items, const char* end = kFuture, unsigned signer = 0) {
    return CrlSequenceText(signer, kTag, CrlText(Item(HashOf(key)), items), kPast, end);
  };
  const std::string item = Item(HashOf(key), kFuture);
  const std::tuple<const char*, std::string, std::string, bool> cases[] = {
      {"listed, whatever the date", list(kOther + item), key, true},
      {"on the list for certificates only", list(kOther), key, false},
      {"hints do not take a key off the list", list(item), hinted, true},
      {"listed as it was written", list(Item(HashOf(hinted))), hinted, true},
      {"named by its hash", list(item), HashOf(key), true},
      {"named by another hash", list(item), HashOf(key, "sha1"), false},
      {"over, but still revoking", list(item, kMiddle), key, true},
      {"unverified", list(item, kFuture, 1), key, false},
  };
  for (const auto& [what, text, named, revoked] : cases) {
    Ref<Subject> object;
    ASSERT_EQ(Subject::Import(object.Out(), Wrap(named).get(), nullptr), 0);
    EXPECT_EQ(CrlSequence::CheckStatusCritical(Acls({Root()}).get(), Store({text}).get(),
                                               Parse(kTag).get(), object.get()),
              revoked ? VESK2_ERR_KEY_REVOKED : 0)
        << what;
  }
}

TEST(CertRevocation, StatusFollowsEachAnswer) {
  const std::string cert = Item(HashOf(Revocable()));
  const std::tuple<std::string, std::string, int, bool, int32_t> cases[] = {
      {cert, kOther, 0, true, Cert::RevokedByCrl},
      {cert, Item(HashOf(KeyText(3))), 0, true, Cert::KeyRevoked},
      {"", kOther, kNoCrl, false, Cert::Undetermined},
      {kOther, kOther, 0, false, Cert::NotRevoked},  // not what the last call left
  };
  const Ref<CertObject> object = Read<CertObject>(Revocable());
  const Ref<SExpression> acls = Acls({Root()});
  bool answer = false;
  for (const auto& [certs, keys, code, revoked, status] : cases) {
    const Ref<SExpression> store = Store({CrlSequenceText(0, kTag, CrlText(certs, keys))});
    EXPECT_EQ(object->IsRevoked(answer, acls.get(), store.get(), nullptr, nullptr), code);
    EXPECT_EQ(answer, revoked);
    EXPECT_EQ(object->GetRevocationStatus(), status);
  }
  // Without a revocation element only the key is asked about.
  const auto plain = Read<CertObject>(Cert({.issuer = KeyText(2), .subject = KeyText(3)}));
  EXPECT_EQ(plain->IsRevoked(answer, acls.get(), nullptr, nullptr, nullptr), 0);
}

// A trust root seen as a certificate lends its parts and has no list.
TEST(CertRevocation, TrustRootSeenAsACertificate) {
  const auto entry = Read<AclEntry>(AclEntryText(HashOf("key"), kTag, true, kPast, kFuture));
  const Ref<CertObject> view(new CertObject(entry.get()));
  EXPECT_EQ(view->GetSubject(), entry->GetSubject());
  EXPECT_TRUE(view->GetPropagate());
  EXPECT_EQ(view->First(), nullptr);
}

// ---- The store ----

constexpr char kNear[] = "3000-01-01_00:00:00";

std::string Sequence(const std::string& tag, const std::string& begin = kPast,
                     const std::string& end = kFuture, unsigned key = 0) {
  return CrlSequenceText(key, tag, CrlText(Item(HashOf("item")), ""), begin, end);
}

class CrlStore : public TrustTest {
 protected:
  // Offers a sequence to a store that trusts key 0 for its tag.
  static int Offer(const std::string& text, const std::string& tag) {
    return Read<CrlSequence>(text)->UpdateStore(Acls({RootOf(tag)}).get());
  }
};

TEST_F(CrlStore, AsksTheStoresAtThisMoment) {
  const Ref<CertObject> cert = Read<CertObject>(Revocable());
  bool revoked = true;
  EXPECT_EQ(cert->IsRevoked(revoked), kNoFile);
  EXPECT_EQ(cert->GetRevocationStatus(), Cert::Undetermined);
  WriteAcl("root", Root());
  for (const char* date : {kFuture, kMiddle}) {
    const std::string crl = CrlText(Item(HashOf(Revocable()), date), "");
    global.Write("cert/sym (revoke x).crl", CrlSequenceText(0, kTag, crl));
    EXPECT_EQ(cert->IsRevoked(revoked), 0);
    EXPECT_EQ(revoked, date == kMiddle);
  }
}

TEST_F(CrlStore, TagsNameFiles) {
  const std::string n(241, 'n'), m(208, 'm');
  std::string slashes;
  for (int i = 0; i < 11; ++i) slashes += "%2F";
  const std::tuple<std::string, std::string, int> cases[] = {
      {Tag("sym (revoke x)"), "<sym (revoke x).crl>", 0},
      {Tag("a/b (revoke x)"), "<a%2Fb (revoke x).crl>", 0},
      {Tag("../../x (revoke)"), "<..%2F..%2Fx (revoke).crl>", 0},
      {Tag(n + " (revoke)"), "<" + n + " (revoke).crl>", 0},
      {Tag(n + "n (revoke)"), "", kInvalid},
      // The limit is on the name that the file gets, in which each "/" takes three bytes.
      {Tag(m + std::string(11, '/') + " (revoke)"), "<" + m + slashes + " (revoke).crl>", 0},
      {Tag(m + "m" + std::string(11, '/') + " (revoke)"), "", kInvalid},
      {Tag(std::string("sym\0x (revoke x)", 16)), "", kInvalid},
      {"(3:foo1:a(6:revoke))", "", kInvalid},
      {Tag(".."), "", 0},  // not in the store
  };
  for (const auto& [tag, file, code] : cases) {
    EXPECT_EQ(Offer(Sequence(tag), tag), code) << tag;
    EXPECT_EQ(Names("cert"), file);
    char* path = nullptr;
    const int named = CrlSequence::StorePath(path, Parse(tag).get());
    EXPECT_EQ(named, tag == Tag("..") ? VESK2_ERR_FILE_OPEN : 0) << tag;
    const std::string base = path != nullptr ? std::filesystem::path(path).filename() : "";
    EXPECT_EQ(base.empty() ? "" : "<" + base + ">", file);
    delete[] path;
    // What was stored is what is loaded for a root with that tag.
    Ref<SExpression> store;
    EXPECT_EQ(CrlSequence::ImportStore(store.Out(), Acls({RootOf(tag)}).get(), nullptr), 0);
    EXPECT_EQ(store->Count(), file.empty() ? 0U : 1U) << tag;
    std::filesystem::remove_all(global.File("cert"));
    std::filesystem::create_directory(global.File("cert"));
  }
  EXPECT_EQ(Offer(Sequence(""), Tag("a")), kInvalid);
  char* none = nullptr;
  EXPECT_EQ(CrlSequence::StorePath(none, Parse("()").get()), 0);
  EXPECT_EQ(none, nullptr);
}

TEST_F(CrlStore, UpdateRules) {
  const std::string tag = Tag("sym");
  const std::tuple<const char*, std::string, std::string, bool> cases[] = {
      {"same end", Sequence(tag, kMiddle), Sequence(tag), true},
      {"earlier end", Sequence(tag), Sequence(tag, kPast, kNear), false},
      {"not begun", Sequence(tag), Sequence(tag, kFuture, kFarFuture), false},
      {"stored not begun", Sequence(tag, kFuture, kFarFuture), Sequence(tag), true},
      {"no start: begun", Sequence(tag), Sequence(tag, "", kFarFuture), true},
      {"no end", Sequence(tag), Sequence(tag, kPast, ""), false},
      {"stored without end", Sequence(tag, kPast, ""), Sequence(tag), false},
      {"damaged, not begun", "damaged", Sequence(tag, kFuture), true},
      {"unverified", Sequence(tag), Sequence(tag, kPast, kFarFuture, 1), false},
      {"another tag", Sequence(Tag("other")), Sequence(tag, kPast, kFarFuture), false},
      {"stored without tag", Sequence(""), Sequence(tag, kPast, kFarFuture), false},
  };
  for (const auto& [what, stored, fresh, replaces] : cases) {
    global.Write("cert/sym.crl", stored);
    EXPECT_EQ(Offer(fresh, tag), 0) << what;
    EXPECT_EQ(global.Read("cert/sym.crl"), replaces ? fresh : stored) << what;
  }
  EXPECT_EQ(Ref(new CrlSequence(nullptr))->UpdateStore(nullptr), kInvalid);
}

TEST_F(CrlStore, ReplacesWholeOrNotAtAll) {
  const std::string tag = Tag("sym");
  const std::string old = Sequence(tag, kPast, kNear);
  global.Write("cert/sym.crl", old);
  const auto handler = std::signal(SIGXFSZ, SIG_IGN);
  rlimit limit{};
  ASSERT_EQ(getrlimit(RLIMIT_FSIZE, &limit), 0);
  const rlimit full = {100, limit.rlim_max};  // the disk is full after 100 bytes
  ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &full), 0);
  EXPECT_EQ(Offer(Sequence(tag), tag), 0);
  ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &limit), 0);
  std::signal(SIGXFSZ, handler);
  EXPECT_EQ(global.Read("cert/sym.crl"), old);
  EXPECT_EQ(Names("cert"), "<sym.crl>");
  // A link is replaced, and what it points to left alone.
  const std::string victim = other.Write("victim", "keep");
  std::filesystem::remove(global.File("cert/sym.crl"));
  std::filesystem::create_symlink(victim, global.File("cert/sym.crl"));
  EXPECT_EQ(Offer(old, tag), 0);
  EXPECT_EQ(global.Read("cert/sym.crl") + other.Read("victim"), old + "keep");
}

TEST_F(CrlStore, ImportPassesOverWhatCannotBeRead) {
  Ref<SExpression> store;
  EXPECT_EQ(CrlSequence::ImportStore(store.Out(), nullptr, nullptr), kNoFile);
  EXPECT_EQ(CrlSequence::ImportStore(store.Out(), Parse("()").get(), nullptr), kInvalid);
  for (const std::string name : {"a (revoke)", "b (revoke)", "c (revoke)", "d (revoke)", "e"}) {
    WriteAcl(name, RootOf(Tag(name)));
    if (name[0] != 'c') global.Write("cert/" + name + ".crl", Sequence(Tag(name)));
  }
  global.Write("cert/b (revoke).crl", "damaged");
  std::filesystem::remove(global.File("cert/d (revoke).crl"));
  ASSERT_EQ(mkfifo(global.File("cert/d (revoke).crl").c_str(), 0600), 0);
  EXPECT_EQ(CrlSequence::ImportStore(store.Out(), nullptr, nullptr), 0);  // "e" names no source
  EXPECT_EQ(Canonical(store), "(" + Sequence(Tag("a (revoke)")) + ")");
}

TEST_F(CrlStore, FromADirectoryToTheStore) {
  const char* const dir = other.Path().c_str();
  other.Write("0.crl", "damaged");
  other.Write("1.txt", Sequence(Tag("a")));
  EXPECT_EQ(CrlSequence::ImportDirAndStore(dir, nullptr), kNoFile);  // no ACLs
  WriteAcl("a", RootOf(Tag("a")));
  EXPECT_EQ(CrlSequence::ImportDirAndStore(dir, nullptr), kNoCrl);
  other.Write("3.crl", Sequence(Tag("a")));
  other.Write("4.crl", Sequence(Tag("unknown")));
  EXPECT_EQ(CrlSequence::ImportDirAndStore(dir, nullptr), 0);
  EXPECT_EQ(Names("cert"), "<a.crl>");
  EXPECT_EQ(global.Read("cert/a.crl"), Sequence(Tag("a")));
}

TEST_F(CrlStore, Find) {
  const Ref<SExpression> tag = Parse("(3:any1:a(6:revoke))");  // the keyword does not count
  Ref<CrlSequence> found;
  EXPECT_EQ(CrlSequence::Find(found.Out(), tag.get()), VESK2_ERR_FIND_DIR);
  std::filesystem::create_directory(global.File("cert"));
  EXPECT_EQ(CrlSequence::Find(found.Out(), tag.get()), 0);  // an empty store is a success
  EXPECT_FALSE(found);
  global.Write("cert/0.crl", Sequence(Tag("a (revoke)")));
  global.Write("cert/1.crl", "damaged");
  global.Write("cert/2.crl", Sequence(""));
  EXPECT_EQ(CrlSequence::Find(found.Out(), tag.get()), 0);
  EXPECT_EQ(Canonical(found), Sequence(Tag("a (revoke)")));
  // The last candidate is handed out though it is not the one.
  EXPECT_EQ(CrlSequence::Find(found.Out(), Parse(Tag("b")).get()), kNoEntry);
  EXPECT_TRUE(found);
}

}  // namespace
}  // namespace vesk2test
