// Signatures: what is accepted, and with which code what was tampered with is refused.
#include <vesk2/cert.h>
#include <vesk2/public_key.h>
#include <vesk2/signature.h>

#include <gtest/gtest.h>

#include <cstdlib>
#include <tuple>

#include "tests/support/temp_dir.h"
#include "tests/support/test_key.h"
#include "tests/support/test_object.h"
#include "tests/support/test_text.h"

namespace vesk2test {
namespace {

using ZvVesk2::ByteString;
using ZvVesk2::Hash;
using ZvVesk2::PublicKey;
using ZvVesk2::Ref;
using ZvVesk2::SExpression;
using ZvVesk2::Signature;

const std::string kObject = "(6:object[bin]3:abc(1:x))";

std::string SignatureText(const std::string& hash, const std::string& principal,
                          const std::string& algorithm, const std::string& value) {
  return List({Str("signature"), hash, principal, List({Str(algorithm), Str(value)})});
}

Ref<Signature> Imported(const std::string& text) {
  Ref<Signature> signature(new Signature(nullptr));
  EXPECT_EQ(signature->Import(Wrap(text).get()), 0);
  EXPECT_EQ(Canonical(signature), text);
  return signature;
}

int Verify(const std::string& signature, const std::string& object = kObject) {
  return Imported(signature)->Verify(Parse(object).get());
}

TEST(VerifyTest, TakesWhatTheOpensslCommandSigns) {
  const TempDir dir;
  const std::string object = dir.Write("object", kObject);
  const struct {
    const TestKey& key;
    const char* options;
    const char* algorithm;
    const char* hash;
  } cases[] = {
      {TestKey::Rsa(0), "-sha256", "rsa-1.5", "sha256"},
      {TestKey::Rsa(0), "-sha1", "rsa-1.5", "sha1"},
      {TestKey::Rsa(0), "-sha256 -sigopt rsa_padding_mode:pss -sigopt rsa_pss_saltlen:-1",
       "rsa-pss", "sha256"},
      {TestKey::Rsa(0), "-sha256 -sigopt rsa_padding_mode:pss -sigopt rsa_pss_saltlen:0", "rsa-pss",
       "sha256"},
      {TestKey::Dsa(0), "-sha1", "dsa-sha1", "sha1"},
  };
  for (const auto& row : cases) {
    const std::string key = dir.Write("key.pem", row.key.PrivatePem());
    const std::string command = "openssl dgst " + std::string(row.options) + " -sign " + key +
                                " -out " + dir.File("value") + " " + object;
    ASSERT_EQ(std::system(command.c_str()), 0) << command;
    std::string value = dir.Read("value");
    if (&row.key == &TestKey::Dsa(0)) value = TestKey::RawDsa(value);
    EXPECT_EQ(
        Verify(SignatureText(HashOf(kObject, row.hash), row.key.Public(), row.algorithm, value)), 0)
        << command;
  }
}

TEST(VerifyTest, RefusesWithTheCodeOfTheFirstFailure) {
  const TestKey& rsa = TestKey::Rsa(0);
  const TestKey& dsa = TestKey::Dsa(0);
  const std::string digest = Digest(kObject);
  const std::string sha1 = Digest(kObject, "sha1");
  const std::string pkcs = rsa.SignDigest(digest, "rsa-1.5", "sha256");
  const std::string pss = rsa.SignDigest(digest, "rsa-pss", "sha256");
  const std::string raw = dsa.SignDigest(sha1, "dsa-sha1", "sha1");
  const std::string h256 = HashOf(kObject);
  const std::string h1 = HashOf(kObject, "sha1");
  const std::string rmd = HashOf(kObject, "rmd160");
  const std::string sha1AsRmd = List({Str("hash"), Str("rmd160"), Str(sha1)});
  std::string flipped = pkcs;
  flipped[100] = static_cast<char>(flipped[100] ^ 1);
  std::string flippedRaw = raw;
  flippedRaw[39] = static_cast<char>(flippedRaw[39] ^ 1);
  const struct {
    const char* what;
    const TestKey& key;
    std::string algorithm, hash, value;
    int code;
  } cases[] = {
      // Names: a prefix of a known name matches it, PSS first.
      {"rsa", rsa, "rsa", h256, pss, 0},
      {"no name", rsa, "", h256, pss, 0},
      {"rsa is not 1.5", rsa, "rsa", h256, pkcs, VESK2_ERR_SIGNATURE},
      {"rsa-1", rsa, "rsa-1", h256, pkcs, 0},
      {"rsa-pkcs1", rsa, "rsa-pkcs1", h256, pkcs, VESK2_ERR_SIGNATURE_ID},
      {"rsa-1.6", rsa, "rsa-1.6", h256, pkcs, VESK2_ERR_SIGNATURE_ID},
      {"longer name", rsa, "rsa-1.5x", h256, pkcs, VESK2_ERR_SIGNATURE_ID},
      {"0 byte in a name", rsa, std::string("rsa\0", 4), h256, pss, VESK2_ERR_SIGNATURE_ID},
      {"rsa name, dsa key", dsa, "rsa-1.5", h1, raw, VESK2_ERR_SIGNATURE_ID},
      {"dsa", dsa, "dsa", h1, raw, 0},
      // Hashes: RSA knows two, DSA takes none but SHA-1 whatever it is called.
      {"rsa over rmd160", rsa, "rsa-1.5", rmd, pkcs, VESK2_ERR_SIGNATURE_ID},
      {"dsa, rmd160 in name only", dsa, "dsa-sha1", sha1AsRmd, raw, 0},
      {"dsa over sha256", dsa, "dsa-sha1", h256, raw, VESK2_ERR_HASH_MISMATCH},
      // Objects are judged before values.
      {"another object, no value", rsa, "rsa-1.5", HashOf("x"), "", VESK2_ERR_HASH_MISMATCH},
      {"another object", dsa, "dsa-sha1", HashOf("x", "sha1"), raw, VESK2_ERR_HASH_MISMATCH},
      // Values.
      {"one bit", rsa, "rsa-1.5", h256, flipped, VESK2_ERR_SIGNATURE},
      {"short", rsa, "rsa-1.5", h256, pkcs.substr(1), VESK2_ERR_SIGNATURE},
      {"empty", rsa, "rsa-1.5", h256, "", VESK2_ERR_SIGNATURE},
      {"other scheme", rsa, "rsa-pss", h256, pkcs, VESK2_ERR_SIGNATURE},
      {"other key", TestKey::Rsa(1), "rsa-1.5", h256, pkcs, VESK2_ERR_SIGNATURE},
      {"other digest", rsa, "rsa-1.5", h1, pkcs, VESK2_ERR_SIGNATURE},
      {"one bit", dsa, "dsa-sha1", h1, flippedRaw, VESK2_ERR_SIGNATURE},
      {"halves of 19", dsa, "dsa-sha1", h1, raw.substr(2), VESK2_ERR_SIGNATURE},
  };
  for (const auto& row : cases) {
    EXPECT_EQ(Verify(SignatureText(row.hash, row.key.Public(), row.algorithm, row.value)), row.code)
        << row.what << " " << row.algorithm;
  }
}

// Display hints are part of what is signed.
TEST(VerifyTest, HashesWithHints) {
  const std::string signature = TestKey::Rsa(0).Sign(kObject);
  EXPECT_EQ(Verify(signature, "(6:object3:abc(1:x))"), VESK2_ERR_HASH_MISMATCH);
  EXPECT_EQ(Verify(signature, "(6:object[num]3:abc(1:x))"), VESK2_ERR_HASH_MISMATCH);
}

TEST(VerifyTest, NeedsAKeyAndItsArguments) {
  const Ref<Signature> signature = Imported(TestKey::Rsa(0).Sign(kObject));
  const Ref<SExpression> object = Parse(kObject);
  ByteString* const name = signature->GetAlgorithm();
  ByteString* const value = signature->GetValue();
  const Ref<PublicKey> none(new PublicKey(nullptr));
  EXPECT_EQ(none->Verify(name, value, signature->GetHash(), object.get()),
            VESK2_ERR_NOT_IMPLEMENTED);
  ZvVesk2::Principal* const key = signature->GetPrincipal();
  EXPECT_EQ(key->Verify(name, nullptr, signature->GetHash(), object.get()),
            VESK2_ERR_INVALID_PARAM);
  EXPECT_EQ(key->VerifyMobile(name, nullptr, 0, nullptr, 0), VESK2_ERR_NOT_IMPLEMENTED);
}

TEST(VerifyTest, ChecksMobileBlocks) {
  const TestKey& dsa = TestKey::Dsa(0);
  const Ref<PublicKey> key(new PublicKey(nullptr));
  ASSERT_EQ(key->Import(Wrap(dsa.Public()).get()), 0);
  const Ref<SExpression> names = Parse("(8:dsa-sha13:dsa7:rsa-pss)");
  auto* const name = dynamic_cast<ByteString*>(names->First());
  auto* const other = dynamic_cast<ByteString*>(names->Last());
  const std::string header = "header of 14 b";
  const auto check = [&](ByteString* algorithm, const std::string& signedData, std::string data) {
    std::string block =
        header + dsa.SignDigest(Digest(header + signedData, "sha1"), "dsa-sha1", "sha1");
    return key->VerifyMobile(algorithm, reinterpret_cast<unsigned char*>(block.data()), 0,
                             reinterpret_cast<unsigned char*>(data.data()),
                             static_cast<unsigned>(data.size()));
  };
  EXPECT_EQ(check(name, "data", "data"), 0);
  EXPECT_EQ(check(name, "data", "dato"), VESK2_ERR_SIGNATURE);
  EXPECT_EQ(check(other, "data", "data"), VESK2_ERR_SIGNATURE_ID);
  unsigned char block[54] = {};
  EXPECT_EQ(key->VerifyMobile(name, block, 54, nullptr, 1), VESK2_ERR_INVALID_PARAM);
}

TEST(SignatureTest, ReadsHashThenPrincipal) {
  const std::string key = TestKey::Rsa(0).Public();
  const std::string hash = HashOf(kObject);
  const std::pair<std::string, int> cases[] = {
      {SignatureText(key, hash, "a", "v"), VESK2_ERR_PARSE_FILE},
      {"(9:signature" + hash + "(6:k-of-n)(1:a1:v))", VESK2_ERR_PRINCIPAL},
      {"(9:signature" + hash + key + "(1:a))", VESK2_ERR_PARSE_FILE},
      {"(9:signature" + hash + key + "(1:a1:v1:w))", VESK2_ERR_PARSE_FILE},
      {"(9:signature" + hash + key + "(1:a1:v)", VESK2_ERR_PARSE_FILE},
  };
  for (const auto& [text, code] : cases) {
    EXPECT_EQ(Ref<Signature>(new Signature(nullptr))->Import(Wrap(text).get()), code) << text;
  }
  const Ref<Signature> signature = Imported(SignatureText(hash, key, "a", "v"));
  EXPECT_EQ(signature->Import(Wrap("").get()), VESK2_ERR_INVALID_PARAM);
}

TEST(SignatureTest, OfACertificateIsItsIssuers) {
  const TestKey& key = TestKey::Rsa(0);
  const std::string text = Cert({.issuer = key.Public(), .subject = HashOf("s")});
  const std::string byHash = Cert({.issuer = HashOf(key.Public()), .subject = HashOf("s")});
  const struct {
    std::string cert, signature;
    int code;
  } cases[] = {
      {text, key.Sign(text), 0},
      {text, key.Sign(text + " "), VESK2_ERR_HASH_MISMATCH},
      {text, TestKey::Rsa(1).Sign(text), VESK2_ERR_SIGNATURE},
      // Told apart before any arithmetic: this value is none.
      {text, SignatureText(HashOf("x"), TestKey::Rsa(1).Public(), "?", "v"), VESK2_ERR_SIGNATURE},
      {byHash, SignatureText(HashOf(byHash), HashOf(key.Public()), "rsa-1.5", "v"),
       VESK2_ERR_NOT_IMPLEMENTED},
  };
  for (const auto& row : cases) {
    const Ref<ZvVesk2::Cert> cert(new ZvVesk2::Cert(nullptr));
    ASSERT_EQ(cert->Import(Wrap(row.cert).get()), 0);
    EXPECT_EQ(Imported(row.signature)->Verify(cert.get()), row.code);
  }
}

// Create over a hash that was computed, whose value field is empty, and over one without a digest.
TEST(SignatureTest, CreatesFromParts) {
  const TestKey& test = TestKey::Rsa(0);
  const Ref<SExpression> object = Parse(kObject);
  std::string value = test.SignDigest(Digest(kObject), "rsa-1.5", "sha256");
  auto* const bytes = reinterpret_cast<unsigned char*>(value.data());
  for (const bool finished : {true, false}) {
    Ref<PublicKey> key(new PublicKey(nullptr));
    Ref<Hash> hash(new Hash(nullptr));
    ASSERT_EQ(key->Import(Wrap(test.Public()).get()), 0);
    ASSERT_EQ(hash->Init(ZVCLM_HASH_SHA256), 0);
    ASSERT_EQ(hash->Update(object.get()), 0);
    ASSERT_EQ(finished ? hash->Finalize() : 0, 0);
    // After a failure the parts are still the caller's, whatever the half-built object holds.
    for (const auto& [name, length, code] : {std::tuple("", 1u, VESK2_ERR_INVALID_PARAM),
                                             std::tuple("a", 8193u, VESK2_ERR_MAX_BYTE_STRING)}) {
      Ref<Signature> failed;
      std::string big(8193, 'v');
      EXPECT_EQ(Signature::Create(failed.Out(), hash.get(), key.get(), name,
                                  reinterpret_cast<unsigned char*>(big.data()), length, nullptr),
                code);
      EXPECT_TRUE(failed);
      failed.Reset();
      EXPECT_EQ(hash->GetRefCount() + key->GetRefCount(), 2);
    }
    Ref<Signature> signature;
    EXPECT_EQ(
        Signature::Create(signature.Out(), hash.get(), key.get(), "rsa-1.5", bytes, 0, nullptr),
        VESK2_ERR_INVALID_PARAM);
    ASSERT_EQ(Signature::Create(signature.Out(), hash.Release(), key.Release(), "rsa-1.5", bytes,
                                static_cast<unsigned>(value.size()), nullptr),
              0);
    EXPECT_EQ(signature->Verify(object.get()), finished ? 0 : VESK2_ERR_HASH_MISMATCH);
    EXPECT_EQ(signature->GetValue()->GetType(), ByteString::BsBin);
  }
}

}  // namespace
}  // namespace vesk2test
