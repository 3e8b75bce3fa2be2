// SPDX-License-Identifier: Apache-2.0
// Trees that fight back: names that only bytes tell apart, what is no file or must not be read, and
// files that change while they are read.
#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>
#include <sys/wait.h>
#include <unistd.h>

#include <filesystem>
#include <functional>
#include <string>
#include <utility>
#include <vector>

#include <vesk2/manifest.h>

#include "tests/manifest/result_text.h"
#include "tests/support/temp_dir.h"
#include "tests/support/test_manifest.h"
#include "tests/support/test_object.h"

using namespace vesk2test;
using ZvVesk2::Manifest;
namespace fs = std::filesystem;

namespace {

// The findings about a tree, behind the code.
std::string Ask(const TempDir& dir, const std::string& body,
                const Vesk2FileCallbacks* callbacks = nullptr) {
  Manifest manifest(nullptr);
  if (manifest.SetFileCallbacks(callbacks) != 0) return "no callbacks";
  const int code = manifest.Verify(Wrap(body).get(), dir.Path().c_str());
  return std::to_string(code) + " " + Findings(manifest, dir.Path() + "/");
}
std::string Expect(int code, const char* findings) { return std::to_string(code) + " " + findings; }

TEST(HostileTree, NamesAreBytes) {
  const std::string names[] = {std::string(255, 'n'),
                               std::string(254, 'n'),
                               "a\nb",
                               "a b",
                               "\xff\xfe",
                               "\xff",
                               "TWIN",
                               "twin",
                               "gr\xc3\xbcn",
                               "gru\xcc\x88n",
                               " ",
                               "...",
                               "-rf",
                               "a\\b",
                               "\x1b[2J"};
  TempDir dir;
  std::string entries;
  for (const std::string& name : names) {
    dir.Write("s/" + name, name);
    entries += FileEntry(name, name);
  }
  const std::string body = Body(DirEntry("s", entries));
  EXPECT_TRUE(Ask(dir, body).ends_with(" I: M: X:"));
  // Each is looked at by itself, and its neighbour does not stand in for it.
  for (const std::string& name : names) {
    fs::rename(dir.File("s/" + name), dir.File("aside"));
    const std::string gone = Ask(dir, body);
    EXPECT_TRUE(gone.ends_with(" I:s/ M:s/" + name + " X:")) << gone;
    fs::copy_file(dir.File("s/" + (name == names[0] ? names[1] : names[0])), dir.File("s/" + name));
    const std::string other = Ask(dir, body);
    EXPECT_TRUE(other.ends_with(" I:s/ s/" + name + " M: X:")) << other;
    fs::rename(dir.File("aside"), dir.File("s/" + name));
  }
  dir.Write("s/Twin", "twin");
  EXPECT_TRUE(Ask(dir, body).starts_with(std::to_string(kExtra)));
}

TEST(HostileTree, WhatIsNoFileOrCannotBeReadIsMissing) {
  const auto link = [](const char* to) {
    return [to](const std::string& path) { fs::create_symlink(to, path); };
  };
  const auto closed = [](const std::string& path) {
    TempDir elsewhere;
    fs::copy(elsewhere.Write("f", ""), path);
    ASSERT_EQ(chmod(path.c_str(), 0), 0);
  };
  // The tree is e (empty) and d/f; each row puts something else at one path.
  const struct {
    const char* path;
    std::function<void(const std::string&)> put;
    int code;
    const char* findings;
  } rows[] = {
      {"e", link("e"), kMissing, "V:d/ d/f I: M:e X:"},
      {"e", link("d"), kMissing, "V:d/ d/f I: M:e X:"},
      {"e", link("/dev/null"), kMissing, "V:d/ d/f I: M:e X:"},
      // Which has no bytes by its size, and is full of them.
      {"e", link("/proc/version"), kDiffers, "V:d/ d/f I:e M: X:"},
      {"e", closed, kMissing, "V:d/ d/f I: M:e X:"},
      {"d/f", closed, kDiffers, "V:e I:d/ M:d/f X:"},
      {"d", link("d"), kDiffers, "V:e I:d/ d/ M:d/f X:"},
      {"d", link("/proc/self/fd"), kDiffers, nullptr},
      // A directory that holds itself.
      {"d", link("."), kDiffers, nullptr},
      {"d",
       [](const std::string& path) {
         fs::create_directory(path);
         ASSERT_EQ(chmod(path.c_str(), 0), 0);
       },
       kDiffers, "V:e I:d/ d/ M:d/f X:"},
  };
  const std::string body = Body(FileEntry("e", "") + DirEntry("d", FileEntry("f", "")));
  for (const auto& row : rows) {
    TempDir dir;
    dir.Write("e", "");
    dir.Write("d/f", "");
    chmod(dir.Path().c_str(), 0755);
    fs::remove_all(dir.File(row.path));
    row.put(dir.File(row.path));
    // As a user who may not read everything.
    const pid_t child = fork();
    if (child == 0) {
      constexpr id_t kNobody = 65534;
      if (geteuid() == 0 && (setgid(kNobody) != 0 || setuid(kNobody) != 0)) _exit(9);
      const std::string answer = Ask(dir, body);
      const bool right = row.findings != nullptr
                             ? answer == Expect(row.code, row.findings)
                             : answer.starts_with(std::to_string(row.code) + " ");
      if (!right) std::fprintf(stderr, "%s\n", answer.c_str());
      _exit(right ? 0 : 1);
    }
    int status = -1;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    EXPECT_EQ(status, 0) << row.path << ", " << (row.findings != nullptr ? row.findings : "");
  }
}

// What is done to a file when half of it has been read.
struct Change {
  std::function<void(const std::string&)> make;
  std::string path;
  bool made = false;
};
int MakeChange(void* user, uint64_t) {
  auto& change = *static_cast<Change*>(user);
  if (!std::exchange(change.made, true)) change.make(change.path);
  return 0;
}

TEST(HostileTree, WhatCountsIsWhatWasRead) {
  const std::string contents(300'000, 'x');
  const auto put = [](const std::string& path, int flags, const std::string& bytes, off_t at) {
    const int file = open(path.c_str(), O_WRONLY | flags, 0600);
    EXPECT_EQ(pwrite(file, bytes.data(), bytes.size(), at), static_cast<ssize_t>(bytes.size()));
    close(file);
  };
  const struct {
    const char* name;
    std::function<void(const std::string&)> make;
    int code;
  } rows[] = {
      {"as it was", [](const std::string&) {}, 0},
      {"grows", [&](const std::string& path) { put(path, 0, "more", 300'000); }, kDiffers},
      {"grows far", [&](const std::string& path) { put(path, 0, "more", 1 << 20); }, kDiffers},
      {"shrinks", [](const std::string& path) { EXPECT_EQ(truncate(path.c_str(), 70'000), 0); },
       kDiffers},
      {"is emptied", [](const std::string& path) { EXPECT_EQ(truncate(path.c_str(), 0), 0); },
       kDiffers},
      {"changes at its end", [&](const std::string& path) { put(path, 0, "y", 299'999); },
       kDiffers},
      // The one that was opened is read to its end, under whatever name.
      {"is removed", [](const std::string& path) { fs::remove(path); }, 0},
      {"is swapped",
       [&](const std::string& path) {
         put(path + "2", O_CREAT, "y", 0);
         fs::rename(path + "2", path);
       },
       0},
  };
  const std::string body = Body(FileEntry("f", contents));
  for (const auto& row : rows) {
    TempDir dir;
    Change change{row.make, dir.Write("f", contents)};
    const Vesk2FileCallbacks callbacks{sizeof callbacks, &change, nullptr, MakeChange, nullptr};
    const char* const findings = row.code == 0 ? "V:f I: M: X:" : "V: I:f M: X:";
    EXPECT_EQ(Ask(dir, body, &callbacks), Expect(row.code, findings)) << row.name;
    EXPECT_TRUE(change.made) << row.name;
  }
}

}  // namespace
