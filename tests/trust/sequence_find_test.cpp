// SPDX-License-Identifier: Apache-2.0
#include <vesk2/cert_sequence.h>

#include <tuple>

#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

std::string Pair(const std::string& tag) {
  const std::string cert = Cert({.issuer = KeyText(0), .subject = KeyText(1), .tag = tag});
  return cert + TestKey::Rsa(0).Sign(cert);
}
std::string Triple(const std::string& tag) { return Pair(tag) + "(5:owner2:me)"; }

class SequenceFind : public TrustTest {};

TEST_F(SequenceFind, ByTheTagOfTheFirstCertificate) {
  const auto store = [this](const char* name, const std::string& items) {
    home.Write(std::string("cert/") + name, List({Str("sequence"), items}));
  };
  const auto check = [](const std::string& tag, int code, const char* name, const char* letters) {
    char* file = nullptr;
    EXPECT_EQ(CertSequence::Find(file, Parse(tag).get()), code) << tag;
    const std::unique_ptr<char[]> owned(file);
    EXPECT_STREQ(file, name) << tag;
    Ref<SExpression> names;
    EXPECT_EQ(CertSequence::Find(names.Out(), Parse(tag).get()), 0);
    std::string text;
    for (; *letters != 0; ++letters) text += Str(*letters + std::string(".cert\0", 6));
    EXPECT_EQ(Canonical(names), "(" + text + ")") << tag;
  };
  const std::string host = Tag("(ftp host)"), web = Tag("(web)"), mail = Tag("(mail)");
  for (const char* name : {"b.cert", "c.cert"}) store(name, Triple(web));
  store("a.cert", Triple(host));
  store("d.cert", Triple(Tag("(ftp)")) + Triple(mail));
  store("n.cert", Triple(""));
  check(host, 0, "a.cert", "ad");
  check(web, VESK2_ERR_MULTI_AUTH_MATCH, "b.cert", "bc");
  check(Tag("(web page)"), VESK2_ERR_FILE_NOT_FOUND, nullptr, "bc");
  check(mail, VESK2_ERR_FILE_NOT_FOUND, nullptr, "");
  store("b2.cert", "1:x");
  check(web, VESK2_ERR_PARSE_FILE, nullptr, "bc");
}

TEST_F(SequenceFind, RefusesWhatIsMissingOrInUse) {
  home.Write("cert/a.cert", List({Str("sequence"), Triple(Tag("a"))}));
  const Ref<SExpression> tag = Parse(Tag("a"));
  char* none = nullptr;
  char text[] = "taken";
  char* file = text;
  SExpression* names = nullptr;
  SExpression* taken = tag.get();
  EXPECT_EQ(CertSequence::Find(none, nullptr), kInvalid);
  EXPECT_EQ(CertSequence::Find(file, tag.get()), kInvalid);
  EXPECT_EQ(CertSequence::Find(names, nullptr), kInvalid);
  EXPECT_EQ(CertSequence::Find(taken, tag.get()), kInvalid);
  EXPECT_TRUE(none == nullptr && file == text && names == nullptr && taken == tag.get());

  ZvBuffer* buffer = nullptr;
  ZvVesk2::Cert* cert = nullptr;
  Signature* signature = nullptr;
  EXPECT_EQ(CertSequence::GetFirstPair(buffer, cert, signature, names, nullptr, true, {}),
            kInvalid);
  // An output that is left over from another walk is not overwritten, as nobody would free it.
  const std::string path = other.Write("x.cert", "(8:sequence" + Triple("") + ")");
  const BufferPtr oldBuffer = Wrap("x");
  const Ref<ZvVesk2::Cert> oldCert(new ZvVesk2::Cert(nullptr));
  const Ref<Signature> oldSignature(new Signature(nullptr));
  for (int held = 0; held < 3; ++held) {
    buffer = held == 0 ? oldBuffer.get() : nullptr;
    cert = held == 1 ? oldCert.get() : nullptr;
    signature = held == 2 ? oldSignature.get() : nullptr;
    const std::tuple before(buffer, cert, signature);
    EXPECT_EQ(CertSequence::GetFirstPair(buffer, cert, signature, names, path.c_str(), true, {}),
              kInvalid);
    EXPECT_EQ(std::tuple(buffer, cert, signature), before);
  }
}

TEST_F(SequenceFind, Pairs) {
  const std::string three = Triple(Tag("a")) + Triple(Tag("b")) + Triple("");
  constexpr int kFails = VESK2_ERR_PARSE_FILE;
  const std::tuple<std::string, int, std::string> cases[] = {
      {three + ")", 0, three},           {three, kFails, three}, {")", kFails, ""},
      {Pair(""), kFails, Pair("")},  // of the first triple its parts are handed out
      {three + Pair(""), kFails, three},
  };
  for (const auto& [text, end, out] : cases) {
    ZvBuffer* buffer = nullptr;
    ZvVesk2::Cert* cert = nullptr;
    Signature* signature = nullptr;
    SExpression *extra = nullptr, *last = nullptr;
    std::string all;
    const std::string path = other.Write("x.cert", "(8:sequence" + text);
    int code = CertSequence::GetFirstPair(buffer, cert, signature, extra, path.c_str(), true, {});
    while (cert != nullptr) {
      for (SExpression* part :
           {static_cast<SExpression*>(cert), static_cast<SExpression*>(signature), last = extra}) {
        const Ref<SExpression> owned(part);
        if (owned) all += Canonical(owned);
      }
      if (code != 0) break;
      code = CertSequence::GetNextPair(buffer, cert, signature, extra, nullptr);
    }
    EXPECT_EQ(std::tuple(text, code, all), std::tuple(text, end, out));
    EXPECT_EQ(extra, last) << "at the end it stays";
    EXPECT_EQ(buffer != nullptr, code == 0);
    const BufferPtr owned(buffer);
  }
}

}  // namespace
}  // namespace vesk2test
