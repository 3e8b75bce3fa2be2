// SPDX-License-Identifier: Apache-2.0
// Signatures: what is accepted, and with which code what was tampered with is refused.
#include <vesk2/cert.h>
#include <vesk2/public_key.h>
#include <vesk2/signature.h>

#include <cstdlib>
#include <tuple>

#include "tests/support/temp_dir.h"
#include "tests/support/test_key.h"
#include "tests/support/test_read.h"
#include "tests/support/test_text.h"

namespace vesk2test {
namespace {

using namespace ZvVesk2;

const std::string kObject = "(6:object[bin]3:abc(1:x))";

std::string SignatureText(const std::string& hash, const std::string& principal,
                          const std::string& algorithm, const std::string& value) {
  return List({Str("signature"), hash, principal, List({Str(algorithm), Str(value)})});
}

int Verify(const std::string& signature, const std::string& object = kObject) {
  return Read<Signature>(signature)->Verify(Parse(object).get());
}

TEST(VerifyTest, TakesWhatTheOpensslCommandSigns) {
  const TempDir dir;
  const std::string object = dir.Write("object", kObject);
  const std::string pss = " -sigopt rsa_padding_mode:pss -sigopt rsa_pss_saltlen:";
  const std::tuple<const char*, std::string, const char*> cases[] = {
      {"sha256", "", "rsa-1.5"},        {"sha1", "", "rsa-1.5"},  {"sha256", pss + "-1", "rsa-pss"},
      {"sha256", pss + "0", "rsa-pss"}, {"sha1", "", "dsa-sha1"},
  };
  for (const auto& [hash, options, algorithm] : cases) {
    const bool dsa = algorithm[0] == 'd';
    const TestKey& key = dsa ? TestKey::Dsa(0) : TestKey::Rsa(0);
    const std::string pem = dir.Write("key.pem", key.PrivatePem());
    const std::string command = std::string("openssl dgst -") + hash + options + " -sign " + pem +
                                " -out " + dir.File("value") + " " + object;
    ASSERT_EQ(std::system(command.c_str()), 0) << command;
    const std::string value = dsa ? TestKey::RawDsa(dir.Read("value")) : dir.Read("value");
    EXPECT_EQ(Verify(SignatureText(HashOf(kObject, hash), key.Public(), algorithm, value)), 0)
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
  std::string flippedRaw = raw;
  for (std::string* value : {&flipped, &flippedRaw}) value->back() = char(value->back() ^ 1);
  using Row = std::tuple<const TestKey&, std::string, std::string, std::string, int>;
  const Row cases[] = {
      // Names: a prefix of a known name matches it, PSS first.
      {rsa, "rsa", h256, pss, 0},
      {rsa, "", h256, pss, 0},
      {rsa, "rsa", h256, pkcs, VESK2_ERR_SIGNATURE},
      {rsa, "rsa-1", h256, pkcs, 0},
      {rsa, "rsa-pkcs1", h256, pkcs, VESK2_ERR_SIGNATURE_ID},
      {rsa, "rsa-1.6", h256, pkcs, VESK2_ERR_SIGNATURE_ID},
      {rsa, "rsa-1.5x", h256, pkcs, VESK2_ERR_SIGNATURE_ID},
      {rsa, std::string("rsa\0", 4), h256, pss, VESK2_ERR_SIGNATURE_ID},
      {dsa, "rsa-1.5", h1, raw, VESK2_ERR_SIGNATURE_ID},
      {dsa, "dsa", h1, raw, 0},
      // Hashes: RSA knows two, DSA takes none but SHA-1 whatever it is called.
      {rsa, "rsa-1.5", rmd, pkcs, VESK2_ERR_SIGNATURE_ID},
      {dsa, "dsa-sha1", sha1AsRmd, raw, 0},
      {dsa, "dsa-sha1", h256, raw, VESK2_ERR_HASH_MISMATCH},
      // Objects are judged before values.
      {rsa, "rsa-1.5", HashOf("x"), "", VESK2_ERR_HASH_MISMATCH},
      {dsa, "dsa-sha1", HashOf("x", "sha1"), raw, VESK2_ERR_HASH_MISMATCH},
      // Values.
      {rsa, "rsa-1.5", h256, flipped, VESK2_ERR_SIGNATURE},
      {rsa, "rsa-1.5", h256, pkcs.substr(1), VESK2_ERR_SIGNATURE},
      {rsa, "rsa-1.5", h256, "", VESK2_ERR_SIGNATURE},
      {rsa, "rsa-pss", h256, pkcs, VESK2_ERR_SIGNATURE},
      {TestKey::Rsa(1), "rsa-1.5", h256, pkcs, VESK2_ERR_SIGNATURE},
      {rsa, "rsa-1.5", h1, pkcs, VESK2_ERR_SIGNATURE},
      {dsa, "dsa-sha1", h1, flippedRaw, VESK2_ERR_SIGNATURE},
      {dsa, "dsa-sha1", h1, raw.substr(2), VESK2_ERR_SIGNATURE},
  };
  for (const auto& [key, algorithm, hash, value, code] : cases) {
    EXPECT_EQ(Verify(SignatureText(hash, key.Public(), algorithm, value)), code)
        << algorithm << " " << code;
  }
  // Display hints are part of what is signed.
  EXPECT_EQ(Verify(rsa.Sign(kObject), "(6:object3:abc(1:x))"), VESK2_ERR_HASH_MISMATCH);
  EXPECT_EQ(Verify(rsa.Sign(kObject), "(6:object[num]3:abc(1:x))"), VESK2_ERR_HASH_MISMATCH);
}

TEST(VerifyTest, ChecksMobileBlocks) {
  const TestKey& dsa = TestKey::Dsa(0);
  const Ref<PublicKey> key = Read<PublicKey>(dsa.Public());
  const Ref<ByteString> name = Read<ByteString>("8:dsa-sha1");
  const Ref<ByteString> other = Read<ByteString>("7:rsa-pss");
  const std::string header = "header of 14 b";
  const auto check = [&](ByteString* algorithm, std::string data) {
    const std::string digest = Digest(header + "data", "sha1");
    std::string block = header + dsa.SignDigest(digest, "dsa-sha1", "sha1");
    return key->VerifyMobile(algorithm, reinterpret_cast<unsigned char*>(block.data()), 0,
                             reinterpret_cast<unsigned char*>(data.data()),
                             static_cast<unsigned>(data.size()));
  };
  EXPECT_EQ(check(name.get(), "data"), 0);
  EXPECT_EQ(check(name.get(), "dato"), VESK2_ERR_SIGNATURE);
  EXPECT_EQ(check(other.get(), "data"), VESK2_ERR_SIGNATURE_ID);
  const Ref<PublicKey> rsa = Read<PublicKey>(TestKey::Rsa(0).Public());
  EXPECT_EQ(rsa->VerifyMobile(name.get(), nullptr, 0, nullptr, 0), VESK2_ERR_NOT_IMPLEMENTED);
}

TEST(SignatureTest, ReadsHashThenPrincipal) {
  const std::string key = TestKey::Rsa(0).Public();
  const std::string hash = HashOf(kObject);
  ExpectRead<Signature>(SignatureText(hash, key, "a", "v"));
  ExpectRead<Signature>(SignatureText(key, hash, "a", "v"), VESK2_ERR_PARSE_FILE);
  ExpectRead<Signature>("(9:signature" + hash + "(6:k-of-n)(1:a1:v))", VESK2_ERR_PRINCIPAL);
  ExpectRead<Signature>("(9:signature" + hash + key + "(1:a))", VESK2_ERR_PARSE_FILE);
  ExpectRead<Signature>("(9:signature" + hash + key + "(1:a1:v1:w))", VESK2_ERR_PARSE_FILE);
  ExpectDamageIsSeen<Signature>(TestKey::Dsa(0).Sign("(1:x)"));
  ExpectDamageIsSeen<Signature>(
      List({Str("signature"), HashOf("x", "sha1"), HashOf("y"), "(7:rsa-1.5[bin]5:value)"}));
}

TEST(SignatureTest, OfACertificateIsItsIssuers) {
  const TestKey& key = TestKey::Rsa(0);
  const std::string text = Cert({.issuer = key.Public(), .subject = HashOf("s")});
  const std::string byHash = Cert({.issuer = HashOf(key.Public()), .subject = HashOf("s")});
  // The counts of a k-of-n are hashed with the hint that they are read into.
  const auto forAny = [&key](const char* counts) {
    return Cert({.issuer = key.Public(), .subject = List({Str("k-of-n"), counts, key.Public()})});
  };
  const std::string hinted = forAny("[num]1:\1[num]1:\1"), plain = forAny("1:\0011:\1");
  const std::tuple<std::string, std::string, int> cases[] = {
      {text, key.Sign(text), 0},
      {hinted, key.Sign(hinted), 0},
      {plain, key.Sign(hinted), 0},
      {plain, key.Sign(plain), VESK2_ERR_HASH_MISMATCH},
      {text, key.Sign(text + " "), VESK2_ERR_HASH_MISMATCH},
      {text, TestKey::Rsa(1).Sign(text), VESK2_ERR_SIGNATURE},
      // Told apart before any arithmetic: this value is none.
      {text, SignatureText(HashOf("x"), TestKey::Rsa(1).Public(), "?", "v"), VESK2_ERR_SIGNATURE},
      {byHash, SignatureText(HashOf(byHash), HashOf(key.Public()), "rsa-1.5", "v"),
       VESK2_ERR_NOT_IMPLEMENTED},
  };
  for (const auto& [cert, signature, code] : cases) {
    EXPECT_EQ(Read<Signature>(signature)->Verify(Read<ZvVesk2::Cert>(cert).get()), code);
  }
}

TEST(SignatureTest, RefusesWhatIsMissing) {
  const Ref<Hash> hash = Read<Hash>(HashOf("x"));
  const Ref<PublicKey> key = Read<PublicKey>(TestKey::Rsa(0).Public());
  unsigned char value[] = {1};
  const std::tuple<Hash*, Principal*, const char*, unsigned char*, unsigned> parts[] = {
      {nullptr, key.get(), "a", value, 1},
      {hash.get(), nullptr, "a", value, 1},
      {hash.get(), key.get(), nullptr, value, 1},
      {hash.get(), key.get(), "a", nullptr, 1},
      {hash.get(), key.get(), "a", value, 0}};
  for (const auto& [from, by, algorithm, bytes, length] : parts) {
    Ref<Signature> made;
    EXPECT_EQ(Signature::Create(made.Out(), from, by, algorithm, bytes, length, nullptr),
              VESK2_ERR_INVALID_PARAM);
    EXPECT_FALSE(made);
  }
  const Ref<Signature> empty(new Signature(nullptr));
  Signature* taken = empty.get();
  EXPECT_EQ(Signature::Create(taken, hash.get(), key.get(), "a", value, 1, nullptr),
            VESK2_ERR_INVALID_PARAM);
  EXPECT_TRUE(taken == empty.get() && hash->GetRefCount() + key->GetRefCount() == 2);
  EXPECT_EQ(empty->Import(static_cast<ZvBuffer*>(nullptr)), VESK2_ERR_INVALID_PARAM);
  EXPECT_EQ(empty->Verify(static_cast<ZvVesk2::Cert*>(nullptr)), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(empty->Verify(static_cast<SExpression*>(nullptr)), VESK2_ERR_PARAM_NULL);
  // Nobody signed with an object that was never read.
  EXPECT_EQ(empty->Verify(hash.get()), VESK2_ERR_SIGNATURE);
  EXPECT_EQ(empty->Verify(Read<ZvVesk2::Cert>(
                              Cert({.issuer = TestKey::Rsa(0).Public(), .subject = HashOf("s")}))
                              .get()),
            VESK2_ERR_SIGNATURE);
}

// Create over a hash that was computed, whose value field is empty, and over one without a digest.
TEST(SignatureTest, CreatesFromParts) {
  const TestKey& test = TestKey::Rsa(0);
  const Ref<SExpression> object = Parse(kObject);
  std::string value = test.SignDigest(Digest(kObject), "rsa-1.5", "sha256");
  auto* const bytes = reinterpret_cast<unsigned char*>(value.data());
  for (const bool finished : {true, false}) {
    Ref<PublicKey> key = Read<PublicKey>(test.Public());
    Ref<Hash> hash(new Hash(nullptr));
    ASSERT_EQ(hash->Init(ZVCLM_HASH_SHA256), 0);
    ASSERT_EQ(hash->Update(object.get()), 0);
    ASSERT_EQ(finished ? hash->Finalize() : 0, 0);
    // After a failure the parts are still the caller's, whatever the half-built object holds.
    Ref<Signature> signature;
    EXPECT_EQ(Signature::Create(signature.Out(), hash.get(), key.get(), "", bytes, 1, nullptr),
              VESK2_ERR_INVALID_PARAM);
    EXPECT_TRUE(signature);
    signature.Reset();
    EXPECT_EQ(hash->GetRefCount() + key->GetRefCount(), 2);
    ASSERT_EQ(Signature::Create(signature.Out(), hash.Release(), key.Release(), "rsa-1.5", bytes,
                                static_cast<unsigned>(value.size()), nullptr),
              0);
    EXPECT_EQ(signature->Verify(object.get()), finished ? 0 : VESK2_ERR_HASH_MISMATCH);
    EXPECT_EQ(signature->GetValue()->GetType(), ByteString::BsBin);
  }
}

}  // namespace
}  // namespace vesk2test
