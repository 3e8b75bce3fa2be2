// SPDX-License-Identifier: Apache-2.0
// The two principals, Hash and PublicKey: read, made, kept in files and written for others.
#include <openssl/x509.h>
#include <vesk2/hash.h>
#include <vesk2/public_key.h>

#include <memory>
#include <tuple>

#include "src/objects/hash_file.h"
#include "tests/support/temp_dir.h"
#include "tests/support/test_key.h"
#include "tests/support/test_read.h"
#include "tests/support/test_text.h"

namespace vesk2test {
namespace {

using namespace ZvVesk2;

Ref<Hash> NewHash() { return Ref<Hash>(new Hash(nullptr)); }

std::string HashText(const char* name, size_t digestLength) {
  return List({Str("hash"), Str(name), Str(std::string(digestLength, '\x81'))});
}

TEST(HashTest, ImportsTheThreeAlgorithmsOnly) {
  // The algorithm is set as soon as the name is known.
  const std::tuple<std::string, int, ZvclmHashID> cases[] = {
      {HashText("sha256", 32), 0, ZVCLM_HASH_SHA256},
      {HashText("rmd160", 20), 0, ZVCLM_HASH_RMD160},
      {"(4:hash[utf-8]4:sha1[bin]20:abcdefghijklmnopqrst)", 0, ZVCLM_HASH_SHA1},
      {HashText("sha1", 19), VESK2_ERR_INVALID_HASH, ZVCLM_HASH_SHA1},
      {HashText("sha1", 21), VESK2_ERR_INVALID_HASH, ZVCLM_HASH_SHA1},
      {HashText("md5", 16), VESK2_ERR_HASH_ID, ZVCLM_HASH_NONE},
      {HashText("sha2567", 32), VESK2_ERR_HASH_ID, ZVCLM_HASH_NONE},
      {"(4:name3:abc)", VESK2_ERR_PARSE_FILE, ZVCLM_HASH_NONE},
      {"(4:hash4:sha120:abcdefghijklmnopqrst1:x)", VESK2_ERR_PARSE_FILE, ZVCLM_HASH_SHA1},
  };
  for (const auto& [text, code, algorithm] : cases) {
    ExpectRead<Hash>(text, code);
    const Ref<Hash> hash = Read<Hash>(text, code);
    EXPECT_EQ(hash->GetAlgorithm(), algorithm) << text;
    EXPECT_EQ(hash->GetValue(), hash->Last());
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
    EXPECT_NE(hash->Finalize(), 0);
    EXPECT_EQ(hash->Init(id), VESK2_ERR_INVALID_PARAM);
    EXPECT_EQ(Canonical(hash), HashOf(text + "tail", name));
    EXPECT_EQ(hash->GetValue(), nullptr);  // only Import fills it
    EXPECT_EQ(hash->GetDigest(), hash->Last());
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
}

TEST(HashTest, HashesFiles) {
  const TempDir dir;
  unsigned char digest[64];
  for (const size_t size : {0u, 1u, 4u, 1023u, 16383u, 16384u, 16385u, 200001u}) {
    std::string bytes(size, '\0');
    for (size_t i = 0; i < size; ++i) bytes[i] = static_cast<char>(i * 7 + i / 251);
    unsigned int length = 0;
    ASSERT_EQ(Hash::HashFile(dir.Write("file", bytes).c_str(), digest, &length, nullptr), 0);
    EXPECT_EQ(std::string(digest, digest + length), Digest(bytes)) << size;
  }
  const std::string file = dir.File("file");
  const std::string missing = dir.File("missing");
  const std::tuple<const char*, unsigned, int, unsigned> cases[] = {
      {file.c_str(), 64, 0, 32},
      {file.c_str(), 31, VESK2_ERR_BUFFER_OVERFLOW, 31},
      {missing.c_str(), 32, VESK2_ERR_FILE_OPEN, 0},
      {dir.Path().c_str(), 32, VESK2_ERR_FILE_OPEN, 0},
      {nullptr, 32, VESK2_ERR_INVALID_PARAM, 32},
  };
  for (auto [path, length, code, after] : cases) {
    EXPECT_EQ(Hash::HashFile(path, digest, &length, nullptr), code);
    EXPECT_EQ(length, after);
  }
}

// Whatever became of one file, the next one's digest is its own.
TEST(HashTest, DigestsOneFileAfterTheOther) {
  const TempDir dir;
  int calls = 0;
  const Vesk2FileCallbacks callbacks = {
      sizeof callbacks, &calls, nullptr,
      [](void* user, uint64_t) { return ++*static_cast<int*>(user) == 3 ? 1 : 0; }, nullptr};
  FileDigester digester(nullptr, &callbacks);
  const std::tuple<const char*, size_t, int> cases[] = {
      {"large", 300'000, VESK2_ERR_USER_INTERRUPT},
      {"small", 5, 0},
      {"none", 0, 0},
      {"missing", 0, VESK2_ERR_FILE_OPEN},
      {"odd", 65537, 0}};
  for (const auto& [name, size, code] : cases) {
    const std::string bytes(size, *name);
    if (code != VESK2_ERR_FILE_OPEN) dir.Write(name, bytes);
    const std::string path = dir.File(name);
    unsigned char digest[32];
    bool held = false;
    const ZVsysutil::ZvPlace place = {ZVsysutil::kZvNoDirectory, path.c_str(), true};
    EXPECT_EQ(digester.Digest({place, path.c_str()}, digest, held), code) << name;
    EXPECT_TRUE(code != 0 || std::string(digest, digest + 32) == Digest(bytes)) << name;
  }
}

TEST(HashTest, PrintsFingerprints) {
  const std::pair<std::string, const char*> cases[] = {
      {"(hash sha256 \x01\xff)", "sha256 01ff"},
      {"(hash sha1 a b))", "sha1 61206229"},  // blanks and parentheses in the bytes
      {"(hash md5 ab)", "md5"},
      {"(hash sha1)", "(null)"},
      {"(hash sha1 ", "(null)"},  // the blank is where the parenthesis should be
      {"(bash sha1 a)", "(null)"},
  };
  for (const auto& [text, expected] : cases) {
    char out[64] = "untouched";
    const auto* const bytes = reinterpret_cast<const unsigned char*>(text.data());
    EXPECT_EQ(Hash::DumpFingerprint(out, bytes, static_cast<unsigned>(text.size())), out);
    EXPECT_STREQ(out, expected) << text;
  }
}

// ---- Keys ----

Ref<PublicKey> NewKey() { return Ref<PublicKey>(new PublicKey(nullptr)); }

std::string RsaText(const std::string& e, const std::string& n) {
  return "(10:public-key(3:rsa(1:e" + e + ")(1:n" + n + ")))";
}

TEST(PublicKeyTest, ReadsBothKindsInTheirOrder) {
  constexpr int kBad = VESK2_ERR_PARSE_FILE;
  // The answer, the type, which is set before anything is read, and the length.
  const std::tuple<std::string, int, int, unsigned> cases[] = {
      {TestKey::Rsa(0).Public(), 0, ZVCLM_KEY_RSA, 2048},
      {TestKey::Dsa(0).Public(), 0, ZVCLM_KEY_DSA, 1024},
      {RsaText("[bin]1:\3", "[bin]2:\1\1"), 0, ZVCLM_KEY_RSA, 9},
      {RsaText("0:", Str({"\0\1\1", 3})), 0, ZVCLM_KEY_RSA, 9},
      {"(10:public-key(3:dsa(1:p1:p)(1:q1:q)(1:g1:g)(1:y1:y)))", kBad, ZVCLM_KEY_DSA, 0},
      {"(10:public-key(3:rsa(1:n1:n)(1:e1:e)))", kBad, ZVCLM_KEY_RSA, 0},
      {"(10:public-key(3:rsa(1:e1:e)(1:n1:n)(1:x1:x)))", kBad, ZVCLM_KEY_RSA, 7},
      {"(10:public-key(3:ecc(1:e1:e)))", kBad, -1, 0},
  };
  for (const auto& [text, code, type, length] : cases) {
    ExpectRead<PublicKey>(text, code);
    const Ref<PublicKey> key = Read<PublicKey>(text, code);
    EXPECT_EQ(key->GetType(), type) << text;
    EXPECT_EQ(key->GetLength(), length) << text;
  }
  // A key is its text without hints; a leading zero makes another one.
  const Ref<PublicKey> plain = Read<PublicKey>(RsaText("1:\3", "1:n"));
  EXPECT_TRUE(plain->IsEqual(Read<PublicKey>(RsaText("[bin]1:\3", "1:n")).get()));
  EXPECT_FALSE(plain->IsEqual(Read<PublicKey>(RsaText("1:\3", Str({"\0n", 2}))).get()));
}

// A key object with the numbers of `key`.
ZVCLMPublicKeyData* CopyOf(const PublicKey& key) {
  ZVCLMRSAKeyData record;
  ZVCLMPublicKeyData* copy = nullptr;
  EXPECT_EQ(zvclm_RSAKeyStructInit(ZVCLM_DATA_RSA, &record), 0);
  EXPECT_EQ(zvclm_PublicKeyGetData(key.GetKey(), ZVCLM_DATA_RSA, &record, 0), 0);
  EXPECT_EQ(zvclm_PublicKeyDefine(&copy, ZVCLM_KEY_RSA, ZVCLM_DATA_RSA, &record, 0, 0), 0);
  EXPECT_EQ(zvclm_RSAKeyStructZeroize(ZVCLM_DATA_RSA, &record), 0);
  return copy;
}

TEST(PublicKeyTest, BuildsTheListFromAKeyObject) {
  const Ref<PublicKey> source = Read<PublicKey>(RsaText("0:", Str({"\0\0n", 3})));
  const Ref<PublicKey> built = NewKey();
  ASSERT_EQ(built->SetRSA(CopyOf(*source)), 0);
  // Without leading zeros, and 0 as one byte.
  EXPECT_EQ(Canonical(built), RsaText("[bin]" + Str({"\0", 1}), "[bin]1:n"));
}

TEST(PublicKeyTest, LivesInPubFiles) {
  const TempDir dir;
  const std::string text = TestKey::Rsa(0).Public();
  ASSERT_EQ(Read<PublicKey>(text)->Export(dir.File("k").c_str()), 0);
  EXPECT_EQ(dir.Read("k.pub"), text);
  const Ref<PublicKey> read = NewKey();
  ASSERT_EQ(read->Import(dir.File("k").c_str()), 0);
  EXPECT_EQ(Canonical(read), text);
  EXPECT_EQ(NewKey()->Import(dir.File("none").c_str()), VESK2_ERR_FILE_OPEN);
}

TEST(PublicKeyTest, ExportsBothEncodings) {
  const Ref<PublicKey> key = Read<PublicKey>(TestKey::Rsa(0).Public());
  const auto exported = [&](int (PublicKey::*form)(unsigned char*&, unsigned int&)) {
    unsigned char* out = nullptr;
    unsigned int length = 0;
    EXPECT_EQ((*key.*form)(out, length), 0);
    const std::unique_ptr<unsigned char[]> owned(out);
    return std::string(out, out + length);
  };
  unsigned char der[512];
  unsigned char* end = der;
  ASSERT_GT(i2d_PUBKEY(TestKey::Rsa(0).Pkey(), &end), 0);
  EXPECT_EQ(exported(&PublicKey::X509Export), std::string(der, end));
  EXPECT_TRUE(exported(&PublicKey::SshExport).starts_with(std::string("\0\0\0\7ssh-rsa", 11)));
}

}  // namespace
}  // namespace vesk2test
