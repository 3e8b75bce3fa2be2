// Cert: the elements that it reads, in their order, and the certificates that it builds.
#include <vesk2/cert.h>

#include <gtest/gtest.h>

#include "tests/support/test_object.h"
#include "tests/support/test_text.h"

namespace vesk2test {
namespace {

using ZvVesk2::Ref;

const std::string kKey = "(10:public-key(3:rsa(1:e1:\3)(1:n1:n)))";
const std::string kThreshold = "(6:k-of-n1:\1" + Str("\1") + kKey + ")";

Ref<ZvVesk2::Cert> NewCert() { return Ref<ZvVesk2::Cert>(new ZvVesk2::Cert(nullptr)); }

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
  const std::string texts[] = {
      Short(""),
      Short("", "(7:version1:1)"),
      Short("(9:propagate)"),
      Short("(3:foo)"),  // any keyword of three characters makes a tag
      Short("(5:valid)"),
      Short("(5:valid(10:not-before3:abc))"),  // stamps are not judged
      Short("(5:valid(9:not-after0:))"),
      Short("(7:comment[utf-8]3:why)"),
      Short("(1:x(3:abc))"),  // "(1" makes a revocation element
      Short("(10:not-before1:x)"),
      Cert(Full()),
  };
  for (const std::string& text : texts) {
    SCOPED_TRACE(text);
    const Ref<ZvVesk2::Cert> cert = NewCert();
    const BufferPtr buffer = Wrap(text + "rest");
    ASSERT_EQ(cert->Import(buffer.get()), 0);
    EXPECT_EQ(buffer->Remaining(), 4u);
    EXPECT_EQ(Canonical(cert), text);
    EXPECT_EQ(cert->Import(Wrap(text).get()), VESK2_ERR_INVALID_PARAM);
  }
}

TEST(CertTest, RefusesOtherOrdersRepetitionsAndVersions) {
  const std::pair<const char*, std::string> cases[] = {
      {"version 2", Short("", "(7:version1:2)")},
      {"version twice", Short("", "(7:version1:1)(7:version1:1)")},
      {"tag before propagate", Short("(3:tag)(9:propagate)")},
      {"two tags", Short("(3:tag)(3:tag)")},
      {"dates exchanged", Short("(5:valid(9:not-after1:a)(10:not-before1:b))")},
      {"comment first", Short("(7:comment1:c)(5:valid)")},
      {"propagate with a value", Short("(9:propagate1:x)")},
      {"comment without text", Short("(7:comment)")},
      {"unknown element", Short("(2:ab)")},
      {"no subject", "(4:cert" + List({Str("issuer"), HashOf("i")}) + ")"},
      {"two principals", "(4:cert" + List({Str("issuer"), HashOf("i"), HashOf("i")}) + ")"},
  };
  for (const auto& [what, text] : cases) {
    EXPECT_EQ(NewCert()->Import(Wrap(text).get()), VESK2_ERR_PARSE_FILE) << what;
  }
  EXPECT_EQ(NewCert()->Import(Wrap(Cert({.issuer = kThreshold, .subject = kKey})).get()),
            VESK2_ERR_PRINCIPAL);
}

TEST(CertTest, ClonesShareEveryPartAndHaveAVersion) {
  CertText parts = Full();
  for (const bool least : {false, true}) {
    if (least) parts = {.issuer = HashOf("i"), .subject = HashOf("s")};
    parts.version = false;
    Ref<ZvVesk2::Cert> source = NewCert();
    ASSERT_EQ(source->Import(Wrap(Cert(parts)).get()), 0);
    EXPECT_EQ(source->GetVersion(), nullptr);
    EXPECT_EQ(source->GetTag() == nullptr, least);
    EXPECT_EQ(Bytes(source->GetNotBefore()), parts.notBefore);
    EXPECT_EQ(Bytes(source->GetNotAfter()), parts.notAfter);
    EXPECT_EQ(Bytes(source->GetComment()), parts.comment);
    const Ref<ZvVesk2::Cert> clone = NewCert();
    ASSERT_EQ(clone->Clone(source.get()), 0);
    EXPECT_EQ(clone->GetIssuer(), source->GetIssuer());
    EXPECT_EQ(clone->Clone(source.get()), VESK2_ERR_INVALID_PARAM);
    source.Reset();  // the clone has references of its own
    parts.version = true;
    EXPECT_EQ(Canonical(clone), Cert(parts));
    EXPECT_EQ(Canonical(*clone->GetVersion()), "(7:version1:1)");
  }
}

TEST(CertTest, CloneFollowsFieldsThatWereSetAside) {
  CertText parts = Full();
  parts.propagate = false;
  const Ref<ZvVesk2::Cert> source = NewCert();
  ASSERT_EQ(source->Import(Wrap(Cert(parts)).get()), 0);
  source->SetPropagate(true);
  source->SetRevocationElement(nullptr);
  const Ref<ZvVesk2::Cert> clone = NewCert();
  ASSERT_EQ(clone->Clone(source.get()), 0);
  parts.propagate = true;
  parts.revocation.clear();
  EXPECT_EQ(Canonical(clone), Cert(parts));

  const Ref<ZvVesk2::Cert> set = NewCert();
  EXPECT_EQ(
      set->Set(nullptr, source->GetSubject(), false, nullptr, nullptr, nullptr, nullptr, nullptr),
      VESK2_ERR_INVALID_PARAM);
  ASSERT_EQ(set->Set(source->GetIssuer(), source->GetSubject(), false, nullptr, nullptr,
                     source->GetNotAfter(), nullptr, nullptr),
            0);
  EXPECT_EQ(Canonical(set), Cert({.issuer = parts.issuer,
                                  .subject = parts.subject,
                                  .notAfter = parts.notAfter,
                                  .version = true}));
}

}  // namespace
}  // namespace vesk2test
