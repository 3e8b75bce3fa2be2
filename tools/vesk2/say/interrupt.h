// SPDX-License-Identifier: Apache-2.0
// interrupt.h: what is tidied up when SIGINT, SIGTERM or SIGHUP ends the command: an unfinished
// file is removed and what is drawn erased, and then the signal ends the process as it would have
// without us, so that a shell sees what happened.
#ifndef VESK2_TOOLS_INTERRUPT_H
#define VESK2_TOOLS_INTERRUPT_H

#include <string>

namespace vesk2_command {

// Has `erase` called when a signal comes. It may do only what POSIX allows in a handler.
void EraseOnInterrupt(void (*erase)());

// RemoveOnInterrupt holds the name of a file that must not survive an interruption. One at a time.
class RemoveOnInterrupt {
 public:
  explicit RemoveOnInterrupt(const std::string& path);
  ~RemoveOnInterrupt();
  RemoveOnInterrupt(const RemoveOnInterrupt&) = delete;
  RemoveOnInterrupt& operator=(const RemoveOnInterrupt&) = delete;

 private:
  const std::string path_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_INTERRUPT_H
