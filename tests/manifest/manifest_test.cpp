// SPDX-License-Identifier: Apache-2.0
// Whole manifests: what is read, what is proved, and which refusal each defect meets.
#include <gtest/gtest.h>

#include <filesystem>
#include <functional>
#include <string>

#include <vesk2/context.h>
#include <vesk2/evidence.h>
#include <vesk2/hash.h>
#include <vesk2/manifest.h>

#include "src/platform/text.h"
#include "tests/manifest/result_text.h"
#include "tests/support/temp_dir.h"
#include "tests/support/test_manifest.h"
#include "tests/support/test_object.h"

using namespace vesk2test;
using ZvVesk2::Evidence;
using ZvVesk2::Manifest;
using ZvVesk2::Ref;
using ZvVesk2::SExpression;
using ZvVesk2::TimeStamp;
using ZvVesk2::VeskConf;

namespace {

constexpr const char* kTag = "(install (app calc))";
constexpr const char* kFrom = "2024-01-01_00:00:00";
constexpr const char* kTo = "2024-12-31_23:59:59";
constexpr long kInside = 1717243200;   // 2024-06-01_12:00:00
constexpr long kOutside = 1750000000;  // 2025-06-15
constexpr long kSigned = 1714564800;   // the writer's time of signing, 2024-05-01_12:00:00
constexpr const char* kAllValid = "V:sub/ sub/f a I: M: X:";

std::string Flip(std::string text, size_t bit) {
  text[bit / 8] = static_cast<char>(text[bit / 8] ^ (1 << bit % 8));
  return text;
}

// A machine that trusts key 0 (the vendor) to install and to revoke; a manifest of a small tree,
// signed by key 1, whom the vendor certified for a year.
class ManifestTest : public testing::Test {
 protected:
  ManifestTest() {
    VeskConf::SetGlobalDirectory(store.Path().c_str());
    store.Write("acl/vendor.acl", AclEntryText(vendor.Public(), Tag(kTag)));
    store.Write("acl/revoke.acl", AclEntryText(vendor.Public(), Tag(kRevoke)));
    for (const char* name : {"a", "sub/f"}) tree.Write(name, name);
    parts.body = BodyOf(tree.Path() + "/");
    parts.signer.tag = Tag(kTag);
    own.issuer = vendor.Public();
    own.subject = signer.Public();
    own.tag = Tag("(install)");
    own.notBefore = kFrom;
    own.notAfter = kTo;
    parts.chain = Signed(own, vendor);
  }
  ~ManifestTest() override { VeskConf::SetGlobalDirectory(nullptr); }

  std::string Write(const std::string& text, const char* name = "m") {
    // A file that is truncated and written again may go to the disk at once; a new one does not.
    std::filesystem::remove(files.File(name));
    return files.Write(name, text);
  }
  void Open(Manifest& manifest, const std::string& text, const char* tag = kTag) {
    ASSERT_EQ(manifest.Initialize(tree.Path().c_str(), Write(text).c_str(), tag), 0);
  }
  int Verify(const std::string& text, const char* tag = kTag, long from = 0, long to = 0) {
    Manifest manifest(nullptr);
    Open(manifest, text, tag);
    const int code = manifest.VerifyManifest(from, to);
    EXPECT_EQ(Findings(manifest, tree.Path() + "/"), code == 0 ? kAllValid : "V: I: M: X:");
    EXPECT_EQ(manifest.GetSigningTime() == nullptr, code != 0);
    JudgeAgain(manifest, code, from, to);
    return code;
  }
  // A verification that keeps its evidence answers the same; what it keeps is judged the same, also
  // when file and stores are gone, and says what the code is about.
  void JudgeAgain(Manifest& manifest, int code, long from, long to) {
    const size_t position = manifest.GetReadPosition();
    Evidence evidence(nullptr);
    manifest.SetEvidence(&evidence);
    manifest.SetStoreUpdate(false);
    EXPECT_EQ(manifest.VerifyManifest(from, to), code);
    EXPECT_EQ(manifest.GetReadPosition(), position);
    EXPECT_EQ(manifest.GetListing() != nullptr, code == 0);
    EXPECT_EQ(evidence.GetContentCode() == VESK2_ERR_HASH_MATCH, code == VESK2_ERR_HASH_MATCH);
    if (code == VESK2_ERR_PARSE_FILE || evidence.GetListingPosition() == 0) return;
    EXPECT_TRUE(code == VESK2_ERR_HASH_MATCH || evidence.GetListingCode() == 0);
    EXPECT_EQ(evidence.CountCerts() > 1 && evidence.GetCarriedLists() != nullptr, true);
    const int authority = code == VESK2_ERR_HASH_MATCH || code == VESK2_ERR_TIME_STAMP ? 0 : code;
    std::filesystem::rename(store.File("acl"), store.File("away"));
    EXPECT_EQ(evidence.Judge(manifest.GetTag()), authority);
    Evidence copy(nullptr);
    EXPECT_EQ(copy.Copy(evidence), 0);
    EXPECT_EQ(copy.Judge(manifest.GetTag()), authority);
    std::filesystem::rename(store.File("away"), store.File("acl"));
  }
  // A revocation list of the vendor: canonical objects revoked as certificates and as keys.
  std::string RevocationList(const std::string& cert, const std::string& key,
                             const char* date = kFrom) {
    const auto item = [&](const std::string& object) {
      return object.empty() ? "" : List({Str("item"), HashOf(object), Str(date)});
    };
    const std::string list =
        List({Str("crl"), "(7:version1:1)", List({Str("list1"), item("nobody"), item(cert)}),
              List({Str("list2"), item(key)})});
    CertText voucher;
    voucher.issuer = vendor.Public();
    voucher.subject = HashOf(list);
    voucher.tag = Tag(kRevoke);
    voucher.notBefore = kFrom;
    voucher.notAfter = "2039-01-01_00:00:00";
    return List({Str("sequence"), list, Signed(voucher, vendor)});
  }

  static constexpr const char* kRevoke = "app (revoke all)";
  const std::string revocation = "(10:revocation3:app(6:revoke3:all))";
  const TestKey& vendor = TestKey::Rsa(0);
  const TestKey& signer = TestKey::Rsa(1);
  const TestKey& stranger = TestKey::Rsa(2);
  TempDir store, tree, files;
  CertText own;  // the signer's certificate from the vendor
  ManifestText parts;
};

TEST_F(ManifestTest, VerifiesATreeAndKeepsWhatItRead) {
  Manifest manifest(nullptr);
  Open(manifest, ManifestFile(parts));
  EXPECT_EQ(manifest.VerifyManifest(0, 0), 0);
  EXPECT_EQ(Findings(manifest, tree.Path() + "/"), kAllValid);
  ASSERT_NE(manifest.GetSigningTime(), nullptr);
  EXPECT_EQ(manifest.GetSigningTime()->ToTime(), kSigned);
  EXPECT_EQ(Canonical(*manifest.GetVersion()), "(7:version1:14:text)");
  EXPECT_EQ(Canonical(*manifest.GetType()), "(4:type5:plain)");

  // Once more, on a tree with an unlisted entry: nothing accumulates.
  tree.Write("sub/x", "");
  EXPECT_EQ(manifest.VerifyManifest(0, 0), 0);
  EXPECT_EQ(Findings(manifest, tree.Path() + "/"), "V:sub/f a I: M: X:sub/ sub/x");
  manifest.SetFailOnExtraEntries(true);
  EXPECT_EQ(manifest.VerifyManifest(0, 0), VESK2_ERR_EXTRA_FILES);

  // A failed reading leaves nothing of the one before.
  Write("(8:manifest(7:version1:2");
  EXPECT_EQ(manifest.VerifyManifest(0, 0), VESK2_ERR_MANIFEST_VERSION);
  EXPECT_EQ(Findings(manifest), "V: I: M: X:");
  EXPECT_EQ(manifest.GetSigningTime(), nullptr);
  EXPECT_EQ(manifest.GetVersion(), nullptr);
  EXPECT_EQ(manifest.GetReadPosition(), 24u);
}

TEST_F(ManifestTest, RefusesEachDefectWithItsCode) {
  CertText other = own;
  other.subject = stranger.Public();
  CertText forged = own;
  forged.issuer = stranger.Public();
  const struct {
    const char* what;
    std::function<void(ManifestText&)> change;
    int code;
  } cases[] = {
      {"as it is", [](ManifestText&) {}, 0},
      {"digest by SHA-1", [](ManifestText& m) { m.hash = "sha1"; }, 0},
      {"version 2", [](ManifestText& m) { m.version = "2"; }, VESK2_ERR_MANIFEST_VERSION},
      {"another type", [](ManifestText& m) { m.type = "plane"; }, VESK2_ERR_MANIFEST_TYPE},
      {"long stamp", [](ManifestText& m) { m.signingTime += "0"; }, VESK2_ERR_TIME_STAMP},
      {"no stamp", [](ManifestText& m) { m.signingTime.clear(); }, VESK2_ERR_TIME_STAMP},
      {"signed before the certificate",
       [](ManifestText& m) { m.signingTime = "2023-05-01_12:00:00"; }, VESK2_ERR_NOT_AUTHORIZED},
      {"signer certificate only", [](ManifestText& m) { m.chain.clear(); }, VESK2_ERR_PARSE_FILE},
      {"signer certificate for a key", [&](ManifestText& m) { m.signer.subject = signer.Public(); },
       VESK2_ERR_NOT_OBJECT_CERT},
      {"signer certificate for something else",
       [](ManifestText& m) { m.signer.subject = HashOf("other"); }, VESK2_ERR_HASH_MATCH},
      {"signed by another key than the issuer",
       [&](ManifestText& m) { m.key = &stranger, m.signer.issuer = signer.Public(); },
       VESK2_ERR_SIGNATURE},
      {"second certificate not the signer's",
       [&](ManifestText& m) { m.chain = Signed(other, vendor) + m.chain; },
       VESK2_ERR_SIGNING_CERT_ORDER},
      {"not the vendor's", [&](ManifestText& m) { m.chain = Signed(forged, stranger); },
       VESK2_ERR_NOT_AUTHORIZED},
  };
  for (const auto& row : cases) {
    ManifestText changed = parts;
    row.change(changed);
    EXPECT_EQ(Verify(ManifestFile(changed)), row.code) << row.what;
  }
  const std::string text = ManifestFile(parts);
  EXPECT_EQ(Verify(text + " "), VESK2_ERR_HASH_MATCH);
  EXPECT_EQ(Verify(text.substr(0, text.size() - parts.body.size() - 1)), VESK2_ERR_PARSE_FILE);
}

TEST_F(ManifestTest, PropagationIsForcedForTheSignersCertificateOnly) {
  CertText upper = own;
  upper.subject = stranger.Public();
  CertText lower = own;
  lower.issuer = stranger.Public();
  parts.chain = Signed(lower, stranger) + Signed(upper, vendor);
  EXPECT_EQ(Verify(ManifestFile(parts)), VESK2_ERR_NOT_AUTHORIZED);
  upper.propagate = true;
  parts.chain = Signed(lower, stranger) + Signed(upper, vendor);
  EXPECT_EQ(Verify(ManifestFile(parts)), 0);
}

TEST_F(ManifestTest, GrantsTheTagWithinThePeriod) {
  const struct {
    const char* tag;
    long from, to;
    int code;
  } cases[] = {
      {kTag, kInside, kInside + 60, 0},
      {kTag, 0, kInside, 0},
      {"(install (app calc) quiet)", 0, 0, 0},
      {"(install)", 0, 0, VESK2_ERR_PACKAGE_NOT_GRANTED},
      {"(remove)", 0, 0, VESK2_ERR_NOT_AUTHORIZED},
      {kTag, kInside, kOutside, 0},  // the periods need only meet
      {kTag, kOutside, kOutside + 60, VESK2_ERR_NOT_AUTHORIZED},
      {kTag, 1L << 40, 0, VESK2_ERR_TIME_STAMP},
  };
  for (const auto& row : cases) {
    EXPECT_EQ(Verify(ManifestFile(parts), row.tag, row.from, row.to), row.code)
        << row.tag << " " << row.from;
  }
}

TEST_F(ManifestTest, RootsComeFromTheStoreOrTheExtraDirectory) {
  TempDir extra;
  extra.Write("vendor.acl", AclEntryText(vendor.Public(), Tag(kTag)));
  std::filesystem::remove_all(store.File("acl"));
  Manifest manifest(nullptr);
  Open(manifest, ManifestFile(parts));
  EXPECT_EQ(manifest.VerifyManifest(0, 0), VESK2_ERR_FILE_NOT_FOUND);
  manifest.SetExtraAclDirectory(ZVsysutil::zv_fstrdup(extra.Path().c_str()));
  EXPECT_EQ(manifest.VerifyManifest(0, 0), 0);
}

TEST_F(ManifestTest, DropsRevokedAndUndeterminedCertificates) {
  parts.signer.revocation = revocation;
  const std::string text = ManifestFile(parts);
  const size_t begin = text.find("(4:cert");
  const std::string signerCert = text.substr(begin, text.find("(9:signature") - begin);
  const struct {
    const char* what;
    std::string lists;
    int code;
  } cases[] = {
      {"no list to ask", "", VESK2_ERR_CRL_NOT_FOUND},
      {"a list that names others", RevocationList("", ""), 0},
      {"revoked after it was signed", RevocationList(signerCert, "", "2024-06-01_00:00:00"), 0},
      {"a key on the chain revoked", RevocationList("", signer.Public()),
       VESK2_ERR_SIGNING_CERT_ORDER},
      {"the signer certificate revoked", RevocationList(signerCert, ""), VESK2_ERR_CERT_REVOKED},
  };
  for (const auto& row : cases) {
    std::filesystem::remove_all(store.File("cert"));
    parts.lists = row.lists;
    EXPECT_EQ(Verify(ManifestFile(parts)), row.code) << row.what;
    // What the manifest carried is in the store now, and counts for those that carry nothing.
    parts.lists.clear();
    EXPECT_EQ(Verify(ManifestFile(parts)), row.code) << row.what;
  }
  // The period that is asked for counts before the time of signing.
  std::filesystem::remove_all(store.File("cert"));
  parts.lists = RevocationList(signerCert, "", "2024-06-01_00:00:00");
  EXPECT_EQ(Verify(ManifestFile(parts), kTag, kInside, 0), VESK2_ERR_CERT_REVOKED);
  // Of the evidence it can be asked by itself.
  Manifest manifest(nullptr);
  Open(manifest, ManifestFile(parts));
  Evidence evidence(nullptr);
  manifest.SetEvidence(&evidence);
  EXPECT_EQ(manifest.VerifyManifest(0, 0), 0);
  const Ref<TimeStamp> later(new TimeStamp(nullptr));
  ASSERT_EQ(later->Set(kOutside), 0);
  evidence.SetRevocationTime(later.get());
  EXPECT_EQ(evidence.Judge(manifest.GetTag()), VESK2_ERR_CERT_REVOKED);
  parts.lists.clear();
  // Elsewhere in the chain too: what is undetermined is left out, needed or not.
  std::filesystem::remove_all(store.File("cert"));
  parts.signer.revocation.clear();
  own.revocation = revocation;
  const std::string plain = parts.chain;
  parts.chain = plain + Signed(own, vendor);
  EXPECT_EQ(Verify(ManifestFile(parts)), 0);
  parts.chain = Signed(own, vendor);
  EXPECT_EQ(Verify(ManifestFile(parts)), VESK2_ERR_SIGNING_CERT_ORDER);
  // A list that nobody here vouches for neither clears nor revokes.
  parts.chain = plain;
  parts.signer.revocation = revocation;
  std::filesystem::remove(store.File("acl/revoke.acl"));
  parts.lists = RevocationList("", "");
  EXPECT_EQ(Verify(ManifestFile(parts)), VESK2_ERR_CRL_NOT_FOUND);
  EXPECT_FALSE(std::filesystem::exists(store.File("cert/app (revoke all).crl")));
}

TEST_F(ManifestTest, CarriedListsCountWithoutTheStoreBeingWritten) {
  parts.signer.revocation = revocation;
  parts.lists = RevocationList("", signer.Public());
  Manifest manifest(nullptr);
  Open(manifest, ManifestFile(parts));
  manifest.SetStoreUpdate(false);
  EXPECT_EQ(manifest.VerifyManifest(0, 0), VESK2_ERR_SIGNING_CERT_ORDER);
  EXPECT_FALSE(std::filesystem::exists(store.File("cert")));
  manifest.SetStoreUpdate(true);
  EXPECT_EQ(manifest.VerifyManifest(0, 0), VESK2_ERR_SIGNING_CERT_ORDER);
  EXPECT_TRUE(std::filesystem::exists(store.File("cert/app (revoke all).crl")));
}

// The evidence of a refusal reaches as far as the file does, and its changes are judged.
TEST_F(ManifestTest, EvidenceReadsOnAndJudgesChanges) {
  CertText forged = own;
  forged.issuer = stranger.Public();
  parts.lists = RevocationList("", "");
  parts.signer.revocation = revocation;
  parts.chain = Signed(own, stranger) + Signed(forged, stranger);
  Manifest manifest(nullptr);
  Open(manifest, ManifestFile(parts));
  Evidence evidence(nullptr);
  manifest.SetEvidence(&evidence);
  EXPECT_EQ(manifest.VerifyManifest(0, 0), VESK2_ERR_SIGNATURE);
  EXPECT_FALSE(std::filesystem::exists(store.File("cert"))) << "a refusal stored a list";
  EXPECT_EQ(manifest.GetListing(), nullptr);
  ASSERT_EQ(evidence.CountCerts(), 3u);
  EXPECT_EQ(evidence.GetSignatureCode(0), 0);
  EXPECT_EQ(evidence.GetSignatureCode(1), VESK2_ERR_SIGNATURE);
  EXPECT_EQ(evidence.GetSignatureCode(2), 0);
  EXPECT_EQ(evidence.GetRevocationStatus(0), ZvVesk2::Cert::NotRevoked);
  EXPECT_EQ(evidence.GetCarriedLists()->Count(), 1u);
  EXPECT_EQ(evidence.GetEntries()->Count(), 3u);
  EXPECT_EQ(evidence.GetSigningTime()->ToTime(), kSigned);
  EXPECT_EQ(evidence.GetListingCode(), 0);

  // The certificate with a good signature, without its list, with another list, later.
  Evidence other(nullptr);
  const auto mend = [&] {
    EXPECT_EQ(other.Copy(evidence), 0);
    other.RemoveCerts();
    for (const size_t i : {0U, 1U}) EXPECT_EQ(other.AddCert(evidence.GetCert(i), nullptr, 0), 0);
    EXPECT_EQ(other.Judge(manifest.GetTag()), 0);
  };
  mend();
  const Ref<SExpression> none(new SExpression(nullptr));
  other.SetLists(none.get(), none.get());
  EXPECT_EQ(other.Judge(manifest.GetTag()), VESK2_ERR_CRL_NOT_FOUND);
  ASSERT_EQ(other.AssumeList(evidence.GetRevocationSource(0)), 0);
  EXPECT_EQ(other.Judge(manifest.GetTag()), 0);
  const Ref<TimeStamp> late(new TimeStamp(nullptr));
  ASSERT_EQ(late->Set(kOutside), 0);
  other.SetPeriod(late.get(), late.get());
  EXPECT_EQ(other.Judge(manifest.GetTag()), VESK2_ERR_NOT_AUTHORIZED);
  // As if a list named the content's certificate, one that names no source, or the signer's key.
  const std::pair<std::string, int> revoked[] = {
      {Canonical(*evidence.GetCert(0)), VESK2_ERR_CERT_REVOKED},
      {Canonical(*evidence.GetCert(1)), 0},
      {signer.Public(), VESK2_ERR_SIGNING_CERT_ORDER}};
  for (const auto& [object, code] : revoked) {
    mend();
    const Ref<ZvVesk2::Hash> digest(new ZvVesk2::Hash(nullptr));
    ASSERT_EQ(digest->Import(Wrap(HashOf(object)).get()), 0);
    ASSERT_EQ(other.AssumeRevoked(digest.get()), 0);
    EXPECT_EQ(other.Judge(manifest.GetTag()), code);
  }
  mend();
  for (const auto& [object, code] : revoked) {  // none takes the place of an earlier one
    const Ref<ZvVesk2::Hash> digest(new ZvVesk2::Hash(nullptr));
    ASSERT_EQ(digest->Import(Wrap(HashOf(object)).get()), 0);
    ASSERT_EQ(other.AssumeRevoked(digest.get()), 0);
    EXPECT_EQ(other.Judge(manifest.GetTag()), revoked[0].second) << code;
  }
  EXPECT_EQ(other.AssumeRevoked(nullptr), VESK2_ERR_PARAM_NULL);
  // The original is as it was, and a list that other entries proved is proved again.
  mend();
  Ref<SExpression> entries;
  ASSERT_EQ(SExpression::Create(entries.Out(), "acl", nullptr), 0);
  ASSERT_EQ(entries->Insert(Parse("(1:x)").Release()), 0);
  other.SetEntries(entries.get());
  EXPECT_EQ(other.Judge(manifest.GetTag()), VESK2_ERR_CRL_NOT_FOUND);
  EXPECT_EQ(evidence.Judge(manifest.GetTag()), VESK2_ERR_SIGNATURE);
}

// What callbacks were told, and when they end the work: at the call of that number.
struct Told {
  std::string text;
  int calls = 0;
  int end = 0;

  int Tell(const std::string& what) {
    text += what;
    return ++calls == end ? 1 : 0;
  }
  Vesk2FileCallbacks Callbacks() {
    return {sizeof(Vesk2FileCallbacks), this,
            [](void* user, const char* path, uint64_t bytes) {
              return static_cast<Told*>(user)->Tell(
                  std::filesystem::path(path).filename().string() + ":" + std::to_string(bytes));
            },
            [](void* user, uint64_t bytes) {
              return static_cast<Told*>(user)->Tell("+" + std::to_string(bytes));
            },
            [](void* user, const char*, int code) {
              static_cast<Told*>(user)->text += "=" + std::to_string(code) + " ";
            }};
  }
};

TEST_F(ManifestTest, CallbacksHearOfEveryFileAndMayEndTheWork) {
  tree.Write("big", std::string(130000, 'x'));
  parts.body = BodyOf(tree.Path() + "/");
  std::filesystem::remove(tree.File("a"));
  constexpr struct {
    int end, code;
    const char* told;
  } kCases[] = {
      {0, VESK2_ERR_FILE_NOT_FOUND, "big:130000+65536+64464=0 f:5+5=0 "},
      {1, VESK2_ERR_USER_INTERRUPT, "big:130000=60 "},
      {3, VESK2_ERR_USER_INTERRUPT, "big:130000+65536+64464=60 "},
      {5, VESK2_ERR_USER_INTERRUPT, "big:130000+65536+64464=0 f:5+5=60 "},
  };
  for (const auto& row : kCases) {
    Told told;
    told.end = row.end;
    Vesk2FileCallbacks callbacks = told.Callbacks();
    Manifest manifest(nullptr);
    Open(manifest, ManifestFile(parts));
    ASSERT_EQ(manifest.SetFileCallbacks(&callbacks), 0);
    EXPECT_EQ(manifest.VerifyManifest(0, 0), row.code);
    EXPECT_EQ(told.text, row.told);
    EXPECT_EQ(manifest.GetValid() == nullptr, row.code == VESK2_ERR_USER_INTERRUPT);
    // Functions that are not given are not missed.
    callbacks = {sizeof callbacks, nullptr, nullptr, nullptr, nullptr};
    EXPECT_EQ(manifest.SetFileCallbacks(&callbacks), 0);
    EXPECT_EQ(manifest.VerifyManifest(0, 0), VESK2_ERR_FILE_NOT_FOUND);
    ++callbacks.size;
    EXPECT_EQ(manifest.SetFileCallbacks(&callbacks), VESK2_ERR_INVALID_PARAM);
  }
}

TEST_F(ManifestTest, ReadsWithoutTheChainAndHandsTheBodyOver) {
  std::filesystem::remove_all(store.File("acl"));
  parts.signer.revocation = revocation;
  parts.lists = RevocationList("", signer.Public());
  Manifest manifest(nullptr);
  Open(manifest, ManifestFile(parts));
  ZVsysutil::ZvBuffer* read = nullptr;
  ASSERT_EQ(manifest.ReadManifest(false, 0, 0, &read), 0);
  const BufferPtr body(read);
  EXPECT_EQ(std::string(reinterpret_cast<const char*>(body->Data()), body->Remaining()),
            parts.body);
  EXPECT_EQ(manifest.ReadManifest(false, 0, 0, nullptr), 0);
  // Without a store nothing is authorized; whoever asks for the evidence gets the rest of it.
  Evidence evidence(nullptr);
  manifest.SetEvidence(&evidence);
  EXPECT_EQ(manifest.VerifyManifest(0, 0), VESK2_ERR_FILE_NOT_FOUND);
  EXPECT_GT(evidence.GetListingPosition(), 0U);
  manifest.SetEvidence(nullptr);

  std::string text = ManifestFile(parts);
  text[text.size() - 3] ^= 1;
  Write(text);
  EXPECT_EQ(manifest.ReadManifest(false, 0, 0, &read), VESK2_ERR_HASH_MATCH);
  EXPECT_EQ(read, nullptr);
  text = ManifestFile(parts);
  text.back() = '(';
  Write(text);
  EXPECT_EQ(manifest.ReadManifest(false, 0, 0, &read), VESK2_ERR_PARSE_FILE);
  EXPECT_EQ(read, nullptr);
}

// Whoever asks for the evidence is told what the file says, whatever that is worth; the answer
// stays.
TEST_F(ManifestTest, TellsWhatARefusedManifestSays) {
  parts.lists = RevocationList("", signer.Public());
  const std::string good = ManifestFile(parts);
  const struct {
    const char* from;
    const char* to;
    int code;
    size_t certs, lists;
    bool whole;
  } rows[] = {
      {"", "", 0, 2, 1, true},
      {"4:text", "4:tixt", VESK2_ERR_HASH_MATCH, 2, 1, true},
      {"7:rsa-1.5", "7:rsa-1.6", VESK2_ERR_SIGNATURE_ID, 2, 1, true},
      {"version1:1", "version1:2", VESK2_ERR_MANIFEST_VERSION, 0, 0, false},
      {"(3:crl(8:", "(3:crl(9:", VESK2_ERR_PARSE_FILE, 2, 0, false},
      {"12:random-token", "12:random-tokem", VESK2_ERR_HASH_MATCH, 2, 1, false},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.to);
    std::string text = good;
    text.replace(text.find(row.from), std::string(row.from).size(), row.to);
    Manifest manifest(nullptr);
    Open(manifest, text);
    EXPECT_EQ(manifest.ReadManifest(false, 0, 0, nullptr), row.code);
    EXPECT_EQ(manifest.GetVersion() != nullptr, row.code == 0);
    EXPECT_EQ(manifest.GetListing(), nullptr);
    Evidence evidence(nullptr);
    manifest.SetEvidence(&evidence);
    EXPECT_EQ(manifest.ReadManifest(false, 0, 0, nullptr), row.code);
    EXPECT_EQ(evidence.CountCerts(), row.certs);
    const SExpression* const lists = evidence.GetCarriedLists();
    EXPECT_EQ(lists != nullptr ? lists->Count() : 0, row.lists);
    EXPECT_EQ(manifest.GetListing() != nullptr, row.whole);
    EXPECT_EQ(manifest.GetVersion() != nullptr && manifest.GetType() != nullptr, row.certs > 0);
    EXPECT_TRUE(!row.whole || evidence.GetListingPosition() + 1 == text.size());
  }
}

TEST_F(ManifestTest, ComparesTwoManifests) {
  ManifestText other = parts;
  other.body = Body(FileEntry("a", "a") + FileEntry("x", ""));
  const std::string path = Write(ManifestFile(other), "other");
  Manifest manifest(nullptr);
  Open(manifest, ManifestFile(parts));
  for (int run = 0; run < 2; ++run) {
    EXPECT_EQ(manifest.CompareManifest(path.c_str()), VESK2_ERR_FILE_NOT_FOUND);
    EXPECT_EQ(Findings(manifest), "V:a I: M:sub/f sub/ X:x");
  }
  parts.body = Body(FileEntry("a", "a"));
  Write(ManifestFile(parts));
  EXPECT_EQ(manifest.CompareManifest(path.c_str()), VESK2_ERR_EXTRA_FILES);
  EXPECT_EQ(manifest.CompareManifest("/nonexistent"), VESK2_ERR_OPEN_MANIFEST_FILE);
  EXPECT_EQ(manifest.CompareManifest(nullptr), VESK2_ERR_INVALID_PARAM);
  Write(ManifestFile(parts) + "x", "other");
  EXPECT_EQ(manifest.CompareManifest(path.c_str()), VESK2_ERR_HASH_MATCH);
}

TEST_F(ManifestTest, InitializeRefusesNullAndBadTags) {
  Manifest manifest(nullptr);
  EXPECT_EQ(manifest.Initialize(nullptr, "m", "a"), VESK2_ERR_INVALID_PARAM);
  EXPECT_EQ(manifest.Initialize("d", nullptr, "a"), VESK2_ERR_INVALID_PARAM);
  EXPECT_EQ(manifest.Initialize("d", "m", nullptr), VESK2_ERR_INVALID_PARAM);
  EXPECT_NE(manifest.Initialize("d", "m", "(a"), 0);
  EXPECT_EQ(manifest.Initialize("d", "m", "(a)"), 0);
  EXPECT_EQ(manifest.CopyExtraAclDirectory("d"), 0);
  EXPECT_EQ(manifest.VerifyManifest(0, 0), VESK2_ERR_OPEN_MANIFEST_FILE);
}

// No truncation and no flipped bit gets through.
TEST_F(ManifestTest, RefusesEveryTruncationAndFlippedBit) {
  const std::string text = ManifestFile(parts);
  Manifest manifest(nullptr);
  Open(manifest, text);
  const auto sound = [&](const std::string& changed) {
    Write(changed);
    // The cheap half first: hardly a change gets past the signatures and the digest.
    return manifest.ReadManifest(false, 0, 0, nullptr) == 0 && manifest.VerifyManifest(0, 0) == 0;
  };
  ASSERT_TRUE(sound(text));
  for (size_t length = 0; length < text.size(); ++length) {
    EXPECT_FALSE(sound(text.substr(0, length))) << length;
  }
  for (size_t bit = 0; bit < text.size() * 8; ++bit) {
    EXPECT_FALSE(sound(Flip(text, bit))) << bit / 8 << " of " << text.size() << ", " << bit % 8;
  }
}

// The lists are outside the digest, but a certificate that asks for one is only as good as its
// list.
TEST_F(ManifestTest, RefusesAListWithAFlippedBit) {
  parts.signer.revocation = revocation;
  parts.lists = RevocationList("", "");
  const std::string text = ManifestFile(parts);
  EXPECT_EQ(Verify(text), 0);
  const size_t begin = text.find(parts.lists);
  for (size_t place = begin; place < begin + parts.lists.size(); ++place) {
    std::filesystem::remove_all(store.File("cert"));
    EXPECT_NE(Verify(Flip(text, place * 8 + place % 8)), 0) << place - begin;
  }
}

}  // namespace
