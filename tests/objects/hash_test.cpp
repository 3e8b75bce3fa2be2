// Hash: as a value, as a computation, over files, and as a fingerprint.
#include <vesk2/hash.h>

#include <gtest/gtest.h>

#include "tests/support/temp_dir.h"
#include "tests/support/test_object.h"
#include "tests/support/test_text.h"

namespace vesk2test {
namespace {

using ZvVesk2::Hash;
using ZvVesk2::Ref;

Ref<Hash> NewHash() { return Ref<Hash>(new Hash(nullptr)); }

std::string HashText(const char* name, size_t digestLength) {
  return List({Str("hash"), Str(name), Str(std::string(digestLength, '\x81'))});
}

TEST(HashTest, ImportsTheThreeAlgorithmsOnly) {
  const struct {
    std::string text;
    int code;
    ZvclmHashID algorithm;  // set as soon as the name is known
  } cases[] = {
      {HashText("sha256", 32), 0, ZVCLM_HASH_SHA256},
      {HashText("rmd160", 20), 0, ZVCLM_HASH_RMD160},
      {"(4:hash[utf-8]4:sha1[bin]20:abcdefghijklmnopqrst)", 0, ZVCLM_HASH_SHA1},
      {HashText("sha1", 19), VESK2_ERR_INVALID_HASH, ZVCLM_HASH_SHA1},
      {HashText("sha1", 21), VESK2_ERR_INVALID_HASH, ZVCLM_HASH_SHA1},
      {HashText("md5", 16), VESK2_ERR_HASH_ID, ZVCLM_HASH_NONE},
      {HashText("", 20), VESK2_ERR_HASH_ID, ZVCLM_HASH_NONE},
      {HashText("sha2567", 32), VESK2_ERR_HASH_ID, ZVCLM_HASH_NONE},
      {"(4:name3:abc)", VESK2_ERR_PARSE_FILE, ZVCLM_HASH_NONE},
      {"(4:hash4:sha120:abcdefghijklmnopqrst1:x)", VESK2_ERR_PARSE_FILE, ZVCLM_HASH_SHA1},
  };
  for (const auto& row : cases) {
    SCOPED_TRACE(row.text);
    const Ref<Hash> hash = NewHash();
    EXPECT_EQ(hash->Import(Wrap(row.text).get()), row.code);
    EXPECT_EQ(hash->GetAlgorithm(), row.algorithm);
    if (row.code != 0) continue;
    EXPECT_EQ(Canonical(hash), row.text);
    EXPECT_EQ(hash->GetValue(), hash->Last());
    EXPECT_EQ(hash->Import(Wrap(row.text).get()), VESK2_ERR_INVALID_PARAM);
    EXPECT_EQ(hash->Verify(nullptr, nullptr, nullptr, nullptr), VESK2_ERR_NOT_IMPLEMENTED);
    bool revoked = true;
    EXPECT_EQ(hash->IsRevoked(revoked), 0);
    EXPECT_TRUE(revoked);
  }
}

TEST(HashTest, ComputesOverCanonicalTextWithHints) {
  const std::string text = "(1:a[bin]2:bc(3:def0:))";
  const std::pair<ZvclmHashID, const char*> algorithms[] = {
      {ZVCLM_HASH_SHA1, "sha1"}, {ZVCLM_HASH_SHA256, "sha256"}, {ZVCLM_HASH_RMD160, "rmd160"}};
  for (const auto& [id, name] : algorithms) {
    const Ref<Hash> hash = NewHash();
    EXPECT_NE(hash->Update(Parse(text).get()), 0);
    EXPECT_NE(hash->Finalize(), 0);
    ASSERT_EQ(hash->Init(id), 0);
    ASSERT_EQ(hash->Update(Parse(text).get()), 0);
    ASSERT_EQ(hash->Update(reinterpret_cast<const unsigned char*>("tail"), 4), 0);
    EXPECT_EQ(hash->GetDigest(), nullptr);
    ASSERT_EQ(hash->Finalize(), 0);
    EXPECT_EQ(Canonical(hash), HashOf(text + "tail", name));
    EXPECT_EQ(hash->GetValue(), nullptr);  // only Import fills it
    EXPECT_EQ(hash->GetDigest(), hash->Last());
    EXPECT_NE(hash->Finalize(), 0);
    EXPECT_EQ(hash->Init(id), VESK2_ERR_INVALID_PARAM);
    EXPECT_EQ(hash->Count(), 3u);
  }
}

TEST(HashTest, SetTakesADigestOfAnyLength) {
  for (const int unknown : {-1, 1, 4}) {
    const auto id = static_cast<ZvclmHashID>(unknown);
    EXPECT_EQ(NewHash()->Init(id), VESK2_ERR_HASH_ID);
    // The array is adopted all the same.
    EXPECT_EQ(NewHash()->Set(id, new unsigned char[3]{}, 3), VESK2_ERR_HASH_ID);
  }
  const Ref<Hash> hash = NewHash();
  ASSERT_EQ(hash->Set(ZVCLM_HASH_SHA256, new unsigned char[3]{'a', 'b', 'c'}, 3), 0);
  EXPECT_EQ(Canonical(hash), "(4:hash6:sha256[bin]3:abc)");
  EXPECT_EQ(hash->GetValue(), nullptr);
  EXPECT_EQ(Bytes(hash->GetDigest()), "abc");
}

TEST(HashTest, HashesFiles) {
  const TempDir dir;
  for (const size_t size : {0u, 1u, 4u, 1023u, 16383u, 16384u, 16385u, 200001u}) {
    std::string bytes(size, '\0');
    for (size_t i = 0; i < size; ++i) bytes[i] = static_cast<char>(i * 7 + i / 251);
    const std::string path = dir.Write("file", bytes);
    unsigned char digest[32];
    unsigned int length = 0;
    ASSERT_EQ(Hash::HashFile(path.c_str(), digest, &length, nullptr), 0);
    EXPECT_EQ(std::string(digest, digest + length), Digest(bytes)) << size;
  }
  const std::string file = dir.File("file");
  const std::string missing = dir.File("missing");
  const struct {
    const char* path;
    unsigned int room;
    int code;
    unsigned int length;
  } cases[] = {
      {file.c_str(), 64, 0, 32},
      {file.c_str(), 31, VESK2_ERR_BUFFER_OVERFLOW, 31},
      {missing.c_str(), 32, VESK2_ERR_FILE_OPEN, 0},
      {dir.Path().c_str(), 32, VESK2_ERR_FILE_OPEN, 0},
      {nullptr, 32, VESK2_ERR_INVALID_PARAM, 32},
  };
  for (const auto& row : cases) {
    unsigned char digest[64];
    unsigned int length = row.room;
    EXPECT_EQ(Hash::HashFile(row.path, digest, &length, nullptr), row.code);
    EXPECT_EQ(length, row.length);
  }
}

TEST(HashTest, PrintsFingerprints) {
  const std::pair<std::string, const char*> cases[] = {
      {"(hash sha256 \x01\xff)", "sha256 01ff"},
      {"(hash sha1 a b))", "sha1 61206229"},  // blanks and parentheses in the bytes
      {"(hash rmd160 )", "rmd160 "},
      {"(hash md5 ab)", "md5"},
      {"(hash sha1)", "(null)"},
      {"(hash sha1 ", "(null)"},  // the blank is where the parenthesis should be
      {"(hash ", "(null)"},
      {"(bash sha1 a)", "(null)"},
  };
  for (const auto& [text, expected] : cases) {
    char out[64] = "untouched";
    const auto* const bytes = reinterpret_cast<const unsigned char*>(text.data());
    EXPECT_EQ(Hash::DumpFingerprint(out, bytes, static_cast<unsigned>(text.size())), out);
    EXPECT_STREQ(out, expected) << text;
  }
}

}  // namespace
}  // namespace vesk2test
