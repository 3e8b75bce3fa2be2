// interrupt.cpp: the signal handler. It does nothing that POSIX does not allow in one.
#include "tools/vesk2/interrupt.h"

#include <unistd.h>

#include <atomic>
#include <csignal>

namespace vesk2_command {
namespace {

std::atomic<const char*> unfinished = nullptr;
std::atomic<bool> line = false;
static_assert(decltype(unfinished)::is_always_lock_free && decltype(line)::is_always_lock_free);

// SA_RESETHAND has put the default action back; the raised signal ends the process on return.
void Tidy(int signal) {
  const char* path = unfinished.load();
  if (path != nullptr) (void)unlink(path);
  if (line.load() && write(STDERR_FILENO, kEraseLine, sizeof kEraseLine - 1) < 0) {
    // Nothing can be done about a terminal that is gone.
  }
  (void)raise(signal);
}

void Install() {
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

RemoveOnInterrupt::RemoveOnInterrupt(const std::string& path) : path_(path) {
  Install();
  unfinished = path_.c_str();
}
RemoveOnInterrupt::~RemoveOnInterrupt() { unfinished = nullptr; }

EraseLineOnInterrupt::EraseLineOnInterrupt() {
  Install();
  line = true;
}
EraseLineOnInterrupt::~EraseLineOnInterrupt() { line = false; }

}  // namespace vesk2_command
