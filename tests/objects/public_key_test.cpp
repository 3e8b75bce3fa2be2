// PublicKey: reading, building, storing and exporting keys.
#include <vesk2/public_key.h>

#include <gtest/gtest.h>

#include <sys/stat.h>

#include <cstdlib>
#include <memory>

#include "tests/support/temp_dir.h"
#include "tests/support/test_key.h"
#include "tests/support/test_object.h"
#include "tests/support/test_text.h"

namespace vesk2test {
namespace {

using ZvVesk2::PublicKey;
using ZvVesk2::Ref;

Ref<PublicKey> NewKey() { return Ref<PublicKey>(new PublicKey(nullptr)); }

Ref<PublicKey> Imported(const std::string& text) {
  Ref<PublicKey> key = NewKey();
  EXPECT_EQ(key->Import(Wrap(text).get()), 0);
  return key;
}

std::string RsaText(const std::string& e, const std::string& n) {
  return "(10:public-key(3:rsa(1:e" + e + ")(1:n" + n + ")))";
}

TEST(PublicKeyTest, ReadsBothKindsInTheirOrder) {
  constexpr int kNone = -1;
  const struct {
    std::string text;
    int code;
    int type;  // set before anything is read
    unsigned length;
  } cases[] = {
      {TestKey::Rsa(0).Public(), 0, ZVCLM_KEY_RSA, 2048},
      {TestKey::Dsa(0).Public(), 0, ZVCLM_KEY_DSA, 1024},
      {RsaText("[bin]1:\3", "[bin]2:\1\1"), 0, ZVCLM_KEY_RSA, 9},
      {RsaText("0:", Str({"\0\1\1", 3})), 0, ZVCLM_KEY_RSA, 9},
      {"(10:public-key(3:dsa(1:p1:p)(1:g1:g)(1:q1:q)(1:y1:y)))", 0, ZVCLM_KEY_DSA, 7},
      {"(10:public-key(3:dsa(1:p1:p)(1:q1:q)(1:g1:g)(1:y1:y)))", VESK2_ERR_PARSE_FILE,
       ZVCLM_KEY_DSA, 0},
      {"(10:public-key(3:rsa(1:n1:n)(1:e1:e)))", VESK2_ERR_PARSE_FILE, ZVCLM_KEY_RSA, 0},
      {"(10:public-key(3:rsa(1:e1:e)(1:n1:n)(1:x1:x)))", VESK2_ERR_PARSE_FILE, ZVCLM_KEY_RSA, 7},
      {"(10:public-key(3:ecc(1:e1:e)))", VESK2_ERR_PARSE_FILE, kNone, 0},
      {"(11:private-key(3:rsa(1:e1:e)(1:n1:n)))", VESK2_ERR_PARSE_FILE, kNone, 0},
  };
  for (const auto& row : cases) {
    SCOPED_TRACE(row.text);
    const Ref<PublicKey> key = NewKey();
    EXPECT_EQ(key->Import(Wrap(row.text).get()), row.code);
    EXPECT_EQ(key->GetType(), row.type);
    EXPECT_EQ(key->GetLength(), row.length);
    if (row.code != 0) continue;
    EXPECT_EQ(Canonical(key), row.text);
    EXPECT_EQ(key->Import(Wrap(row.text).get()), VESK2_ERR_INVALID_PARAM);
  }
  // A key is its text without hints; a leading zero makes another one.
  const Ref<PublicKey> plain = Imported(RsaText("1:\3", "1:n"));
  EXPECT_TRUE(plain->IsEqual(Imported(RsaText("[bin]1:\3", "1:n")).get()));
  EXPECT_FALSE(plain->IsEqual(Imported(RsaText("1:\3", Str({"\0n", 2}))).get()));
}

// A key object with the numbers of `key`.
ZVCLMPublicKeyData* CopyOf(const PublicKey& key) {
  ZVCLMRSAKeyData record;
  ZVCLMPublicKeyData* copy = nullptr;
  EXPECT_EQ(zvclm_RSAKeyStructInit(ZVCLM_DATA_RSA, &record), 0);
  EXPECT_EQ(zvclm_PublicKeyGetData(key.GetKey(), ZVCLM_DATA_RSA, &record, 0), 0);
  EXPECT_EQ(zvclm_PublicKeyDefine(&copy, ZVCLM_KEY_RSA, ZVCLM_DATA_RSA, &record, 0, 0), 0);
  zvclm_RSAKeyStructZeroize(ZVCLM_DATA_RSA, &record);
  return copy;
}

TEST(PublicKeyTest, BuildsTheListFromAKeyObject) {
  const Ref<PublicKey> source = Imported(RsaText("0:", Str({"\0\0n", 3})));
  const Ref<PublicKey> built = NewKey();
  ASSERT_EQ(built->SetRSA(CopyOf(*source)), 0);
  // Without leading zeros, and 0 as one byte.
  EXPECT_EQ(Canonical(built), RsaText("[bin]" + Str({"\0", 1}), "[bin]1:n"));
  EXPECT_EQ(built->GetType(), ZVCLM_KEY_RSA);
  EXPECT_EQ(built->GetLength(), 7u);
  ZVCLMPublicKeyData* const refused = CopyOf(*source);
  EXPECT_EQ(built->SetRSA(refused), VESK2_ERR_INVALID_PARAM);
  zvclm_PublicKeyFree(refused, 0);  // still ours
  // Owned from the call on, although it is of the other kind.
  EXPECT_NE(NewKey()->SetDSA(CopyOf(*source)), 0);
}

TEST(PublicKeyTest, LivesInPubFiles) {
  const TempDir dir;
  const std::string text = TestKey::Rsa(0).Public();
  ASSERT_EQ(Imported(text)->Export(dir.File("k").c_str()), 0);
  EXPECT_EQ(dir.Read("k.pub"), text);
  for (const char* name : {"k", "k.pub"}) {
    const Ref<PublicKey> read = NewKey();
    ASSERT_EQ(read->Import(dir.File(name).c_str()), 0);
    EXPECT_EQ(read->GetFileName(), dir.File("k.pub"));
    EXPECT_EQ(Canonical(read), text);
  }
  EXPECT_EQ(NewKey()->Import(dir.File("none").c_str()), VESK2_ERR_FILE_OPEN);
}

std::string Exported(PublicKey& key, int (PublicKey::*form)(unsigned char*&, unsigned int&)) {
  unsigned char* out = nullptr;
  unsigned int length = 0;
  EXPECT_EQ((key.*form)(out, length), 0);
  const std::unique_ptr<unsigned char[]> owned(out);
  return {reinterpret_cast<char*>(out), length};
}

TEST(PublicKeyTest, OtherProgramsReadItsExports) {
  const TempDir dir;
  const Ref<PublicKey> key = Imported(TestKey::Rsa(0).Public());
  const std::string file = dir.Write("key.pem", TestKey::Rsa(0).PrivatePem());
  chmod(file.c_str(), 0600);
  const std::string openssl = "openssl pkey -in " + file + " -pubout -outform DER -out ";
  ASSERT_EQ(std::system((openssl + dir.File("der")).c_str()), 0);
  EXPECT_EQ(Exported(*key, &PublicKey::X509Export), dir.Read("der"));

  ASSERT_EQ(std::system(("ssh-keygen -y -f " + file + " >" + dir.File("ssh")).c_str()), 0);
  const std::string blob = Exported(*key, &PublicKey::SshExport);
  unsigned char base64[1024];
  const int size = EVP_EncodeBlock(base64, reinterpret_cast<const unsigned char*>(blob.data()),
                                   static_cast<int>(blob.size()));
  EXPECT_NE(dir.Read("ssh").find(std::string(base64, base64 + size)), std::string::npos);
}

}  // namespace
}  // namespace vesk2test
