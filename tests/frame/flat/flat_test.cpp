// SPDX-License-Identifier: Apache-2.0
// The flat functions: their null rules, and what they hand out and keep. (The C program beside this
// file covers those that need no objects.)
#include <gtest/gtest.h>

#include <string>

#include <vesk2/context.h>
#include <vesk2/manifest.h>

#include "tests/support/temp_dir.h"
#include "tests/support/test_manifest.h"

using namespace vesk2test;
using ZvVesk2::VeskConf;

namespace {

TEST(FlatDirectories, SetTheRootThatTheyName) {
  Vesk2HomeDirectory("home");
  Vesk2GlobalDirectory("global");
  EXPECT_STREQ(VeskConf::GetHomeDirectory(), "home");
  EXPECT_STREQ(VeskConf::GetGlobalDirectory(), "global");
  Vesk2HomeDirectoryA("homeA");
  Vesk2GlobalDirectoryA(nullptr);
  EXPECT_STREQ(VeskConf::GetHomeDirectory(), "homeA");
  EXPECT_STREQ(VeskConf::GetGlobalDirectory(), "");
}

TEST(FlatManifests, CreateRefusesMisplacedArguments) {
  for (const auto create : {CreateManifestContext, CreateManifestContextA}) {
    Manifest* manifest = nullptr;
    EXPECT_EQ(create(nullptr, "d", "m", "a"), VESK2_ERR_INVALID_PARAM);
    EXPECT_EQ(create(&manifest, nullptr, "m", "a"), VESK2_ERR_INVALID_PARAM);
    EXPECT_EQ(create(&manifest, "d", nullptr, "a"), VESK2_ERR_INVALID_PARAM);
    EXPECT_EQ(create(&manifest, "d", "m", nullptr), VESK2_ERR_INVALID_PARAM);
    EXPECT_NE(create(&manifest, "d", "m", "(a"), 0);
    EXPECT_EQ(manifest, nullptr);
    ASSERT_EQ(create(&manifest, "d", "m", "(a)"), 0);
    Manifest* const before = manifest;
    EXPECT_EQ(create(&manifest, "d", "m", "(a)"), VESK2_ERR_INVALID_PARAM);
    EXPECT_EQ(manifest, before);
    EXPECT_EQ(GetTimeOfSigning(manifest), 0);
    EXPECT_EQ(VerifyManifest(manifest, 0, 0), VESK2_ERR_OPEN_MANIFEST_FILE);
    DeleteManifestContext(manifest);
  }
  DeleteManifestContext(nullptr);
}

TEST(FlatManifests, SettingsAreCopied) {
  Manifest* manifest = nullptr;
  ASSERT_EQ(CreateManifestContext(&manifest, "d", "m", "(a)"), 0);
  SetExtraAclDirectory(manifest, "one");
  SetExtraAclDirectoryA(manifest, "two");
  EXPECT_STREQ(manifest->GetExtraAclDirectory(), "two");
  SetExtraAclDirectory(manifest, nullptr);
  EXPECT_EQ(manifest->GetExtraAclDirectory(), nullptr);
  FailOnExtraEntries(manifest);
  EXPECT_TRUE(manifest->GetFailOnExtraEntries());

  // Kept in reverse, nameless records left out.
  char a[] = "a", b[] = "b", c[] = "c";
  FileItem items[4] = {};
  for (int i = 0; i < 3; ++i) items[i].next = &items[i + 1];
  items[0].name = a;
  items[1].nameA = b;
  items[3].name = c;
  for (int run = 0; run < 2; ++run) {
    SetIgnoredEntries(manifest, items);
    std::string names;
    for (const FileItem* item = manifest->GetIgnoredEntries(); item != nullptr; item = item->next) {
      names += item->name;
    }
    EXPECT_EQ(names, "cba");
  }
  SetIgnoredEntries(manifest, nullptr);
  EXPECT_EQ(manifest->GetIgnoredEntries(), nullptr);
  DeleteManifestContext(manifest);
}

TEST(FlatManifests, VerifyAndCompareThroughTheFlatFunctions) {
  TempDir store, tree, files;
  const TestKey& vendor = TestKey::Rsa(0);
  store.Write("acl/vendor.acl", AclEntryText(vendor.Public(), Tag("(install)")));
  for (const char* name : {"a", "b", "c", "sub/f"}) tree.Write(name, name);
  ManifestText parts;
  parts.body = BodyOf(tree.Path());
  CertText own;
  own.issuer = vendor.Public();
  own.subject = parts.key->Public();
  parts.chain = Signed(own, vendor);
  const std::string path = files.Write("m", ManifestFile(parts));
  tree.Write("b", "changed");
  std::filesystem::remove(tree.File("c"));
  tree.Write("sub/x", "");

  Vesk2GlobalDirectoryA(store.Path().c_str());
  Manifest* manifest = nullptr;
  ASSERT_EQ(CreateManifestContextA(&manifest, tree.Path().c_str(), path.c_str(), "(install)"), 0);
  EXPECT_EQ(VerifyManifest(manifest, 0, 0), VESK2_ERR_HASH_MISMATCH);
  EXPECT_EQ(GetTimeOfSigning(manifest), 1714564800);
  EXPECT_EQ(GetValidEntries(manifest)->name, tree.File("sub/f"));
  EXPECT_EQ(GetInvalidEntries(manifest)->nameA, tree.File("b"));
  EXPECT_EQ(GetMissingEntries(manifest)->name, tree.File("c"));
  EXPECT_EQ(GetExtraEntries(manifest)->name, tree.File("sub"));
  EXPECT_EQ(GetExtraEntries(manifest)->isDirectory, 1);
  EXPECT_EQ(CompareManifest(manifest, path.c_str()), 0);
  EXPECT_EQ(CompareManifestA(manifest, path.c_str()), 0);
  EXPECT_EQ(GetInvalidEntries(manifest), nullptr);
  DeleteManifestContext(manifest);
  Vesk2GlobalDirectory(nullptr);
}

}  // namespace
