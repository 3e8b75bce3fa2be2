// Signatures of libcrypto, opened and then changed in every bit.
#include "src/platform/rsa_padding.h"

#include <gtest/gtest.h>
#include <openssl/bn.h>
#include <openssl/evp.h>
#include <openssl/rsa.h>

#include <array>
#include <memory>
#include <vector>

#include <vesk2/platform.h>

#include "src/platform/openssl.h"

namespace {

using namespace ZVsysutil;
using Text = std::vector<unsigned char>;
using Number = Evp<BIGNUM, BN_free>;

Number Parameter(EVP_PKEY* key, const char* name) {
  BIGNUM* number = nullptr;
  EXPECT_EQ(EVP_PKEY_get_bn_param(key, name, &number), 1);
  return Number(number);
}

// What a signature over `digest` holds; a PSS signature when there is a salt length.
Text Padded(EVP_PKEY* key, const EVP_MD* hash, Bytes digest, const int* salt) {
  const Evp<EVP_PKEY_CTX, EVP_PKEY_CTX_free> context(EVP_PKEY_CTX_new(key, nullptr));
  const int padding = salt != nullptr ? RSA_PKCS1_PSS_PADDING : RSA_PKCS1_PADDING;
  EXPECT_TRUE(EVP_PKEY_sign_init(context.get()) == 1 &&
              EVP_PKEY_CTX_set_rsa_padding(context.get(), padding) == 1 &&
              EVP_PKEY_CTX_set_signature_md(context.get(), hash) == 1 &&
              (salt == nullptr || EVP_PKEY_CTX_set_rsa_pss_saltlen(context.get(), *salt) == 1));
  Text text(static_cast<size_t>(EVP_PKEY_get_size(key)));
  size_t length = text.size();
  EXPECT_EQ(EVP_PKEY_sign(context.get(), text.data(), &length, digest.data(), digest.size()), 1);
  const Number number(BN_bin2bn(text.data(), static_cast<int>(length), nullptr));
  const Evp<BN_CTX, BN_CTX_free> room(BN_CTX_new());
  BN_mod_exp(number.get(), number.get(), Parameter(key, "e").get(), Parameter(key, "n").get(),
             room.get());
  BN_bn2binpad(number.get(), text.data(), static_cast<int>(length));
  return text;
}

// The lengths of n put the first bit of a PSS padding at different places of its byte.
TEST(RsaPaddingTest, EveryBitCountsAndEverySaltIsRight) {
  const std::array<unsigned char, 32> digests{1, 2, 3};
  const int none = 0, some = 7, most = RSA_PSS_SALTLEN_MAX;
  for (const int bits : {1024, 1025, 1026, 1031}) {
    const Evp<EVP_PKEY, EVP_PKEY_free> key(EVP_RSA_gen(static_cast<unsigned>(bits)));
    for (const int hash : {ZVCLM_HASH_SHA1, ZVCLM_HASH_SHA256, ZVCLM_HASH_RMD160}) {
      const Bytes digest = Bytes(digests).first(HashLength(hash));
      for (const int* salt : {static_cast<const int*>(nullptr), &none, &some, &most}) {
        const auto good = [&](const Text& text) {
          if (salt == nullptr) return IsPkcs1Padded(text, hash, digest);
          bool padded = false;
          EXPECT_EQ(IsPssPadded(&padded, text, bits, hash, digest), 0);
          return padded;
        };
        Text text = Padded(key.get(), EVP_get_digestbyname(HashName(hash)), digest, salt);
        EXPECT_TRUE(good(text)) << bits << " " << hash;
        for (size_t bit = 0; bit < 8 * text.size(); ++bit) {
          const auto mask = static_cast<unsigned char>(0x80 >> bit % 8);
          text[bit / 8] ^= mask;
          EXPECT_FALSE(good(text)) << bits << " " << hash << " " << bit;
          text[bit / 8] ^= mask;
        }
      }
    }
  }
}

}  // namespace
