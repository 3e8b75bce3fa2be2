// SPDX-License-Identifier: Apache-2.0
// terminal.cpp: reading without showing. libcrypto has a reader of its own, which takes a signal
// for an empty answer: the command would go on where its user wanted it to end.
#include "tools/vesk2/keys/terminal.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <termios.h>
#include <unistd.h>

#include <array>
#include <cerrno>

namespace vesk2_command {
namespace {

constexpr std::array kSignals = {SIGINT, SIGTERM, SIGHUP, SIGQUIT};
volatile sig_atomic_t caught = 0;

void Catch(int signal) { caught = signal; }

// While it lives, signals are only noted, and only come in while Wait waits.
class SignalsNoted {
 public:
  SignalsNoted() {
    caught = 0;
    sigset_t blocked;
    sigemptyset(&blocked);
    for (const int signal : kSignals) sigaddset(&blocked, signal);
    (void)pthread_sigmask(SIG_BLOCK, &blocked, &mask_);
    struct sigaction note = {};
    note.sa_handler = Catch;
    for (size_t i = 0; i < kSignals.size(); ++i) {
      (void)sigaction(kSignals[i], nullptr, &before_[i]);
      // What our caller ignores (nohup) stays ignored.
      if (before_[i].sa_handler != SIG_IGN) (void)sigaction(kSignals[i], &note, nullptr);
    }
  }
  ~SignalsNoted() {
    for (size_t i = 0; i < kSignals.size(); ++i) (void)sigaction(kSignals[i], &before_[i], nullptr);
    (void)pthread_sigmask(SIG_SETMASK, &mask_, nullptr);
    // Now as if it had come by itself.
    if (caught != 0) (void)raise(caught);
  }
  SignalsNoted(const SignalsNoted&) = delete;
  SignalsNoted& operator=(const SignalsNoted&) = delete;

  // Whether there is something to be read; false for a signal.
  bool Wait(int file) const {
    pollfd ready = {file, POLLIN, 0};
    while (caught == 0) {
      if (ppoll(&ready, 1, nullptr, &mask_) > 0) return true;
      if (errno != EINTR) return false;
    }
    return false;
  }

 private:
  sigset_t mask_ = {};
  std::array<struct sigaction, kSignals.size()> before_ = {};
};

class NoEcho {
 public:
  explicit NoEcho(int file) : file_(file), known_(tcgetattr(file, &before_) == 0) {
    termios quiet = before_;
    quiet.c_lflag &= ~static_cast<tcflag_t>(ECHO);
    quiet.c_lflag |= ICANON | ISIG;
    if (known_) (void)tcsetattr(file_, TCSAFLUSH, &quiet);
  }
  ~NoEcho() {
    if (known_) (void)tcsetattr(file_, TCSAFLUSH, &before_);
  }
  NoEcho(const NoEcho&) = delete;
  NoEcho& operator=(const NoEcho&) = delete;

 private:
  const int file_;
  termios before_ = {};
  const bool known_;
};

void Show(int file, std::string_view text) {
  const ssize_t written = write(file, text.data(), text.size());
  static_cast<void>(written);
}

// Up to the end of the line; what has no room is read and forgotten.
int ReadLine(int file, const SignalsNoted& signals, char* out, int size) {
  int length = 0;
  for (char byte = 0; signals.Wait(file);) {
    const ssize_t got = read(file, &byte, 1);
    if (got < 0 && errno == EINTR) continue;
    if (got <= 0) return -1;
    if (byte == '\n') {
      if (length >= size) return -1;
      out[length] = '\0';
      return length;
    }
    if (length < size) out[length++] = byte;
  }
  return -1;
}

}  // namespace

Terminal::Terminal() : file_(open("/dev/tty", O_RDWR | O_CLOEXEC | O_NOCTTY)) {}

int Terminal::Ask(const std::string& prompt, char* out, int size) const {
  const SignalsNoted signals;  // ends last: the terminal is as it was when the signal is raised
  const NoEcho quiet(file_.get());
  Show(file_.get(), prompt);
  const int length = ReadLine(file_.get(), signals, out, size);
  Show(file_.get(), "\n");
  return length;
}

}  // namespace vesk2_command
