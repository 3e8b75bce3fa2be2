// SPDX-License-Identifier: Apache-2.0
// Bodies against real trees and against each other: every row gives the exact lists.
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <sys/stat.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include <vesk2/manifest.h>

#include "tests/manifest/result_text.h"
#include "tests/support/held_file.h"
#include "tests/support/temp_dir.h"
#include "tests/support/test_manifest.h"
#include "tests/support/test_object.h"

using namespace vesk2test;
using ZvVesk2::Manifest;
namespace fs = std::filesystem;

namespace {

// Changes what is on disk at `path`: "+" writes a file, "-" removes, "P" puts a FIFO there, "S" a
// socket, "D" a directory, "L" a dangling link; "M" moves it elsewhere and leaves a link.
void Change(const TempDir& dir, char what, const std::string& path) {
  const std::string file = dir.File(path);
  if (what == '+') {
    dir.Write(path, "new");
    return;
  }
  if (what == 'M') {
    const std::string moved = dir.File(fs::path(path).filename().string() + "-moved");
    fs::rename(file, moved);
    fs::create_symlink(moved, file);
    return;
  }
  fs::remove_all(file);
  if (what == 'P' || what == 'S') {
    ASSERT_EQ(mknod(file.c_str(), (what == 'P' ? S_IFIFO : S_IFSOCK) | 0600, 0), 0);
  }
  if (what == 'D') fs::create_directory(file);
  if (what == 'L') fs::create_symlink("nowhere", file);
}

// The tree is a, b, s/f, s/d/g.
constexpr struct {
  const char* changes;
  const char* ignored;
  int code;
  const char* findings;
} kDiskCases[] = {
    {"", "", 0, "V:s/ s/d/ s/d/g s/f b a I: M: X:"},
    // The root is not searched for extra entries.
    {"+x +new/y", "", 0, "V:s/ s/d/ s/d/g s/f b a I: M: X:"},
    // What is extra makes the directories above extra, unless something worse is in them.
    {"+s/d/x +s/d/q/y", "", kExtra, "V:s/d/g s/f b a I: M: X:s/ s/d/ s/d/x s/d/q/"},
    {"+s/d/x -s/f", "", kDiffers, "V:s/d/g b a I:s/ M:s/f X:s/d/ s/d/x"},
    {"-a +s/x", "", kMissing, "V:s/d/ s/d/g s/f b I: M:a X:s/ s/x"},
    // Below the root a missing file makes its directory invalid.
    {"-s/f", "", kDiffers, "V:s/d/ s/d/g b a I:s/ M:s/f X:"},
    {"-a +b", "", kDiffers, "V:s/ s/d/ s/d/g s/f I:b M:a X:"},
    // A missing directory is recorded by itself and by its parent.
    {"-s/d", "", kDiffers, "V:s/f b a I:s/ s/d/ s/d/ M:s/d/g X:"},
    // Contents count, not links; what is no regular file is missing, and nothing blocks.
    {"Ma Ms/d", "", 0, "V:s/ s/d/ s/d/g s/f b a I: M: X:"},
    {"Pa Sb Ps/f Ps/x", "", kDiffers, "V:s/d/ s/d/g I:s/ M:s/f b a X:s/x"},
    {"Da Lb", "", kMissing, "V:s/ s/d/ s/d/g s/f I: M:b a X:"},
    {"-s/d +s/d", "", kDiffers, "V:s/f b a I:s/ s/d/ s/d/ M:s/d/g X:s/d"},
    // Ignored names count for their directory only, for files also behind directories of larger
    // names, and what is in an ignored directory does not matter.
    {"+a +s/f +s/x +s/a", "a s/x s/f f x", kExtra, "V:s/d/ s/d/g b I: M: X:s/ s/a"},
    {"+s/a0 +s/zz/y", "s/a0 s/zz", 0, "V:s/ s/d/ s/d/g s/f b a I: M: X:"},
    {"+s/d/x +s/x", "s/d/x s/x", 0, "V:s/ s/d/ s/d/g s/f b a I: M: X:"},
    {"-s", "s", 0, "V:b a I: M: X:"},
};

// Lends threads; none where `count` is 0.
struct Threads {
  unsigned count;
  ZvVesk2::Vesk2TaskRunner Runner() {
    return {this, [](void* self, void (*task)(void*), void* work) {
              std::vector<std::thread> threads(static_cast<Threads*>(self)->count);
              for (std::thread& thread : threads) thread = std::thread(task, work);
              for (std::thread& thread : threads) thread.join();
            }};
  }
};

TEST(BodyVerify, FindsWhatDiffers) {
  for (const auto& row : kDiskCases) {
    TempDir dir;
    for (const char* name : {"a", "b", "s/f", "s/d/g"}) dir.Write(name, name);
    const std::string body = BodyOf(dir.Path());
    std::istringstream changes(row.changes);
    for (std::string word; changes >> word;) Change(dir, word[0], word.substr(1));
    // A separator at the end must not switch the ignored names off, nor do threads count.
    for (const std::string end : {"", "/", "//"}) {
      Manifest manifest(nullptr);
      Ignore(manifest, row.ignored);
      Threads threads{static_cast<unsigned>(end.size()) * 3};
      const ZvVesk2::Vesk2TaskRunner runner = threads.Runner();
      manifest.SetTaskRunner(end == "/" ? nullptr : &runner);
      const std::string root = dir.Path() + end;
      EXPECT_EQ(manifest.Verify(Wrap(body).get(), root.c_str()), row.code) << row.changes;
      EXPECT_EQ(Findings(manifest, end.empty() ? root + "/" : root), row.findings) << row.changes;
    }
  }
}

TEST(BodyVerify, DuplicatesAreCheckedEachAndIgnoredOneByOne) {
  TempDir dir;
  for (const char* name : {"a", "b"}) dir.Write(name, name);
  const std::string twice = FileEntry("a", "a") + FileEntry("b", "b") + FileEntry("b", "b");
  Manifest manifest(nullptr);
  Ignore(manifest, "b");
  EXPECT_EQ(manifest.Verify(Wrap(Body(twice + FileEntry("a", ""))).get(), dir.Path().c_str()),
            kDiffers);
  EXPECT_EQ(Findings(manifest, dir.Path() + "/"), "V:b a I:a M: X:");
}

// The reason of the entry whose path ends in `name`, of whichever list.
int ReasonOf(const Manifest& manifest, const std::string& name) {
  int reason = -1;
  for (const ZvVesk2::FileItem* item :
       {manifest.GetValid(), manifest.GetInvalid(), manifest.GetMissing(), manifest.GetExtra()}) {
    for (; item != nullptr; item = item->next) {
      const std::string path = item->name;
      if (!path.ends_with(name)) continue;
      EXPECT_TRUE(reason == -1 || reason == manifest.GetReason(item)) << path;
      reason = manifest.GetReason(item);
    }
  }
  return reason;
}

TEST(BodyVerify, TellsWhatWasNotCompared) {
  TempDir dir;
  for (const char* name : {"a", "b", "c", "d", "s/f", "t/f"}) dir.Write(name, name);
  const std::string body = BodyOf(dir.Path());
  fs::remove(dir.File("b"));
  dir.Write("c", "C");
  fs::remove_all(dir.File("s"));
  const HeldFiles held({dir.File("a")});
  Manifest manifest(nullptr);
  ZVsysutil::ZvCall call;
  for (int run = 1; run <= 2; ++run) {  // the second adds to the first
    EXPECT_EQ(manifest.Verify(Wrap(body).get(), dir.Path().c_str()), kDiffers);
    EXPECT_EQ(call.Waited(), HeldFiles::kWait);
    const std::pair<const char*, int> reasons[] = {
        {"/a", VESK2_ERR_FILE_OPEN},
        {"/b", VESK2_ERR_FILE_OPEN},
        {"/c", 0},
        {"/d", 0},
        {"/s", VESK2_ERR_FIND_DIR},
        {"/t", 0},
        {"/t/f", 0},
    };
    for (const auto& [name, reason] : reasons) EXPECT_EQ(ReasonOf(manifest, name), reason) << name;
  }
  EXPECT_TRUE(Findings(manifest, dir.Path() + "/").ends_with(" M:s/f b s/f b X:"));
  EXPECT_EQ(manifest.GetReason(nullptr), 0);
}

// A deep tree of many files gives the same on one thread and on many, with few descriptors.
TEST(BodyVerify, NeedsFewDescriptorsAndHasOneOrder) {
  constexpr int kLevels = 200;
  TempDir dir;
  std::string path, inside;
  for (int level = 1; level <= kLevels; ++level) {
    path += "d/";
    for (const char* name : {"a", "b", "c"}) dir.Write(path + name, name);
    if (level % 7 == 0) dir.Write(path + "more", "");
  }
  for (int level = kLevels; level > 0; --level) {
    inside = DirEntry("d", FileEntry("c", "c") + FileEntry("a", level % 5 == 0 ? "A" : "a") +
                               FileEntry("b", "b") + FileEntry("gone", "") + inside);
  }
  std::vector<std::string> findings;
  for (unsigned count : {0u, 1u, 4u}) {
    Manifest manifest(nullptr);
    Threads threads{count};
    const ZvVesk2::Vesk2TaskRunner runner = threads.Runner();
    manifest.SetTaskRunner(count > 0 ? &runner : nullptr);
    rlimit limit{};
    getrlimit(RLIMIT_NOFILE, &limit);
    rlimit few = limit;
    few.rlim_cur = 100;
    ASSERT_EQ(setrlimit(RLIMIT_NOFILE, &few), 0);
    EXPECT_EQ(manifest.Verify(Wrap(Body(inside)).get(), dir.Path().c_str()), kDiffers);
    setrlimit(RLIMIT_NOFILE, &limit);
    findings.push_back(Findings(manifest, dir.Path() + "/"));
  }
  EXPECT_TRUE(findings[0].starts_with("V:" + path + "c " + path + "b "));
  EXPECT_NE(findings[0].find(" I:d/ d/d/ "), std::string::npos);
  EXPECT_NE(findings[0].find(" X:d/d/d/d/d/d/d/more "), std::string::npos);
  EXPECT_EQ(findings[1], findings[0]);
  EXPECT_EQ(findings[2], findings[0]);
}

// Whichever thread waits, all of them wait as long as one would.
TEST(BodyVerify, WaitsOnceOnAllThreads) {
  TempDir dir;
  std::vector<std::string> paths;
  std::string entries;
  for (int i = 0; i < 20; ++i) {
    paths.push_back(dir.Write(std::to_string(i), "x"));
    entries += FileEntry(std::to_string(i), "x");
  }
  const HeldFiles held(paths);
  Manifest manifest(nullptr);
  Threads threads{3};
  const ZvVesk2::Vesk2TaskRunner runner = threads.Runner();
  manifest.SetTaskRunner(&runner);
  ZVsysutil::ZvCall call;
  EXPECT_EQ(manifest.Verify(Wrap(Body(entries)).get(), dir.Path().c_str()), kDiffers);
  EXPECT_EQ(call.Waited(), HeldFiles::kWait);
}

// Paths that are too long to be opened are findings like others, and the search goes on.
TEST(BodyVerify, GoesOnBehindLongPaths) {
  constexpr size_t kLength = 3841;  // with a "/" and 255 bytes more than can be opened
  const std::string longest(255, 'x');
  TempDir dir;
  dir.Write("extra/y", "y");
  std::string path = dir.Path() + "/s";
  fs::create_directory(path);
  std::vector<std::string> parts;
  while (path.size() < kLength) {
    parts.emplace_back(std::min<size_t>(200, kLength - path.size() - 1), 'd');
    path += "/" + parts.back();
    fs::create_directory(path);
  }
  std::ofstream(path + "/f") << "f";
  fs::current_path(path);
  std::ofstream(std::string(longest)) << "x";
  fs::current_path("/");
  std::string inside = FileEntry("f", "f");
  for (; !parts.empty(); parts.pop_back()) inside = DirEntry(parts.back(), inside);
  const std::string body = Body(DirEntry("s", inside) + DirEntry("extra", ""));
  {
    Manifest manifest(nullptr);
    Ignore(manifest, std::string(5000, 'i'));
    EXPECT_EQ(manifest.Verify(Wrap(body).get(), dir.Path().c_str()), kExtra);
    EXPECT_EQ(std::string(manifest.GetValid()->name), path + "/f");
    EXPECT_EQ(std::string(manifest.GetExtra()->name), dir.Path() + "/s");
    EXPECT_NE(Findings(manifest).find(path + "/" + longest), std::string::npos);
    EXPECT_NE(Findings(manifest).find("/extra/y"), std::string::npos);
  }
  // From a root that is long itself, all below is missing, and the body no more malformed than
  // from "/".
  Manifest manifest(nullptr);
  EXPECT_EQ(manifest.Verify(Wrap(body).get(), path.c_str()), kDiffers);
  EXPECT_EQ(std::string(manifest.GetMissing()->name).substr(path.size(), 3), "/s/");
  // Listed directories that nobody can open are changed.
  EXPECT_EQ(manifest.Verify(Wrap(Body(DirEntry(longest, ""))).get(), path.c_str()), kDiffers);
  // Without the names that are too long, TempDir could not remove its own.
  fs::current_path(path);
  fs::remove(longest);
  fs::current_path("/");
}

TEST(BodyVerify, RefusesNull) {
  Manifest manifest(nullptr);
  EXPECT_EQ(manifest.Verify(nullptr, "/"), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(manifest.Verify(Wrap(Body("")).get(), nullptr), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(manifest.Compare(nullptr, Wrap(Body("")).get()), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(manifest.Compare(Wrap(Body("")).get(), nullptr), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(manifest.Compare(Wrap(Body("")).get(), Wrap("(4:body").get()), VESK2_ERR_PARSE_FILE);
}

TEST(BodyCompare, FindsWhatDiffers) {
  const std::string a = FileEntry("a", "a"), b = FileEntry("b", "b"), c = FileEntry("c", "c");
  const std::string changed = FileEntry("b", "B");
  const std::string s = DirEntry("s", a + DirEntry("t", b));
  const std::string sa = DirEntry("s", a), sab = DirEntry("s", a + b);
  const struct {
    std::string reference, other;
    const char* ignored;
    int code;
    const char* findings;
  } cases[] = {
      {a + s, s + a, "", 0, "V:s/ s/t/ s/t/b s/a a I: M: X:"},
      {a + b, changed + c, "", kDiffers, "V: I:b M:a X:c"},
      {a, a + b, "", kExtra, "V:a I: M: X:b"},
      {a + b, a, "", kMissing, "V:a I: M:b X:"},
      // Whole subtrees, the directory first; nothing inside is ignored.
      {s, a, "s/a", kMissing, "V: I: M:s/t/b s/t/ s/a s/ X:a"},
      {a, s + a, "", kExtra, "V:a I: M: X:s/t/b s/t/ s/a s/"},
      // Any difference inside makes both directories of that name invalid, also extra files.
      {sa, sab, "", kDiffers, "V:s/a I:s/ M: X:s/b"},
      {sa, sab, "b", kDiffers, "V:s/a I:s/ M: X:s/b"},
      {sa, sab, "s/b", 0, "V:s/ s/a I: M: X:"},
      {s, a, "s", kExtra, "V: I: M: X:a"},
      {a, s + a, "s", 0, "V:a I: M: X:"},
      {a + b, changed + c, "a b c", 0, "V: I: M: X:"},
      // The reference's list decides while both sides last, then each side's own.
      {b + c, b + b + c, "b", kExtra, "V:c I: M: X:b"},
      {b, b + b, "b", 0, "V: I: M: X:"},
  };
  for (const auto& row : cases) {
    Manifest manifest(nullptr);
    Ignore(manifest, row.ignored);
    const int code = manifest.Compare(Wrap(Body(row.reference)).get(), Wrap(Body(row.other)).get());
    EXPECT_EQ(code, row.code) << row.findings;
    EXPECT_EQ(Findings(manifest), row.findings);
  }
}

}  // namespace
