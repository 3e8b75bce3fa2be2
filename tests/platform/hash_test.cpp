// Running hashes against libcrypto over whole inputs.
#include <gtest/gtest.h>
#include <openssl/err.h>
#include <openssl/evp.h>

#include <memory>
#include <string>
#include <vector>

#include "src/platform/crypto.h"

namespace {

using Bytes = std::vector<unsigned char>;

struct HashFree {
  void operator()(ZVCLMHashContextData* hash) const { zvclm_HashFree(hash, 0); }
};
using HashOwner = std::unique_ptr<ZVCLMHashContextData, HashFree>;

HashOwner Start(ZvclmHashID id) {
  ZVCLMHashContextData* hash = nullptr;
  EXPECT_EQ(zvclm_HashAlloc(&hash, id, 0), 0);
  return HashOwner(hash);
}

const struct {
  ZvclmHashID id;
  const char* name;
  unsigned length;
} kAlgorithms[] = {
    {ZVCLM_HASH_SHA1, "SHA1", 20},
    {ZVCLM_HASH_SHA256, "SHA256", 32},
    {ZVCLM_HASH_RMD160, "RIPEMD160", 20},
};

// Feeds `input` in pieces of `piece` bytes, those of odd number through a feed.
Bytes InPieces(ZvclmHashID id, const Bytes& input, size_t piece, size_t length) {
  const HashOwner hash = Start(id);
  bool odd = false;
  for (size_t at = 0; at < input.size(); at += piece, odd = !odd) {
    const size_t count = std::min(piece, input.size() - at);
    if (odd) {
      ZVCLMHashFeed feed(hash.get());
      EXPECT_EQ(zvclm_HashUpdate(feed, &input[at], count, 0), 0);
    } else {
      EXPECT_EQ(zvclm_HashUpdate(hash.get(), &input[at], count, 0), 0);
    }
  }
  Bytes digest(length);
  EXPECT_EQ(zvclm_HashFinal(hash.get(), digest.data(), 0), 0);
  return digest;
}

TEST(HashTest, DigestsDoNotDependOnThePieces) {
  constexpr size_t kBlock = ZVCLMHashContextData::kBlock;
  Bytes input(5 * kBlock + 13);
  for (size_t i = 0; i < input.size(); ++i) input[i] = static_cast<unsigned char>(i * 7 + i / 251);
  for (const auto& algorithm : kAlgorithms) {
    for (const size_t size : {size_t{0}, size_t{3}, kBlock - 1, kBlock, kBlock + 1, input.size()}) {
      const Bytes part(input.begin(), input.begin() + static_cast<ptrdiff_t>(size));
      Bytes expected(algorithm.length);
      ASSERT_EQ(EVP_Q_digest(nullptr, algorithm.name, nullptr, part.data(), part.size(),
                             expected.data(), nullptr),
                1);
      for (const size_t piece : {size_t{1}, size_t{4}, size_t{1021}, kBlock, 3 * kBlock + 5}) {
        EXPECT_EQ(InPieces(algorithm.id, part, piece, algorithm.length), expected)
            << algorithm.name << " " << size << " in " << piece;
      }
    }
  }
}

TEST(HashTest, KnowsThreeAlgorithms) {
  for (const int id : {-1, 1, 4, 258}) {
    const auto unknown = static_cast<ZvclmHashID>(id);
    ZVCLMHashContextData* hash = nullptr;
    EXPECT_EQ(zvclm_HashAlloc(&hash, unknown, 0), ZVCLM_ERR_UNKNOWN_HASH) << id;
    EXPECT_EQ(hash, nullptr);
    ZVCLMHashInfo info{};
    info.size = 32;
    EXPECT_EQ(zvclm_HashInfo(unknown, &info), ZVCLM_ERR_UNKNOWN_HASH) << id;
  }
  for (const auto& algorithm : kAlgorithms) {
    ZVCLMHashInfo info{};
    EXPECT_NE(zvclm_HashInfo(algorithm.id, &info), 0);
    info.size = 32;
    EXPECT_EQ(zvclm_HashInfo(algorithm.id, &info), 0);
    EXPECT_EQ(reinterpret_cast<const uint32_t*>(&info)[6], algorithm.length);  // by its place
  }
}

TEST(HashTest, RefusesMisuse) {
  const HashOwner hash = Start(ZVCLM_HASH_SHA256);
  unsigned char digest[32];
  EXPECT_EQ(zvclm_HashUpdate(nullptr, digest, 1, 0), ZVCLM_ERR_NULL_PARAM);
  EXPECT_EQ(zvclm_HashUpdate(hash.get(), nullptr, 1, 0), ZVCLM_ERR_NULL_PARAM);
  EXPECT_EQ(zvclm_HashUpdate(hash.get(), nullptr, 0, 0), 0);  // an empty byte string
  EXPECT_EQ(zvclm_HashFinal(hash.get(), nullptr, 0), ZVCLM_ERR_NULL_PARAM);
  EXPECT_EQ(zvclm_HashFinal(hash.get(), digest, 0), 0);
  EXPECT_EQ(zvclm_HashFinal(hash.get(), digest, 0), ZVCLM_ERR_FAILURE);
  EXPECT_EQ(zvclm_HashUpdate(hash.get(), digest, 1, 0), ZVCLM_ERR_FAILURE);
  ZVCLMHashContextData* started = hash.get();
  EXPECT_EQ(zvclm_HashAlloc(&started, ZVCLM_HASH_SHA1, 0), ZVCLM_ERR_NULL_PARAM);
  EXPECT_EQ(ERR_peek_error(), 0u);
}

}  // namespace
