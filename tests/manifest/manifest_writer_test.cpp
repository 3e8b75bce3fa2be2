// SPDX-License-Identifier: Apache-2.0
// What the writer of manifests writes is what an independent writer writes, and what the reader
// reads.
#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <string>

#include <vesk2/manifest.h>
#include <vesk2/manifest_writer.h>

#include "tests/support/temp_dir.h"
#include "tests/support/test_manifest.h"
#include "tests/support/test_read.h"

using namespace vesk2test;
using namespace ZvVesk2;

namespace {

constexpr unsigned char kToken[4] = {'t', 'o', 'k', 'n'};
constexpr int kInvalid = VESK2_ERR_INVALID_PARAM;

using Digest32 = unsigned char[32];
const Digest32& Sha256(const std::string& contents) {
  static Digest32 digest;
  std::memcpy(digest, vesk2test::Digest(contents).data(), sizeof digest);
  return digest;
}

// What is written, or "code N".
std::string Written(ManifestWriter& writer) {
  char* text = nullptr;
  size_t size = 0;
  FILE* const stream = open_memstream(&text, &size);
  const int code = writer.Write(stream);
  std::fclose(stream);
  std::string result(text, size);
  std::free(text);
  return code == 0 ? result : "code " + std::to_string(code);
}

class ManifestWriterTest : public testing::Test {
 protected:
  void Head() {
    const Ref<TimeStamp> time = Read<TimeStamp>(Str(parts.signingTime));
    ASSERT_EQ(writer.SetHead("text", time.get()), 0);
  }
  // A tree of a file, an empty directory and one that holds a file.
  void Body() {
    ASSERT_EQ(writer.BeginBody(kToken), 0);
    ASSERT_EQ(writer.AddFile("a", Sha256("A")), 0);
    ASSERT_EQ(writer.OpenDirectory("empty"), 0);
    ASSERT_EQ(writer.CloseDirectory(), 0);
    ASSERT_EQ(writer.OpenDirectory("sub"), 0);
    ASSERT_EQ(writer.AddFile("f \n", Sha256("F")), 0);
    ASSERT_EQ(writer.CloseDirectory(), 0);
    ASSERT_EQ(writer.EndBody(), 0);
  }
  void Add(const CertText& cert, const TestKey& key) {
    const std::string text = vesk2test::Cert(cert);
    ASSERT_EQ(writer.AddCertificate(Read<ZvVesk2::Cert>(text).get(),
                                    Read<Signature>(key.Sign(text)).get()),
              0);
  }

  const TestKey& signer = TestKey::Rsa(1);
  ManifestText parts;
  ManifestWriter writer{nullptr};
};

// The same text but for the second string of an entry, which has no meaning: "-" there, nothing
// here.
std::string Plain(std::string text) {
  for (size_t at = 0; (at = text.find("1:-", at)) != std::string::npos;) text.replace(at, 3, "0:");
  return text;
}

TEST_F(ManifestWriterTest, WritesWhatItsReaderProves) {
  parts.body = Plain(vesk2test::Body(FileEntry("a", "A") + DirEntry("empty", "") +
                                     DirEntry("sub", FileEntry("f \n", "F"))));
  CertText own{.issuer = signer.Public(), .subject = signer.Public(), .propagate = true};
  parts.chain = Signed(own, signer);

  Head();
  Body();
  size_t length = 0;
  const char* const body = writer.GetBody(&length);
  EXPECT_EQ(std::string(body, length), parts.body);
  Ref<Hash> subject;
  ASSERT_EQ(writer.SignedDigest(subject.Out(), ZVCLM_HASH_SHA256), 0);
  Add({.issuer = signer.Public(), .subject = Canonical(subject)}, signer);
  EXPECT_EQ(Written(writer), "code " + std::to_string(kInvalid)) << "one certificate is not enough";
  Add(own, signer);
  const std::string text = Written(writer);
  EXPECT_EQ(text, ManifestFile(parts));

  TempDir files;
  Manifest manifest(nullptr);
  ASSERT_EQ(manifest.Initialize(files.Path().c_str(), files.Write("m", text).c_str(), "none"), 0);
  EXPECT_EQ(manifest.ReadManifest(false, 0, 0, nullptr), 0);
}

TEST_F(ManifestWriterTest, RefusesWhatItsReaderWouldRefuse) {
  Ref<Hash> subject;
  EXPECT_EQ(writer.AddFile("early", Sha256("")), kInvalid);
  EXPECT_EQ(writer.OpenDirectory("early"), kInvalid);
  EXPECT_EQ(writer.EndBody(), kInvalid);
  ASSERT_EQ(writer.BeginBody(kToken), 0);
  EXPECT_EQ(writer.BeginBody(kToken), kInvalid);
  for (const char* name : {"", ".", "..", "a/b", "/"}) {
    EXPECT_EQ(writer.AddFile(name, Sha256("")), kInvalid) << name;
    EXPECT_EQ(writer.OpenDirectory(name), kInvalid) << name;
  }
  EXPECT_EQ(writer.AddFile(nullptr, Sha256("")), kInvalid);
  EXPECT_EQ(writer.AddFile(std::string(5000, 'x').c_str(), Sha256("")), VESK2_ERR_MAX_BYTE_STRING);
  EXPECT_EQ(writer.CloseDirectory(), kInvalid) << "the body is no directory";
  unsigned depth = 1;
  while (writer.OpenDirectory("d") == 0) ++depth;
  EXPECT_EQ(depth, Limits::kMaxDepth);
  EXPECT_EQ(writer.EndBody(), kInvalid) << "directories are open";
  while (writer.CloseDirectory() == 0) --depth;
  EXPECT_EQ(depth, 1u);
  ASSERT_EQ(writer.EndBody(), 0);
  EXPECT_EQ(writer.BeginBody(kToken), kInvalid);
  EXPECT_EQ(writer.SignedDigest(subject.Out(), ZVCLM_HASH_SHA256), kInvalid) << "without a head";
  EXPECT_EQ(writer.SetHead("text", Read<TimeStamp>(Str("2024")).get()), VESK2_ERR_TIME_STAMP);
  EXPECT_EQ(writer.SetHead("", Read<TimeStamp>(Str(parts.signingTime)).get()), kInvalid);
  EXPECT_EQ(writer.SetHead(nullptr, nullptr), kInvalid);
  Head();
  EXPECT_EQ(writer.SignedDigest(subject.Out(), static_cast<ZvclmHashID>(1)), VESK2_ERR_HASH_ID);
  EXPECT_EQ(writer.AddCertificate(nullptr, nullptr), kInvalid);
  EXPECT_EQ(writer.AddList(nullptr), kInvalid);
}

}  // namespace
