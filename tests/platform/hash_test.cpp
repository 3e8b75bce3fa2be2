// SPDX-License-Identifier: Apache-2.0
// Running hashes against libcrypto over whole inputs.
#include <gtest/gtest.h>
#include <openssl/err.h>
#include <openssl/evp.h>

#include <memory>
#include <tuple>
#include <vector>

#include "src/platform/crypto.h"

namespace {

using Bytes = std::vector<unsigned char>;
constexpr size_t kBlock = ZVCLMHashContextData::kBlock;

std::shared_ptr<ZVCLMHashContextData> Start(ZvclmHashID id) {
  ZVCLMHashContextData* hash = nullptr;
  EXPECT_EQ(zvclm_HashAlloc(&hash, id, 0), 0);
  return {hash, [](ZVCLMHashContextData* started) { zvclm_HashFree(started, 0); }};
}

TEST(HashTest, DigestsDoNotDependOnThePieces) {
  Bytes input(5 * kBlock + 13);
  for (size_t i = 0; i < input.size(); ++i) input[i] = static_cast<unsigned char>(i * 7 + i / 251);
  for (const auto& [id, name, length] : {std::tuple{ZVCLM_HASH_SHA1, "SHA1", 20u},
                                         {ZVCLM_HASH_SHA256, "SHA256", 32u},
                                         {ZVCLM_HASH_RMD160, "RIPEMD160", 20u}}) {
    ZVCLMHashInfo info{};
    info.size = 32;
    EXPECT_EQ(zvclm_HashInfo(id, &info), 0);
    EXPECT_EQ(reinterpret_cast<const uint32_t*>(&info)[6], length);  // by its place
    for (const size_t size : {size_t{0}, kBlock - 1, kBlock, kBlock + 1, input.size()}) {
      Bytes expected(length), digest(length);
      EVP_Q_digest(nullptr, name, nullptr, input.data(), size, expected.data(), nullptr);
      for (const size_t piece : {size_t{1}, size_t{4}, size_t{1021}, kBlock, 3 * kBlock + 5}) {
        const auto hash = Start(id);
        for (size_t at = 0; at < size; at += piece) {
          const size_t count = std::min(piece, size - at);
          const int code = at / piece % 2 == 0
                               ? zvclm_HashUpdate(hash.get(), &input[at], count, 0)
                               : ZVCLMHashFeed(hash.get()).Update(&input[at], count);
          EXPECT_EQ(code, 0);
        }
        EXPECT_EQ(zvclm_HashFinal(hash.get(), digest.data(), 0), 0);
        EXPECT_EQ(digest, expected) << name << " " << size << " in " << piece;
      }
    }
  }
}

TEST(HashTest, RefusesMisuse) {
  ZVCLMHashContextData* none = nullptr;
  EXPECT_EQ(zvclm_HashAlloc(&none, ZvclmHashID{1}, 0), ZVCLM_ERR_UNKNOWN_HASH);
  const auto hash = Start(ZVCLM_HASH_SHA256);
  unsigned char digest[32];
  EXPECT_EQ(zvclm_HashUpdate(hash.get(), nullptr, 1, 0), ZVCLM_ERR_NULL_PARAM);
  EXPECT_EQ(zvclm_HashUpdate(hash.get(), nullptr, 0, 0), 0);  // an empty byte string
  EXPECT_EQ(zvclm_HashFinal(hash.get(), digest, 0), 0);
  EXPECT_EQ(zvclm_HashFinal(hash.get(), digest, 0), ZVCLM_ERR_FAILURE);
  EXPECT_EQ(zvclm_HashUpdate(hash.get(), digest, 1, 0), ZVCLM_ERR_FAILURE);
  EXPECT_EQ(ERR_peek_error(), 0u);
}

}  // namespace
