// SPDX-License-Identifier: Apache-2.0
// What keeps files from being opened for a time: another process that holds leases on them, and a
// process that has no descriptors left.
#ifndef VESK2_TESTS_SUPPORT_HELD_FILE_H
#define VESK2_TESTS_SUPPORT_HELD_FILE_H

#include <fcntl.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <stdexcept>
#include <string>
#include <vector>

#include "src/platform/wait.h"

namespace vesk2test {

// What the holder does when somebody else wants a file: keeps all, gives all back, or keeps them
// and puts a FIFO into the place of the first.
enum class OnDemand { kKeep, kGiveBack, kPutFifo };

// Files that another process holds for as long as this lives; the library waits 20 ms for them
// unless they are to be given back.
class HeldFiles {
 public:
  explicit HeldFiles(const std::vector<std::string>& paths, OnDemand action = OnDemand::kKeep) {
    int ready[2];
    if (pipe(ready) != 0 || (child_ = fork()) < 0) throw std::runtime_error("no process");
    if (child_ == 0) Hold(paths, action, ready[1]);
    char held = 'n';
    close(ready[1]);
    const bool told = read(ready[0], &held, 1) == 1;
    close(ready[0]);
    if (!told || held != 'y') throw std::runtime_error("no lease");
    if (action == OnDemand::kKeep) ZVsysutil::zv_limit_waits(kWait);
  }
  ~HeldFiles() {
    ZVsysutil::zv_limit_waits(0);
    kill(child_, SIGKILL);
    waitpid(child_, nullptr, 0);
  }
  HeldFiles(const HeldFiles&) = delete;
  HeldFiles& operator=(const HeldFiles&) = delete;

  static constexpr unsigned kWait = 20;

 private:
  [[noreturn]] static void Hold(const std::vector<std::string>& paths, OnDemand action, int ready) {
    prctl(PR_SET_PDEATHSIG, SIGKILL);  // a test that crashes leaves nobody behind
    sigset_t demand;
    sigemptyset(&demand);
    sigaddset(&demand, SIGIO);
    sigprocmask(SIG_BLOCK, &demand, nullptr);
    char held = 'y';
    std::vector<int> files;
    for (const std::string& path : paths) {
      files.push_back(open(path.c_str(), O_RDWR));
      if (fcntl(files.back(), F_SETLEASE, F_WRLCK) != 0) held = 'n';
    }
    if (write(ready, &held, 1) != 1) _exit(1);
    sigwaitinfo(&demand, nullptr);
    if (action == OnDemand::kGiveBack) _exit(0);
    if (action == OnDemand::kPutFifo) {
      const std::string fifo = paths[0] + ".fifo";
      if (mkfifo(fifo.c_str(), 0600) != 0 || rename(fifo.c_str(), paths[0].c_str()) != 0) _exit(1);
    }
    for (;;) pause();
  }

  pid_t child_ = -1;
};

// While this lives, nothing can be opened.
class NoDescriptors {
 public:
  NoDescriptors() {
    getrlimit(RLIMIT_NOFILE, &limit_);
    rlimit none = limit_;
    none.rlim_cur = 0;
    if (setrlimit(RLIMIT_NOFILE, &none) != 0) throw std::runtime_error("no limit");
  }
  ~NoDescriptors() { setrlimit(RLIMIT_NOFILE, &limit_); }
  NoDescriptors(const NoDescriptors&) = delete;
  NoDescriptors& operator=(const NoDescriptors&) = delete;

 private:
  rlimit limit_{};
};

}  // namespace vesk2test

#endif  // VESK2_TESTS_SUPPORT_HELD_FILE_H
