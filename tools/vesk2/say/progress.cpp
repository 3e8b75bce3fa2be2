// SPDX-License-Identifier: Apache-2.0
// progress.cpp: the progress line.
#include "tools/vesk2/say/progress.h"

#include <cstdio>
#include <utility>

#include "tools/vesk2/say/line.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

using std::chrono::milliseconds;

constexpr milliseconds kPause{100};

std::string Bytes(double bytes) {
  constexpr const char* kUnits[] = {"B", "kB", "MB", "GB", "TB"};
  size_t unit = 0;
  for (; bytes >= 1000 && unit + 1 < std::size(kUnits); ++unit) bytes /= 1000;
  char text[32];
  std::snprintf(text, sizeof text, unit == 0 ? "%.0f %s" : "%.1f %s", bytes, kUnits[unit]);
  return text;
}

std::string Minutes(double seconds) {
  const auto whole = static_cast<unsigned long>(seconds + 0.5);
  char text[32];
  std::snprintf(text, sizeof text, "%lu:%02lu", whole / 60, whole % 60);
  return text;
}

}  // namespace

ProgressLine::ProgressLine(const std::string& doing, std::function<size_t()> total)
    : doing_(doing),
      total_(std::move(total)),
      wanted_(GetStyle().progress),
      callbacks_{sizeof callbacks_, this, nullptr,
                 [](void* user, uint64_t bytes) {
                   return static_cast<ProgressLine*>(user)->Add(0, bytes);
                 },
                 [](void* user, const char*, int) { static_cast<ProgressLine*>(user)->Add(1, 0); }},
      start_(Clock::now()),
      next_(start_ + kPause) {}

ProgressLine::~ProgressLine() {
  if (wanted_) EraseLine();
}

int ProgressLine::Add(uint64_t files, uint64_t bytes) {
  const std::lock_guard<std::mutex> locked(mutex_);
  files_ += files;
  bytes_ += bytes;
  const Clock::time_point now = Clock::now();
  if (now < next_) return 0;
  next_ = now + kPause;
  DrawLine(Text(std::chrono::duration<double>(now - start_).count()));
  return 0;
}

std::string ProgressLine::Text(double seconds) const {
  const size_t total = total_ ? total_() : 0;
  const auto bytes = static_cast<double>(bytes_);
  std::string text = doing_ + " " + std::to_string(files_);
  if (total > 0) text += "/" + std::to_string(total);
  text += " files, " + Bytes(bytes) + ", " + Bytes(bytes / seconds) + "/s";
  if (files_ == 0 || files_ > total) return text;
  const double each = seconds / static_cast<double>(files_);
  return text + ", " + Minutes(each * static_cast<double>(total - files_)) + " left";
}

}  // namespace vesk2_command
