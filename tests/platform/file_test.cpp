// Files, directories and buffers: what may be opened, what is read, and what a failure leaves.
#include "src/platform/file.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <string>
#include <vector>

#include <vesk2/limits.h>

#include "src/platform/text.h"
#include "tests/support/temp_dir.h"

namespace ZVsysutil {
namespace {

namespace fs = std::filesystem;
using Bytes = std::vector<unsigned char>;
using vesk2test::TempDir;

struct BufferFree {
  void operator()(ZvBuffer* buffer) const { zv_buffer_free(buffer); }
};
using BufferOwner = std::unique_ptr<ZvBuffer, BufferFree>;

BufferOwner Wrap(const std::string& text) {
  return BufferOwner(zv_buffer_wrap(text.data(), text.size()));
}

void MakeSocket(const std::string& path) {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  ASSERT_TRUE(zv_fstrcpy(address.sun_path, sizeof address.sun_path, path.c_str()));
  const int fd = socket(AF_UNIX, SOCK_STREAM, 0);
  ASSERT_EQ(bind(fd, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
  close(fd);
}

// Opening any of these for reading or writing must come back at once; the test would hang else.
TEST(FileTest, OpensRegularFilesOnly) {
  const TempDir dir;
  dir.Write("file", "abc");
  fs::create_directory(dir.File("directory"));
  ASSERT_EQ(mkfifo(dir.File("fifo").c_str(), 0600), 0);
  ASSERT_EQ(mkfifo(dir.File("busy").c_str(), 0600), 0);
  const int reader = open(dir.File("busy").c_str(), O_RDWR);
  MakeSocket(dir.File("socket"));
  fs::create_symlink("file", dir.File("link"));
  fs::create_symlink("nowhere", dir.File("dangling"));
  fs::create_symlink("/dev/zero", dir.File("endless"));
  const struct {
    const char* name;
    bool readable;
    bool writable;
  } cases[] = {
      {"absent", false, true},    {"file", true, true},      {"directory", false, false},
      {"fifo", false, false},     {"busy", false, false},    {"socket", false, false},
      {"link", true, false},  // contents may lie behind a link; writing never goes through one
      {"dangling", false, false}, {"endless", false, false},
  };
  for (const auto& row : cases) {
    const std::string path = dir.File(row.name);
    EXPECT_EQ(ZvFileOwner(zv_open(path.c_str(), ZV_READ)) != nullptr, row.readable) << row.name;
    EXPECT_EQ(BufferOwner(zv_buffer_wrap_file(path.c_str())) != nullptr, row.readable) << row.name;
    EXPECT_EQ(ZvFileOwner(zv_open(path.c_str(), ZV_WRITE)) != nullptr, row.writable) << row.name;
    EXPECT_EQ(ZvFileOwner(zv_create_new(path.c_str())), nullptr) << row.name;  // all there by now
  }
  EXPECT_FALSE(fs::exists(dir.File("nowhere")));
  EXPECT_EQ(zv_open(nullptr, ZV_READ), nullptr);
  EXPECT_EQ(zv_open(dir.File("file").c_str(), 3), nullptr);
  EXPECT_NE(ZvFileOwner(zv_create_new(dir.File("new").c_str())), nullptr);
  close(reader);
}

TEST(FileTest, ReadsTheSameInPiecesOfAnySize) {
  const TempDir dir;
  std::string content(200'001, '\0');
  for (size_t i = 0; i < content.size(); ++i) content[i] = static_cast<char>(i * i >> 3);
  const std::string path = dir.Write("file", content);
  for (const size_t piece : {1u, 4u, 7u, 65535u, 65536u, 65537u, 300000u}) {
    std::string read;
    std::string byReader;
    Bytes block(piece);
    const ZvFileOwner file(zv_open(path.c_str(), ZV_READ));
    const ZvFileOwner again(zv_open(path.c_str(), ZV_READ));
    ZvReader reader(again.get());
    while (const size_t count = zv_read(file.get(), block.data(), piece)) {
      read.append(block.begin(), block.begin() + static_cast<ptrdiff_t>(count));
    }
    while (const size_t count = zv_read(reader, block.data(), piece)) {
      byReader.append(block.begin(), block.begin() + static_cast<ptrdiff_t>(count));
    }
    EXPECT_TRUE(read == content && byReader == content) << piece;
    EXPECT_TRUE(!zv_failed(file.get()) && zv_unchanged(file.get())) << piece;
  }
}

TEST(FileTest, NoticesAFileThatChangesWhileItIsRead) {
  const TempDir dir;
  const std::string path = dir.Write("file", "abcdef");
  unsigned char out[100];
  const ZvFileOwner grown(zv_open(path.c_str(), ZV_READ));
  const ZvFileOwner touched(zv_open(path.c_str(), ZV_READ));
  std::ofstream(path, std::ios::app) << "g";
  EXPECT_EQ(zv_read(grown.get(), out, sizeof out), 0u);
  EXPECT_TRUE(zv_failed(grown.get()));
  EXPECT_FALSE(zv_unchanged(touched.get()));
  // A pseudo file holds bytes where its size says none.
  EXPECT_EQ(BufferOwner(zv_buffer_wrap_file("/proc/self/status")), nullptr);
}

TEST(FileTest, ReportsWhatCouldNotBeWritten) {
  const TempDir dir;
  const std::string path = dir.File("file");
  ZvFile* good = zv_open(path.c_str(), ZV_WRITE);
  ASSERT_NE(good, nullptr);
  EXPECT_EQ(zv_write(zv_stream(good), "abc", 3), 3u);
  EXPECT_EQ(zv_sync(good), 0);
  EXPECT_EQ(zv_close(good), 0);
  EXPECT_EQ(dir.Read("file"), "abc");

  for (const bool sync : {false, true}) {
    auto* full = new ZvFile;
    full->stream = fopen("/dev/full", "w");
    EXPECT_EQ(zv_write(zv_stream(full), "abc", 3), 3u);  // still in the stream
    EXPECT_EQ(sync ? zv_sync(full) : VESK2_ERR_WRITE_FILE, VESK2_ERR_WRITE_FILE);
    EXPECT_EQ(zv_close(full), VESK2_ERR_WRITE_FILE) << sync;
  }
}

TEST(FileTest, MakesDirectories) {
  const TempDir dir;
  dir.Write("file", "");
  fs::create_symlink("d", dir.File("link"));
  EXPECT_EQ(zv_mkdir(dir.File("d").c_str(), 0700), 0);
  EXPECT_EQ(fs::status(dir.File("d")).permissions(), fs::perms::owner_all);
  EXPECT_EQ(zv_mkdir(dir.File("d").c_str()), 0);
  EXPECT_EQ(zv_mkdir(dir.File("link").c_str()), 0);
  for (const char* name : {"file", "x/y"}) {
    EXPECT_EQ(zv_mkdir(dir.File(name).c_str()), VESK2_ERR_CREATE_DIR) << name;
  }
  EXPECT_EQ(zv_mkdir(nullptr), VESK2_ERR_CREATE_DIR);
}

std::string Names(const std::string& path, const char* pattern, bool full = false) {
  ZvDir dir;
  if (const int code = dir.open(path.c_str(), pattern)) return std::to_string(code);
  std::string names;
  while (const char* name = dir.read(full)) names += std::string(name) + " ";
  return names;
}

TEST(FileTest, ListsNamesInByteOrder) {
  const TempDir dir;
  for (const char* name :
       {"b.acl", "a.acl", "B.acl", ".acl", "a", "a.ACL", "a.acl.x", "\xe4.acl"}) {
    dir.Write(name, "");
  }
  fs::create_directory(dir.File("d.acl"));
  EXPECT_EQ(Names(dir.Path(), "*"), ".acl B.acl a a.ACL a.acl a.acl.x b.acl d.acl \xe4.acl ");
  EXPECT_EQ(Names(dir.Path(), "*.acl"), ".acl B.acl a.acl b.acl d.acl \xe4.acl ");
  EXPECT_EQ(Names(dir.Path() + "/", "*.x", true), dir.File("a.acl.x") + " ");
  const std::string failure = std::to_string(VESK2_ERR_FIND_DIR);
  EXPECT_EQ(Names(dir.File("absent"), "*"), failure);
  EXPECT_EQ(Names(dir.File("a"), "*"), failure);
  EXPECT_EQ(ZvDir().open(nullptr, "*"), VESK2_ERR_FIND_DIR);
}

TEST(BufferTest, MatchesWithoutConsumingOnFailure) {
  const BufferOwner buffer = Wrap("(4:hash ab");
  EXPECT_TRUE(buffer->LooksAt("(4:"));
  EXPECT_EQ(buffer->Position(), 0u);
  EXPECT_EQ(buffer->Expect("(4:hush"), VESK2_ERR_PARSE_FILE);
  EXPECT_FALSE(buffer->Accept("(4:hash ab)"));  // longer than what is left
  EXPECT_EQ(buffer->Position(), 0u);
  EXPECT_EQ(buffer->Expect("(4:hash"), 0);
  EXPECT_FALSE(buffer->Accept("ab"));  // blanks are not skipped
  EXPECT_EQ(buffer->Next(), ' ');
  EXPECT_TRUE(buffer->Accept(""));
  EXPECT_EQ(buffer->Peek(), 'a');
  char out[9];
  EXPECT_EQ(buffer->Read(out, sizeof out), 2u);
  EXPECT_EQ(buffer->Peek(), -1);
  EXPECT_EQ(buffer->Next(), -1);
  EXPECT_EQ(buffer->Skip(1), 0u);
  EXPECT_FALSE(buffer->LooksAt("x"));
  EXPECT_EQ(Wrap("\xff")->Next(), 255);
  EXPECT_EQ(zv_buffer_wrap(nullptr, 1), nullptr);
}

TEST(BufferTest, RefusesFilesAboveTheCap) {
  const TempDir dir;
  const std::string path = dir.Write("sparse", "");
  fs::resize_file(path, ZvVesk2::Limits::kMaxFile + 1);
  EXPECT_EQ(BufferOwner(zv_buffer_wrap_file(path.c_str())), nullptr);
  fs::resize_file(path, 3);
  const BufferOwner buffer(zv_buffer_wrap_file(path.c_str()));
  ASSERT_NE(buffer, nullptr);
  EXPECT_EQ(buffer->Remaining(), 3u);
}

}  // namespace
}  // namespace ZVsysutil
