// Numbers, keys and signature checks. Signatures and the reading of exports are left to other
// programs; every way to be wrong must be an answer of "not valid", never an error or a crash.
#include <gtest/gtest.h>
#include <openssl/bn.h>
#include <openssl/core_names.h>
#include <openssl/err.h>

#include <algorithm>
#include <cstdlib>
#include <memory>
#include <string>

#include "src/platform/crypto.h"
#include "tests/support/temp_dir.h"
#include "tests/support/test_key.h"
#include "tests/support/test_text.h"

namespace {

using vesk2test::Digest;
using vesk2test::TempDir;
using vesk2test::TestKey;

const unsigned char* Data(const std::string& bytes) {
  return reinterpret_cast<const unsigned char*>(bytes.data());
}

ZVCLMBigInt* Number(const std::string& bytes) {
  ZVCLMBigInt* number = nullptr;
  EXPECT_EQ(zvclm_BigIntFromBuffer(&number, Data(bytes), static_cast<uint32_t>(bytes.size())), 0);
  return number;
}

// A number of `bits` bits with the highest and the lowest set.
std::string Bits(int bits) {
  std::string bytes(static_cast<size_t>(bits + 7) / 8, '\0');
  bytes.front() = static_cast<char>(1 << (bits + 7) % 8);
  bytes.back() = static_cast<char>(bytes.back() | 1);
  return bytes;
}

using Big = std::unique_ptr<BIGNUM, decltype(&BN_free)>;
using Work = std::unique_ptr<BN_CTX, decltype(&BN_CTX_free)>;

Big ToBig(const std::string& bytes) {
  return {BN_bin2bn(Data(bytes), static_cast<int>(bytes.size()), nullptr), BN_free};
}

// At least `length` bytes.
std::string ToBytes(const BIGNUM* number, int length = 0) {
  length = std::max(length, BN_num_bytes(number));
  std::string bytes(static_cast<size_t>(length), '\0');
  BN_bn2binpad(number, reinterpret_cast<unsigned char*>(bytes.data()), length);
  return bytes;
}

std::string Parameter(const TestKey& key, const char* name) {
  BIGNUM* number = nullptr;
  EXPECT_EQ(EVP_PKEY_get_bn_param(key.Pkey(), name, &number), 1);
  return ToBytes(Big(number, BN_free).get());
}

struct KeyFree {
  void operator()(ZVCLMPublicKeyData* key) const { zvclm_PublicKeyFree(key, 0); }
};
using Key = std::unique_ptr<ZVCLMPublicKeyData, KeyFree>;

struct Rsa {
  std::string n = Parameter(TestKey::Rsa(0), OSSL_PKEY_PARAM_RSA_N);
  std::string e = Parameter(TestKey::Rsa(0), OSSL_PKEY_PARAM_RSA_E);
};
struct Dsa {
  std::string p = Parameter(TestKey::Dsa(0), OSSL_PKEY_PARAM_FFC_P);
  std::string q = Parameter(TestKey::Dsa(0), OSSL_PKEY_PARAM_FFC_Q);
  std::string g = Parameter(TestKey::Dsa(0), OSSL_PKEY_PARAM_FFC_G);
  std::string y = Parameter(TestKey::Dsa(0), OSSL_PKEY_PARAM_PUB_KEY);
};

Key Define(const Rsa& numbers) {
  ZVCLMRSAKeyData record;
  EXPECT_EQ(zvclm_RSAKeyStructInit(ZVCLM_DATA_RSA, &record), 0);
  record.n = Number(numbers.n);
  record.e = Number(numbers.e);
  ZVCLMPublicKeyData* key = nullptr;
  EXPECT_EQ(zvclm_PublicKeyDefine(&key, ZVCLM_KEY_RSA, ZVCLM_DATA_RSA, &record, 0, 0), 0);
  EXPECT_EQ(zvclm_RSAKeyStructZeroize(ZVCLM_DATA_RSA, &record), 0);
  EXPECT_EQ(record.n, nullptr);
  return Key(key);
}

Key Define(const Dsa& numbers) {
  ZVCLMDSSKeyData record;
  EXPECT_EQ(zvclm_DSSKeyStructInit(ZVCLM_DATA_DSA, &record, 48), 0);
  record.p = Number(numbers.p);
  record.q = Number(numbers.q);
  record.g = Number(numbers.g);
  record.y = Number(numbers.y);
  ZVCLMPublicKeyData* key = nullptr;
  EXPECT_EQ(zvclm_PublicKeyDefine(&key, ZVCLM_KEY_DSA, ZVCLM_DATA_DSA, &record, 0, 0), 0);
  EXPECT_EQ(zvclm_DSSKeyStructZeroize(ZVCLM_DATA_DSA, &record), 0);
  return Key(key);
}

bool Valid(const Key& key, int scheme, int hash, const std::string& digest,
           const std::string& signature) {
  ZVCLMRSAParameters record{
      {40, 0x7AFAB04D, 0, static_cast<uint32_t>(hash), 0, static_cast<uint32_t>(hash), 0, 0, 4, 0}};
  int valid = 7;
  EXPECT_EQ(zvclm_PublicKeyVerifySignature(key.get(), scheme, &record, Data(digest),
                                           static_cast<uint32_t>(digest.size()), Data(signature),
                                           static_cast<uint32_t>(signature.size()), &valid, 0),
            0);
  EXPECT_EQ(ERR_peek_error(), 0u);
  EXPECT_TRUE(valid == 0 || valid == 1);
  return valid != 0;
}

TEST(KeyTest, NumbersKeepNoLeadingZeros) {
  const std::string zero(1, '\0');
  for (const auto& [in, expected] : {std::pair{std::string(), zero},
                                     {zero + zero, zero},
                                     {zero + "\x81" + zero, "\x81" + zero}}) {
    ZVCLMRSAKeyData record;
    ASSERT_EQ(zvclm_RSAKeyStructInit(ZVCLM_DATA_RSA, &record), 0);
    record.n = Number(in);
    unsigned char out[9];
    auto size = static_cast<uint32_t>(zvclm_BigIntGetBufferSize(record.n)) - 1;
    EXPECT_EQ(zvclm_BigIntToBuffer(record.n, out, &size), ZVCLM_ERR_BUFFER_TOO_SMALL);
    size = sizeof out;
    EXPECT_EQ(zvclm_BigIntToBuffer(record.n, out, &size), 0);
    EXPECT_EQ(std::string(out, out + size), expected);
    zvclm_RSAKeyStructZeroize(ZVCLM_DATA_RSA, &record);
  }
}

TEST(KeyTest, TakesAndGivesRecordsByTheirMarks) {
  ZVCLMRSAKeyData rsa;
  ZVCLMDSSKeyData dsa;
  EXPECT_EQ(zvclm_RSAKeyStructInit(ZVCLM_DATA_DSA, &rsa), ZVCLM_ERR_KEY_TYPE);
  EXPECT_EQ(zvclm_DSSKeyStructInit(ZVCLM_DATA_DSA, &dsa, 47), ZVCLM_ERR_KEY_TYPE);
  ASSERT_EQ(zvclm_RSAKeyStructInit(ZVCLM_DATA_RSA, &rsa), 0);
  ASSERT_EQ(zvclm_DSSKeyStructInit(ZVCLM_DATA_DSA, &dsa, 48), 0);
  EXPECT_TRUE(rsa.size == 20 && dsa.size == 60 && dsa.parameterSize == 48);

  const auto define = [&](int type) {
    ZVCLMPublicKeyData* none = nullptr;
    return zvclm_PublicKeyDefine(&none, type, ZVCLM_DATA_RSA, &rsa, 0, 0);
  };
  EXPECT_EQ(define(ZVCLM_KEY_RSA), ZVCLM_ERR_NULL_PARAM);  // no numbers
  EXPECT_EQ(define(ZVCLM_KEY_DSA), ZVCLM_ERR_KEY_TYPE);

  const Key keys[] = {Define(Dsa{}), Define(Rsa{})};
  EXPECT_EQ(zvclm_PublicKeyGetData(keys[1].get(), ZVCLM_DATA_DSA, &dsa, 0), ZVCLM_ERR_KEY_TYPE);
  for (int again = 0; again < 2; ++again) {  // a record filled twice leaks nothing
    EXPECT_EQ(zvclm_PublicKeyGetData(keys[1].get(), ZVCLM_DATA_RSA, &rsa, 0), 0);
    EXPECT_EQ(zvclm_PublicKeyGetData(keys[0].get(), ZVCLM_DATA_DSA, &dsa, 0), 0);
  }
  EXPECT_TRUE(rsa.keyLength == 2048 && dsa.keyLength == 1024);
  EXPECT_EQ(zvclm_BigIntGetBufferSize(dsa.q), 20);
  for (int again = 0; again < 2; ++again) {
    EXPECT_EQ(zvclm_RSAKeyStructZeroize(ZVCLM_DATA_RSA, &rsa), 0);
    EXPECT_EQ(zvclm_DSSKeyStructZeroize(ZVCLM_DATA_DSA, &dsa), 0);
  }
}

TEST(KeyTest, VerifiesWhatTheOpensslCommandSigns) {
  const TempDir dir;
  const Key keys[] = {Define(Dsa{}), Define(Rsa{})};
  const std::string pss = "-pkeyopt rsa_padding_mode:pss -pkeyopt rsa_pss_saltlen:";
  const struct {
    int type, scheme;
    const char* hash;
    std::string options;
  } cases[] = {
      {ZVCLM_KEY_RSA, ZVCLM_SCHEME_RSA_PKCS1, "sha1", ""},
      {ZVCLM_KEY_RSA, ZVCLM_SCHEME_RSA_PKCS1, "sha256", ""},
      {ZVCLM_KEY_RSA, ZVCLM_SCHEME_RSA_PSS, "sha1", pss + "20"},
      {ZVCLM_KEY_RSA, ZVCLM_SCHEME_RSA_PSS, "sha256", pss + "0"},
      {ZVCLM_KEY_RSA, ZVCLM_SCHEME_RSA_PSS, "sha256", pss + "max"},
      {ZVCLM_KEY_DSA, ZVCLM_SCHEME_DSA, "sha1", ""},
  };
  for (const auto& row : cases) {
    const bool rsa = row.type == ZVCLM_KEY_RSA;
    const TestKey& pair = rsa ? TestKey::Rsa(0) : TestKey::Dsa(0);
    const std::string digest = Digest("object", row.hash);
    const std::string command =
        "openssl pkeyutl -sign -inkey " + dir.Write("pem", pair.PrivatePem()) + " -in " +
        dir.Write("digest", digest) + " -out " + dir.File("signature") +
        (rsa ? " -pkeyopt digest:" + std::string(row.hash) : "") + " " + row.options;
    ASSERT_EQ(std::system(command.c_str()), 0) << command;
    std::string signature = dir.Read("signature");
    if (!rsa) signature = TestKey::RawDsa(signature);
    const int hash = row.hash == std::string("sha1") ? ZVCLM_HASH_SHA1 : ZVCLM_HASH_SHA256;
    const Key& key = keys[row.type];
    const auto valid = [&](const std::string& d, const std::string& s) {
      return Valid(key, row.scheme, hash, d, s);
    };
    EXPECT_TRUE(valid(digest, signature)) << command;

    std::string changed = signature;
    changed.back() = static_cast<char>(changed.back() ^ 1);
    const std::string zeros(signature.size(), '\0');
    const std::string ones(signature.size(), '\xff');
    for (const std::string& bad : {signature.substr(1), signature + '\0', '\0' + signature,
                                   std::string(), zeros, ones, changed}) {
      EXPECT_FALSE(valid(digest, bad)) << command << " " << bad.size();
    }
    for (const std::string& bad : {Digest("other", row.hash), digest.substr(1), std::string()}) {
      EXPECT_FALSE(valid(bad, signature)) << command << " " << bad.size();
    }
    for (const int scheme : {0, 1, 2, 3, 4}) {
      EXPECT_EQ(Valid(key, scheme, hash, digest, signature), scheme == row.scheme) << scheme;
    }
    EXPECT_FALSE(Valid(keys[1 - row.type], row.scheme, hash, digest, signature)) << command;
    for (const int other : {1, 2 - hash}) {
      EXPECT_FALSE(rsa && Valid(key, row.scheme, other, digest, signature)) << command;
    }
  }
  int valid = 7;
  EXPECT_EQ(zvclm_PublicKeyVerifySignature(nullptr, 2, "", Data("x"), 1, Data("x"), 1, &valid, 0),
            ZVCLM_ERR_NULL_PARAM);
  EXPECT_EQ(valid, 0);
}

// What a signer by RSA PKCS #1 v1.5 with SHA-256 raises to the private exponent.
std::string Padded(const std::string& digest, size_t length) {
  const std::string prefix(
      "\0\x30\x31\x30\x0d\x06\x09\x60\x86\x48\x01\x65\x03\x04\x02\x01\x05\0\x04\x20", 20);
  const size_t filled = length - 2 - prefix.size() - digest.size();
  return std::string("\0\x01", 2) + std::string(filled, '\xff') + prefix + digest;
}

// The signatures would be good by arithmetic alone.
TEST(KeyTest, RefusesRsaKeysOutsideTheLimits) {
  const std::string digest = Digest("object");
  const auto valid = [&](const Rsa& numbers, const std::string& signature) {
    return Valid(Define(numbers), ZVCLM_SCHEME_RSA_PKCS1, ZVCLM_HASH_SHA256, digest, signature);
  };
  const Rsa rsa;
  for (const char* e : {"\x01", "\x02", "", "\x01\x01\x01\x01\x01\x01\x01\x01\x01"}) {
    EXPECT_FALSE(valid({rsa.n, e}, Padded(digest, rsa.n.size()))) << BN_num_bits(ToBig(e).get());
  }
  // An exponent grown by a multiple of the group's order does what the small one does.
  const TestKey& pair = TestKey::Rsa(0);
  const std::string good = pair.SignDigest(digest, "rsa-1.5", "sha256");
  const Big p = ToBig(Parameter(pair, OSSL_PKEY_PARAM_RSA_FACTOR1));
  const Big q = ToBig(Parameter(pair, OSSL_PKEY_PARAM_RSA_FACTOR2));
  const Work work(BN_CTX_new(), BN_CTX_free);
  BN_sub_word(p.get(), 1);
  BN_sub_word(q.get(), 1);
  BN_rshift1(q.get(), q.get());
  BN_mul(p.get(), p.get(), q.get(), work.get());
  BN_add(p.get(), p.get(), ToBig(rsa.e).get());
  EXPECT_TRUE(valid(rsa, good));
  EXPECT_FALSE(valid({rsa.n, ToBytes(p.get())}, good));
  for (const std::string& n : {std::string(), std::string("\x0f"), Bits(2048) + '\0'}) {
    EXPECT_FALSE(valid({n, rsa.e}, std::string(n.size(), '\x01'))) << n.size();
  }
}

TEST(KeyTest, RefusesDsaKeysOutsideTheLimits) {
  const Dsa dsa;
  const std::string sha1 = Digest("object", "sha1");
  for (const Dsa& odd : {Dsa{dsa.p, dsa.q, "\x01", "\x01"}, Dsa{dsa.p, dsa.q, dsa.g, "\x01"},
                         Dsa{dsa.p, dsa.q, "", dsa.y}, Dsa{dsa.p, dsa.q, dsa.g, dsa.p},
                         Dsa{dsa.p, dsa.q, dsa.p + '\1', dsa.y}, Dsa{dsa.p, "\x01", dsa.g, dsa.y},
                         Dsa{dsa.p, "", dsa.g, dsa.y}, Dsa{dsa.p, Bits(161), dsa.g, dsa.y},
                         Dsa{Bits(10001), dsa.q, dsa.g, dsa.y}, Dsa{"", dsa.q, dsa.g, dsa.y}}) {
    // r = s = 1, which fits any digest when g and y are 1.
    const std::string one = ToBytes(BN_value_one(), static_cast<int>(odd.q.size()));
    EXPECT_FALSE(Valid(Define(odd), ZVCLM_SCHEME_DSA, 0, sha1, one + one)) << odd.q.size();
  }
  // Both halves y mod q sign the number 0, which no digest is but an empty one would be.
  const Big half(BN_new(), BN_free);
  const Work work(BN_CTX_new(), BN_CTX_free);
  BN_mod(half.get(), ToBig(dsa.y).get(), ToBig(dsa.q).get(), work.get());
  const std::string forged = ToBytes(half.get(), 20) + ToBytes(half.get(), 20);
  const Key key = Define(dsa);
  EXPECT_TRUE(Valid(key, ZVCLM_SCHEME_DSA, 0, std::string(20, '\0'), forged));
  EXPECT_FALSE(Valid(key, ZVCLM_SCHEME_DSA, 0, "", forged));
}

std::string Export(const Key& key, int format) {
  uint32_t length = 0;
  const int code = zvclm_PublicKeyExport(key.get(), format, 0, nullptr, &length, 0);
  EXPECT_EQ(ERR_peek_error(), 0u);
  if (code != ZVCLM_ERR_BUFFER_TOO_SMALL) return "code " + std::to_string(code);
  std::string out(length, '?');
  auto* bytes = reinterpret_cast<unsigned char*>(out.data());
  uint32_t less = length - 1;
  EXPECT_EQ(zvclm_PublicKeyExport(key.get(), format, 0, bytes, &less, 0),
            ZVCLM_ERR_BUFFER_TOO_SMALL);
  EXPECT_EQ(less, length - 1);
  EXPECT_EQ(zvclm_PublicKeyExport(key.get(), format, 0, bytes, &length, 0), 0);
  return out;
}

TEST(KeyTest, OtherProgramsReadTheExports) {
  const TempDir dir;
  const Key keys[] = {Define(Dsa{}), Define(Rsa{})};
  for (const int type : {ZVCLM_KEY_RSA, ZVCLM_KEY_DSA}) {
    const TestKey& pair = type == ZVCLM_KEY_RSA ? TestKey::Rsa(0) : TestKey::Dsa(0);
    const std::string pem = dir.Write("pem", pair.PrivatePem());
    dir.Write("der", Export(keys[type], ZVCLM_FORMAT_X509));
    dir.Write("blob", Export(keys[type], ZVCLM_FORMAT_SSH));
    const std::string name = type == ZVCLM_KEY_RSA ? "ssh-rsa" : "ssh-dss";
    const std::string command =
        "cd " + dir.Path() + " && openssl pkey -in pem -pubout -out a &&" +
        " openssl pkey -pubin -inform DER -in der -pubout -out b && cmp a b &&" + " (printf '" +
        name + " ' && base64 -w0 blob) >ssh && ssh-keygen -l -f ssh >/dev/null &&" +
        " ssh-keygen -e -m PKCS8 -f ssh >c && cmp a c";
    EXPECT_EQ(std::system(command.c_str()), 0) << name;
    EXPECT_EQ(Export(keys[type], 1), "code " + std::to_string(ZVCLM_ERR_FORMAT));
  }
  // Odd numbers are a code or an encoding, never a crash; zero is an mpint without bytes.
  EXPECT_EQ(Export(Define(Rsa{"", ""}), ZVCLM_FORMAT_SSH).size(), 4 + 7 + 4 + 4u);
  Export(Define(Dsa{"", "", "", ""}), ZVCLM_FORMAT_X509);
}

}  // namespace
