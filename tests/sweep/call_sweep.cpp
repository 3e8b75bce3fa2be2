// SPDX-License-Identifier: Apache-2.0
// Every allocation of the process and every open, read, readdir and stat fails in turn, once and
// from then on, while the library or the command answers about a machine of scenes.h: whatever
// fails, what is refused otherwise is not granted. Each point is a process of its own, so that a
// crash is one.
#include <gtest/gtest.h>

#include <fcntl.h>
#include <spawn.h>
#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "tests/sweep/failing_calls.h"
#include "tests/sweep/scenes.h"
#include "tools/vesk2/commands/command.h"

#include <vesk2.h>

namespace vesk2test {
namespace {

using Stored = std::map<std::string, std::string>;

struct Point {
  FailingCall call;
  int error;
  bool lasting;
  long n;
};
constexpr const char* kCallNames[] = {"memory", "open", "read", "scan", "stat"};

std::string ErrorName(int error) {
  if (error == kShortRead) return "a short read";
  return error == kEarlyEnd ? "an early end" : strerrorname_np(error);
}

std::string Text(const Point& point) {
  return std::string(kCallNames[point.call]) + " " + std::to_string(point.n) + ": " +
         ErrorName(point.error) + (point.lasting ? ", lasting" : "");
}

// ---- One point ---------------------------------------------------------------------------------

struct Answer {
  int code = 0;
  bool crashed = false;
  std::string failed;  // the call that failed first; empty when it did not come to it
  std::string said;    // on standard output
};

// Runs children, and what they leave in memory that outlives them.
class Children {
 public:
  Children()
      : record_(memfd_create("record", 0)),
        said_(memfd_create("said", 0)),
        null_(open("/dev/null", O_WRONLY)) {
    void* const shared =
        mmap(nullptr, sizeof *code_, PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    if (record_ < 0 || said_ < 0 || shared == MAP_FAILED) std::abort();
    code_ = static_cast<int*>(shared);
  }

  // In a child of this process, ready before the first call that can fail.
  Answer Ask(const std::function<int()>& ask, const Point* point, bool trace = false) {
    Clear();
    const pid_t child = fork();
    if (child == 0) Become(ask, point, trace);
    return Wait(child, false);
  }

  std::vector<TracedCall> Trace(const std::function<int()>& ask) {
    const auto traced = [&] {
      TraceCalls(record_);
      return ask();
    };
    const std::string record = Ask(traced, nullptr).failed;
    std::vector<TracedCall> calls(record.size() / sizeof(TracedCall));
    std::memcpy(calls.data(), record.data(), record.size());
    return calls;
  }

  // As a program of its own, from its start on.
  Answer Run(const std::vector<std::string>& words, const Point& point) {
    Clear();
    std::vector<char*> arguments;
    for (const std::string& word : words) arguments.push_back(const_cast<char*>(word.c_str()));
    arguments.push_back(nullptr);
    std::string plan = VESK2_FAIL_CALLS "=";
    for (const long number :
         {long{point.call}, point.n, long{point.error}, long{point.lasting}, long{record_}, 0L}) {
      plan += std::to_string(number) + " ";
    }
    std::string preload = "LD_PRELOAD=" VESK2_FAILING_CALLS_LIBRARY;
    char* environment[] = {plan.data(), preload.data(), nullptr};
    posix_spawn_file_actions_t files;
    posix_spawn_file_actions_init(&files);
    posix_spawn_file_actions_adddup2(&files, said_, STDOUT_FILENO);
    posix_spawn_file_actions_adddup2(&files, null_, STDERR_FILENO);
    pid_t child = -1;
    const int failure =
        posix_spawn(&child, VESK2_COMMAND, &files, nullptr, arguments.data(), environment);
    posix_spawn_file_actions_destroy(&files);
    if (failure != 0) std::abort();
    return Wait(child, true);
  }

 private:
  // Nothing that is thrown leaves: it would find the rest of the test.
  [[noreturn]] void Become(const std::function<int()>& ask, const Point* point,
                           bool trace) const noexcept {
    dup2(said_, STDOUT_FILENO);
    dup2(null_, STDERR_FILENO);
    if (point != nullptr) {
      FailCalls(point->call, point->n, point->error, point->lasting, record_, trace);
    }
    const int code = ask();
    LetCallsBe();
    *code_ = code;
    std::fflush(stdout);
    _exit(0);
  }

  void Clear() const {
    for (const int file : {record_, said_}) {
      if (ftruncate(file, 0) != 0 || lseek(file, 0, SEEK_SET) != 0) std::abort();
    }
  }

  static std::string Contents(int file) {
    std::string text(static_cast<size_t>(lseek(file, 0, SEEK_END)), '\0');
    if (pread(file, text.data(), text.size(), 0) != static_cast<ssize_t>(text.size())) std::abort();
    return text;
  }

  Answer Wait(pid_t child, bool exits) const {
    int status = 0;
    if (waitpid(child, &status, 0) != child) std::abort();
    Answer answer;
    answer.crashed = !WIFEXITED(status);
    if (!answer.crashed) answer.code = exits ? WEXITSTATUS(status) : *code_;
    answer.failed = Contents(record_);
    answer.said = Contents(said_);
    return answer;
  }

  int record_;
  int said_;
  int null_;
  int* code_ = nullptr;
};

Children& TheChildren() {
  static Children children;
  return children;
}

// ---- All points --------------------------------------------------------------------------------

// What a lack of resources is, and what else can befall a call of each kind.
constexpr int kShortages[] = {ENOMEM, EMFILE, ENFILE};
std::vector<int> ShortagesOf(FailingCall call) {
  if (call == kMemory) return {ENOMEM};
  return {std::begin(kShortages), std::end(kShortages)};
}
std::vector<int> TroublesOf(FailingCall call) {
  if (call == kMemory) return {};
  if (call == kRead) return {EIO, EACCES, kShortRead, kEarlyEnd};
  return {EIO, EACCES};
}

// Hands each point of a kind of call to `judge` until none comes to it; how many did.
template <typename Judge>
long Sweep(FailingCall call, int error, bool lasting, const Judge& judge, long stride = 1) {
  constexpr long kMost = 100'000;
  long points = 0;
  while (points < kMost && judge(Point{call, error, lasting, points * stride})) ++points;
  EXPECT_LT(points, kMost) << "no end of calls";
  return points;
}

template <typename Errors, typename Judge>
long SweepAll(const Errors& errors, const Judge& judge) {
  long points = 0;
  for (const FailingCall call : {kMemory, kOpen, kRead, kScan, kStat}) {
    for (const int error : errors(call)) {
      for (const bool lasting : {false, true}) points += Sweep(call, error, lasting, judge);
    }
  }
  return points;
}

// VESK2_SWEEP_ALL in the environment sweeps the command at each allocation, which takes an hour:
// else the points are chosen. VESK2_SWEEP_SCENE names the one scene to sweep.
bool WantsAll() { return std::getenv("VESK2_SWEEP_ALL") != nullptr; }
bool Wants(const Scene& scene) {
  const char* const name = std::getenv("VESK2_SWEEP_SCENE");
  return name == nullptr || std::string_view(name) == scene.Name();
}

// Hands each scene to `sweep`, which counts its points. Their number may not dwindle unseen.
template <typename OneScene>
void ForEachScene(long floor, const OneScene& sweep) {
  long points = 0;
  for (const auto& scene : MakeScenes()) {
    if (!Wants(*scene)) continue;
    SCOPED_TRACE(scene->Name());
    points += sweep(*scene);
  }
  std::printf("%ld points\n", points);
  EXPECT_GE(points, std::getenv("VESK2_SWEEP_SCENE") == nullptr ? floor : 1);
}

// The sweep of the library over one scene, with its normal answer known.
class LibrarySweep {
 public:
  explicit LibrarySweep(const Scene& scene) : scene_(scene), before_(scene.Stored()) {
    const Answer normal = TheChildren().Ask(scene.ask, nullptr);
    EXPECT_EQ(normal.code, scene.code);
    EXPECT_EQ(Changed(), scene.stores);
    // libcrypto loads much the first time: from the second scene on that is done.
    EXPECT_EQ(used ? scene.ask() : scene.code, scene.code);
    used = true;
    (void)Changed();
  }

  // Whether it came to the point. Short of resources nothing is granted, nor written that would not
  // be written otherwise.
  bool Shortage(const Point& point) {
    const Answer answer = TheChildren().Ask(scene_.ask, &point);
    const bool granted = !answer.crashed && answer.code == 0 && scene_.code != 0;
    const bool wrote = Changed() && !scene_.stores;
    const bool told =
        answer.code == scene_.code || point.call == kMemory || answer.code == VESK2_ERR_MEM_ALLOC;
    if (answer.crashed || granted || wrote || !told) {
      ADD_FAILURE() << Text(point) << (answer.crashed ? ": crash" : "")
                    << (granted ? ": granted" : "") << (wrote ? ": wrote" : "") << ": code "
                    << answer.code << "\n"
                    << Trace(point);
    }
    return !answer.failed.empty();
  }

  // The same with errors that may well mean that a file is not there: what is granted then is told.
  bool Trouble(const Point& point, std::set<std::string>& granted) {
    const Answer answer = TheChildren().Ask(scene_.ask, &point);
    (void)Changed();
    EXPECT_FALSE(answer.crashed) << Text(point) << "\n" << Trace(point);
    if (point.error == kShortRead) {
      EXPECT_EQ(answer.code, scene_.code) << Text(point) << "\n" << Trace(point);
    }
    if (answer.code == 0 && scene_.code != 0) {
      const std::string trace = Trace(point);
      granted.insert(ErrorName(point.error) + " of " + trace.substr(0, trace.find('\n')));
    }
    return !answer.failed.empty();
  }

 private:
  std::string Trace(const Point& point) {
    const std::string trace = TheChildren().Ask(scene_.ask, &point, true).failed;
    (void)Changed();
    return trace;
  }

  // Whether the store was changed, which it is no more.
  bool Changed() const {
    if (scene_.Stored() == before_) return false;
    scene_.Restore(before_);
    return true;
  }

  static inline bool used = false;
  const Scene& scene_;
  const Stored before_;
};

TEST(CallSweep, ShortOfResourcesTheLibraryGrantsNothing) {
  ForEachScene(20'000, [](const Scene& scene) {
    LibrarySweep sweep(scene);
    return SweepAll(ShortagesOf, [&](const Point& point) { return sweep.Shortage(point); });
  });
}

TEST(CallSweep, OtherErrorsAreListed) {
  ForEachScene(2'000, [](const Scene& scene) {
    LibrarySweep sweep(scene);
    std::set<std::string> granted;
    const auto judge = [&](const Point& point) { return sweep.Trouble(point, granted); };
    const long points = SweepAll(TroublesOf, judge);
    for (const std::string& line : granted) {
      std::printf("%s: yes after %s\n", scene.Name(), line.c_str());
    }
    return points;
  });
}

// ---- The command -------------------------------------------------------------------------------

std::vector<int> AllErrorsOf(FailingCall call) {
  std::vector<int> errors = ShortagesOf(call);
  for (const int error : TroublesOf(call)) errors.push_back(error);
  return errors;
}

// The sweep of the command over one scene, in children of this process.
class CommandSweep {
 public:
  explicit CommandSweep(const Scene& scene) : scene_(scene), before_(scene.Stored()) {
    words_.push_back("vesk2");
    for (const std::string& word : scene.words) words_.push_back(word.c_str());
    ask_ = [this] {
      return vesk2_command::RunCommand(static_cast<int>(words_.size()), words_.data());
    };
    EXPECT_EQ(scene.ask(), scene.code);  // with which libcrypto is ready
    const Answer normal = TheChildren().Ask(ask_, nullptr);
    EXPECT_EQ(normal.code, scene.exit) << normal.said;
    scene_.Restore(before_);
  }

  // The allocations that are worth a point: from the first look at a file on, the first of each
  // way.
  std::vector<long> Allocations() {
    std::set<unsigned long> seen;
    std::vector<long> chosen;
    long n = 0;
    bool looked = false;
    for (const TracedCall& each : TheChildren().Trace(ask_)) {
      if (each.call != kMemory) {
        looked = true;
      } else {
        const bool first = looked && seen.insert(each.way).second;
        if (first || WantsAll()) chosen.push_back(n);
        ++n;
      }
    }
    return chosen;
  }

  int crashes = 0;

  bool Try(const Point& point) {
    const Answer answer = TheChildren().Ask(ask_, &point);
    if (scene_.Stored() != before_) scene_.Restore(before_);
    const bool yes = scene_.exit != 0 &&
                     ((!answer.crashed && answer.code == 0) || answer.said.starts_with("yes"));
    // The explanation is built with a library that does not survive every lack of memory. What
    // could not be read is refused in all scenes.
    if ((answer.crashed && point.call != kMemory) || yes) {
      ADD_FAILURE() << Text(point) << (answer.crashed ? ": crash" : "") << (yes ? ": granted" : "")
                    << ": code " << answer.code << "\n"
                    << TheChildren().Ask(ask_, &point, true).failed << answer.said;
      scene_.Restore(before_);
    }
    crashes += answer.crashed;
    return !answer.failed.empty();
  }

 private:
  const Scene& scene_;
  const Stored before_;
  std::vector<const char*> words_;
  std::function<int()> ask_;
};

TEST(CallSweep, TheCommandNeverSaysYes) {
  ForEachScene(10'000, [](const Scene& scene) {
    if (scene.words.empty()) return 0L;
    CommandSweep sweep(scene);
    long points = 0;
    for (const long n : sweep.Allocations()) {
      EXPECT_TRUE(sweep.Try({kMemory, ENOMEM, false, n}));
      ++points;
      if (!WantsAll() && n % 16 != 0) continue;
      sweep.Try({kMemory, ENOMEM, true, n});
      ++points;
    }
    const auto files = [](FailingCall call) {
      return call == kMemory ? std::vector<int>() : AllErrorsOf(call);
    };
    points += SweepAll(files, [&](const Point& point) { return sweep.Try(point); });
    std::printf("%s: %ld points, %d crashes\n", scene.Name(), points, sweep.crashes);
    return points;
  });
}

// As a program of its own, with all that comes before and after its main function.
TEST(CallSweep, TheProgramNeverSaysYes) {
  const Scenes scenes = MakeScenes();
  const auto scene = std::ranges::find(scenes, std::string("a revoked key"),
                                       [](const auto& each) { return each->Name(); });
  ASSERT_NE(scene, scenes.end());
  std::vector<std::string> words = (*scene)->words;
  words.insert(words.begin(), "vesk2");
  const Stored before = (*scene)->Stored();
  const auto judge = [&](const Point& point) {
    const Answer answer = TheChildren().Run(words, point);
    EXPECT_TRUE(answer.crashed || answer.code != 0) << Text(point);
    EXPECT_FALSE(answer.said.starts_with("yes")) << Text(point);
    EXPECT_EQ((*scene)->Stored(), before);
    return !answer.failed.empty();
  };
  const long stride = WantsAll() ? 1 : 97;
  long points = Sweep(kMemory, ENOMEM, false, judge, stride);
  for (const FailingCall call : {kOpen, kRead, kScan, kStat}) {
    for (const int error : {EMFILE, EIO}) points += Sweep(call, error, false, judge);
  }
  std::printf("%ld points\n", points);
  EXPECT_GE(points, 200);
}

}  // namespace
}  // namespace vesk2test
