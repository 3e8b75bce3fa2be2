// SPDX-License-Identifier: Apache-2.0
// Certificate sequences through the flat functions: records, verification and listing.
#include <openssl/x509.h>
#include <vesk2/cert_sequence.h>

#include <cstdlib>
#include <cstring>
#include <utility>

#include "tests/frame/flat/chain_text.h"

namespace vesk2test {
namespace {

class Certificates : public TrustTest {};

std::string X509(const TestKey& key) {
  unsigned char* der = nullptr;
  const int length = i2d_PUBKEY(key.Pkey(), &der);
  const std::string bytes(reinterpret_cast<char*>(der), static_cast<size_t>(length));
  OPENSSL_free(der);
  return bytes;
}

TEST_F(Certificates, ReadIntoRecords) {
  CertText cert{.issuer = KeyText(0), .subject = KeyText(1), .tag = Tag("(app calc)")};
  cert.notBefore = kPast;
  const std::string first = Signed(cert, TestKey::Rsa(0)) + "(5:owner3:Ann3:Bob)";
  cert = {.issuer = KeyText(0), .subject = HashOf("x"), .notAfter = kMiddle};
  const std::string second = Signed(cert, TestKey::Rsa(0)) + "(7:comment5:owner)";
  cert = {.issuer = KeyText(0),
          .subject =
              "(6:k-of-n1:\x01"
              "1:\x01" +
              KeyText(2) + ")"};
  const std::string third = Signed(cert, TestKey::Rsa(0)) + kNothing;
  other.Write("chain.cert", Sequence({first, second, third}));

  Vesk2ContextStruct context{7};
  Vesk2CertInfoStruct* chain = nullptr;
  ASSERT_EQ(Vesk2CertReadCtx(&chain, other.File("chain").c_str(), &context), 0);
  EXPECT_EQ(chain->sequence->GetContext(), &context);
  EXPECT_EQ(chain->notBefore, 978307200);
  EXPECT_EQ(chain->notAfter, 0);
  EXPECT_STREQ(chain->tag, "(app calc)");
  EXPECT_STREQ(chain->owner, "Ann Bob");
  EXPECT_EQ(std::string(reinterpret_cast<char*>(chain->keyData), chain->keyLength),
            X509(TestKey::Rsa(1)));
  const std::string hash = "(hash sha256 " +
                           Digest(Cert({.issuer = KeyText(0),
                                        .subject = KeyText(1),
                                        .tag = Tag("(app calc)"),
                                        .notBefore = kPast})) +
                           ")";
  EXPECT_EQ(std::string(chain->hashText, chain->hashTextLength + 1), hash + '\0');
  // Subjects without a key, and what is missing, leave their members null.
  unsigned count = 0;
  for (auto* record = chain; record != nullptr; record = record->next, ++count) {
    EXPECT_EQ(record->size, 44U);
    EXPECT_EQ(record->sequence, chain->sequence);
    if (record == chain) continue;
    EXPECT_TRUE(record->tag == nullptr && record->owner == nullptr && record->keyData == nullptr);
    EXPECT_EQ(record->keyLength, 0U);
    EXPECT_EQ(record->notBefore, 0);
    EXPECT_EQ(record->notAfter, count == 1 ? 1293840000 : 0);
  }
  EXPECT_EQ(count, 3U);
  EXPECT_EQ(Vesk2CertFree(chain), 0);
  EXPECT_EQ(Vesk2CertFree(nullptr), VESK2_ERR_PARAM_NULL);
}

TEST_F(Certificates, ReadWritesItsOutputOnSuccessOnly) {
  other.Write("damaged.cert", Sequence({"(4:cert)"}));
  other.Write(
      "second.cert",
      Sequence({Signed({.issuer = KeyText(0), .subject = KeyText(1)}, TestKey::Rsa(0)) + kNothing,
                "(4:cert)"}));
  other.Write("empty.cert", Sequence({}));
  Vesk2CertInfoStruct sentinel{};
  for (const auto& [name, code] :
       {std::pair("absent", VESK2_ERR_FILE_OPEN), std::pair("damaged", VESK2_ERR_PARSE_FILE),
        std::pair("second", VESK2_ERR_PARSE_FILE), std::pair("empty", VESK2_SUCCESS)}) {
    for (const auto read : {Vesk2CertRead, Vesk2CertReadA}) {
      Vesk2CertInfoStruct* out = &sentinel;
      EXPECT_EQ(read(&out, other.File(name).c_str()), code) << name;
      EXPECT_EQ(out, code == 0 ? nullptr : &sentinel);
      EXPECT_EQ(read(&out, nullptr), VESK2_ERR_PARAM_NULL);
      EXPECT_EQ(read(nullptr, other.File(name).c_str()), VESK2_ERR_PARAM_NULL);
    }
  }
}

TEST_F(Certificates, VerifyFromRecordsAndFromTheFile) {
  constexpr time_t kNow = 1700000000;  // 2023
  constexpr time_t kNoYear = 400'000'000'000;
  const std::string file = other.Write("chain.cert", Chain());
  Vesk2CertInfoStruct* chain = nullptr;
  ASSERT_EQ(Vesk2CertReadA(&chain, file.c_str()), 0);
  const std::tuple<const char*, time_t, time_t, int> cases[] = {
      {"(install)", 0, 0, 0},
      {"(install)", kNow, kNow + 1, 0},
      {"(install (app calc))", kNow, 0, 0},
      {"(install)", 978307200 - 2, 978307200 - 1, VESK2_ERR_NOT_AUTHORIZED},  // not valid yet
      {"(other)", 0, 0, VESK2_ERR_NOT_AUTHORIZED},
      {"(*)", 0, 0, VESK2_ERR_PACKAGE_NOT_GRANTED},  // more than was granted
      {"(install", 0, 0, VESK2_ERR_INVALID_S_EXPRESSION},
      {nullptr, 0, 0, VESK2_ERR_INVALID_PARAM},
      {"(install)", kNoYear, 0, VESK2_ERR_TIME_STAMP},
      {"(install)", 0, kNoYear, VESK2_ERR_TIME_STAMP},
  };
  EXPECT_EQ(Vesk2CertVerify(chain, "(install)", 0, 0), VESK2_ERR_ACL_ENTRY_NOT_FOUND);
  WriteAcl("root", AclEntryText(KeyText(0), Tag("(install)")));
  for (const auto& [tag, begin, end, code] : cases) {
    EXPECT_EQ(Vesk2CertVerify(chain, tag, begin, end), code) << tag << begin;
    EXPECT_EQ(Vesk2CertVerifyFile(file.c_str(), tag, begin, end), code) << tag << begin;
    EXPECT_EQ(Vesk2CertVerifyFileA(file.c_str(), tag, begin, end), code) << tag << begin;
  }
  EXPECT_EQ(Vesk2CertFree(chain), 0);
  EXPECT_EQ(Vesk2CertVerify(nullptr, "(install)", 0, 0), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(Vesk2CertVerifyFileA(nullptr, "(install)", 0, 0), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(Vesk2CertVerifyFile("/nonexistent", "", 0, 0), VESK2_ERR_FILE_OPEN);
}

// Keys, digests and signatures by the openssl command; the text around them put together here.
TEST_F(Certificates, SignedByTheOpensslCommand) {
  const auto run = [this](const std::string& command) {
    ASSERT_EQ(std::system(("cd " + other.Path() + "; " + command).c_str()), 0) << command;
  };
  const auto key = [&](const std::string& name) {
    run("openssl genrsa -out " + name + " 2048 2>/dev/null; openssl rsa -in " + name +
        " -noout -modulus >hex");
    const std::string hex = other.Read("hex").substr(std::strlen("Modulus="), 512);
    std::string n;
    for (size_t i = 0; i < 512; i += 2) {
      n += static_cast<char>(std::stoi(hex.substr(i, 2), nullptr, 16));
    }
    return "(10:public-key(3:rsa(1:e3:" + std::string("\1\0\1", 3) + ")(1:n256:" + n + ")))";
  };
  const std::string root = key("root"), leaf = key("leaf");
  const std::string cert = "(4:cert(6:issuer" + root + ")(7:subject" + leaf + ")(3:tag(4:read)))";
  other.Write("cert", cert);
  run("openssl dgst -sha256 -binary -out digest cert");
  WriteAcl("root", "(5:entry(7:subject" + root + ")(9:propagate)(3:tag(4:read)))");
  for (const auto& [name, options] :
       {std::pair("7:rsa-1.5", ""), std::pair("7:rsa-pss", "-sigopt rsa_padding_mode:pss")}) {
    run("openssl dgst -sha256 -sign root " + std::string(options) + " -out value cert");
    other.Write("chain.cert",
                "(8:sequence" + cert + "(9:signature(4:hash6:sha25632:" + other.Read("digest") +
                    ")" + root + "(" + name + "256:" + other.Read("value") + "))" + kNothing + ")");
    EXPECT_EQ(Vesk2CertVerifyFile(other.File("chain").c_str(), "(read)", 0, 0), 0) << name;
  }
}

TEST_F(Certificates, FindListsBareNames) {
  const auto names = [](FileItem* found) {
    std::string text;
    for (const FileItem* item = found; item != nullptr; item = item->next) {
      text += "<" + std::string(item->name) + "|" + item->nameA + ">";
    }
    // The chain is its caller's, who may take a name out of it.
    if (found != nullptr) {
      found->nameA = nullptr;
      Vesk2Free(std::exchange(found->name, nullptr));
    }
    FreeFileItemList(found);
    return text;
  };
  for (const char* name : {"cert/b.cert", "cert/a.cert", "cert/c.crl"}) home.Write(name, "");
  other.Write("x.cert", "");
  for (const auto find : {CertFind, CertFindA}) {
    EXPECT_EQ(names(find(nullptr)), "<a.cert|a.cert><b.cert|b.cert>");
    EXPECT_EQ(names(find(other.Path().c_str())), "<x.cert|x.cert>");
    EXPECT_EQ(find(home.Path().c_str()), nullptr);
    EXPECT_EQ(find("/nonexistent"), nullptr);
  }
}

}  // namespace
}  // namespace vesk2test
