// SPDX-License-Identifier: Apache-2.0
// Verifications of manifests while another process holds a file, or descriptors are short: what
// could not be read never makes a yes, and a held file of the tree is told as such.
#include <gtest/gtest.h>

#include <cstring>
#include <filesystem>
#include <string>
#include <utility>

#include <vesk2/context.h>
#include <vesk2/manifest.h>

#include "tests/manifest/result_text.h"
#include "tests/support/held_file.h"
#include "tests/support/temp_dir.h"
#include "tests/support/test_manifest.h"

using namespace vesk2test;
using ZvVesk2::Manifest;
using ZvVesk2::VeskConf;

namespace {

constexpr const char* kTag = "(install)";
constexpr const char* kSource = "app (revoke all)";
constexpr const char* kDate = "2024-01-01_00:00:00";

// The store trusts key 0 to revoke, and its list names the signer's key 1; another directory
// trusts key 0 to install. The manifest is signed by key 1, whom key 0 certified.
class HeldManifest : public testing::Test {
 protected:
  HeldManifest() {
    VeskConf::SetGlobalDirectory(store.Path().c_str());
    revoker = store.Write("acl/revoke.acl", AclEntryText(vendor.Public(), Tag(kSource)));
    const std::string item = List({Str("item"), HashOf(signer.Public()), Str(kDate)});
    const std::string crl =
        List({Str("crl"), "(7:version1:1)", List({Str("list1")}), List({Str("list2"), item})});
    const CertText voucher{.issuer = vendor.Public(),
                           .subject = HashOf(crl),
                           .tag = Tag(kSource),
                           .notBefore = kDate,
                           .notAfter = "2039-01-01_00:00:00"};
    list = store.Write(std::string("cert/") + kSource + ".crl",
                       List({Str("sequence"), crl, Signed(voucher, vendor)}));
    roots.Write("install.acl", AclEntryText(vendor.Public(), Tag(kTag)));
    for (const char* name : {"a", "sub/f"}) tree.Write(name, name);
    ManifestText parts;
    parts.body = BodyOf(tree.Path() + "/");
    parts.signer.tag = Tag(kTag);
    parts.chain =
        Signed({.issuer = vendor.Public(), .subject = signer.Public(), .tag = Tag(kTag)}, vendor);
    file = files.Write("m", ManifestFile(parts));
  }
  ~HeldManifest() override { VeskConf::SetGlobalDirectory(nullptr); }

  int Verify() {
    Manifest manifest(nullptr);
    EXPECT_EQ(manifest.Initialize(tree.Path().c_str(), file.c_str(), kTag), 0);
    manifest.SetExtraAclDirectory(strcpy(new char[roots.Path().size() + 1], roots.Path().c_str()));
    return manifest.VerifyManifest(0, 0);
  }

  const TestKey& vendor = TestKey::Rsa(0);
  const TestKey& signer = TestKey::Rsa(1);
  TempDir store, roots, tree, files;
  std::string revoker, list, file;
};

TEST_F(HeldManifest, NeverPassesARevokedSigner) {
  const int revoked = Verify();
  EXPECT_NE(revoked, 0);
  const std::pair<std::string, int> cases[] = {
      {list, VESK2_ERR_READ_FILE},
      {revoker, VESK2_ERR_READ_FILE},
      {roots.File("install.acl"), VESK2_ERR_READ_FILE},
      {file, VESK2_ERR_OPEN_MANIFEST_FILE},
      {tree.File("a"), revoked},  // comes later
  };
  for (const auto& [path, code] : cases) {
    const HeldFiles held({path});
    EXPECT_EQ(Verify(), code) << path;
  }
  int code = 0;
  {
    const NoDescriptors none;
    code = Verify();
  }
  EXPECT_EQ(code, VESK2_ERR_MEM_ALLOC);
  std::filesystem::remove(list);
  EXPECT_EQ(Verify(), 0) << "the list alone refuses";
}

}  // namespace
