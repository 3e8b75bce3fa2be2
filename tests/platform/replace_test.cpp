// SPDX-License-Identifier: Apache-2.0
// Files written whole or not at all, and what dead writers leave behind.
#include "src/platform/replace.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/file.h>
#include <unistd.h>

#include <atomic>
#include <functional>
#include <set>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <vesk2.h>

#include "tests/support/temp_dir.h"

// The linker sends calls of flock here: what happens between the making of a file and its locking.
std::function<void(int)> beforeLock;
extern "C" int __real_flock(int fd, int operation);
extern "C" int __wrap_flock(int fd, int operation) {
  if (const auto hook = std::exchange(beforeLock, nullptr)) {
    hook(fd);
    beforeLock = hook;
  }
  return __real_flock(fd, operation);
}

namespace ZVsysutil {
namespace {

namespace fs = std::filesystem;
using vesk2test::TempDir;

const std::string kDigits(32, 'a');

// What a directory holds, each name in "<>".
std::string Names(const TempDir& dir) {
  std::set<std::string> sorted;
  for (const auto& file : fs::directory_iterator(dir.Path())) sorted.insert(file.path().filename());
  std::string names;
  for (const std::string& name : sorted) names += "<" + name + ">";
  return names;
}

int Write(const std::string& path, const std::string& bytes, bool replace = true) {
  ZvReplacement file;
  if (const int code = file.Open(path.c_str(), 0644)) return code;
  std::fwrite(bytes.data(), 1, bytes.size(), file.Stream());
  return file.Keep(replace);
}

TEST(ReplaceTest, WholeOrNotAtAll) {
  const TempDir dir;
  const std::string path = dir.File("x");
  for (const mode_t mask : {0000u, 0022u, 0077u, 0777u}) {
    const mode_t old = umask(mask);
    EXPECT_EQ(Write(path, std::to_string(mask)), 0);
    umask(old);
    EXPECT_EQ(dir.Read("x"), std::to_string(mask));
    EXPECT_EQ(fs::status(path).permissions(), fs::perms{0644}) << mask;
  }
  dir.Write("x", "old");
  {
    ZvReplacement dropped;
    ASSERT_EQ(dropped.Open(path.c_str(), 0644), 0);
    std::fputs("half", dropped.Stream());
    EXPECT_EQ(dropped.Open(path.c_str(), 0644), VESK2_ERR_FILE_OPEN);
  }
  EXPECT_EQ(dir.Read("x") + Names(dir), "old<x>");
  // What has the name, be it a link to nowhere, stays unless it is to be replaced.
  fs::create_symlink("nowhere", dir.File("link"));
  for (const char* name : {"x", "link"}) {
    EXPECT_EQ(Write(dir.File(name), "new", false), VESK2_ERR_WRITE_FILE);
  }
  EXPECT_EQ(dir.Read("x") + Names(dir), "old<link><x>");
  EXPECT_EQ(Write(dir.File("link"), "new") + Write(dir.File("fresh"), "new", false), 0);
  EXPECT_EQ(dir.Read("link") + dir.Read("fresh") + Names(dir), "newnew<fresh><link><x>");
  // The temporary name of the longest one is cut.
  EXPECT_EQ(Write(dir.File(std::string(255, 'n')), ""), 0);
  EXPECT_EQ(Write(dir.File(std::string(256, 'n')), ""), VESK2_ERR_WRITE_FILE);
  EXPECT_EQ(Write(dir.File("none/x"), ""), VESK2_ERR_FILE_OPEN);
  EXPECT_EQ(ZvReplacement().Open(nullptr, 0644), VESK2_ERR_FILE_OPEN);
}

TEST(ReplaceTest, RemovesWhatDeadWritersLeft) {
  const TempDir dir;
  const std::string dead = "dead.tmp-" + kDigits, held = "held.tmp-" + kDigits;
  const std::string link = "link.tmp-" + kDigits;
  for (const std::string& name : {dead, held, std::string("x.tmp12"), "x.tmp-" + kDigits + ".acl",
                                  "x.tmp-" + std::string(32, 'g'), ".tmp-" + kDigits}) {
    dir.Write(name, "half");
  }
  fs::create_symlink("x.tmp12", dir.File(link));
  const int writer = open(dir.File(held).c_str(), O_RDONLY);
  ASSERT_EQ(flock(writer, LOCK_EX), 0);
  ZvReplacement writing;
  ASSERT_EQ(writing.Open(dir.File("alive").c_str(), 0644), 0);
  const std::string before = Names(dir);
  zv_remove_leftovers(dir.Path().c_str());
  std::string expected = before;
  EXPECT_EQ(Names(dir), expected.erase(expected.find("<" + dead), dead.size() + 2));
  EXPECT_EQ(writing.Keep(true), 0);
  close(writer);
  zv_remove_leftovers(dir.Path().c_str());
  EXPECT_FALSE(fs::exists(dir.File(held)));
  zv_remove_leftovers(dir.File("none").c_str());
}

// Who removes leftovers comes before the lock, and is gone, or still has the lock: as often as that
// goes on the file is made anew, and in the end nothing is left of any.
TEST(ReplaceTest, RemoversComeBeforeTheLock) {
  const struct {
    bool stays;
    int times;
    int code;
  } cases[] = {{false, 50, 0},
               {true, 50, 0},
               {false, 100'000, VESK2_ERR_FILE_OPEN},
               {true, 100'000, VESK2_ERR_FILE_OPEN}};
  for (const auto& row : cases) {
    const TempDir dir;
    dir.Write("x", "old");
    std::vector<int> removers;
    std::set<std::string> names;
    int left = row.times;
    beforeLock = [&](int fd) {
      if (left-- <= 0) return;
      names.insert(Names(dir));
      if (!row.stays) return zv_remove_leftovers(dir.Path().c_str());
      removers.push_back(open(("/proc/self/fd/" + std::to_string(fd)).c_str(), O_RDONLY));
      ASSERT_EQ(__real_flock(removers.back(), LOCK_EX | LOCK_NB), 0);
    };
    EXPECT_EQ(Write(dir.File("x"), "new"), row.code);
    beforeLock = nullptr;
    EXPECT_EQ(dir.Read("x"), row.code == 0 ? "new" : "old");
    EXPECT_TRUE(row.code != 0 || names.size() == 50U) << "each under a name of its own";
    for (const int fd : removers) close(fd);
    zv_remove_leftovers(dir.Path().c_str());
    EXPECT_EQ(Names(dir), "<x>");
  }
}

// Who removes leftovers never takes a writer's file away, at whatever moment it looks.
TEST(ReplaceTest, WritersAndRemoversMeet) {
  const TempDir dir;
  std::atomic<bool> done = false;
  std::thread remover([&] {
    while (!done) zv_remove_leftovers(dir.Path().c_str());
  });
  int failed = 0;
  for (int i = 0; i < 300; ++i) failed += Write(dir.File("x"), std::string(5000, 'x')) != 0;
  done = true;
  remover.join();
  EXPECT_EQ(failed, 0);
  EXPECT_EQ(dir.Read("x").size(), 5000U);
  EXPECT_EQ(Names(dir), "<x>");
}

}  // namespace
}  // namespace ZVsysutil
