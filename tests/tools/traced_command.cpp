// SPDX-License-Identifier: Apache-2.0
// See traced_command.h.
#include "tests/tools/traced_command.h"

#include <gtest/gtest.h>

#include <fcntl.h>
#include <signal.h>
#include <sys/ptrace.h>
#include <sys/syscall.h>
#include <sys/user.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <iterator>

#include "tools/vesk2/commands/command.h"

// <linux/ptrace.h> and <sys/ptrace.h> cannot both be included; this is the part that is needed.
struct SystemCall {
  uint8_t op;
  uint8_t pad[3];
  uint32_t machine;
  uint64_t instruction, stack;
  uint64_t number;
  uint64_t arguments[6];
};
constexpr uint8_t kEntry = 1;
constexpr int kGetSystemCall = 0x420e;

namespace vesk2test {
namespace {

pid_t Start(const Task& task, bool traced) {
  const pid_t child = fork();
  if (child != 0) return child;
  const int null = open("/dev/null", O_WRONLY);
  dup2(null, STDOUT_FILENO);
  dup2(null, STDERR_FILENO);
  if (traced) {
    ptrace(PTRACE_TRACEME, 0, nullptr, nullptr);
    raise(SIGSTOP);
  }
  _exit(task());
}

int Wait(pid_t child) {
  int status = 0;
  EXPECT_EQ(waitpid(child, &status, 0), child);
  return WIFEXITED(status) ? WEXITSTATUS(status) : kKilled;
}

constexpr uint64_t kTransferring[] = {SYS_read, SYS_pread64, SYS_write, SYS_pwrite64};
constexpr uint64_t kChanging[] = {
#ifdef SYS_rename
    SYS_rename,   SYS_mkdir,    SYS_rmdir,     SYS_unlink,      SYS_link,
    SYS_symlink,  SYS_chmod,
#endif
    SYS_renameat, SYS_mkdirat,  SYS_renameat2, SYS_unlinkat,    SYS_linkat,
    SYS_flock,    SYS_openat2,  SYS_symlinkat, SYS_fchmod,      SYS_fchmodat,
    SYS_write,    SYS_pwrite64, SYS_fsync,     SYS_memfd_create};
constexpr uint64_t kLooking[] = {
#ifdef SYS_open
    SYS_open,       SYS_stat,  SYS_lstat,      SYS_access, SYS_readlink,
#endif
    SYS_openat,     SYS_read,  SYS_pread64,    SYS_close,  SYS_fstat,
    SYS_newfstatat, SYS_statx, SYS_getdents64, SYS_lseek,  SYS_faccessat,
    SYS_readlinkat, SYS_fcntl, SYS_getrandom};

bool Counts(const SystemCall& call, Calls calls) {
  if (call.number == SYS_write && call.arguments[0] <= STDERR_FILENO) return false;
  const auto isOneOf = [&](const auto& table) {
    return std::ranges::find(table, call.number) != std::end(table);
  };
  switch (calls) {
    case Calls::kChanging:
      return isOneOf(kChanging);
    case Calls::kOfFiles:
      return isOneOf(kChanging) || isOneOf(kLooking);
    case Calls::kTransfers:
      return isOneOf(kTransferring);
    case Calls::kEvery:
      return true;
  }
  return false;
}

// Has the call that the child has just entered fail, or do half; whether that is possible on this
// machine.
bool FailCall([[maybe_unused]] pid_t child, [[maybe_unused]] int error) {
#ifdef __x86_64__
  user_regs_struct registers = {};
  int status = 0;
  ptrace(PTRACE_GETREGS, child, nullptr, &registers);
  if (error == kHalf) {
    registers.rdx -= registers.rdx / 2;
    return ptrace(PTRACE_SETREGS, child, nullptr, &registers) == 0;
  }
  registers.orig_rax = ~0ULL;
  ptrace(PTRACE_SETREGS, child, nullptr, &registers);
  ptrace(PTRACE_SYSCALL, child, nullptr, nullptr);
  waitpid(child, &status, 0);
  registers.rax = static_cast<unsigned long long>(-error);
  return ptrace(PTRACE_SETREGS, child, nullptr, &registers) == 0;
#else
  return false;
#endif
}

}  // namespace

Task CommandOf(const Words& words) {
  return [words] {
    std::vector<const char*> arguments = {"vesk2"};
    for (const std::string& word : words) arguments.push_back(word.c_str());
    return vesk2_command::RunCommand(static_cast<int>(arguments.size()), arguments.data());
  };
}

int RunTask(const Task& task) { return Wait(Start(task, false)); }
int RunCommand(const Words& words) { return RunTask(CommandOf(words)); }

Outcome RunTo(const Task& task, const Point& point) {
  const pid_t child = Start(task, true);
  int status = 0;
  waitpid(child, &status, 0);
  ptrace(static_cast<__ptrace_request>(PTRACE_SETOPTIONS), child, nullptr,
         PTRACE_O_TRACESYSGOOD | PTRACE_O_EXITKILL);
  Outcome outcome;
  long seen = 0;
  for (;;) {
    ptrace(PTRACE_SYSCALL, child, nullptr, nullptr);
    waitpid(child, &status, 0);
    if (!WIFSTOPPED(status)) break;
    SystemCall call = {};
    if (WSTOPSIG(status) != (SIGTRAP | 0x80)) continue;
    ptrace(static_cast<__ptrace_request>(kGetSystemCall), child, sizeof call, &call);
    if (call.op != kEntry || !Counts(call, point.calls)) continue;
    const bool follows = outcome.reached && point.lasting && call.number == outcome.call;
    if (seen++ != point.n && !follows) continue;
    outcome = {true, call.number, 0};
    if (point.error != kKill && FailCall(child, point.error)) continue;
    kill(child, SIGKILL);
    waitpid(child, &status, 0);
    break;
  }
  outcome.exit = WIFEXITED(status) ? WEXITSTATUS(status) : kKilled;
  return outcome;
}

}  // namespace vesk2test
