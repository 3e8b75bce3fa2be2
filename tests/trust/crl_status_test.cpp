#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

const std::string kTag = Tag("sym (revoke x)");
const std::string kNothing = Item(HashOf("other"));
constexpr int kRevoked = VESK2_ERR_CERT_REVOKED;
constexpr int kNoCrl = VESK2_ERR_CRL_NOT_FOUND;
constexpr int kEnded = VESK2_ERR_NOT_AFTER;

// Key 0 vouches for lists of the source kTag; key 1 is a stranger. The certificate that is asked
// about names kTag in its revocation element, and has key 3 as its subject.
std::string Revocable() {
  CertText parts;
  parts.issuer = KeyText(2);
  parts.subject = KeyText(3);
  parts.revocation = "(10:revocation3:sym(6:revoke1:x))";
  return Cert(parts);
}
Ref<SExpression> Roots(unsigned key = 0) { return Acls({AclEntryText(KeyText(key), kTag)}); }

Ref<SExpression> Store(std::initializer_list<std::string> sequences) {
  Ref<SExpression> store(new SExpression(nullptr));
  for (const std::string& text : sequences) {
    EXPECT_EQ(store->Insert(Read<CrlSequence>(text).Release()), 0);
  }
  return store;
}
Ref<SExpression> Store(const std::string& certs, const std::string& keys) {
  return Store({CrlSequenceText(0, kTag, CrlText(certs, keys))});
}

int AskCert(const Ref<SExpression>& store, const char* from = "", const char* to = "",
            unsigned root = 0) {
  return CrlSequence::CheckStatusNonCritical(Roots(root).get(), store.get(), Parse(kTag).get(),
                                             Read<ZvVesk2::Cert>(Revocable()).get(),
                                             Stamp(from).get(), Stamp(to).get());
}
int AskKey(const Ref<SExpression>& store, const std::string& object = KeyText(3),
           const std::string& tag = kTag, unsigned root = 0) {
  return CrlSequence::CheckStatusCritical(Roots(root).get(), store.get(), Parse(tag).get(),
                                          ReadSubject(object).get());
}

TEST(CrlStatus, CertificatesAndPeriods) {
  const std::string hash = HashOf(Revocable());
  const struct {
    const char* what;
    std::string items;
    const char *begin, *end, *from, *to;
    int code;
  } cases[] = {
      {"not listed, covered", kNothing, kPast, kFuture, kMiddle, kMiddle, 0},
      {"revoked before", Item(hash, kPast), kPast, kFuture, kMiddle, kMiddle, kRevoked},
      {"revoked at the start", Item(hash, kMiddle), kPast, kFuture, kMiddle, kMiddle, kRevoked},
      {"revoked afterwards", Item(hash, kFuture), kPast, kFuture, kMiddle, kFarFuture, 0},
      {"no period", Item(hash, kFuture), kPast, kFuture, "", "", kRevoked},
      {"no start", Item(hash, kFuture), kPast, kFuture, "", kMiddle, kRevoked},
      {"a later item", Item(hash, kFuture) + Item(hash), kPast, kFuture, kMiddle, "", kRevoked},
      {"short date", Item(hash, "3001"), kPast, kFuture, kMiddle, "", kRevoked},
      {"no date", Item(hash, "3001-01-01_00.00.00"), kPast, kFuture, kMiddle, "", kRevoked},
      {"sha1", Item(HashOf(Revocable(), "sha1")), kPast, kFuture, "", "", kRevoked},
      {"rmd160", Item(HashOf(Revocable(), "rmd160")), kPast, kFuture, "", "", kRevoked},
      // The period of the list itself.
      {"an empty list is absent", "", kPast, kFuture, kMiddle, kMiddle, kNoCrl},
      {"ended", kNothing, kPast, kMiddle, kFuture, kFuture, kEnded},
      {"ended, no end asked for", kNothing, kPast, kMiddle, kFuture, "", kEnded},
      {"ended at the start", kNothing, kPast, kMiddle, kMiddle, kMiddle, 0},
      {"ended, no period", kNothing, kPast, kMiddle, "", "", 0},
      {"not begun", kNothing, kFuture, kFarFuture, kPast, kMiddle, 0},
      {"without start", kNothing, "", kFuture, kMiddle, kMiddle, 0},
      {"without end", kNothing, kPast, "", kMiddle, kMiddle, kNoCrl},
      {"without end but revoked", Item(hash), kPast, "", kMiddle, kMiddle, kRevoked},
  };
  for (const auto& c : cases) {
    const std::string crl = CrlText(c.items, Item(hash));
    EXPECT_EQ(AskCert(Store({CrlSequenceText(0, kTag, crl, c.begin, c.end)}), c.from, c.to), c.code)
        << c.what;
  }
}

TEST(CrlStatus, SeveralSequences) {
  const std::string revoking = CrlText(Item(HashOf(Revocable())), "");
  const std::string forged = CrlSequenceText(1, kTag, revoking);
  const std::string forgedQuiet = CrlSequenceText(1, kTag, CrlText(kNothing, ""));
  const std::string good = CrlSequenceText(0, kTag, revoking);
  const std::string quiet = CrlSequenceText(0, kTag, CrlText(kNothing, ""));
  const std::string ended = CrlSequenceText(0, kTag, CrlText(kNothing, ""), "", kPast);
  const struct {
    const char* what;
    Ref<SExpression> store;
    int code;
  } cases[] = {
      {"no store", {}, kNoCrl},
      {"unverified match", Store({forged}), kNoCrl},
      {"unverified, then quiet", Store({forged, quiet}), 0},
      {"unverified, then revoking", Store({forged, good}), kRevoked},
      {"quiet, then revoking", Store({quiet, good}), kRevoked},
      {"another source", Store({CrlSequenceText(0, Tag("web"), revoking)}), kNoCrl},
      {"unverified does not stand in for ended", Store({forgedQuiet, ended}), kEnded},
      {"the latest end counts", Store({quiet, ended}), 0},
  };
  for (const auto& c : cases) EXPECT_EQ(AskCert(c.store, kMiddle, kMiddle), c.code) << c.what;
  // Once verified a sequence stays so.
  const Ref<SExpression> store = Store({good});
  EXPECT_EQ(AskCert(store, "", "", 1), kNoCrl);
  EXPECT_EQ(AskCert(store), kRevoked);
  EXPECT_EQ(AskCert(store, "", "", 1), kRevoked);
}

TEST(CrlStatus, Keys) {
  const std::string key = KeyText(3);
  std::string hinted = key;
  hinted.insert(hinted.find("3:", hinted.find("1:e")), "[bin]");
  const Ref<SExpression> listed = Store("", kNothing + Item(HashOf(key), kFuture));
  const struct {
    const char* what;
    const Ref<SExpression>& store;
    std::string object;
    bool revoked;
  } cases[] = {
      {"listed, whatever the date", listed, key, true},
      {"another key", listed, KeyText(2), false},
      {"list1 is for certificates", Store(Item(HashOf(key)), kNothing), key, false},
      {"hints do not take a key off the list", listed, hinted, true},
      {"listed as it was written", Store("", Item(HashOf(hinted))), hinted, true},
      {"named by its hash", listed, HashOf(key), true},
      {"named by another hash", listed, HashOf(key, "sha1"), false},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(AskKey(c.store, c.object), c.revoked ? VESK2_ERR_KEY_REVOKED : 0) << c.what;
  }
  // A list whose time is over still revokes keys; one that does not verify never did.
  const std::string crl = CrlText("", Item(HashOf(key)));
  const std::string ended = CrlSequenceText(0, kTag, crl, kPast, kMiddle);
  EXPECT_EQ(AskKey(Store({CrlSequenceText(1, kTag, crl), ended})), VESK2_ERR_KEY_REVOKED);
  EXPECT_EQ(AskKey(Store({ended}), key, Tag("web")), 0);
  EXPECT_EQ(AskKey(Store({ended}), key, kTag, 1), 0);
}

TEST(CertRevocation, StatusFollowsEachAnswer) {
  const std::string cert = Item(HashOf(Revocable()));
  const struct {
    std::string certs, keys;
    int code;
    bool revoked;
    int32_t status;
  } cases[] = {
      {kNothing, kNothing, 0, false, Cert::NotRevoked},
      {cert, kNothing, 0, true, Cert::RevokedByCrl},
      {cert, Item(HashOf(KeyText(3))), 0, true, Cert::KeyRevoked},
      {"", kNothing, kNoCrl, false, Cert::Undetermined},
      {kNothing, kNothing, 0, false, Cert::NotRevoked},  // not what the last call left
  };
  const Ref<ZvVesk2::Cert> object = Read<ZvVesk2::Cert>(Revocable());
  bool revoked = false;
  for (const auto& c : cases) {
    EXPECT_EQ(
        object->IsRevoked(revoked, Roots().get(), Store(c.certs, c.keys).get(), nullptr, nullptr),
        c.code);
    EXPECT_EQ(revoked, c.revoked) << &c - cases;
    EXPECT_EQ(object->GetRevocationStatus(), c.status) << &c - cases;
  }
  // Without a revocation element only the key is asked about.
  object->SetRevocationElement(nullptr);
  EXPECT_EQ(object->IsRevoked(revoked, Roots().get(), nullptr, nullptr, nullptr), 0);
}

class InstalledRevocation : public TrustTest {};

TEST_F(InstalledRevocation, AsksTheStoresAtThisMoment) {
  const Ref<ZvVesk2::Cert> cert = Read<ZvVesk2::Cert>(Revocable());
  bool revoked = true;
  EXPECT_EQ(cert->IsRevoked(revoked), VESK2_ERR_FILE_NOT_FOUND);
  EXPECT_EQ(cert->GetRevocationStatus(), 3);
  WriteAcl("root", AclEntryText(KeyText(0), kTag));
  EXPECT_EQ(cert->IsRevoked(revoked), kNoCrl);
  for (const char* date : {kFuture, kMiddle}) {
    const std::string crl = CrlText(Item(HashOf(Revocable()), date), "");
    global.Write("cert/sym (revoke x).crl", CrlSequenceText(0, kTag, crl));
    EXPECT_EQ(cert->IsRevoked(revoked), 0);
    EXPECT_EQ(revoked, date == kMiddle);
  }
}

TEST(CertRevocation, TrustRootSeenAsACertificate) {
  const Ref<AclEntry> entry =
      Read<AclEntry>(AclEntryText(HashOf("key"), kTag, true, kPast, kFuture));
  const Ref<ZvVesk2::Cert> view(new ZvVesk2::Cert(entry.get()));
  EXPECT_EQ(view->GetSubject(), entry->GetSubject());
  EXPECT_EQ(view->GetTag(), entry->GetTag());
  EXPECT_EQ(view->GetNotAfter(), entry->GetNotAfter());
  EXPECT_TRUE(view->GetPropagate());
  EXPECT_EQ(view->First(), nullptr);
}

}  // namespace
}  // namespace vesk2test
