// SPDX-License-Identifier: Apache-2.0
// confine.cpp: what the kernel is asked to take away.
#include "tools/vesk2/confine/confine.h"

#include <fcntl.h>
#include <linux/audit.h>
#include <linux/filter.h>
#include <linux/landlock.h>
#include <linux/seccomp.h>
#include <openssl/evp.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <iterator>

#include "tools/vesk2/files/descriptor.h"

namespace vesk2_command {
namespace {

bool allowed = false;
std::string inForce;

void Tell(const char* what) { inForce += (inForce.empty() ? "" : ", ") + std::string(what); }

// libcrypto reads its configuration, and the providers that it names, on first use.
void LoadLateParts() { EVP_MD_free(EVP_MD_fetch(nullptr, "SHA256", nullptr)); }

// ---- System calls ----

#if defined(__x86_64__)
constexpr uint32_t kMachine = AUDIT_ARCH_X86_64;
#elif defined(__aarch64__)
constexpr uint32_t kMachine = AUDIT_ARCH_AARCH64;
#else
constexpr uint32_t kMachine = 0;  // not known here: calls are left as they are
#endif
// Above this, x86-64 has the same calls for another kind of programs.
constexpr uint32_t kOtherCalls = 0x40000000;

// What starts programs, talks to others, or looks into other processes. A thread needs clone, and
// a library may need anything else: what is not named stays.
constexpr uint32_t kForbidden[] = {
#ifdef SYS_fork
    SYS_fork,
    SYS_vfork,
#endif
#ifndef VESK2_SANITIZED  // whose leak check traces
    SYS_ptrace,
#endif
    SYS_execve,
    SYS_execveat,
    SYS_socket,
    SYS_socketpair,
    SYS_connect,
    SYS_bind,
    SYS_listen,
    SYS_accept,
    SYS_accept4,
    SYS_sendto,
    SYS_sendmsg,
    SYS_sendmmsg,
    SYS_recvfrom,
    SYS_recvmsg,
    SYS_recvmmsg,
    SYS_process_vm_readv,
    SYS_process_vm_writev,
    SYS_pidfd_getfd,
    SYS_io_uring_setup,
    SYS_bpf,
    SYS_userfaultfd,
    SYS_perf_event_open,
    SYS_keyctl,
    SYS_add_key,
    SYS_request_key,
    SYS_mount,
    SYS_umount2,
    SYS_move_mount,
    SYS_open_tree,
    SYS_fsopen,
    SYS_pivot_root,
    SYS_chroot,
    SYS_unshare,
    SYS_setns,
    SYS_init_module,
    SYS_finit_module,
    SYS_kexec_load,
    SYS_open_by_handle_at};

// Written by hand: the library that makes such filters takes longer than the command's start.
bool ForbidCalls() {
  if (kMachine == 0) return false;
  constexpr size_t kCalls = std::size(kForbidden);
  constexpr uint32_t kRefuse = SECCOMP_RET_ERRNO | EPERM;
  sock_filter steps[kCalls + 7];
  size_t count = 0;
  const auto add = [&](uint16_t code, uint32_t value, uint8_t yes = 0, uint8_t no = 0) {
    steps[count++] = {code, yes, no, value};
  };
  add(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, arch));
  add(BPF_JMP | BPF_JEQ | BPF_K, kMachine, 1, 0);
  add(BPF_RET | BPF_K, SECCOMP_RET_KILL_PROCESS);
  add(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr));
  add(BPF_JMP | BPF_JGE | BPF_K, kOtherCalls, static_cast<uint8_t>(kCalls + 1), 0);
  for (size_t i = 0; i < kCalls; ++i) {
    add(BPF_JMP | BPF_JEQ | BPF_K, kForbidden[i], static_cast<uint8_t>(kCalls - i), 0);
  }
  add(BPF_RET | BPF_K, SECCOMP_RET_ALLOW);
  add(BPF_RET | BPF_K, kRefuse);
  const sock_fprog program = {static_cast<unsigned short>(count), steps};
  return syscall(SYS_seccomp, SECCOMP_SET_MODE_FILTER, 0, &program) == 0;
}

// ---- Files ----

// The C library has no functions for these.
int CreateRuleset(const landlock_ruleset_attr* attributes, size_t size, uint32_t flags) {
  return static_cast<int>(syscall(SYS_landlock_create_ruleset, attributes, size, flags));
}

constexpr uint64_t kReadFile = LANDLOCK_ACCESS_FS_READ_FILE;
constexpr uint64_t kReadTree = kReadFile | LANDLOCK_ACCESS_FS_READ_DIR;
constexpr uint64_t kTruncate = uint64_t{1} << 14;  // from the third version of Landlock on
constexpr uint64_t kRefer = uint64_t{1} << 13;     // from the second
constexpr uint64_t kWriteFile = LANDLOCK_ACCESS_FS_WRITE_FILE | kTruncate;
constexpr uint64_t kWriteTree = kWriteFile | kRefer | LANDLOCK_ACCESS_FS_MAKE_REG |
                                LANDLOCK_ACCESS_FS_MAKE_DIR | LANDLOCK_ACCESS_FS_REMOVE_FILE |
                                LANDLOCK_ACCESS_FS_REMOVE_DIR;
constexpr uint64_t kFirstVersion = (uint64_t{1} << 13) - 1;  // the rights that it knows

class FileRules {
 public:
  FileRules() {
    const int version = CreateRuleset(nullptr, 0, LANDLOCK_CREATE_RULESET_VERSION);
    if (version < 1) return;
    handled_ = kFirstVersion | (version >= 2 ? kRefer : 0) | (version >= 3 ? kTruncate : 0);
    landlock_ruleset_attr attributes = {};
    attributes.handled_access_fs = handled_;
    ruleset_.Take(CreateRuleset(&attributes, sizeof attributes.handled_access_fs, 0));
  }

  // A file may be replaced by another one of its name before it is opened: the files beside it are
  // allowed with it. Directories hold files by links, too: where stores are managed, entries often
  // are.
  void AllowReading(const std::string& path) {
    Allow(path, kReadFile, kReadTree);
    const std::string above = std::filesystem::path(path).parent_path().string();
    std::error_code error;
    if (!std::filesystem::is_directory(path, error))
      Allow(above.empty() ? "." : above, 0, kReadFile);
    std::filesystem::directory_iterator each(path, error);
    for (; !error && each != std::filesystem::directory_iterator(); each.increment(error)) {
      std::error_code ignored;
      if (each->is_symlink(ignored)) Allow(each->path().string(), kReadFile, kReadTree);
    }
  }

  // What is to be made is made in a directory that is there.
  void AllowWriting(const std::string& path) {
    std::filesystem::path there(path);
    std::error_code error;
    while (!there.empty() && !std::filesystem::exists(there, error)) {
      const std::filesystem::path above = there.parent_path();
      there = above.empty() ? "." : above;
    }
    Allow(there.string(), kReadFile | kWriteFile, kReadTree | kWriteTree);
  }

  bool Enforce() const {
    return ruleset_.get() >= 0 && !incomplete_ &&
           syscall(SYS_landlock_restrict_self, ruleset_.get(), 0) == 0;
  }

 private:
  void Allow(const std::string& path, uint64_t ofFile, uint64_t ofDirectory) {
    if (ruleset_.get() < 0) return;
    const Descriptor place(open(path.c_str(), O_PATH | O_CLOEXEC));
    struct stat status = {};
    if (place.get() < 0 || fstat(place.get(), &status) != 0) return;
    landlock_path_beneath_attr rule = {};
    rule.allowed_access = (S_ISDIR(status.st_mode) ? ofDirectory : ofFile) & handled_;
    if (rule.allowed_access == 0) return;
    rule.parent_fd = place.get();
    const long added =
        syscall(SYS_landlock_add_rule, ruleset_.get(), LANDLOCK_RULE_PATH_BENEATH, &rule, 0);
    // Pipes and the like lie in no directory and need no rule. What is lacking otherwise would make
    // a file that is there look forbidden.
    if (added != 0 && errno != EBADFD) incomplete_ = true;
  }

  uint64_t handled_ = 0;
  Descriptor ruleset_;
  bool incomplete_ = false;
};

}  // namespace

void AllowConfinement() { allowed = true; }

void Confine(const Reach& reach) {
  if (!allowed) return;
  LoadLateParts();
  FileRules rules;
  for (const std::string& path : reach.readable) rules.AllowReading(path);
  for (const std::string& path : reach.writable) rules.AllowWriting(path);
#ifdef VESK2_SANITIZED  // which looks at its own process at the end
  rules.AllowReading("/proc");
#endif
  if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0) return;  // without it, neither of the others
  Tell("no new privileges");
  if (rules.Enforce()) Tell("files");
  if (ForbidCalls()) Tell("system calls");
}

std::string Confinement() { return "confined: " + (inForce.empty() ? "nothing" : inForce); }

}  // namespace vesk2_command
