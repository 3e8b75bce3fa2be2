// SPDX-License-Identifier: Apache-2.0
// Files, directories and buffers: what may be opened, what is read, and what a failure leaves.
#include "src/platform/file.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <string>

#include <vesk2/limits.h>

#include "tests/support/temp_dir.h"
#include "tests/support/test_object.h"

namespace ZVsysutil {
namespace {

namespace fs = std::filesystem;
using vesk2test::BufferPtr;
using vesk2test::TempDir;

ZvFileOwner Open(const std::string& path, int mode = ZV_READ) {
  ZvFileOwner file;
  const int code = zv_open(file, path.c_str(), mode);
  EXPECT_EQ(file == nullptr, code != 0) << path;
  return file;
}
BufferPtr WrapFile(const std::string& path) { return BufferPtr(zv_buffer_wrap_file(path.c_str())); }

// Opening any of these for reading or writing must come back at once; the test would hang else.
TEST(FileTest, OpensRegularFilesOnly) {
  const TempDir dir;
  dir.Write("file", "abc");
  fs::create_directory(dir.File("directory"));
  for (const char* name : {"fifo", "busy"}) ASSERT_EQ(mkfifo(dir.File(name).c_str(), 0600), 0);
  ASSERT_EQ(mknod(dir.File("socket").c_str(), S_IFSOCK | 0600, 0), 0);
  const int reader = open(dir.File("busy").c_str(), O_RDWR);
  fs::create_symlink("file", dir.File("link"));
  fs::create_symlink("nowhere", dir.File("dangling"));
  fs::create_symlink("/dev/zero", dir.File("endless"));
  ZvListing inside;
  ASSERT_EQ(inside.Open({kZvNoDirectory, dir.Path().c_str()}), 0);
  const ZvFileOwner again = zv_reader();
  for (const std::string name :
       {"absent", "file", "directory", "fifo", "busy", "socket", "link", "dangling", "endless"}) {
    const std::string path = dir.File(name);
    const bool readable = name == "file" || name == "link";  // contents may lie behind a link
    EXPECT_TRUE((Open(path) != nullptr) == readable && (WrapFile(path) != nullptr) == readable)
        << name;
    // A directory may have called a file what is none any more.
    for (const bool listed : {false, true}) {
      const ZvPlace place = {inside.Descriptor(), name.c_str(), listed};
      EXPECT_EQ(zv_reopen(again.get(), place), readable ? 0 : VESK2_ERR_FILE_OPEN) << name;
      std::unique_ptr<unsigned char[]> bytes;
      size_t size = 0;
      EXPECT_EQ(zv_read_whole(bytes, &size, place, 3) == 0, listed ? name == "file" : readable)
          << name;
    }
    const bool writable = name == "absent" || name == "file";
    for (const int mode : {ZV_WRITE_STORE, ZV_WRITE_SHARED}) {
      EXPECT_EQ(Open(path, mode) != nullptr, writable) << name;
    }
    EXPECT_FALSE(fs::exists(dir.File("nowhere")));
  }
  // One's own path may be a link, also to a file that is made by writing.
  for (const char* name : {"file", "link", "dangling"}) EXPECT_TRUE(Open(dir.File(name), ZV_WRITE));
  for (const char* name : {"directory", "fifo", "busy", "socket", "endless"}) {
    EXPECT_FALSE(Open(dir.File(name), ZV_WRITE)) << name;
  }
  close(reader);
  EXPECT_TRUE(fs::file_size(dir.File("file")) == 0 && fs::exists(dir.File("nowhere")));
}

TEST(FileTest, ReadsTheSameInPiecesOfAnySize) {
  const TempDir dir;
  std::string content(200'001, '\0');
  for (size_t i = 0; i < content.size(); ++i) content[i] = static_cast<char>(i * i >> 3);
  const std::string path = dir.Write("file", content);
  for (const size_t piece : {1u, 4u, 7u, 65535u, 65536u, 65537u, 300000u}) {
    const ZvFileOwner file = Open(path);
    std::string read, block(piece, '\0');
    auto* const bytes = reinterpret_cast<unsigned char*>(block.data());
    for (size_t count = 1; count > 0; read.append(block, 0, count)) {
      const bool odd = read.size() / piece % 2 != 0;
      count = odd ? zv_read(file.get(), bytes, piece) : ZvReader(file.get()).Read(bytes, piece);
    }
    EXPECT_TRUE(read == content && zv_read_error(file.get()) == 0 &&
                zv_check_unchanged(file.get()) == 0)
        << piece;
  }
}

TEST(FileTest, NoticesAFileThatChangesWhileItIsRead) {
  const TempDir dir;
  const std::string path = dir.Write("file", "abcdef");
  const ZvFileOwner file = Open(path);
  std::ofstream(path, std::ios::app) << "g";
  unsigned char out[100];
  EXPECT_EQ(zv_read(file.get(), out, sizeof out), 0u);
  EXPECT_EQ(zv_read_error(file.get()), VESK2_ERR_READ_FILE);
  EXPECT_EQ(zv_check_unchanged(file.get()), VESK2_ERR_READ_FILE);
  EXPECT_EQ(WrapFile("/proc/self/status"), nullptr);  // holds bytes where its size says none
  fs::resize_file(path, ZvVesk2::Limits::kMaxFile + 1);
  EXPECT_EQ(WrapFile(path), nullptr);
}

TEST(FileTest, ReportsWhatCouldNotBeWritten) {
  auto* full = new ZvFile;
  full->stream = fopen("/dev/full", "w");
  EXPECT_EQ(zv_write(zv_stream(full), "abc", 3), 3u);  // still in the stream
  EXPECT_EQ(zv_close(full), VESK2_ERR_WRITE_FILE);
}

// The names that match, or the code.
std::string Names(const std::string& path, const char* pattern, bool full = false) {
  ZvDir dir;
  if (const int code = dir.open(path.c_str(), pattern)) return std::to_string(code);
  std::string names;
  while (const char* name = dir.read(full)) names += std::string(name) + " ";
  return names;
}

TEST(FileTest, MakesAndListsDirectories) {
  const TempDir dir;
  fs::create_symlink("d.acl", dir.File("link"));
  for (const char* name : {"b.acl", "B.acl", ".acl", "a.acl.x", "\xe4.acl"}) dir.Write(name, "");
  for (const char* name : {"d.acl", "d.acl", "link"}) {
    EXPECT_EQ(zv_mkdir(dir.File(name).c_str(), 0700), 0) << name;
  }
  EXPECT_EQ(fs::status(dir.File("d.acl")).permissions(), fs::perms::owner_all);
  EXPECT_EQ(Names(dir.Path(), "*"), ".acl B.acl a.acl.x b.acl d.acl link \xe4.acl ");
  EXPECT_EQ(Names(dir.Path(), "*.acl"), ".acl B.acl b.acl d.acl \xe4.acl ");
  EXPECT_EQ(Names(dir.Path() + "/", "*.x", true), dir.File("a.acl.x") + " ");
  for (const char* name : {"absent/x", "b.acl"}) {
    EXPECT_EQ(Names(dir.File(name), "*"), std::to_string(VESK2_ERR_FIND_DIR));
    EXPECT_EQ(zv_mkdir(dir.File(name).c_str(), 0700), VESK2_ERR_CREATE_DIR);
  }
}

TEST(BufferTest, MatchesWithoutConsumingOnFailure) {
  const BufferPtr buffer = vesk2test::Wrap("(4:hash \xff|");
  EXPECT_TRUE(buffer->LooksAt("(4:") && buffer->Expect("(4:hush") == VESK2_ERR_PARSE_FILE);
  EXPECT_FALSE(buffer->Accept("(4:hash \xff|)"));  // longer than what is left
  EXPECT_EQ(buffer->Position(), 0u);
  EXPECT_EQ(buffer->Expect("(4:hash"), 0);
  EXPECT_FALSE(buffer->Accept("\xff"));  // blanks are not skipped
  EXPECT_TRUE(buffer->Next() == ' ' && buffer->Accept("") && buffer->Peek() == 255);
  char out[9];
  EXPECT_EQ(buffer->Read(out, sizeof out), 2u);
  EXPECT_TRUE(buffer->Peek() == -1 && buffer->Next() == -1 && buffer->Skip(1) == 0);
  EXPECT_FALSE(buffer->LooksAt("x"));
}

}  // namespace
}  // namespace ZVsysutil
