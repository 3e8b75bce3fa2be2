// interrupt.h: what is tidied up when SIGINT, SIGTERM or SIGHUP ends the command: an unfinished
// file is removed and a progress line erased, and then the signal ends the process as it would have
// without us, so that a shell sees what happened.
#ifndef VESK2_TOOLS_INTERRUPT_H
#define VESK2_TOOLS_INTERRUPT_H

#include <string>

namespace vesk2_command {

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

// EraseLineOnInterrupt stands for a line drawn on standard error that has not been ended.
class EraseLineOnInterrupt {
 public:
  EraseLineOnInterrupt();
  ~EraseLineOnInterrupt();
  EraseLineOnInterrupt(const EraseLineOnInterrupt&) = delete;
  EraseLineOnInterrupt& operator=(const EraseLineOnInterrupt&) = delete;
};

// Moves to the start of a terminal's line and erases it.
inline constexpr char kEraseLine[] = "\r\033[K";

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_INTERRUPT_H
