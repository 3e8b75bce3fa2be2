// SPDX-License-Identifier: Apache-2.0
// What stands at the place of an installation, whatever happens meanwhile: the command is killed,
// or a system call of it fails, at each call that changes something; somebody changes the source
// all the time; the file system cannot do what is needed.
//
// VESK2_SWEEP_ALL kills at every system call, VESK2_SWAPS says how often the source is swapped.
#include <gtest/gtest.h>

#include <fcntl.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <map>
#include <random>
#include <string>
#include <vector>

#include "tests/sweep/scenes.h"
#include "tests/tools/traced_command.h"

static bool cannotExchange = false;
extern "C" {
int __real_renameat2(int from, const char* name, int to, const char* other, unsigned flags);
int __wrap_renameat2(int from, const char* name, int to, const char* other, unsigned flags) {
  if (!cannotExchange || flags != RENAME_EXCHANGE) {
    return __real_renameat2(from, name, to, other, flags);
  }
  errno = EINVAL;
  return -1;
}
}

namespace vesk2test {
namespace {

namespace fs = std::filesystem;
using Tree = std::map<std::string, std::string>;  // what is at each path below

Tree Look(const std::string& root) {
  Tree tree;
  if (!fs::exists(fs::symlink_status(root))) return {{"", "nothing"}};
  for (const auto& each : fs::recursive_directory_iterator(root)) {
    const std::string path = fs::relative(each.path(), root);
    struct stat status = {};
    EXPECT_EQ(lstat(each.path().c_str(), &status), 0);
    std::string text = std::to_string(status.st_mode);
    if (each.is_symlink()) {
      text += " -> " + fs::read_symlink(each).string();
    } else if (each.is_regular_file()) {
      const std::unique_ptr<FILE, int (*)(FILE*)> file(fopen(each.path().c_str(), "r"), fclose);
      char bytes[1000];
      text += " " + std::string(bytes, fread(bytes, 1, sizeof bytes, file.get()));
    }
    tree[path] = text;
  }
  return tree;
}

// ---- The place ----

// Where files are synced at once, if there is such a place.
Scenes MakeQuickScenes() {
  if (access("/dev/shm", W_OK) == 0) setenv("TMPDIR", "/dev/shm", 0);
  return MakeScenes();
}

// A machine that trusts the signer of a tree, and a directory to install in.
class InstallTest : public testing::Test {
 protected:
  InstallTest() : scenes_(MakeQuickScenes()), scene_(*scenes_.front()) {
    EXPECT_EQ(scene_.ask(), 0);  // with which libcrypto is ready
    fs::create_directory(scene_.File("place"));
    fs::copy(scene_.File("tree"), scene_.File("source"), fs::copy_options::recursive);
    EXPECT_EQ(RunCommand(Install({})), 0);
    new_ = Look(Dest());
    EXPECT_EQ(new_.size(), 3U);
  }

  std::string Dest() const { return scene_.File("place/app"); }
  Words Install(const Words& options) const {
    Words words = {"manifest",
                   "install",
                   scene_.File("source"),
                   scene_.File("tree.manifest"),
                   Dest(),
                   "--tag",
                   "(install (app calc))",
                   "--acl-dir",
                   scene_.File("extra"),
                   "--global",
                   scene_.File("global"),
                   "--home",
                   scene_.File("home")};
    words.insert(words.end(), options.begin(), options.end());
    return words;
  }

  // With what is to be replaced there, or nothing.
  void Prepare(bool replaces) {
    fs::remove_all(scene_.File("place"));
    fs::create_directory(scene_.File("place"));
    if (replaces) {
      scene_.Write("place/app/sub/old", "old\n");
      scene_.Write("place/app/other", "old\n");
    }
    old_ = Look(Dest());
  }

  // Whether nothing else is there.
  bool IsTidy() const {
    for (const auto& each : fs::directory_iterator(scene_.File("place"))) {
      const std::string name = each.path().filename();
      if (name != "app" && name != "kept") return false;
    }
    return true;
  }

  // What is there after a run that did not come to its end, and that the next one gets by.
  void Judge(const Outcome& outcome, const Words& options, const std::string& point) {
    const Tree found = Look(Dest());
    EXPECT_TRUE(found == old_ || found == new_) << point;
    EXPECT_TRUE(outcome.exit != 0 || found == new_) << point;
    const bool keeps = !options.empty() && options[0] == "--keep-old";
    const Tree kept = Look(scene_.File("place/kept"));
    EXPECT_TRUE(!keeps || found == old_ || kept == old_) << point;
    const bool free = !fs::exists(scene_.File("place/kept"));
    const Words again = keeps && free ? options : Words{"--replace"};
    EXPECT_EQ(RunCommand(Install(again)), 0) << point;
    EXPECT_EQ(Look(Dest()), new_) << point;
    EXPECT_TRUE(IsTidy()) << point;
  }

  const Scenes scenes_;
  const Scene& scene_;
  Tree old_, new_;
};

// Where a lock cannot be had, nobody has one; what cannot be removed stays.
bool IsForgiven(uint64_t call) {
#ifdef SYS_rmdir
  if (call == SYS_rmdir || call == SYS_unlink) return true;
#endif
  return call == SYS_flock || call == SYS_unlinkat;
}

const std::vector<Words> kWays = {{}, {"--replace"}, {"--keep-old", "kept"}};

TEST_F(InstallTest, KilledAnywhereTheOldOrTheWholeNewOneIsThere) {
  const bool all = std::getenv("VESK2_SWEEP_ALL") != nullptr;
  for (const Words& options : kWays) {
    long n = 0;
    for (;; ++n) {
      Prepare(!options.empty());
      const Outcome outcome =
          RunTo(CommandOf(Install(options)), {n, kKill, all ? Calls::kEvery : Calls::kChanging});
      if (!outcome.reached) break;
      Judge(outcome, options,
            "killed before " + std::to_string(n) + ", call " + std::to_string(outcome.call));
      if (HasFailure()) return;
    }
    std::printf("%s: killed %ld times\n", options.empty() ? "new" : options[0].c_str(), n);
    EXPECT_GE(n, 25);
  }
}

TEST_F(InstallTest, WhateverFailsNothingElseIsAccepted) {
#ifndef __x86_64__
  GTEST_SKIP() << "calls cannot be failed on this machine";
#endif
  for (const Words& options : kWays) {
    long n = 0;
    for (;; ++n) {
      Prepare(!options.empty());
      const Outcome outcome = RunTo(CommandOf(Install(options)), {n, EIO});
      if (!outcome.reached) break;
      const std::string point =
          "failed: " + std::to_string(n) + ", call " + std::to_string(outcome.call);
      const bool forgiven = IsForgiven(outcome.call);
      EXPECT_TRUE(forgiven || outcome.exit == 2) << point << ": " << outcome.exit;
      Judge(outcome, options, point);
      if (HasFailure()) return;
    }
    std::printf("%s: failed %ld times\n", options.empty() ? "new" : options[0].c_str(), n);
  }
}

TEST_F(InstallTest, NothingIsCopiedWhereDirectoriesCannotBeExchanged) {
  Prepare(false);
  cannotExchange = true;
  EXPECT_EQ(RunCommand(Install({})), 2);
  cannotExchange = false;
  EXPECT_TRUE(fs::is_empty(scene_.File("place")));
}

// ---- Somebody at the source ----

// Changes the source, again and again: what is signed, and what is not.
[[noreturn]] void Swap(const Scene& scene, unsigned seed) {
  std::minstd_rand random(seed);
  const std::string one = scene.File("source/one");
  const std::string sub = scene.File("source/sub");
  const auto put = [&](const auto& make, const std::string& at) {
    std::error_code error;
    fs::remove_all(scene.File("next"), error);
    make(scene.File("next"));
    fs::rename(scene.File("next"), at, error);
  };
  // Into the file that is there; a link, a pipe or a directory stays as it is.
  const auto write = [&](const std::string& at, std::string_view bytes) {
    const int file = open(at.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_NOFOLLOW | O_NONBLOCK, 0644);
    (void)!::write(file, bytes.data(), bytes.size());
    close(file);
  };
  signal(SIGPIPE, SIG_IGN);
  std::error_code error;
  for (;;) {
    switch (random() % 8) {
      case 0:
        write(one, "evil");
        break;
      case 1:
        put([&](const auto& at) { fs::create_symlink("../secret/two", at); }, one);
        break;
      case 2:
        put([&](const auto& at) { fs::create_symlink(scene.File("secret"), at); }, one);
        break;
      case 3:
        put([&](const auto& at) { mkfifo(at.c_str(), 0600); }, one);
        break;
      case 4:
        fs::rename(sub, scene.File("aside"), error);
        fs::create_directory_symlink("../secret", sub, error);
        break;
      default:  // what was signed, mostly
        put([&](const auto& at) { write(at, "one\n"); }, one);
        if (fs::is_symlink(sub, error)) fs::remove(sub, error);
        fs::rename(scene.File("aside"), sub, error);
    }
    usleep(static_cast<useconds_t>(random() % 2000));
  }
}

TEST_F(InstallTest, ASourceThatIsSwappedNeverGivesWhatIsNotListed) {
  const char* const text = std::getenv("VESK2_SWAPS");
  const int runs = text != nullptr ? std::atoi(text) : 50;
  scene_.Write("secret/two", "evil\n");
  scene_.Write("secret/three", "evil\n");
  const pid_t swapper = fork();
  if (swapper == 0) Swap(scene_, 1);
  Prepare(false);
  int installed = 0;
  for (int i = 0; i < runs && !HasFailure(); ++i) {
    const int exit = RunCommand(Install({}));
    EXPECT_NE(exit, kKilled);
    installed += exit == 0;
    EXPECT_EQ(Look(Dest()), exit == 0 ? new_ : old_);
    EXPECT_TRUE(IsTidy());
    fs::remove_all(Dest());
  }
  EXPECT_EQ(waitpid(swapper, nullptr, WNOHANG), 0) << "the swapper has stopped";
  kill(swapper, SIGKILL);
  waitpid(swapper, nullptr, 0);
  std::printf("%d of %d installed\n", installed, runs);
}

}  // namespace
}  // namespace vesk2test
