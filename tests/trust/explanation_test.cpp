// SPDX-License-Identifier: Apache-2.0
// Why a chain was refused, and what a yes rests on. The ACL store trusts key 0 for (ftp); key 4
// issues the revocation lists.
#include <vesk2/cert_sequence.h>
#include <vesk2/evidence.h>
#include <vesk2/explanation.h>
#include <vesk2/limits.h>

#include <tuple>

#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

constexpr int kNone = VESK2_ERR_NOT_AUTHORIZED;
const std::string kSource = "sym (revoke x)";

std::string Revocable(const std::string& source = "1:x") {
  return "(10:revocation3:sym(6:revoke" + source + "))";
}
std::string Link(unsigned from, CertText parts) {
  if (parts.issuer.empty()) parts.issuer = KeyText(from);
  if (parts.tag.empty()) parts.tag = Tag("(ftp)");
  const std::string cert = Cert(parts);
  return cert + TestKey::Rsa(from).Sign(cert) + "(5:owner2:me)";
}
std::string Link(unsigned from, unsigned to) {
  return Link(from, {.subject = KeyText(to), .propagate = true});
}

// "KIND cert N/OTHER", "KIND entry FILE"; one after the other.
std::string Told(const Explanation& explanation) {
  std::string told;
  for (size_t i = 0; i < explanation.CountReasons(); ++i) {
    const Explanation::Reason& reason = explanation.GetReason(i);
    told += (i > 0 ? ", " : "") + std::string(Explanation::Word(reason.kind));
    if (reason.cert != Explanation::kNone) told += " " + std::to_string(reason.cert + 1);
    if (reason.otherCert != Explanation::kNone) told += "/" + std::to_string(reason.otherCert + 1);
    const char* const path = reason.entry != nullptr ? reason.entry->GetFileName() : nullptr;
    if (path != nullptr) told += " " + std::filesystem::path(path).filename().string();
    EXPECT_NE(reason.text, nullptr);
  }
  return told;
}

// What is told when the second certificate is not the signer's.
std::string OutOfOrder(const std::string& subject, const std::string& signer) {
  const auto print = [](const std::string& key) {
    std::string text = "sha256:";
    for (const char byte : Digest(key)) {
      text += "0123456789abcdef"[static_cast<unsigned char>(byte) >> 4];
      text += "0123456789abcdef"[byte & 15];
    }
    return text;
  };
  return " is for " + print(subject) + ", not for the signer " + print(signer);
}

class Explaining : public TrustTest {
 protected:
  Explaining() { WriteAcl("source", AclEntryText(KeyText(4), Tag(kSource))); }

  int Verify(const std::string& items, const std::string& asked, const std::string& at) {
    Ref<CertSequence> sequence;
    const BufferPtr buffer = Wrap(List({Str("sequence"), items}));
    EXPECT_EQ(CertSequence::Import(sequence.Out(), buffer.get(), nullptr), 0);
    tag = Parse(Tag(asked));
    const Ref<TimeStamp> stamp = Stamp(at);
    const int code = sequence->Verify(nullptr, tag.get(), stamp.get(), stamp.get(), evidence);
    EXPECT_EQ(explanation.Explain(evidence, code, tag.get()), 0);
    EXPECT_TRUE(explanation.IsComplete());
    return code;
  }

  Evidence evidence{nullptr};
  Explanation explanation{nullptr};
  Ref<SExpression> tag;
};

TEST_F(Explaining, Refusals) {
  const std::string root = AclEntryText(KeyText(0), Tag("(ftp)"), true, kPast, kFuture);
  const std::string leaf = Link(1, 2), top = Link(0, 1);
  const std::string revocable = Cert({.issuer = KeyText(1),
                                      .subject = KeyText(2),
                                      .tag = Tag("(ftp)"),
                                      .revocation = Revocable()});
  const std::string listed = revocable + TestKey::Rsa(1).Sign(revocable) + "()";
  const std::string lost = Link(1, {.subject = KeyText(2), .revocation = Revocable("1:y")});
  const std::string ended = Link(1, {.subject = KeyText(2), .notAfter = kPast});
  const std::string late =
      Link(0, {.subject = KeyText(1), .propagate = true, .notBefore = kMiddle});
  const std::string forged = Cert({.issuer = KeyText(0), .subject = KeyText(1), .propagate = true});
  const std::string bad = forged + TestKey::Rsa(3).Sign(forged) + "()";
  const std::string either = "(6:k-of-n[num]1:\1[num]1:\2" + KeyText(0) + KeyText(5) + ")";
  const std::string several =
      "(6:k-of-n[num]1:\2[num]1:\3" + KeyText(0) + KeyText(5) + KeyText(6) + ")";
  // The name in the store: what stands there; the chain; the tag; when; the code; the reasons.
  const std::tuple<std::string, std::string, const char*, std::string, int, std::string> cases[] = {
      {root, leaf + forged + TestKey::Rsa(3).Sign(forged) + "()", "(ftp)", "", VESK2_ERR_SIGNATURE,
       "signature 2"},
      {root, listed + top + Link(0, 7), "(ftp)", kMiddle, VESK2_ERR_CERT_REVOKED,
       "revoked 1, key-revoked 3"},
      {root, bad + forged + TestKey::Rsa(3).Sign(forged) + "()", "(ftp)", "", VESK2_ERR_SIGNATURE,
       "signature 1, signature 2"},
      {root, lost + top, "(ftp)", "", VESK2_ERR_CRL_NOT_FOUND, "undetermined 1"},
      {root, ended + top, "(ftp)", kMiddle, kNone, "period 1, combination"},
      {root, ended + late, "(ftp)", "", kNone, "period 1/2"},
      {root, leaf + top, "(ftp)", kFarFuture, kNone, "period root.acl, combination"},
      {root, Link(1, {.subject = KeyText(2), .tag = Tag("(ftp a)")}) + top, "(ftp)", "",
       VESK2_ERR_PACKAGE_NOT_GRANTED, "tag 1, combination"},
      {root, leaf + Link(0, {.subject = KeyText(1)}), "(ftp)", "", kNone, "propagate 2"},
      {root, leaf + Link(0, 3), "(ftp)", "", kNone, "link 2"},
      {root, Link(2, 3), "(ftp)", "", kNone, "no-entry"},
      {AclEntryText(KeyText(0), Tag("(ftp)"), false), top, "(ftp)", "", kNone,
       "propagate root.acl"},
      {AclEntryText(KeyText(0), Tag("(web)")), top, "(ftp)", "", kNone, "tag root.acl"},
      {AclEntryText(HashOf(KeyText(0), "sha1"), Tag("(web)")), top, "(ftp)", "", kNone,
       "tag root.acl"},
      {AclEntryText(several, Tag("(ftp)")), top, "(ftp)", "", kNone, "threshold root.acl"},
      // Nobody is missing.
      {AclEntryText(either, Tag("(web)")), top, "(ftp)", "", kNone, "tag root.acl"},
      {root, Link(0, {.subject = "(6:k-of-n[num]1:\1[num]1:\1" + KeyText(3) + ")"}), "(ftp)", "",
       SPKI_ERR_KEY_OR_HASH_EXPECTED, "unreadable 1"},
      {AclEntryText("(6:k-of-n[num]1:\3[num]1:\1" + KeyText(3) + ")", Tag("(ftp)")), top, "(ftp)",
       "", SPKI_ERR_KOFN_SYNTAX, "unreadable root.acl"},
      // The first that stops the reduction, and not whom it could not be asked about.
      {AclEntryText("(6:k-of-n[num]1:\3[num]1:\1" + KeyText(3) + ")", Tag("(ftp)")),
       Link(0, {.subject = "(6:k-of-n[num]1:\1[num]1:\1" + KeyText(3) + ")"}), "(ftp)", "",
       SPKI_ERR_KEY_OR_HASH_EXPECTED, "unreadable root.acl"},
  };
  global.Write(
      "cert/" + kSource + ".crl",
      CrlSequenceText(4, Tag(kSource), CrlText(Item(HashOf(revocable)), Item(HashOf(KeyText(7))))));
  for (const auto& [entry, items, asked, at, code, reasons] : cases) {
    WriteAcl("root", entry);
    EXPECT_EQ(Verify(items, asked, at), code) << reasons;
    EXPECT_EQ(Told(explanation), reasons) << code;
  }
  std::filesystem::remove_all(global.File("acl"));
  EXPECT_EQ(Verify(leaf, "(ftp)", ""), VESK2_ERR_ACL_ENTRY_NOT_FOUND);
  EXPECT_EQ(Told(explanation), "no-entry");
}

// What is told of the loss: what was valid or granted, and what was asked.
TEST_F(Explaining, Texts) {
  const std::string root = AclEntryText(KeyText(0), Tag("(ftp)"), true, kPast, kFuture);
  const std::string top = Link(0, 1);
  const std::string from = std::string(" from ") + kPast + " until " + kFuture + ", ";
  // The chain; when; what is in the text of the first reason, and of the last.
  const std::tuple<std::string, std::string, std::string, std::string> cases[] = {
      {Link(1, 2) + top, kFarFuture, std::string(" was valid until ") + kFuture + ", asked was ",
       "the chain grants (ftp)" + from + "asked was (ftp) "},
      {Link(1, {.subject = KeyText(2), .notBefore = kFuture}) + top, kMiddle,
       std::string(" is not valid before ") + kFuture + ", asked was ", "asked was (ftp) "},
      {Link(1, {.subject = KeyText(2), .tag = Tag("(ftp a)")}) + top, kMiddle,
       " grants (ftp a), asked was (ftp)", "the chain grants (ftp a)" + from + "asked was (ftp) "},
  };
  WriteAcl("root", root);
  for (const auto& [items, at, first, last] : cases) {
    EXPECT_NE(Verify(items, "(ftp)", at), 0);
    ASSERT_GT(explanation.CountReasons(), 0U) << first;
    const std::string texts[] = {explanation.GetReason(0).text,
                                 explanation.GetReason(explanation.CountReasons() - 1).text};
    EXPECT_NE(texts[0].find(first), std::string::npos) << texts[0];
    EXPECT_NE(texts[1].find(last), std::string::npos) << texts[1];
  }
  // Asked about several tags, the first that is beyond.
  const Ref<SExpression> members = Parse(List({Tag("(ftp a)"), Tag("(web)")}));
  EXPECT_EQ(Verify(top, "(ftp)", kMiddle), 0);
  ASSERT_EQ(explanation.Explain(evidence, kNone, tag.get(), members.get()), 0);
  EXPECT_TRUE(Told(explanation).starts_with("tag 1, tag root.acl")) << Told(explanation);
  EXPECT_NE(std::string(explanation.GetReason(0).text).find("asked was (web)"), std::string::npos);
}

// A manifest's own reasons, from evidence that is put together by hand.
TEST_F(Explaining, RefusedManifests) {
  const Ref<CertObject> signer =
      Read<CertObject>(Cert({.issuer = KeyText(1), .subject = HashOf("x")}));
  const Ref<CertObject> own = Read<CertObject>(Cert({.issuer = KeyText(0), .subject = KeyText(1)}));
  const Ref<CertObject> stray =
      Read<CertObject>(Cert({.issuer = KeyText(0), .subject = KeyText(2)}));
  tag = Parse(Tag("(ftp)"));
  const std::tuple<CertObject*, CertObject*, int, int, std::string> cases[] = {
      {signer.get(), own.get(), 0, VESK2_ERR_HASH_MATCH, "content 1"},
      {signer.get(), own.get(), VESK2_ERR_PARSE_FILE, VESK2_ERR_HASH_MATCH, "content, content 1"},
      {stray.get(), own.get(), 0, VESK2_ERR_NOT_OBJECT_CERT, "order 1"},
      {signer.get(), stray.get(), 0, VESK2_ERR_SIGNING_CERT_ORDER,
       "order 2, undetermined 1, undetermined 2"},
      {signer.get(), own.get(), 0, VESK2_ERR_OPEN_MANIFEST_FILE, ""},
  };
  for (const auto& [first, second, listing, code, reasons] : cases) {
    evidence.Clear(Evidence::SignedManifest);
    ASSERT_EQ(evidence.AddCert(first, nullptr, 0) + evidence.AddCert(second, nullptr, 0), 0);
    evidence.SetContent(VESK2_ERR_HASH_MATCH, listing, 7);
    ASSERT_EQ(explanation.SetNames("a\x1b\xc2\xa7.manifest", "extra"), 0);
    ASSERT_EQ(explanation.Explain(evidence, code, tag.get()), 0);
    EXPECT_EQ(Told(explanation), reasons);
    if (second == stray.get()) {
      EXPECT_TRUE(
          std::string(explanation.GetReason(0).text).ends_with(OutOfOrder(KeyText(2), KeyText(1))));
    }
    if (listing == 0) continue;
    EXPECT_STREQ(
        explanation.GetReason(0).text,
        "a\\x1b\xc2\xa7.manifest: byte 7: not in the expected form (VESK2_ERR_PARSE_FILE)");
  }
}

// What a yes rests on, when it ends, and by what.
TEST_F(Explaining, Grants) {
  constexpr char kSoon[] = "2900-01-01_00:00:00";
  const std::string plain = AclEntryText(KeyText(0), Tag("(ftp)")), top = Link(0, 1);
  const std::string brief = AclEntryText(KeyText(0), Tag("(ftp)"), true, kPast, kFuture);
  const std::string elsewhere = AclEntryText(KeyText(9), Tag("(ftp)"), true, kPast, kPast);
  const std::string ends = Link(1, {.subject = KeyText(2), .notAfter = kSoon});
  const std::string asks = Link(1, {.subject = KeyText(2), .revocation = Revocable()});
  const std::string pair = "(6:k-of-n[num]1:\2[num]1:\2" + KeyText(0) + KeyText(5) + ")";
  using E = Explanation;
  // Two entries, the chain; the file that grants, the path, what ends and whose.
  const std::tuple<std::string, std::string, std::string, std::string, std::string, E::End, size_t,
                   std::string>
      cases[] = {
          {plain, elsewhere, top, "a.acl", "1", E::NoEnd, E::kNone, ""},
          {AclEntryText(KeyText(0), Tag("(web)")), plain, top, "b.acl", "1", E::NoEnd, E::kNone,
           ""},
          {elsewhere, brief, Link(1, 2) + top, "b.acl", "21", E::EntryEnds, E::kNone, kFuture},
          {plain, brief, ends + Link(3, 4) + top, "a.acl", "31", E::CertEnds, 0, kSoon},
          {brief, plain, ends + top, "a.acl", "21", E::CertEnds, 0, kSoon},
          {plain, plain, asks + top, "a.acl", "21", E::ListEnds, 0, kSoon},
          {AclEntryText(pair, Tag("(ftp)")), elsewhere, Link(5, 1) + top, "a.acl", "21", E::NoEnd,
           E::kNone, ""},
      };
  global.Write("cert/" + kSource + ".crl",
               CrlSequenceText(4, Tag(kSource), CrlText(Item(HashOf("x")), ""), kPast, kSoon));
  for (const auto& [first, second, items, file, path, kind, cert, end] : cases) {
    WriteAcl("a", first);
    WriteAcl("b", second);
    EXPECT_EQ(Verify(items, "(ftp)", kMiddle), 0);
    ASSERT_NE(explanation.GetEntry(), nullptr) << file;
    EXPECT_EQ(std::filesystem::path(explanation.GetEntry()->GetFileName()).filename(), file);
    std::string found;
    for (size_t i = 0; i < explanation.CountPath(); ++i) {
      found += std::to_string(explanation.GetPathCert(i) + 1);
    }
    EXPECT_EQ(found, path) << file;
    EXPECT_EQ(std::pair(explanation.GetEndKind(), explanation.GetEndCert()), std::pair(kind, cert));
    const TimeStamp* const at = explanation.GetEnd();
    EXPECT_EQ(at != nullptr ? std::string(at->GetData(), at->GetData() + at->GetLength()) : "",
              end);
  }
}

// Which list decided about a certificate, and since when it was revoked.
TEST_F(Explaining, DecidingLists) {
  WriteAcl("root", AclEntryText(KeyText(0), Tag("(ftp)")));
  const std::string cert = Cert({.issuer = KeyText(0),
                                 .subject = KeyText(1),
                                 .tag = Tag("(ftp)"),
                                 .revocation = Revocable()});
  const std::string items = cert + TestKey::Rsa(0).Sign(cert) + "()";
  const std::string named = Item(HashOf(cert)), key = Item(HashOf(KeyText(1)), kPast);
  const std::string odd = Item(HashOf(cert), "soon") + named, unnamed = Item(HashOf("x"));
  const std::tuple<std::string, std::string, const char*, int32_t, bool, std::string> cases[] = {
      {unnamed, "", kMiddle, CertObject::NotRevoked, true, ""},
      {named, "", kMiddle, CertObject::RevokedByCrl, true, kMiddle},
      {named, "", kPast, CertObject::NotRevoked, true, ""},
      {odd, "", kPast, CertObject::RevokedByCrl, true, ""},  // a date that is none: always
      {named, key, kMiddle, CertObject::KeyRevoked, true, kPast},
      {unnamed, "", kFarFuture, CertObject::Undetermined, true, ""},
      {"", "", kMiddle, CertObject::Undetermined, false, ""},
  };
  for (const auto& [certs, keys, at, status, decided, since] : cases) {
    global.Write("cert/" + kSource + ".crl",
                 CrlSequenceText(4, Tag(kSource), CrlText(certs, keys)));
    (void)Verify(items, "(ftp)", at);
    EXPECT_EQ(evidence.GetRevocationStatus(0), status);
    EXPECT_EQ(evidence.GetRevocationList(0) != nullptr, decided) << status;
    const TimeStamp* const from = evidence.GetRevokedSince(0);
    EXPECT_EQ(
        from != nullptr ? std::string(from->GetData(), from->GetData() + from->GetLength()) : "",
        since);
  }
}

// A stranger chooses the number of certificates, and their periods can miss one another in pairs.
TEST_F(Explaining, IsBounded) {
  tag = Parse(Tag("(ftp)"));
  evidence.Clear(Evidence::Chain);
  const Ref<CertObject> early =
      Read<CertObject>(Cert({.issuer = KeyText(0), .subject = KeyText(1), .notAfter = kPast}));
  const Ref<CertObject> late =
      Read<CertObject>(Cert({.issuer = KeyText(0), .subject = KeyText(1), .notBefore = kFuture}));
  for (int i = 0; i < 20'000; ++i) {
    ASSERT_EQ(evidence.AddCert(i % 2 == 0 ? early.get() : late.get(), nullptr, 0), 0);
  }
  evidence.SetEntries(Acls({AclEntryText(KeyText(0), Tag("(ftp)"))}).get());
  ASSERT_EQ(explanation.Explain(evidence, kNone, tag.get()), 0);
  EXPECT_FALSE(explanation.IsComplete());
  EXPECT_EQ(explanation.CountReasons(), Limits::kMaxReasons);
  // Each certificate of a yes would have to be left out once.
  ASSERT_EQ(explanation.Explain(evidence, 0, tag.get()), 0);
  EXPECT_EQ(explanation.GetEntry(), nullptr);

  // Each entry is tried with all that the chain brings, which alone is too much.
  const std::string entry = AclEntryText(KeyText(0), Tag("(ftp)"));
  evidence.SetEntries(Acls({entry, entry, entry, entry, entry, entry, entry, entry}).get());
  ASSERT_EQ(explanation.Explain(evidence, 0, tag.get()), 0);
  EXPECT_FALSE(explanation.IsComplete());

  // One that grants, and more beside it than can be left out one by one.
  evidence.Clear(Evidence::Chain);
  for (int i = 0; i < 3'000; ++i) {
    const auto cert = Cert({.issuer = KeyText(i == 0 ? 0 : 3), .subject = KeyText(1)});
    ASSERT_EQ(evidence.AddCert(Read<CertObject>(cert).get(), nullptr, 0), 0);
  }
  evidence.SetEntries(Acls({AclEntryText(KeyText(0), Tag("(ftp)"))}).get());
  ASSERT_EQ(evidence.MarkRevoked() + evidence.Prove(tag.get()), 0);
  ASSERT_EQ(explanation.Explain(evidence, 0, tag.get()), 0);
  EXPECT_FALSE(explanation.IsComplete());
  EXPECT_EQ(explanation.GetEntry(), nullptr);
  EXPECT_EQ(explanation.CountPath(), 0U);
}

// Evidence that a caller put together, and forgot something.
TEST_F(Explaining, NothingIsProvedWithoutWhatIsNeeded) {
  tag = Parse(Tag("(ftp)"));
  EXPECT_EQ(evidence.MarkRevoked(), VESK2_ERR_PARAM_NULL);
  evidence.Clear(Evidence::SignedManifest);
  evidence.SetEntries(Acls({AclEntryText(KeyText(0), Tag("(ftp)"))}).get());
  EXPECT_EQ(evidence.Prove(tag.get()), VESK2_ERR_SIGNING_CERT_ORDER);
}

}  // namespace
}  // namespace vesk2test
