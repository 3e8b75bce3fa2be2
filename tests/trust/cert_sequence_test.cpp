#include <vesk2/cert_sequence.h>

#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

const std::string& CertPart() {
  static const std::string text = [] {
    CertText parts;
    parts.issuer = KeyText(0);
    parts.subject = KeyText(1);
    return Cert(parts);
  }();
  return text;
}
const std::string& SignaturePart() {
  static const std::string text = TestKey::Rsa(0).Sign(CertPart());
  return text;
}
std::string Triple() { return CertPart() + SignaturePart() + "(5:owner2:me)"; }
std::string Sequence(const std::string& items) { return List({Str("sequence"), items}); }

// The first triple as a reader hands it out: all of it or nothing.
struct First {
  Ref<ZvVesk2::Cert> cert;
  Ref<Signature> signature;
  Ref<SExpression> extra;
  template <typename... Source>
  int Import(Source... source) {
    return CertSequence::Import(cert.Out(), signature.Out(), extra.Out(), source..., nullptr);
  }
  std::string Text() const {
    if (!cert && !signature && !extra) return "";
    return Canonical(cert) + Canonical(signature) + Canonical(extra);
  }
};

TEST(CertSequence, ReadsCompleteTriples) {
  constexpr int kBad = VESK2_ERR_PARSE_FILE;
  const struct {
    std::string text;
    int whole, first;
  } cases[] = {
      {Sequence(Triple()), 0, 0},
      {Sequence(Triple() + Triple()), 0, 0},
      {Sequence(""), 0, kBad},
      {Sequence(Triple() + "1:x"), kBad, 0},
      {Sequence(CertPart() + SignaturePart()), kBad, kBad},
      {Sequence(Triple() + CertPart()), kBad, 0},
      {List({Str("sequences"), Triple()}), kBad, kBad},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(&c - cases);
    Ref<CertSequence> sequence;
    EXPECT_EQ(CertSequence::Import(sequence.Out(), Wrap(c.text).get(), nullptr), c.whole);
    EXPECT_EQ(sequence ? Canonical(sequence) : "", c.whole == 0 ? c.text : "");
    First first;
    EXPECT_EQ(first.Import(Wrap(c.text).get()), c.first);
    EXPECT_EQ(first.Text(), c.first == 0 ? Triple() : "");
  }
}

TEST(CertSequence, AnExtraItemLeftOverIsTestedForFilesOnly) {
  const Ref<SExpression> old = Parse("(1:x)");
  SExpression* extra = old.get();
  First first;
  EXPECT_EQ(
      CertSequence::Import(first.cert.Out(), first.signature.Out(), extra, "name", true, nullptr),
      VESK2_ERR_INVALID_PARAM);
  EXPECT_EQ(CertSequence::Import(first.cert.Out(), first.signature.Out(), extra,
                                 Wrap(Sequence(Triple())).get(), nullptr),
            0);
  first.extra = Ref<SExpression>(extra);
  EXPECT_EQ(first.Text(), Triple());
}

class CertSequenceFiles : public TrustTest {};

TEST_F(CertSequenceFiles, NamesAndPaths) {
  home.Write("cert/chain.cert", Sequence(Triple()));
  other.Write("chain.cert", Sequence(Triple()));
  other.Write("plain", Sequence(Triple()));
  const struct {
    std::string name;
    bool usePath;
    int code;
    std::string file;
  } cases[] = {
      {"chain", false, 0, home.File("cert/chain.cert")},
      {"any/where/chain.cert", false, 0, home.File("cert/chain.cert")},
      {other.File("chain"), true, 0, other.File("chain.cert")},
      {other.File("chain.cert"), true, 0, other.File("chain.cert")},
      {other.File("plain"), true, VESK2_ERR_FILE_OPEN, ""},
      {"..", false, VESK2_ERR_MEM_ALLOC, ""},  // no such path
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    Ref<CertSequence> sequence;
    EXPECT_EQ(CertSequence::Import(sequence.Out(), c.name.c_str(), c.usePath, nullptr), c.code);
    EXPECT_EQ(sequence ? sequence->GetFileName() : "", c.file);
    First first;
    EXPECT_EQ(first.Import(c.name.c_str(), c.usePath), c.code);
    EXPECT_EQ(first.Text(), c.code == 0 ? Triple() : "");
  }
}

TEST_F(CertSequenceFiles, RequestNames) {
  const Ref<CertRequest> request(new CertRequest(nullptr));
  ASSERT_EQ(request->Init(), 0);
  ASSERT_EQ(request->Insert(Read<ZvVesk2::Cert>(CertPart()).Release()), 0);
  ASSERT_EQ(request->Insert(Read<Signature>(SignaturePart()).Release()), 0);
  ASSERT_EQ(request->Insert(Parse("(5:owner2:me)").Release()), 0);
  const char* const cases[][2] = {{"r", "r.req"}, {"s.req", "s.req"}, {"t.REQ", "t.REQ.req"}};
  for (const auto& [name, file] : cases) {
    First first;
    EXPECT_EQ(request->Export(other.File(name).c_str()), 0);
    EXPECT_EQ(other.Read(file), Sequence(Triple()));
    EXPECT_EQ(CertRequest::Import(first.cert.Out(), first.signature.Out(), first.extra.Out(),
                                  other.File(name).c_str(), nullptr),
              0);
    EXPECT_EQ(first.Text(), Triple());
  }
  EXPECT_EQ(request->Export(""), VESK2_ERR_INVALID_PARAM);
  EXPECT_EQ(request->Export(other.File("no/directory").c_str()), VESK2_ERR_FILE_OPEN);
}

}  // namespace
}  // namespace vesk2test
