// SPDX-License-Identifier: Apache-2.0
// progress.h: how far the reading of a tree has come, in a line on the terminal.
#ifndef VESK2_TOOLS_PROGRESS_H
#define VESK2_TOOLS_PROGRESS_H

#include <atomic>
#include <cstdint>
#include <functional>
#include <mutex>
#include <string>

#include <vesk2.h>

namespace vesk2_command {

// ProgressLine shows files, bytes and rate while its callbacks are called, if the style asks for
// it, and how many files there will be and the time that is left where somebody knows. Nobody looks
// through the tree for that: it would take as long as verifying some trees. The line is gone with
// the object, and before anything else is said.
class ProgressLine {
 public:
  // `total` tells how many files there are when the first was read; 0 when that is not known.
  explicit ProgressLine(const std::string& doing, std::function<size_t()> total = nullptr);
  ~ProgressLine();
  ProgressLine(const ProgressLine&) = delete;
  ProgressLine& operator=(const ProgressLine&) = delete;

  // For Manifest::SetFileCallbacks and Hash::HashFile; null when there is no line to draw. They
  // live as long as this object, and any thread may call them.
  const Vesk2FileCallbacks* Callbacks() const { return wanted_ ? &callbacks_ : nullptr; }

 private:
  // Called twice for each file of a million: it counts, and looks at a clock that costs little.
  void Add(uint64_t files, uint64_t bytes);
  void Draw(int64_t now);
  std::string Text(double seconds) const;

  const std::string doing_;
  const std::function<size_t()> total_;
  const bool wanted_;
  const Vesk2FileCallbacks callbacks_;
  std::atomic<uint64_t> files_ = 0;
  std::atomic<uint64_t> bytes_ = 0;
  const int64_t start_;        // in milliseconds
  std::atomic<int64_t> next_;  // when to draw again
  std::mutex drawing_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_PROGRESS_H
