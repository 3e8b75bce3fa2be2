// SPDX-License-Identifier: Apache-2.0
// Measuring: times by turns, system calls and memory in a process of its own.
#include <sys/ptrace.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <csignal>
#include <fstream>

#include "bench/bench.h"

namespace bench {
namespace {

double Seconds(const timeval& time) {
  return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_usec) / 1e6;
}
double SpentBy(int who) {
  rusage usage{};
  getrusage(who, &usage);
  return Seconds(usage.ru_utime) + Seconds(usage.ru_stime);
}

double OnTheClock() {
  const auto now = std::chrono::steady_clock::now().time_since_epoch();
  return std::chrono::duration<double>(now).count();
}

// What a way takes by `clock`; negative for a wrong result.
double Take(double (*clock)(), const Way& way) {
  const double before = clock();
  const bool right = way();
  const double taken = clock() - before;
  return right ? taken : -1;
}

Outcome RatioBy(double (*clock)(), const Effort& effort, const Way& ours, const Way& yardstick) {
  // Both ways once before: caches are warm, and what is made on first use is there.
  if (!ours()) return Failed("a wrong result");
  if (!yardstick()) return Failed("a wrong result of the yardstick");
  std::vector<double> ratios;
  for (int round = 0; round < effort.rounds; ++round) {
    const bool oursFirst = round % 2 == 0;
    const double first = Take(clock, oursFirst ? ours : yardstick);
    const double second = Take(clock, oursFirst ? yardstick : ours);
    if (first < 0 || second < 0) return Failed("a wrong result");
    ratios.push_back(oursFirst ? first / second : second / first);
  }
  std::ranges::sort(ratios);
  return {Outcome::kMeasured, ratios[ratios.size() / 2], {}};
}

// A line of /proc/PROCESS/status, in bytes.
double StatusBytes(const std::string& name, const std::string& process = "self") {
  std::ifstream status("/proc/" + process + "/status");
  std::string word;
  double kibibytes = -1;
  while (status >> word) {
    if (word == name + ":" && status >> kibibytes) return kibibytes * 1024;
  }
  return -1;
}

// The exit status of a child, -1 when it did not exit.
int ExitOf(pid_t child) {
  int status = 0;
  if (waitpid(child, &status, 0) != child || !WIFEXITED(status)) return -1;
  return WEXITSTATUS(status);
}

}  // namespace

Outcome Failed(std::string what) { return {Outcome::kFailed, 0, std::move(what)}; }
Outcome NotInstalled(std::string program) {
  return {Outcome::kNotInstalled, 0, std::move(program)};
}

double Spent() { return SpentBy(RUSAGE_SELF) + SpentBy(RUSAGE_CHILDREN); }

Outcome Ratio(const Effort& effort, const Way& ours, const Way& yardstick) {
  return RatioBy(Spent, effort, ours, yardstick);
}
double LeastSeconds(const Way& way) {
  double least = -1;
  for (int round = 0; round < 5; ++round) {
    const double taken = Take(Spent, way);
    if (taken < 0) return -1;
    if (least < 0 || taken < least) least = taken;
  }
  return least;
}
Outcome ClockRatio(const Effort& effort, const Way& ours, const Way& yardstick) {
  return RatioBy(OnTheClock, effort, ours, yardstick);
}

long CountCalls(const Way& work) {
  const pid_t child = fork();
  if (child == 0) {
    if (ptrace(PTRACE_TRACEME, 0, nullptr, nullptr) != 0) _exit(2);
    raise(SIGSTOP);
    _exit(work() ? 0 : 1);
  }
  int status = 0;
  if (waitpid(child, &status, 0) != child || !WIFSTOPPED(status)) return -1;
  ptrace(PTRACE_SETOPTIONS, child, nullptr, PTRACE_O_TRACESYSGOOD | PTRACE_O_EXITKILL);
  long stops = 0;  // two for each call: before and after it
  while (ptrace(PTRACE_SYSCALL, child, nullptr, nullptr) == 0) {
    if (waitpid(child, &status, 0) != child) return -1;
    if (WIFEXITED(status)) return WEXITSTATUS(status) == 0 ? stops / 2 : -1;
    if (!WIFSTOPPED(status)) return -1;
    if (WSTOPSIG(status) == (SIGTRAP | 0x80)) ++stops;
  }
  return -1;
}

double PeakMemory(const Way& work) {
  int ends[2];
  if (pipe(ends) != 0) return -1;
  const pid_t child = fork();
  if (child == 0) {
    std::ofstream("/proc/self/clear_refs") << "5";  // the peak counts from here on
    const double before = StatusBytes("VmRSS");
    const double grown = work() ? StatusBytes("VmHWM") - before : -1;
    _exit(write(ends[1], &grown, sizeof grown) == sizeof grown ? 0 : 1);
  }
  close(ends[1]);
  double grown = -1;
  if (read(ends[0], &grown, sizeof grown) != sizeof grown) grown = -1;
  close(ends[0]);
  return ExitOf(child) == 0 ? grown : -1;
}

double PeakOfProgram(const std::vector<std::string>& words) {
  const pid_t child = fork();
  if (child == 0) {
    if (ptrace(PTRACE_TRACEME, 0, nullptr, nullptr) != 0) _exit(2);
    raise(SIGSTOP);
    Become(words);
    _exit(127);
  }
  int status = 0;
  if (waitpid(child, &status, 0) != child || !WIFSTOPPED(status)) return -1;
  ptrace(PTRACE_SETOPTIONS, child, nullptr, PTRACE_O_TRACEEXIT | PTRACE_O_EXITKILL);
  double peak =
      -1;  // of the program, not of the process that became it, which was as large as this
  while (ptrace(PTRACE_CONT, child, nullptr, nullptr) == 0) {
    if (waitpid(child, &status, 0) != child) return -1;
    if (WIFEXITED(status)) return WEXITSTATUS(status) == 0 ? peak : -1;
    if (!WIFSTOPPED(status)) return -1;
    if (status >> 8 == (SIGTRAP | (PTRACE_EVENT_EXIT << 8))) {
      peak = StatusBytes("VmHWM", std::to_string(child));
    }
  }
  return -1;
}

}  // namespace bench
