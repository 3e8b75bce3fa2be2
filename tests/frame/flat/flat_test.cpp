// The flat functions: their conversions, their null rules, and what they hand out and keep.
#include <gtest/gtest.h>

#include <string>

#include <vesk2/context.h>
#include <vesk2/file_item.h>
#include <vesk2/manifest.h>

#include "src/platform/text.h"
#include "tests/support/temp_dir.h"
#include "tests/support/test_manifest.h"

using namespace vesk2test;
using ZvVesk2::VeskConf;

namespace {

TEST(FlatContext, InitKeepsTheValue) {
  EXPECT_EQ(Vesk2Init(nullptr, 7), 0);
  Vesk2ContextStruct* context = nullptr;
  ASSERT_EQ(Vesk2Init(&context, 0xfffffff7u), 0);
  EXPECT_EQ(context->cryptoHandle, 0xfffffff7u);
  EXPECT_EQ(Vesk2FreeContext(context), 0);
  EXPECT_EQ(Vesk2FreeContext(nullptr), 0);
  Vesk2Free(nullptr);
}

TEST(FlatContext, StoreRootsAreCutAndCleared) {
  const std::string longest(4096, 'd');
  const auto check = [&](void (*set)(const char*), const char* (*get)()) {
    set((longest + "more").c_str());
    EXPECT_EQ(get(), longest);
    set(nullptr);
    EXPECT_STREQ(get(), "");
  };
  check(Vesk2HomeDirectory, VeskConf::GetHomeDirectory);
  check(Vesk2HomeDirectoryA, VeskConf::GetHomeDirectory);
  check(Vesk2GlobalDirectory, VeskConf::GetGlobalDirectory);
  check(Vesk2GlobalDirectoryA, VeskConf::GetGlobalDirectory);
}

TEST(FlatContext, ConversionsCopyUpToTheLength) {
  for (char* (*convert)(const char*, uint32_t, unsigned int*) :
       {Vesk2WideToAscii, Vesk2AsciiToWide}) {
    unsigned int length = 9;
    char* copy = convert("abcdef", 3, &length);
    EXPECT_STREQ(copy, "abc");
    EXPECT_EQ(length, 3u);
    Vesk2Free(copy);
    copy = convert("ab", 10, nullptr);
    EXPECT_STREQ(copy, "ab");
    Vesk2Free(copy);
    EXPECT_EQ(convert(nullptr, 3, &length), nullptr);
    EXPECT_EQ(length, 0u);
  }
}

TEST(FlatFileItems, BothFormsAreHeldAndChainsCounted) {
  FileItem* const first = ZvVesk2::FileItemCreate(ZVsysutil::zv_fstrdup("n"), nullptr);
  first->next = ZvVesk2::FileItemCreate(nullptr, ZVsysutil::zv_strdup("a"));
  first->next->next =
      ZvVesk2::FileItemCreate(ZVsysutil::zv_fstrdup("x"), ZVsysutil::zv_strdup("y"));
  EXPECT_STREQ(first->nameA, "n");
  EXPECT_STREQ(first->next->name, "a");
  EXPECT_STREQ(first->next->next->nameA, "y");
  EXPECT_EQ(first->size, 28u);
  EXPECT_EQ(first->isDirectory, 0);
  EXPECT_EQ(FreeFileItemList(first), 3u);
  EXPECT_EQ(FreeFileItemList(nullptr), 0u);
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
