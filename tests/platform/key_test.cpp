// SPDX-License-Identifier: Apache-2.0
// Keys and signature checks. Signatures and the reading of exports are left to other programs;
// every way to be wrong must be an answer of "not valid", never an error or a crash.
#include <gtest/gtest.h>
#include <openssl/bn.h>
#include <openssl/err.h>

#include <cstdlib>
#include <memory>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "src/platform/crypto.h"
#include "tests/support/temp_dir.h"
#include "tests/support/test_key.h"
#include "tests/support/test_text.h"

namespace {

using namespace std::string_literals;
using vesk2test::Digest;
using vesk2test::TestKey;

using Big = std::unique_ptr<BIGNUM, decltype(&BN_free)>;
using Key = std::shared_ptr<ZVCLMPublicKeyData>;
using Numbers = std::vector<std::string>;  // n and e, or p, q, g and y

Big Parameter(const TestKey& key, const char* name) {
  BIGNUM* number = nullptr;
  EXPECT_EQ(EVP_PKEY_get_bn_param(key.Pkey(), name, &number), 1);
  return {number, BN_free};
}
Big ToNumber(const std::string& bytes) {
  const auto* data = reinterpret_cast<const unsigned char*>(bytes.data());
  return {BN_bin2bn(data, static_cast<int>(bytes.size()), nullptr), BN_free};
}

std::string ToBytes(const Big& number) {
  std::string bytes(static_cast<size_t>(BN_num_bytes(number.get())), '\0');
  BN_bn2bin(number.get(), reinterpret_cast<unsigned char*>(bytes.data()));
  return bytes;
}

const TestKey& Pair(bool rsa) { return rsa ? TestKey::Rsa(0) : TestKey::Dsa(0); }

Numbers NumbersOf(bool rsa) {
  Numbers numbers;
  for (const char* name : rsa ? std::vector{"n", "e"} : std::vector{"p", "q", "g", "pub"}) {
    numbers.push_back(ToBytes(Parameter(Pair(rsa), name)));
  }
  return numbers;
}

const unsigned char* Data(const std::string& bytes) {
  return reinterpret_cast<const unsigned char*>(bytes.data());
}
uint32_t Size(const std::string& bytes) { return static_cast<uint32_t>(bytes.size()); }

// Makes a key, and tries on the way what must be refused.
Key Define(const Numbers& numbers) {
  ZVCLMRSAKeyData rsa;
  ZVCLMDSSKeyData dsa;
  EXPECT_EQ(zvclm_RSAKeyStructInit(ZVCLM_DATA_RSA, &rsa), 0);
  EXPECT_EQ(zvclm_DSSKeyStructInit(ZVCLM_DATA_DSA, &dsa, 48), 0);
  EXPECT_TRUE(rsa.size == 20 && dsa.size == 60 && dsa.parameterSize == 48);
  const int ids[] = {ZVCLM_DATA_DSA, ZVCLM_DATA_RSA};
  void* const records[] = {&dsa, &rsa};
  const int type = numbers.size() == 2 ? ZVCLM_KEY_RSA : ZVCLM_KEY_DSA, other = 1 - type;
  ZVCLMPublicKeyData* key = nullptr;
  const auto define = [&](int as) {
    return zvclm_PublicKeyDefine(&key, as, ids[type], records[type], 0, 0);
  };
  EXPECT_EQ(define(type), ZVCLM_ERR_NULL_PARAM);  // no numbers yet
  const auto fields = type == ZVCLM_KEY_RSA ? std::vector{&rsa.n, &rsa.e}
                                            : std::vector{&dsa.p, &dsa.q, &dsa.g, &dsa.y};
  for (size_t i = 0; i < numbers.size(); ++i) {
    EXPECT_EQ(zvclm_BigIntFromBuffer(fields[i], Data(numbers[i]), Size(numbers[i])), 0);
  }
  EXPECT_TRUE(define(other) == ZVCLM_ERR_KEY_TYPE && define(type) == 0);
  // A record filled twice leaks nothing.
  EXPECT_EQ(zvclm_PublicKeyGetData(key, ids[type], records[type], 0), 0);
  EXPECT_EQ(zvclm_PublicKeyGetData(key, ids[other], records[other], 0), ZVCLM_ERR_KEY_TYPE);
  EXPECT_EQ(zvclm_RSAKeyStructZeroize(ZVCLM_DATA_RSA, &rsa), 0);
  EXPECT_EQ(zvclm_DSSKeyStructZeroize(ZVCLM_DATA_DSA, &dsa), 0);
  return {key, [](ZVCLMPublicKeyData* made) { zvclm_PublicKeyFree(made, 0); }};
}

bool Valid(const Key& key, int scheme, int hash, const std::string& digest,
           const std::string& signature, int code = 0) {
  ZVCLMRSAParameters record{};
  record.words[3] = static_cast<uint32_t>(hash);
  int valid = 7;
  const int result =
      zvclm_PublicKeyVerifySignature(key.get(), scheme, &record, Data(digest), Size(digest),
                                     Data(signature), Size(signature), &valid, 0);
  EXPECT_TRUE(result == code && ERR_peek_error() == 0 && (valid == 0 || valid == 1)) << result;
  return valid != 0;
}

TEST(KeyTest, VerifiesWhatTheOpensslCommandSigns) {
  const vesk2test::TempDir dir;
  const std::string pss = " -pkeyopt rsa_padding_mode:pss -pkeyopt rsa_pss_saltlen:";
  for (const auto& [scheme, name, options] : {std::tuple{ZVCLM_SCHEME_RSA_PKCS1, "sha256", ""s},
                                              {ZVCLM_SCHEME_RSA_PSS, "sha1", pss + "20"},
                                              {ZVCLM_SCHEME_RSA_PSS, "sha256", pss + "max"},
                                              {ZVCLM_SCHEME_DSA, "sha1", ""s}}) {
    const bool rsa = scheme != ZVCLM_SCHEME_DSA;
    const int hash = name == "sha1"s ? ZVCLM_HASH_SHA1 : ZVCLM_HASH_SHA256;
    const std::string digest = Digest("object", name), flags = " -pkeyopt digest:"s + name;
    dir.Write("digest", digest);
    dir.Write("pem", Pair(rsa).PrivatePem());
    const std::string command = "cd " + dir.Path() + "; openssl pkeyutl -sign -in digest" +
                                " -inkey pem -out signature" + options + (rsa ? flags : "");
    ASSERT_EQ(std::system(command.c_str()), 0) << command;
    std::string signature = dir.Read("signature");
    if (!rsa) signature = TestKey::RawDsa(signature);
    const Key keys[] = {Define(NumbersOf(!rsa)), Define(NumbersOf(rsa))};
    const std::string zeros(signature.size(), '\0'), ones(signature.size(), '\xff');
    for (const std::string& bad : {""s, signature.substr(1), signature + '\0',
                                   signature.substr(1) + signature[0], zeros, ones}) {
      EXPECT_FALSE(Valid(keys[1], scheme, hash, digest, bad)) << command << " " << bad.size();
    }
    for (const std::string& bad : {""s, digest.substr(1), Digest("other", name)}) {
      EXPECT_FALSE(Valid(keys[1], scheme, hash, bad, signature)) << command << " " << bad.size();
    }
    for (const int other : {0, 1, 2, 3, 4}) {
      EXPECT_EQ(Valid(keys[1], other, hash, digest, signature), other == scheme) << command;
      EXPECT_EQ(Valid(keys[1], scheme, other, digest, signature), !rsa || other == hash);
      EXPECT_FALSE(Valid(keys[0], other, hash, digest, signature)) << command;
    }
  }
  EXPECT_FALSE(Valid(nullptr, ZVCLM_SCHEME_DSA, 0, "x", "x", ZVCLM_ERR_NULL_PARAM));
}

// libcrypto's no is told from its lack of memory by what it leaves in its error queue: Valid
// expects the code 0 for odd numbers of every length and for changes anywhere in a good signature.
TEST(KeyTest, TellsANoFromALackOfMemory) {
  const std::string digest = Digest("object");
  const Numbers rsa = NumbersOf(true);
  for (const auto& [scheme, name] :
       {std::pair{ZVCLM_SCHEME_RSA_PKCS1, "rsa-1.5"}, std::pair{ZVCLM_SCHEME_RSA_PSS, "rsa-pss"}}) {
    std::string signature = Pair(true).SignDigest(digest, name, "sha256");
    for (char& byte : signature) {
      byte ^= 0x10;
      EXPECT_FALSE(Valid(Define(rsa), scheme, ZVCLM_HASH_SHA256, digest, signature));
      byte ^= 0x10;
    }
    for (size_t bytes = 1; bytes < 160; ++bytes) {
      for (const char top : {'\x01', '\x1f', '\xff'}) {
        std::string n(bytes, '\xa7');
        n[0] = top;
        const std::string below = std::string(1, static_cast<char>(top - 1)) + n.substr(1);
        EXPECT_FALSE(Valid(Define({n, "\3"}), scheme, ZVCLM_HASH_SHA256, digest, below));
      }
    }
  }
}

// A key that signs any block, whatever is in it. One prime is modulus enough: a check cannot tell.
class BlockKey {
 public:
  explicit BlockKey(size_t size) : size_(size) {
    const Big order(BN_new(), BN_free);
    do {
      BN_generate_prime_ex(n_.get(), static_cast<int>(8 * size), 0, nullptr, nullptr, nullptr);
      BN_sub(order.get(), n_.get(), BN_value_one());
    } while (BN_mod_word(order.get(), 65537) == 0);
    BN_mod_inverse(d_.get(), ToNumber(kE).get(), order.get(), context_.get());
    key_ = Define({ToBytes(n_), kE});
  }
  // The signature that opens to `block`.
  std::string Sign(const std::string& block) const {
    const Big number(BN_new(), BN_free);
    BN_mod_exp(number.get(), ToNumber(block).get(), d_.get(), n_.get(), context_.get());
    std::string signature(size_, '\0');
    BN_bn2binpad(number.get(), reinterpret_cast<unsigned char*>(signature.data()),
                 static_cast<int>(size_));
    return signature;
  }
  bool TakesSignature(const std::string& signature, int scheme, const std::string& digest) const {
    return Valid(key_, scheme, ZVCLM_HASH_SHA256, digest, signature);
  }
  bool Takes(const std::string& block, int scheme, const std::string& digest) const {
    return TakesSignature(Sign(block), scheme, digest);
  }

 private:
  inline static const std::string kE = "\1\0\1"s;
  size_t size_;
  Big n_{BN_new(), BN_free}, d_{BN_new(), BN_free};
  std::unique_ptr<BN_CTX, decltype(&BN_CTX_free)> context_{BN_CTX_new(), BN_CTX_free};
  Key key_;
};

// The one good block is taken, and no other with anything of it changed.
void ExpectNoOther(const BlockKey& key, int scheme, std::string block, const std::string& digest) {
  EXPECT_TRUE(key.Takes(block, scheme, digest));
  // The top bit of a block is not free: it must stay below the modulus.
  for (size_t bit = 1; bit < 8 * block.size(); ++bit) {
    char& byte = block[bit / 8];
    const char flip = static_cast<char>(0x80 >> bit % 8);
    byte = static_cast<char>(byte ^ flip);
    EXPECT_FALSE(key.Takes(block, scheme, digest)) << "bit " << bit;
    byte = static_cast<char>(byte ^ flip);
  }
}

// "00 <type> ff...ff <content>" of `size` bytes.
std::string Block(size_t size, const std::string& content, char type = 1) {
  return "\0"s + type + std::string(size - 2 - content.size(), '\xff') + content;
}

TEST(KeyTest, TakesOnePkcs1BlockOnly) {
  const std::string digest = Digest("object");
  const std::string oid = "\x06\x09\x60\x86\x48\x01\x65\x03\x04\x02\x01";
  const std::string info = "\x30\x31\x30\x0d"s + oid + "\x05\0\x04\x20"s + digest;
  const std::string sha512 = "\x30\x31\x30\x0d"s + oid.substr(0, 10) + "\x03\x05\0\x04\x20"s;
  const std::string sha1 = "\x30\x21\x30\x09\x06\x05\x2b\x0e\x03\x02\x1a\x05\0\x04\x14"s;
  constexpr size_t kSize = 64;
  const BlockKey key(kSize);
  const std::string good = Block(kSize, "\0"s + info);
  ExpectNoOther(key, ZVCLM_SCHEME_RSA_PKCS1, good, digest);
  const std::pair<const char*, std::string> blocks[] = {
      {"nothing", Block(kSize, "\0"s)},
      {"padding only", Block(kSize, "")},
      {"a bare digest", Block(kSize, "\0"s + digest)},
      {"no digest", Block(kSize, "\0"s + info.substr(0, 19))},
      {"a truncated digest", Block(kSize, "\0"s + info.substr(0, info.size() - 1))},
      {"garbage behind", Block(kSize, "\0"s + info + "x")},
      {"garbage for padding", Block(kSize, "\0"s + info + std::string(9, 'x'))},
      {"short padding", Block(kSize, "\0"s + info + "xyz")},
      {"shorter padding", "\0\1\0"s + info + std::string(kSize - 3 - info.size(), '\0')},
      {"an encrypted block", Block(kSize, "\0"s + info, 2)},
      {"type 0", "\0"s + std::string(kSize - 1 - info.size(), '\0') + info},
      {"no first byte", good.substr(1) + '\0'},
      {"no NULL", Block(kSize, "\0\x30\x2f\x30\x0b"s + oid + "\x04\x20" + digest)},
      {"another NULL", Block(kSize, "\0\x30\x32\x30\x0e"s + oid + "\x05\1\0\x04\x20"s + digest)},
      {"a long length", Block(kSize, "\0\x30\x81\x31"s + info.substr(2))},
      {"SHA-512's name", Block(kSize, "\0"s + sha512 + digest)},
      {"SHA-1's name", Block(kSize, "\0"s + sha1 + digest.substr(0, 20))},
      {"another digest", Block(kSize, "\0"s + info.substr(0, 19) + Digest("other"))},
      {"zeros", std::string(kSize, '\0')}};
  for (const auto& [name, block] : blocks) {
    EXPECT_FALSE(key.Takes(block, ZVCLM_SCHEME_RSA_PKCS1, digest)) << name;
    EXPECT_FALSE(key.Takes(block, ZVCLM_SCHEME_RSA_PSS, digest)) << name;
  }
  // Eight bytes of padding are needed, and fill a block of 62 bytes.
  for (const size_t size : {61u, 62u}) {
    const std::string full = Block(size, "\0"s + info);
    EXPECT_EQ(BlockKey(size).Takes(full, ZVCLM_SCHEME_RSA_PKCS1, digest), size == 62);
  }
}

// A number without known factors that takes one signature s for the block: n = s^3 - block.
struct OneSignature {
  std::string n, signature;
};
OneSignature MakeModulusFor(int bits, const std::string& digest) {
  const std::string info = "\0\x30\x31\x30\x0d\x06\x09\x60\x86\x48\x01\x65\x03\x04\x02\x01"s +
                           "\x05\0\x04\x20"s + digest;
  const Big block = ToNumber(Block(static_cast<size_t>(bits) / 8, info));
  const std::unique_ptr<BN_CTX, decltype(&BN_CTX_free)> context(BN_CTX_new(), BN_CTX_free);
  const Big s(BN_new(), BN_free), n(BN_new(), BN_free);
  BN_set_bit(s.get(), (bits - 1) / 3);
  do {  // a little larger each time: odd, and of that many bits in the end
    const Big step(BN_new(), BN_free);
    BN_rshift(step.get(), s.get(), 4);
    BN_add(s.get(), s.get(), step.get());
    if (BN_is_odd(block.get()) == BN_is_odd(s.get())) BN_add_word(s.get(), 1);
    BN_sqr(n.get(), s.get(), context.get());
    BN_mul(n.get(), n.get(), s.get(), context.get());
    BN_sub(n.get(), n.get(), block.get());
  } while (BN_num_bits(n.get()) < bits);
  std::string signature(static_cast<size_t>(bits) / 8, '\0');
  BN_bn2binpad(s.get(), reinterpret_cast<unsigned char*>(signature.data()),
               static_cast<int>(signature.size()));
  return {ToBytes(n), signature};
}

// The largest modulus is one, larger ones cost nothing.
TEST(KeyTest, BoundsTheModulus) {
  const std::string digest = Digest("object");
  for (const int bits : {2048, 16384, 16392, 65536}) {
    const OneSignature made = MakeModulusFor(bits, digest);
    EXPECT_EQ(Valid(Define({made.n, "\3"}), ZVCLM_SCHEME_RSA_PKCS1, 2, digest, made.signature),
              bits <= 16384)
        << bits;
  }
}

// A PSS block: a mask over zeros, 1 and the salt; the hash of digest and salt; "bc".
std::string PssBlock(size_t size, const std::string& digest, const std::string& salt,
                     const char* maskHash = "sha256") {
  const std::string hash = Digest(std::string(8, '\0') + digest + salt);
  std::string block(size - hash.size() - salt.size() - 2, '\0');
  block += '\1' + salt;
  std::string mask;
  for (char i = 0; mask.size() < block.size(); ++i) mask += Digest(hash + "\0\0\0"s + i, maskHash);
  for (size_t i = 0; i < block.size(); ++i) block[i] = static_cast<char>(block[i] ^ mask[i]);
  block[0] = static_cast<char>(block[0] & 0x7f);
  return block + hash + '\xbc';
}

TEST(KeyTest, TakesPssBlocksOfAnySaltOnly) {
  const std::string digest = Digest("object");
  constexpr size_t kSize = 72;
  const BlockKey key(kSize);
  const auto takes = [&](const std::string& block) {
    return key.Takes(block, ZVCLM_SCHEME_RSA_PSS, digest);
  };
  for (const size_t salt : {0u, 20u, 38u}) {
    const std::string block = PssBlock(kSize, digest, std::string(salt, 's'));
    ExpectNoOther(key, ZVCLM_SCHEME_RSA_PSS, block, digest);
    EXPECT_FALSE(key.Takes(block, ZVCLM_SCHEME_RSA_PKCS1, digest));
  }
  EXPECT_FALSE(takes(PssBlock(kSize, digest, "salt", "sha1"))) << "another mask";
  EXPECT_FALSE(takes(PssBlock(kSize, Digest("other"), "salt")));
  EXPECT_FALSE(takes('\0' + PssBlock(kSize - 1, digest, "salt"))) << "too short a block";
  std::string trailer = PssBlock(kSize, digest, "salt");
  trailer.back() = '\xcc';
  EXPECT_FALSE(takes(trailer)) << "a trailer that names the hash";
  // A zero at the start is part of the text: without it the same number is no signature.
  std::string signature;
  for (int salt = 0; signature.empty() || signature[0] != '\0'; ++salt) {
    signature = key.Sign(PssBlock(kSize, digest, std::to_string(salt)));
  }
  EXPECT_TRUE(key.TakesSignature(signature, ZVCLM_SCHEME_RSA_PSS, digest));
  EXPECT_FALSE(key.TakesSignature(signature.substr(1), ZVCLM_SCHEME_RSA_PSS, digest));
}

TEST(KeyTest, LeavesTheCallersErrors) {
  const Key key = Define(NumbersOf(true));
  const std::string digest = Digest("object"), zeros(256, '\0');
  ZVCLMRSAParameters record{};
  record.words[3] = ZVCLM_HASH_SHA256;
  ERR_raise(ERR_LIB_USER, 1);  // the library has such an entry of its own
  ERR_raise(ERR_LIB_USER, 8);
  int valid = 1;
  EXPECT_EQ(zvclm_PublicKeyVerifySignature(key.get(), ZVCLM_SCHEME_RSA_PSS, &record, Data(digest),
                                           Size(digest), Data(zeros), Size(zeros), &valid, 0),
            0);
  EXPECT_EQ(valid, 0);
  for (const int reason : {1, 8}) EXPECT_EQ(ERR_GET_REASON(ERR_get_error()), reason);
  EXPECT_EQ(ERR_peek_error(), 0u);
  // Nor is a mark left behind a yes.
  const std::string signature = Pair(true).SignDigest(digest, "rsa-pss", "sha256");
  ERR_raise(ERR_LIB_USER, 8);
  EXPECT_EQ(
      zvclm_PublicKeyVerifySignature(key.get(), ZVCLM_SCHEME_RSA_PSS, &record, Data(digest),
                                     Size(digest), Data(signature), Size(signature), &valid, 0),
      0);
  EXPECT_EQ(valid, 1);
  EXPECT_EQ(ERR_GET_REASON(ERR_peek_last_error()), 8);
  EXPECT_EQ(ERR_pop_to_mark(), 0);
}

// r and s are numbers of q's length: with zeros before them, and with a first bit that is no sign.
TEST(KeyTest, TakesDsaNumbersOfAnyLength) {
  const Key key = Define(NumbersOf(false));
  bool small = false, large = false;
  for (int i = 0; !small || !large; ++i) {
    const std::string digest = Digest(std::to_string(i), "sha1");
    const std::string signature = Pair(false).SignDigest(digest, "dsa-sha1", "sha1");
    ASSERT_TRUE(Valid(key, ZVCLM_SCHEME_DSA, 0, digest, signature)) << i;
    small = small || signature[0] == '\0' || signature[signature.size() / 2] == '\0';
    large = large || signature[0] < 0;
  }
}

// The first of each kind would be good by arithmetic alone, the others only have to be harmless.
TEST(KeyTest, RefusesKeysOutsideTheLimits) {
  const std::string digest = Digest("object");
  const Numbers rsa = NumbersOf(true), dsa = NumbersOf(false);
  // An exponent grown by the order of the group, n - p - q + 1, does what the small one does.
  const Big grown = Parameter(Pair(true), "n");
  BN_add_word(grown.get(), 65537 + 1);
  for (const char* factor : {"rsa-factor1", "rsa-factor2"}) {
    BN_sub(grown.get(), grown.get(), Parameter(Pair(true), factor).get());
  }
  // With the exponent 1 anybody can sign.
  const std::string padded =
      "\0\x01"s + std::string(202, '\xff') +
      "\0\x30\x31\x30\x0d\x06\x09\x60\x86\x48\x01\x65\x03\x04\x02\x01\x05\0\x04\x20"s + digest;
  const std::pair<Numbers, std::string> rsaCases[] = {
      {{rsa[0], ToBytes(grown)}, Pair(true).SignDigest(digest, "rsa-1.5", "sha256")},
      {{rsa[0], "\1"}, padded},
      {{"", rsa[1]}, ""}};
  for (const auto& [numbers, signature] : rsaCases) {
    EXPECT_FALSE(Valid(Define(numbers), ZVCLM_SCHEME_RSA_PKCS1, 2, digest, signature));
  }
  // r = s = 1 fits any digest when g and y are 1.
  const std::string &p = dsa[0], &q = dsa[1], &g = dsa[2], &y = dsa[3];
  for (const Numbers& numbers : {Numbers{p, q, "\1", "\1"},
                                 {p, q, "", y},
                                 {p, q, g, p},
                                 {"", q, g, y},
                                 {p, "", g, y},
                                 Numbers{p + '\2', q, g, y},
                                 Numbers{p, std::string(20, '\x99'), g, y}}) {
    const std::string one = numbers[1].empty() ? "" : std::string(19, '\0') + '\1';
    EXPECT_FALSE(Valid(Define(numbers), ZVCLM_SCHEME_DSA, 0, Digest("object", "sha1"), one + one));
  }
  // The number 0, which no digest is but an empty one would be.
  const std::string zeros(20, '\0');
  const std::string forged = Pair(false).SignDigest(zeros, "dsa-sha1", "sha1");
  EXPECT_TRUE(Valid(Define(dsa), ZVCLM_SCHEME_DSA, 0, zeros, forged));
  EXPECT_FALSE(Valid(Define(dsa), ZVCLM_SCHEME_DSA, 0, "", forged));
}

std::string Export(const Key& key, int format) {
  uint32_t length = 0;
  const int code = zvclm_PublicKeyExport(key.get(), format, 0, nullptr, &length, 0);
  EXPECT_EQ(ERR_peek_error(), 0u);
  if (code != ZVCLM_ERR_BUFFER_TOO_SMALL) return "code " + std::to_string(code);
  const auto out = std::make_unique<unsigned char[]>(length);
  for (uint32_t room : {length - 1, length}) {
    EXPECT_EQ(zvclm_PublicKeyExport(key.get(), format, 0, out.get(), &room, 0),
              room < length ? ZVCLM_ERR_BUFFER_TOO_SMALL : 0);
  }
  return {out.get(), out.get() + length};
}

TEST(KeyTest, OtherProgramsReadTheExports) {
  const vesk2test::TempDir dir;
  for (const bool rsa : {false, true}) {
    const Key key = Define(NumbersOf(rsa));
    dir.Write("pem", Pair(rsa).PrivatePem());
    dir.Write("der", Export(key, ZVCLM_FORMAT_X509));
    dir.Write("blob", Export(key, ZVCLM_FORMAT_SSH));
    const std::string command = "set -e; cd " + dir.Path() + "; name=" + (rsa ? "rsa" : "dss") + R"(
        openssl pkey -in pem -pubout -out a
        openssl pkey -pubin -inform DER -in der -pubout -out b; cmp a b
        (printf "ssh-$name " && base64 -w0 blob) >ssh
        ssh-keygen -l -f ssh >fingerprint; ssh-keygen -e -m PKCS8 -f ssh >c; cmp a c)";
    EXPECT_EQ(std::system(command.c_str()), 0) << command;
    EXPECT_EQ(Export(key, 1), "code " + std::to_string(ZVCLM_ERR_FORMAT));
  }
  // Odd numbers are a code or an encoding, never a crash; zero is an mpint without bytes.
  EXPECT_EQ(Export(Define({"", ""}), ZVCLM_FORMAT_SSH).size(), 4 + 7 + 4 + 4u);
  Export(Define({"", "", "", ""}), ZVCLM_FORMAT_X509);
}

}  // namespace
