// SPDX-License-Identifier: Apache-2.0
// Chains, leaf first. The ACL store trusts key 0; key 4 issues the revocation lists.
#include <vesk2/cert_sequence.h>
#include <vesk2/evidence.h>

#include <tuple>

#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

constexpr int kCut = VESK2_ERR_INVALID_SEQUENCE;

std::string Grant(unsigned from, const std::string& to, const std::string& tag = "(ftp)",
                  const std::string& source = "") {
  const std::string element = source.empty() ? "" : "(10:revocation3:sym(6:revoke" + source + "))";
  return Cert({KeyText(from), to, Tag(tag), true, "", "", "", element});
}
std::string Link(unsigned from, const std::string& cert) {
  return cert + TestKey::Rsa(from).Sign(cert) + "(5:owner2:me)";
}
std::string Link(unsigned from, unsigned to) { return Link(from, Grant(from, KeyText(to))); }

class Chain : public TrustTest {
 protected:
  Chain() {
    WriteAcl("root", AclEntryText(KeyText(0), Tag("(ftp)"), true, kPast, kFuture));
    WriteAcl("source", AclEntryText(KeyText(4), Tag("sym (revoke x)")));
  }
  void Revoke(const std::string& certs, const std::string& keys) const {
    const std::string list = CrlSequenceText(4, Tag("sym (revoke x)"), CrlText(certs, keys));
    global.Write("cert/sym (revoke x).crl", list);
  }
  static Ref<CertSequence> Import(const std::string& items) {
    Ref<CertSequence> sequence;
    const BufferPtr buffer = Wrap(List({Str("sequence"), items}));
    EXPECT_EQ(CertSequence::Import(sequence.Out(), buffer.get(), nullptr), 0);
    return sequence;
  }
  int Verify(const Ref<CertSequence>& sequence, const char* from = "", const char* to = "") const {
    const int code = sequence->Verify(nullptr, tag.get(), Stamp(from).get(), Stamp(to).get());
    // Keeping the evidence does not change the answer, and what is kept comes to it again.
    Evidence evidence(nullptr);
    EXPECT_EQ(sequence->Verify(nullptr, tag.get(), Stamp(from).get(), Stamp(to).get(), evidence),
              code);
    EXPECT_EQ(evidence.Judge(tag.get()), code);
    EXPECT_EQ(evidence.CountCerts(), sequence->Count() / 3);
    return code;
  }
  // The tag that Verify2 finds; empty for none.
  static std::string Granted(const Ref<CertSequence>& sequence, int code) {
    Ref<SExpression> found, from, to;
    EXPECT_EQ(sequence->Verify2(found.Out(), from.Out(), to.Out()), code);
    return found ? Canonical(found) : "";
  }

  const Ref<SExpression> tag = Parse(Tag("(ftp)"));
};

TEST_F(Chain, Answers) {
  const std::string leaf = Link(2, 3), middle = Link(1, 2), top = Link(0, 1), ftp = Tag("(ftp)");
  const std::string cert = Grant(2, KeyText(3)), listed = Grant(1, KeyText(2), "(ftp)", "1:x");
  const std::string narrow = Link(2, Grant(2, KeyText(3), "(ftp host)"));
  // The reduction would not even read this element.
  const std::string lost = Link(1, Grant(1, KeyText(2), "(ftp)", "1:y0:"));
  const std::string revoked = Link(1, listed), spent = Link(0, 5);
  const std::string anyOf = Link(0, Grant(0, "(6:k-of-n[num]1:\1[num]1:\1" + KeyText(3) + ")"));
  const std::string another = cert + TestKey::Rsa(1).Sign(cert) + "()";
  const std::string elsewhere = cert + TestKey::Rsa(2).Sign(listed) + "()";
  Revoke(Item(HashOf(listed)), Item(HashOf(KeyText(5))));
  constexpr int kNone = VESK2_ERR_NOT_AUTHORIZED, kNoKey = SPKI_ERR_KEY_OR_HASH_EXPECTED;
  constexpr int kRevoked = VESK2_ERR_CERT_REVOKED, kLost = VESK2_ERR_CRL_NOT_FOUND,
                kTooWide = VESK2_ERR_PACKAGE_NOT_GRANTED;
  const std::tuple<const char*, std::string, int, int, std::string> cases[] = {
      {"three certificates", leaf + middle + top, 0, 0, ftp},
      {"a narrow leaf", narrow + middle + top, kTooWide, 0, Tag("(ftp host)")},
      {"the first is asked about", top + narrow + middle, 0, 0, ftp},
      {"the middle is missing", leaf + top, kNone, 0, ""},
      {"a k-of-n leaf", anyOf, kNoKey, kNoKey, ""},
      {"a self-made grant", Link(3, 3), kNone, 0, ""},
      {"loops", leaf + Link(2, 2) + middle + Link(2, 1) + top, 0, 0, ftp},
      {"nothing", "", kCut, kCut, ""},
      {"another's signature", another, VESK2_ERR_SIGNATURE, kCut, ""},
      {"over something else", elsewhere, VESK2_ERR_HASH_MISMATCH, kCut, ""},
      {"a revoked certificate", leaf + revoked + top, kRevoked, 0, ""},
      {"a revoked key", leaf + middle + top + spent, kRevoked, 0, ftp},
      {"undetermined, then revoked", leaf + lost + spent + top, kLost, 0, ftp},
      {"revoked, then undetermined", leaf + spent + lost + top, kRevoked, 0, ftp},
  };
  for (const auto& [name, items, code, code2, granted] : cases) {
    const Ref<CertSequence> sequence = Import(items);
    // Verify2 first: the element that it takes away for the copy must be back.
    EXPECT_EQ(Granted(sequence, code2), granted) << name;
    EXPECT_EQ(Verify(sequence), code) << name;
  }
}

TEST_F(Chain, StoresAreReadEachTime) {
  const std::string cert = Grant(0, KeyText(1), "(ftp)", "1:x");
  const Ref<CertSequence> sequence = Import(Link(0, 1)), dated = Import(Link(0, cert));
  Revoke(Item(HashOf(cert)), "");  // from kMiddle on
  EXPECT_EQ(Verify(dated, kPast, kPast), 0);
  EXPECT_EQ(Verify(dated, kMiddle, kMiddle), VESK2_ERR_CERT_REVOKED);
  EXPECT_EQ(Granted(dated, kCut), "") << "nothing is left";
  EXPECT_EQ(Verify(sequence, kFarFuture), VESK2_ERR_NOT_AUTHORIZED);
  EXPECT_EQ(Verify(sequence, "", "2000-12-31_23:59:59"), VESK2_ERR_NOT_AUTHORIZED);

  Revoke("", Item(HashOf(KeyText(1))));
  EXPECT_EQ(Verify(sequence), VESK2_ERR_CERT_REVOKED);
  EXPECT_EQ(Granted(sequence, kCut), "");
  std::filesystem::remove(global.File("cert/sym (revoke x).crl"));
  EXPECT_EQ(Verify(sequence), 0);
  const std::string path = other.Write("x.cert", Canonical(sequence));
  EXPECT_EQ(CertSequence::Verify({}, tag.get(), {}, {}, path.c_str(), true, nullptr), 0);
  std::filesystem::remove_all(global.File("acl"));
  EXPECT_EQ(Verify(sequence), VESK2_ERR_ACL_ENTRY_NOT_FOUND);
  EXPECT_EQ(Granted(sequence, VESK2_ERR_FILE_NOT_FOUND), "");
  SExpression *used = tag.get(), *unused = nullptr;
  EXPECT_EQ(sequence->Verify2(unused, unused, used), VESK2_ERR_INVALID_PARAM);
}

// The lists of a caller that takes the stages one by one.
TEST_F(Chain, ListsLoseWhatIsRevoked) {
  Revoke("", Item(HashOf(KeyText(5))));
  const Ref<CertSequence> sequence = Import(Link(2, 3) + Link(0, 5) + Link(1, 2));
  Ref<SExpression> certs(new SExpression(nullptr)), extras(new SExpression(nullptr));
  ASSERT_EQ(sequence->VerifySignatures2(certs.get(), extras.get()), 0);
  SExpression *goodCerts = certs.Release(), *goodExtras = extras.Release(), *none = nullptr;
  EXPECT_EQ(sequence->VerifyRevocations2(goodCerts, none), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(goodCerts->Count(), 3U);
  EXPECT_EQ(sequence->VerifyRevocations2(goodCerts, goodExtras), 0);
  certs.Reset(goodCerts);
  extras.Reset(goodExtras);
  EXPECT_EQ(Canonical(certs), List({Grant(2, KeyText(3)), Grant(1, KeyText(2))}));
  EXPECT_EQ(extras->Count(), 2U);
}

// Sequences put together by hand: c a certificate, s its signature, b a bad one, x anything else.
TEST_F(Chain, ItemsOfEveryKind) {
  const std::string cert = Grant(0, KeyText(1));
  const auto item = [&cert](char kind) -> DExpression* {
    if (kind == 'c') return Read<ZvVesk2::Cert>(cert).Release();
    if (kind == 'x') return Parse("(4:cert)").Release();
    return Read<Signature>(TestKey::Rsa(kind == 's' ? 0 : 1).Sign(cert)).Release();
  };
  constexpr int kForged = VESK2_ERR_SIGNATURE;
  // The signatures; the other stages, which do not look at them; the tolerant stage, which goes on
  // at the third item of a bad triple, and how many certificates it collects.
  const std::tuple<std::string, int, int, int, unsigned> cases[] = {
      {"csc", 0, 0, 0, 1},
      {"cb", kCut, kCut, kCut, 0},
      {"csxc", kCut, kCut, kCut, 1},
      {"cbx", kForged, 0, kCut, 0},
      {"cbcsx", kForged, kCut, 0, 1},
      {"cbxcsx", kForged, 0, kCut, 0},
      {"cbxcsxcsx", kForged, 0, 0, 1},
      {"xsx", kCut, kCut, kCut, 0},
      {"ccx", kCut, kCut, kCut, 0},
  };
  for (const auto& [kinds, signatures, others, tolerant, count] : cases) {
    const Ref<CertSequence> sequence = Import("");
    for (const char kind : kinds) ASSERT_EQ(sequence->Insert(item(kind)), 0);
    EXPECT_EQ(sequence->VerifySignatures(), signatures) << kinds;
    EXPECT_EQ(sequence->VerifyRevocations(nullptr, nullptr), others) << kinds;
    EXPECT_EQ(sequence->VerifyChain(nullptr, tag.get(), nullptr, nullptr), others) << kinds;
    const Ref<SExpression> certs = Parse("()"), extras = Parse("()");
    EXPECT_EQ(sequence->VerifySignatures2(certs.get(), extras.get()), tolerant) << kinds;
    EXPECT_EQ(std::pair(certs->Count(), extras->Count()), std::pair(count, count)) << kinds;
  }
}

TEST_F(Chain, ManyCertificates) {
  constexpr unsigned kMany = 10'000;
  const auto key = [](unsigned i) {
    return "(10:public-key(3:rsa(1:e1:\x11)(1:n" + Str(std::to_string(i)) + ")))";
  };
  const std::string same = Link(0, 1), rest = TestKey::Rsa(0).Sign("x") + "()";
  std::string repeated, path;
  for (unsigned i = 0; i < kMany; ++i) {
    repeated += same;
    path += Cert({key(i + 1), key(i), Tag("(ftp)"), true}) + rest;
  }
  EXPECT_EQ(Verify(Import(repeated)), 0);
  EXPECT_EQ(Import(path + Link(0, Grant(0, key(kMany))))
                ->VerifyChain(nullptr, tag.get(), nullptr, nullptr),
            0);
}

}  // namespace
}  // namespace vesk2test
