// SPDX-License-Identifier: Apache-2.0
// progress.h: how far the reading of a tree has come, in a line on the terminal.
#ifndef VESK2_TOOLS_PROGRESS_H
#define VESK2_TOOLS_PROGRESS_H

#include <chrono>
#include <cstdint>
#include <mutex>
#include <string>

#include <vesk2.h>

namespace vesk2_command {

// ProgressLine shows files, bytes, rate and the time that is left while its callbacks are called,
// if the style asks for it. The line is gone with the object, and before anything else is said.
class ProgressLine {
 public:
  // `directory` is looked through first, for the sums that are to be reached.
  ProgressLine(const std::string& doing, const std::string& directory);
  ~ProgressLine();
  ProgressLine(const ProgressLine&) = delete;
  ProgressLine& operator=(const ProgressLine&) = delete;

  // For Manifest::SetFileCallbacks and Hash::HashFile; null when there is no line to draw. They
  // live as long as this object, and any thread may call them.
  const Vesk2FileCallbacks* Callbacks() const { return wanted_ ? &callbacks_ : nullptr; }

 private:
  using Clock = std::chrono::steady_clock;
  struct Sums {
    uint64_t files = 0;
    uint64_t bytes = 0;
  };
  static Sums LookThrough(const std::string& directory);
  int Add(uint64_t files, uint64_t bytes);
  std::string Text(double seconds) const;

  const std::string doing_;
  const bool wanted_;
  const Vesk2FileCallbacks callbacks_;
  const Sums expected_;
  std::mutex mutex_;  // of what follows
  Sums done_;
  const Clock::time_point start_;
  Clock::time_point next_;  // when to draw again
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_PROGRESS_H
