// SPDX-License-Identifier: Apache-2.0
// Every writer of a store or a file is killed at each system call that changes something, and has
// system calls fail. What it wrote to is then as it was or as it was to be, and can be read. After
// a kill the next run gets by, and nothing that the dead one left stays; a failure is told, and
// nothing is left. (manifest install: install_test.cpp.)
//
// VESK2_SWEEP_ALL kills at every system call, and fails all that have to do with files.
#include <gtest/gtest.h>

#include <sched.h>
#include <sys/mount.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <map>
#include <string>
#include <vector>

#include "tests/support/temp_dir.h"
#include "tests/support/test_key.h"
#include "tests/support/test_text.h"
#include "tests/tools/traced_command.h"

#include <vesk2.h>
#include <vesk2.hpp>

namespace vesk2test {
namespace {

namespace fs = std::filesystem;
using Files = std::map<std::string, std::string>;  // bytes by path

// Where files are synced at once, if there is such a place.
bool UseMemory() { return access("/dev/shm", W_OK) != 0 || setenv("TMPDIR", "/dev/shm", 0) == 0; }

#ifdef SYS_unlink
constexpr uint64_t kUnlink = SYS_unlink;
#else
constexpr uint64_t kUnlink = SYS_unlinkat;
#endif

struct Writer {
  const char* name;
  Words words;
  Words again = {};       // run after a kill, if other words are to do the same
  bool refused = false;   // whether the second of two complete runs may be refused
  bool forgives = false;  // whether it succeeds also with nothing written
};

// What fails, and how many points lie between two that are tried, unless all are.
const struct {
  Calls calls;
  int error;
  bool lasting;
  long stride;
} kFailures[] = {
    {Calls::kChanging, EIO, false, 1},   {Calls::kChanging, ENOSPC, true, 1},
    {Calls::kOfFiles, EIO, false, 11},   {Calls::kOfFiles, EMFILE, true, 23},
    {Calls::kTransfers, kHalf, true, 7},
};

bool WantsAll() { return std::getenv("VESK2_SWEEP_ALL") != nullptr; }

class Writers : public testing::Test {
 protected:
  Writers() {
    const char* const names[] = {"vendor", "signer", "revoker", "other"};
    for (unsigned i = 0; i < std::size(names); ++i) {
      dir_.Write(names[i] + std::string(".pem"), TestKey::Rsa(i).PrivatePem());
      dir_.Write(names[i] + std::string(".pub"), TestKey::Rsa(i).Public());
    }
    dir_.Write("tree/one", "one\n");
    dir_.Write("tree/sub/two", "two\n");
    fs::create_directory(At("home"));
    const std::string key = At("vendor.pem");
    Make({"acl", "grant", "--subject", At("vendor.pub"), "--tag", "(install)", "--propagate"});
    Make({"cert", "issue", "--key", key, "--subject", At("signer.pub"), "--tag", "(install)",
          "--propagate", "-o", At("one.cert")});
    Make({"cert", "issue", "--key", At("other.pem"), "--subject", At("signer.pub"), "--tag",
          "(install)", "-o", At("two.cert")});
    Make(List("old.crl", "2037", {"--grant", "--import"}));
    Make(List("new/next.crl", "2038", {"--revoke-key", At("other.pub")}));
    dir_.Write("new/more.acl", AclEntryText(TestKey::Rsa(3).Public(), Tag("other")));
    Make(Sign("m", {}));
    Make(Sign("carries", {"--crl", At("new/next.crl")}));
    Make({"floor", "set", "--tag", "(install)", "--floor", At("f"), "2024"});
    before_ = Look();
  }

  std::string At(const std::string& file) const { return dir_.File(file); }
  Words List(const std::string& file, const char* end, const Words& options) {
    fs::create_directories(fs::path(At(file)).parent_path());
    return Join({"crl", "issue", "--key", At("revoker.pem"), "--tag", "calc (revoke all)",
                 "--not-after", end, "-o", At(file)},
                options);
  }
  Words Sign(const char* file, const Words& options) const {
    return Join({"manifest", "sign", At("tree"), "--key", At("signer.pem"), "--cert",
                 At("one.cert"), "--at", "2025", "-o", At(file)},
                options);
  }
  Words Verify(const char* file, const Words& options) const {
    return Join({"manifest", "verify", At("tree"), At(file), "--tag", "(install)"}, options);
  }
  static Words Join(Words words, const Words& more) {
    words.insert(words.end(), more.begin(), more.end());
    return words;
  }
  Task CommandHere(const Words& words) const {
    return CommandOf(Join(words, {"--home", At("home"), "--global", At("global")}));
  }
  void Make(const Words& words) const { ASSERT_EQ(RunTask(CommandHere(words)), 0) << words[1]; }

  Files Look() const {
    Files files;
    for (const auto& each : fs::recursive_directory_iterator(dir_.Path())) {
      const std::string path = fs::relative(each.path(), dir_.Path());
      if (each.is_regular_file()) files[path] = dir_.Read(path);
    }
    return files;
  }
  void Restore() const {
    for (const auto& each : fs::directory_iterator(dir_.Path())) fs::remove_all(each.path());
    fs::create_directory(At("home"));
    for (const auto& [path, bytes] : before_) dir_.Write(path, bytes);
  }

  // Whether the files of a run are whole: those that are the same after each run byte by byte,
  // others, which hold something random, for the command.
  bool IsWhole(const std::string& path, const std::string& bytes) const {
    if (stable_.contains(path)) return stable_.at(path) == bytes;
    const bool key = path.ends_with(".pem") || path.ends_with(".pub");
    const Words words = key ? Words{"key", "show", At(path)} : Words{"show", At(path)};
    return RunTask(CommandHere(words)) == 0;
  }

  // What is there after two complete runs, each from the beginning.
  void Learn(const Task& task) {
    Files runs[2];
    for (Files& files : runs) {
      Restore();
      EXPECT_EQ(RunTask(task), 0);
      files = Look();
    }
    after_ = runs[0];
    stable_.clear();
    for (const auto& each : runs[1]) {
      if (after_.contains(each.first) && after_[each.first] == each.second) stable_.insert(each);
    }
    EXPECT_NE(after_, before_);
  }

  // What a run that was killed has left: the old files or whole new ones, and temporary ones.
  void JudgeKilled(const std::string& point) const {
    const Files found = Look();
    for (const auto& [path, bytes] : before_) {
      const auto now = found.find(path);
      const bool gone = now == found.end();
      EXPECT_TRUE(gone ? !after_.contains(path)
                       : now->second == bytes || IsWhole(path, now->second))
          << point << ": " << path;
    }
    for (const auto& [path, bytes] : found) {
      if (before_.contains(path)) continue;
      const bool temporary = path.find(".tmp-") != std::string::npos;
      EXPECT_TRUE(temporary || (after_.contains(path) && IsWhole(path, bytes)))
          << point << ": " << path;
    }
  }

  // The next run gets by, and cleans up.
  void JudgeNext(const Task& again, bool refused, const std::string& point) const {
    const int code = RunTask(again);
    EXPECT_TRUE(code == 0 || (refused && code != kKilled)) << point << ": " << code;
    const Files found = Look();
    EXPECT_EQ(Paths(found), Paths(after_)) << point;
    for (const auto& [path, bytes] : found) {
      const auto old = before_.find(path);
      const bool same = old != before_.end() && after_.at(path) == old->second;
      EXPECT_TRUE(same ? bytes == old->second : IsWhole(path, bytes)) << point << ": " << path;
    }
  }
  static std::string Paths(const Files& files) {
    std::string paths;
    for (const auto& each : files) paths += each.first + "\n";
    return paths;
  }

  // A writer that does not keep its word need not be shown at each of its calls.
  static int Failures() {
    return testing::UnitTest::GetInstance()->current_test_info()->result()->total_part_count();
  }
  bool HasMany() const { return Failures() > most_; }

  // How often it was killed.
  long Kill(const Task& task, const Task& again, bool refused) {
    Learn(task);
    for (long n = 0; !HasMany(); ++n) {
      Restore();
      const Outcome outcome =
          RunTo(task, {n, kKill, WantsAll() ? Calls::kEvery : Calls::kChanging});
      if (!outcome.reached) return n;
      const std::string point =
          "killed before " + std::to_string(n) + ", call " + std::to_string(outcome.call);
      JudgeKilled(point);
      JudgeNext(again, refused, point);
    }
    return 0;
  }

  // A failure that is told, or that made no difference. What cannot be removed stays.
  void JudgeFailed(const Outcome& outcome, bool forgives, const std::string& point) const {
    JudgeKilled(point);
    EXPECT_TRUE(outcome.exit != kKilled && (forgives || outcome.exit <= 2))
        << point << ": " << outcome.exit;
    const Files found = Look();
    const bool removes = outcome.call == SYS_unlinkat || outcome.call == kUnlink;
    for (const auto& [path, bytes] : found) {
      EXPECT_TRUE(removes || path.find(".tmp-") == std::string::npos) << point << ": " << path;
    }
    if (outcome.exit != 0 || forgives) return;
    EXPECT_NE(outcome.call, SYS_fsync) << point;
    for (const auto& [path, bytes] : after_) {
      const auto now = found.find(path);
      const bool there = now != found.end();
      EXPECT_TRUE(there && (now->second == bytes || IsWhole(path, now->second)))
          << point << ": " << path << (there ? " is not what it was to be" : " is not there");
    }
  }

  // How often something failed. One that `forgives` may report success with nothing done.
  long Fail(const Task& task, bool forgives) {
    long points = 0;
    for (const auto& row : kFailures) {
      for (long n = 0; !HasMany(); n += WantsAll() ? 1 : row.stride, ++points) {
        Restore();
        const Outcome outcome = RunTo(task, {n, row.error, row.calls, row.lasting});
        if (!outcome.reached) break;
        JudgeFailed(outcome, forgives,
                    "error " + std::to_string(row.error) + (row.lasting ? ", lasting" : "") +
                        " at " + std::to_string(n) + ", call " + std::to_string(outcome.call));
      }
    }
    return points;
  }

  void Sweep(const char* name, const Task& task, const Task& again, bool refused, bool forgives) {
    SCOPED_TRACE(name);
    most_ = Failures() + 2;
    const long kills = Kill(task, again, refused);
    EXPECT_GE(kills, 1);
    long failures = 0;
#ifdef __x86_64__  // where calls can be failed
    failures = Fail(task, forgives);
    EXPECT_GE(failures, 3);
#endif
    std::printf("%s: killed %ld times, failed %ld times\n", name, kills, failures);
  }

  std::vector<Writer> Table();

  // In a child: on a file system of its own, that takes nothing any more. (What is removed needs no
  // room.)
  static constexpr int kNoMount = 77;
  int RunOnDisk(bool full, const Writer& writer) const {
    const char* const path = dir_.Path().c_str();
    if (unshare(CLONE_NEWNS) != 0 || mount("", "/", "", MS_PRIVATE | MS_REC, nullptr) != 0 ||
        mount("none", path, "tmpfs", 0, "size=1m") != 0) {
      return kNoMount;
    }
    Restore();
    if (full) {
      const std::string page(4096, 'x');
      for (const size_t size : {page.size(), size_t{1}}) {
        std::ofstream filler(At("filler"), std::ios::app);
        while (filler.write(page.data(), static_cast<std::streamsize>(size)).flush()) {
        }
      }
    } else if (mount("none", path, "", MS_REMOUNT | MS_RDONLY, nullptr) != 0) {
      return kNoMount;
    }
    const int code = RunTask(CommandHere(writer.words));
    Files found = Look();
    std::erase_if(found, [&](const auto& file) {
      const std::string& name = file.first;
      return !before_.contains(name) && (name == "filler" || name.ends_with(".lock"));
    });
    if (found == before_ && (code == 2 || (writer.forgives && code == 0))) return 0;
    return full && code == 0 && found.size() < before_.size() ? 0 : 1;
  }

  const bool quick_ = UseMemory();
  TempDir dir_;
  Files before_, after_, stable_;
  int most_ = 0;
};

TEST_F(Writers, OfTheLibrary) {
  const auto stores = [this] {
    ZvVesk2::VeskConf::SetHomeDirectory(At("home").c_str());
    ZvVesk2::VeskConf::SetGlobalDirectory(At("global").c_str());
  };
  const struct {
    const char* name;
    Task task;
  } rows[] = {{"UpdateStore",
               [&] {
                 stores();
                 return Vesk2ImportCrls(At("new").c_str());
               }},
              {"InstallAcls", [&] {
                 stores();
                 return ZvVesk2::AclEntry::InstallAcls(At("new").c_str(), nullptr);
               }}};
  // Both report success whatever happens, which callers know.
  for (const auto& row : rows) Sweep(row.name, row.task, row.task, false, true);
}

std::vector<Writer> Writers::Table() {
  const std::string tag = "(install)";
  const Words grant = {"acl", "grant", "--subject", At("other.pub"), "--tag", tag, "--name", "x"};
  const Words join = {"cert", "join", At("one.cert"), At("two.cert"), "-o", At("both.cert")};
  const Words issue = {"cert",  "issue", "--key", At("vendor.pem"), "--subject", At("other.pub"),
                       "--tag", tag,     "-o"};
  const Words next = List("next.crl", "2039", {"--revoke-key", At("other.pub"), "--import"});
  const Words key = {"key", "new", "--bits", "2048", At("made")};
  const Words import = {"crl", "import", At("new/next.crl")};
  const Words floor = {"floor", "set", "--tag", tag, "--floor", At("f"), "2025"};
  const Words approve = {"manifest", "approve", At("m"), "--key", At("other.pem")};
  const Words install = {"acl", "install", At("new/more.acl")};
  return {
      {"acl grant", grant, Join(grant, {"-f"})},
      {"acl install", install, Join(install, {"-f"})},
      {"acl remove", {"acl", "remove", "vendor"}, {}, true},
      {"crl import", import, Join(import, {"-f"})},
      {"crl issue", next, Join(next, {"-f"})},
      {"manifest sign", Sign("fresh", {}), Sign("fresh", {"-f"})},
      {"manifest sign -f", Sign("m", {"--tag", tag, "-f"})},
      {"manifest approve", approve, {}, true},
      {"key new", key, Join(key, {"-f"})},
      {"cert issue", Join(issue, {At("o.cert")}), Join(issue, {At("o.cert"), "-f"})},
      {"cert issue -f", Join(issue, {At("two.cert"), "-f"})},
      {"cert join", join, Join(join, {"-f"})},
      {"floor set", floor},
      {"manifest verify, storing", Verify("carries", {}), {}, false, true},
      {"manifest verify --floor", Verify("m", {"--floor", At("f")})},
      {"manifest verify --remember", Verify("m", {"--remember"})},
  };
}

TEST_F(Writers, OfTheCommand) {
  for (const Writer& writer : Table()) {
    const Words& again = writer.again.empty() ? writer.words : writer.again;
    Sweep(writer.name, CommandHere(writer.words), CommandHere(again), writer.refused,
          writer.forgives);
  }
}

// What is there stays as it is, and that nothing could be written is told.
TEST_F(Writers, OnDisksThatTakeNothing) {
  for (const bool full : {false, true}) {
    for (const Writer& writer : Table()) {
      const int status = RunTask([&] { return RunOnDisk(full, writer); });
      if (status == kNoMount) GTEST_SKIP() << "may not mount anything";
      EXPECT_EQ(status, 0) << writer.name << (full ? ", full" : ", read-only");
    }
  }
}

}  // namespace
}  // namespace vesk2test
