// SPDX-License-Identifier: Apache-2.0
// line.cpp: drawing over a line of the terminal.
#include "tools/vesk2/say/line.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <atomic>
#include <string_view>

#include "tools/vesk2/say/interrupt.h"

namespace vesk2_command {
namespace {

constexpr std::string_view kErase = "\r\033[K";

std::atomic<bool> drawn = false;
static_assert(decltype(drawn)::is_always_lock_free);

// A terminal that is gone takes nothing; that is no reason to stop.
void Put(std::string_view text) {
  [[maybe_unused]] const ssize_t written = write(STDERR_FILENO, text.data(), text.size());
}

size_t TerminalWidth() {
  constexpr size_t kUsual = 80;
  winsize size = {};
  return ioctl(STDERR_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 1 ? size.ws_col : kUsual;
}

}  // namespace

void DrawLine(const std::string& text) {
  EraseOnInterrupt(EraseLine);
  drawn = true;
  // A line that fills the last column would wrap, and could not be erased any more.
  Put(std::string(kErase) + text.substr(0, TerminalWidth() - 1));
}

void EraseLine() {
  if (drawn.exchange(false)) Put(kErase);
}

}  // namespace vesk2_command
