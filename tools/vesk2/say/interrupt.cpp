// SPDX-License-Identifier: Apache-2.0
// interrupt.cpp: the signal handler. It does nothing that POSIX does not allow in one.
#include "tools/vesk2/say/interrupt.h"

#include <unistd.h>

#include <atomic>
#include <csignal>

namespace vesk2_command {
namespace {

std::atomic<const char*> unfinished = nullptr;
std::atomic<void (*)()> eraser = nullptr;
static_assert(decltype(unfinished)::is_always_lock_free);
static_assert(decltype(eraser)::is_always_lock_free);

// SA_RESETHAND has put the default action back; the raised signal ends the process on return.
void Tidy(int signal) {
  const char* path = unfinished.load();
  if (path != nullptr) (void)unlink(path);
  if (void (*const erase)() = eraser.load(); erase != nullptr) erase();
  (void)raise(signal);
}

// Has the signals handled, from the first call on.
void TidyOnInterrupt() {
  static bool installed = false;
  if (installed) return;
  installed = true;
  for (const int signal : {SIGINT, SIGTERM, SIGHUP}) {
    struct sigaction now = {};
    // A signal that our caller ignores (nohup) stays ignored.
    if (sigaction(signal, nullptr, &now) != 0 || now.sa_handler != SIG_DFL) continue;
    now.sa_handler = Tidy;
    now.sa_flags = static_cast<int>(SA_RESETHAND);
    sigfillset(&now.sa_mask);
    (void)sigaction(signal, &now, nullptr);
  }
}

}  // namespace

void EraseOnInterrupt(void (*erase)()) {
  eraser = erase;
  TidyOnInterrupt();
}

RemoveOnInterrupt::RemoveOnInterrupt(const std::string& path) : path_(path) {
  TidyOnInterrupt();
  unfinished = path_.c_str();
}
RemoveOnInterrupt::~RemoveOnInterrupt() { unfinished = nullptr; }

}  // namespace vesk2_command
