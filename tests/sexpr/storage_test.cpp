// SPDX-License-Identifier: Apache-2.0
// Where objects are stored, and writing them there.
#include <vesk2/context.h>
#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include <filesystem>
#include <memory>
#include <string>
#include <tuple>
#include <utility>

#include <gtest/gtest.h>

#include "tests/support/temp_dir.h"

namespace ZvVesk2 {
namespace {

namespace fs = std::filesystem;

// A class with a store, as an access-control entry is.
class Stored : public SExpression {
 public:
  Stored() : SExpression(nullptr) {}
  const char* DirectoryName() const override { return "acl"; }
  const char* ExtensionName() const override { return ".acl"; }
};

constexpr auto kOddType = static_cast<StorageType>(7);

// Runs in a temporary directory, with the roots "h" and "g" in it.
class Storage : public testing::Test {
 protected:
  Storage() {
    fs::current_path(dir_.Path());
    for (const char* root : {"h", "g"}) fs::create_directory(root);
    VeskConf::SetHomeDirectory("h");
    VeskConf::SetGlobalDirectory("g");
  }
  ~Storage() override { fs::current_path("/"); }
  const vesk2test::TempDir dir_;
  const Ref<SExpression> object_{new Stored};
};

TEST_F(Storage, Paths) {
  delete[] SExpression::CalcPath("acl", ".acl", "a/..", StorageHome);
  EXPECT_FALSE(fs::exists("h/acl")) << "made only for a name that can be stored";
  const std::string tooLong(4097, 'x');
  const std::tuple<const char*, const char*, StorageType, const char*> cases[] = {
      {"acl", "x/y/root", StorageHome, "h/acl/root.acl"},  // the base name counts
      {"acl", "root.acl", StorageHome, "h/acl/root.acl"},
      {"acl", "a.txt", StorageHome, "h/acl/a.txt.acl"},  // another extension is kept
      {"acl", "r", kOddType, "h/acl/r.acl"},             // all but 1 and 2 mean home
      {"cert", "r", StorageGlobal, "g/cert/r.acl"},
      {"cert", "/tmp.acl/c", StoragePath, "/tmp.acl/c.acl"},
      {"", "d/k", StorageGlobal, "d/k.acl"},  // no directory name, no store
      {"acl", "", StorageHome, nullptr},
      {"acl", tooLong.c_str() + 1, StorageHome, nullptr},  // cut only below the root
      {"acl", tooLong.c_str(), StoragePath, nullptr},
  };
  for (const auto& [directory, name, type, expected] : cases) {
    const std::unique_ptr<char[]> path(SExpression::CalcPath(directory, ".acl", name, type));
    EXPECT_STREQ(path.get(), expected);
  }
  EXPECT_EQ(fs::status("h/acl").permissions(), fs::perms::owner_all);
}

TEST_F(Storage, DirectoriesThatCannotBe) {
  for (const auto& [directory, type] : {std::pair{"acl", StoragePath}, {"", StorageGlobal}}) {
    EXPECT_STREQ(std::unique_ptr<char[]>(SExpression::CalcDir(directory, type)).get(), ".");
  }
  VeskConf::SetHomeDirectory("none");
  EXPECT_EQ(object_->Export("x"), VESK2_ERR_CREATE_DIR);
  VeskConf::SetHomeDirectory("");  // is not the current directory
  EXPECT_EQ(SExpression::CalcDir("acl", StorageHome), nullptr);
  EXPECT_EQ(object_->SetFileName("x"), VESK2_ERR_MEM_ALLOC);
  EXPECT_EQ(object_->Export("x"), VESK2_ERR_FIND_DIR);
  const Ref<SExpression> plain(new SExpression(nullptr));
  EXPECT_EQ(plain->CreateFileDirectory(), 0) << "a class without a store needs none";
  plain->SetStorageType(kOddType);
  EXPECT_EQ(plain->CreateFileDirectory(), VESK2_ERR_FIND_DIR);
  object_->SetStorageType(StoragePath);
  EXPECT_TRUE(object_->Export("none") == 0 && object_->Exists());
}

TEST_F(Storage, ExportWritesIntoTheStore) {
  ASSERT_EQ(object_->Insert("abc"), 0);
  object_->SetStorageType(StorageGlobal);
  ASSERT_EQ(object_->Export("some/where/x"), 0);
  EXPECT_STREQ(std::unique_ptr<char[]>(object_->BaseName()).get(), "x.acl");
  ASSERT_EQ(object_->Insert("d"), 0);
  ASSERT_EQ(object_->SetFileName(object_->GetFileName()), 0) << "its own name as the new one";
  EXPECT_EQ(object_->Export(static_cast<const char*>(nullptr)), 0) << "to the name it has";
  Ref<SExpression> read;
  ASSERT_EQ(SExpression::Import(read.Out(), "g/acl/x.acl", nullptr), 0);
  EXPECT_TRUE(object_->IsEqual(read.get()) && read->Count() == 2);
  EXPECT_EQ(SExpression::Import(read.Out(), "g/acl/x", nullptr), VESK2_ERR_FILE_OPEN);
}

// One's own path is written as any program writes its output; in a store a link is refused.
TEST_F(Storage, ExportFollowsLinksToOnesOwnPath) {
  for (const char* store : {"h/acl", "g/acl"}) fs::create_directory(store);
  for (const char* link : {"x.acl", "h/acl/x.acl", "g/acl/x.acl"}) {
    fs::create_symlink(dir_.File("target"), link);
  }
  for (const StorageType type : {StorageHome, StorageGlobal, StoragePath}) {
    object_->SetStorageType(type);
    const bool own = type == StoragePath;
    EXPECT_EQ(object_->Export("x"), own ? 0 : VESK2_ERR_FILE_OPEN);
    EXPECT_EQ(fs::exists("target"), own);
  }
  // A class without a store has paths of its own only.
  const Ref<SExpression> plain(new SExpression(nullptr));
  EXPECT_EQ(plain->Export("x.acl"), 0);
  EXPECT_TRUE(fs::is_symlink("x.acl"));
}

}  // namespace
}  // namespace ZvVesk2
