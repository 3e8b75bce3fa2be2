// Where objects are stored, and writing them there.
#include <vesk2/context.h>
#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include <filesystem>
#include <memory>
#include <string>
#include <tuple>

#include <gtest/gtest.h>

#include "src/frame/check.h"
#include "tests/support/temp_dir.h"

namespace ZvVesk2 {
namespace {

namespace fs = std::filesystem;

// A class with a store, as an access-control entry is.
class Stored : public SExpression {
 public:
  using SExpression::SExpression;
  const char* DirectoryName() const override { return "acl"; }
  const char* ExtensionName() const override { return ".acl"; }
};

constexpr auto kOddType = static_cast<StorageType>(7);

// Runs in a temporary directory, with the roots "h" and "g" in it.
class Storage : public testing::Test {
 protected:
  void SetUp() override {
    fs::current_path(dir_.Path());
    fs::create_directory("h");
    fs::create_directory("g");
    VeskConf::SetHomeDirectory("h");
    VeskConf::SetGlobalDirectory("g");
  }
  void TearDown() override { fs::current_path("/"); }

  const vesk2test::TempDir dir_;
};

TEST_F(Storage, Paths) {
  const std::string tooLong(4097, 'x');
  const std::tuple<const char*, const char*, const char*, StorageType, const char*> cases[] = {
      {"acl", ".acl", "x/y/root", StorageHome, "h/acl/root.acl"},  // the base name counts
      {"acl", ".acl", "root.acl", StorageHome, "h/acl/root.acl"},
      {"acl", ".acl", "a.txt", StorageHome, "h/acl/a.txt.acl"},  // another extension is kept
      {"acl", ".acl", "r", kOddType, "h/acl/r.acl"},             // all but 1 and 2 mean home
      {"cert", ".crl", "r", StorageGlobal, "g/cert/r.crl"},
      {"cert", ".cert", "/tmp/c.cert", StoragePath, "/tmp/c.cert"},
      {"cert", ".cert", "/tmp/c", StoragePath, "/tmp/c.cert"},
      {"cert", ".cert", "/tmp.cert/c", StoragePath, "/tmp.cert/c.cert"},
      {"", ".pub", "d/k", StorageGlobal, "d/k.pub"},  // no directory name, no store
      {"acl", ".acl", "", StorageHome, nullptr},
      {"acl", ".acl", "a/..", StorageHome, nullptr},
      {"acl", ".acl", "/", StorageHome, nullptr},
      {"acl", ".acl", nullptr, StorageHome, nullptr},
      {"acl", ".acl", tooLong.c_str() + 1, StorageHome, nullptr},  // cut only below the root
      {"acl", ".acl", tooLong.c_str(), StoragePath, nullptr},
  };
  for (const auto& [directory, extension, name, type, expected] : cases) {
    const std::unique_ptr<char[]> path(SExpression::CalcPath(directory, extension, name, type));
    EXPECT_STREQ(path.get(), expected);
  }
}

TEST_F(Storage, Directories) {
  const std::tuple<const char*, StorageType, const char*> cases[] = {
      {"acl", StorageHome, "h/acl"}, {"acl", StorageGlobal, "g/acl"}, {"acl", kOddType, "h/acl"},
      {"acl", StoragePath, "."},     {"", StorageGlobal, "."},
  };
  for (const auto& [directory, type, expected] : cases) {
    const std::unique_ptr<char[]> path(SExpression::CalcDir(directory, type));
    EXPECT_STREQ(path.get(), expected);
  }
  // A path makes its directory, for a name that can be stored.
  delete[] SExpression::CalcPath("acl", ".acl", "..", StorageHome);
  EXPECT_FALSE(fs::exists("h/acl"));
  delete[] SExpression::CalcPath("acl", ".acl", "x", StorageHome);
  EXPECT_EQ(fs::status("h/acl").permissions() & fs::perms{077}, fs::perms::none)
      << "the home store is its user's alone";
}

TEST_F(Storage, AnUnsetRootIsNotTheCurrentDirectory) {
  VeskConf::SetHomeDirectory("");
  EXPECT_EQ(SExpression::CalcDir("acl", StorageHome), nullptr);
  EXPECT_EQ(SExpression::CalcPath("acl", ".acl", "x", StorageHome), nullptr);
  const Ref<Stored> object(TryNew<Stored>(nullptr));
  EXPECT_EQ(object->SetFileName("x"), VESK2_ERR_MEM_ALLOC);
  EXPECT_EQ(object->CreateFileDirectory(), VESK2_ERR_FIND_DIR);
  EXPECT_EQ(object->Export("x"), VESK2_ERR_FIND_DIR);
  EXPECT_FALSE(fs::exists("acl"));
}

TEST_F(Storage, ExportWritesIntoTheStore) {
  const Ref<Stored> object(TryNew<Stored>(nullptr));
  ASSERT_EQ(object->Insert("abc"), 0);
  object->SetStorageType(StorageGlobal);
  ASSERT_EQ(object->Export("some/where/x"), 0);
  EXPECT_EQ(dir_.Read("g/acl/x.acl"), "(3:abc)");
  EXPECT_STREQ(std::unique_ptr<char[]>(object->BaseName()).get(), "x.acl");
  ASSERT_EQ(object->Insert("d"), 0);
  EXPECT_EQ(object->Export(static_cast<const char*>(nullptr)), 0) << "to the name it has";
  EXPECT_EQ(dir_.Read("g/acl/x.acl"), "(3:abc1:d)");
  ASSERT_EQ(object->SetFileName(object->GetFileName()), 0) << "its own name as the new one";
  EXPECT_STREQ(object->GetFileName(), "g/acl/x.acl");
}

TEST_F(Storage, DirectoriesThatCannotBe) {
  const Ref<SExpression> plain(TryNew<SExpression>(nullptr));
  EXPECT_EQ(plain->Export(static_cast<const char*>(nullptr)), VESK2_ERR_FILE_OPEN);
  EXPECT_EQ(plain->CreateFileDirectory(), 0) << "a class without a store needs none";
  plain->SetStorageType(kOddType);
  EXPECT_EQ(plain->CreateFileDirectory(), VESK2_ERR_FIND_DIR);

  const Ref<Stored> stored(TryNew<Stored>(nullptr));
  VeskConf::SetHomeDirectory("none");
  EXPECT_EQ(stored->Export("x"), VESK2_ERR_CREATE_DIR);
  stored->SetStorageType(StoragePath);
  EXPECT_EQ(stored->Export("none"), 0);
  EXPECT_TRUE(stored->Exists());
}

}  // namespace
}  // namespace ZvVesk2
