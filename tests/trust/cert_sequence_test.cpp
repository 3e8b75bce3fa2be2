// SPDX-License-Identifier: Apache-2.0
#include <vesk2/cert_sequence.h>

#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

std::string CertPart() { return Cert({.issuer = KeyText(0), .subject = KeyText(1)}); }
std::string SignaturePart() { return TestKey::Rsa(0).Sign(CertPart()); }
const std::string kOwner = "(5:owner2:me)";
std::string Triple() { return CertPart() + SignaturePart() + kOwner; }
std::string Sequence(const std::string& items) { return List({Str("sequence"), items}); }

// The first triple as a reader hands it out, or the number of the error. `extra` is what is left
// over from an earlier read.
template <typename... Source>
std::string First(SExpression* extra, Source... source) {
  Ref<CertObject> cert;
  Ref<Signature> signature;
  const int code = CertSequence::Import(cert.Out(), signature.Out(), extra, source..., nullptr);
  if (code != 0) return std::to_string(code);
  return Canonical(cert) + Canonical(signature) + Canonical(Ref(extra));
}

class CertSequences : public TrustTest {};

TEST_F(CertSequences, ReadsCompleteTriples) {
  const std::string bad = std::to_string(kBad);
  const std::tuple<std::string, int, std::string> cases[] = {
      {Sequence(Triple() + Triple()), 0, Triple()},
      {Sequence(""), 0, bad},
      {Sequence(Triple() + "1:x"), kBad, Triple()},
      {Sequence(CertPart() + SignaturePart()), kBad, bad},
      {Sequence(Triple() + CertPart()), kBad, Triple()},
      {List({Str("sequences"), Triple()}), kBad, bad},
  };
  const Ref<SExpression> leftOver = Parse("(1:x)");  // refused by the file form only
  for (const auto& [text, code, first] : cases) {
    Ref<CertSequence> sequence;
    EXPECT_EQ(CertSequence::Import(sequence.Out(), Wrap(text).get(), nullptr), code) << text;
    EXPECT_EQ(sequence ? Canonical(sequence) : "", code == 0 ? text : "");
    EXPECT_EQ(First(leftOver.get(), Wrap(text).get()), first);
  }
  EXPECT_EQ(First(leftOver.get(), "name", true), std::to_string(kInvalid));
}

TEST_F(CertSequences, NamesAndPaths) {
  home.Write("cert/chain.cert", Sequence(Triple()));
  other.Write("more.cert", Sequence(Triple()));
  const std::tuple<std::string, bool, int> cases[] = {
      {"chain", false, 0},
      {other.File("more"), true, 0},
      {"more", false, VESK2_ERR_FILE_OPEN},
      {"..", false, VESK2_ERR_MEM_ALLOC},  // no such path
  };
  for (const auto& [name, usePath, code] : cases) {
    Ref<CertSequence> sequence;
    EXPECT_EQ(CertSequence::Import(sequence.Out(), name.c_str(), usePath, nullptr), code) << name;
    EXPECT_EQ(First(nullptr, name.c_str(), usePath), code == 0 ? Triple() : std::to_string(code));
    if (code != 0) continue;
    EXPECT_EQ(sequence->GetStorageType(), usePath ? ZvVesk2::StoragePath : ZvVesk2::StorageHome);
  }
}

// Requests have an extension of their own and stay out of every store.
TEST_F(CertSequences, Requests) {
  const Ref<CertRequest> request(new CertRequest(nullptr));
  ASSERT_EQ(request->Init(), 0);
  for (const std::string& part : {CertPart(), SignaturePart(), kOwner}) {
    ASSERT_EQ(request->Insert(Parse(part).Release()), 0);
  }
  const std::string file = other.File("t.REQ");
  EXPECT_EQ(request->Export(file.c_str()), 0);
  EXPECT_EQ(other.Read("t.REQ.req"), Sequence(Triple()));
  Ref<CertObject> cert;
  Ref<Signature> signature;
  Ref<SExpression> extra;
  EXPECT_EQ(CertRequest::Import(cert.Out(), signature.Out(), extra.Out(), file.c_str(), nullptr),
            0);
  EXPECT_EQ(Canonical(cert) + Canonical(signature) + Canonical(extra), Triple());
  EXPECT_EQ(request->Export(""), kInvalid);
  EXPECT_EQ(request->Export(other.File("no/directory").c_str()), VESK2_ERR_FILE_OPEN);
}

}  // namespace
}  // namespace vesk2test
