// interrupt.cpp: the signal handler. It does nothing that POSIX does not allow in one.
#include "tools/vesk2/interrupt.h"

#include <unistd.h>

#include <atomic>
#include <csignal>

#include "tools/vesk2/line.h"

namespace vesk2_command {
namespace {

std::atomic<const char*> unfinished = nullptr;
static_assert(decltype(unfinished)::is_always_lock_free);

// SA_RESETHAND has put the default action back; the raised signal ends the process on return.
void Tidy(int signal) {
  const char* path = unfinished.load();
  if (path != nullptr) (void)unlink(path);
  EraseLine();
  (void)raise(signal);
}

}  // namespace

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

RemoveOnInterrupt::RemoveOnInterrupt(const std::string& path) : path_(path) {
  TidyOnInterrupt();
  unfinished = path_.c_str();
}
RemoveOnInterrupt::~RemoveOnInterrupt() { unfinished = nullptr; }

}  // namespace vesk2_command
