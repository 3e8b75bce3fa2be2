// SPDX-License-Identifier: Apache-2.0
// progress.cpp: the progress line.
#include "tools/vesk2/say/progress.h"

#include <ctime>

#include <cstdio>
#include <utility>

#include "tools/vesk2/say/line.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

constexpr int64_t kPause = 100;

// In milliseconds, and some of them late: a tenth of a second is asked about, twice a file.
int64_t Now() {
  timespec now{};
  clock_gettime(CLOCK_MONOTONIC_COARSE, &now);
  return int64_t{now.tv_sec} * 1000 + now.tv_nsec / 1'000'000;
}

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
                   static_cast<ProgressLine*>(user)->Add(0, bytes);
                   return 0;
                 },
                 [](void* user, const char*, int) { static_cast<ProgressLine*>(user)->Add(1, 0); }},
      start_(Now()),
      next_(start_ + kPause) {}

ProgressLine::~ProgressLine() {
  if (wanted_) EraseLine();
}

void ProgressLine::Add(uint64_t files, uint64_t bytes) {
  if (files > 0) files_.fetch_add(files, std::memory_order_relaxed);
  if (bytes > 0) bytes_.fetch_add(bytes, std::memory_order_relaxed);
  const int64_t now = Now();
  if (now >= next_.load(std::memory_order_relaxed)) Draw(now);
}

// Of threads that come at once, one draws.
void ProgressLine::Draw(int64_t now) {
  const std::lock_guard<std::mutex> locked(drawing_);
  if (now < next_.load(std::memory_order_relaxed)) return;
  next_.store(now + kPause, std::memory_order_relaxed);
  DrawLine(Text(static_cast<double>(now - start_) / 1000));
}

std::string ProgressLine::Text(double seconds) const {
  const size_t total = total_ ? total_() : 0;
  const uint64_t files = files_;
  const auto bytes = static_cast<double>(bytes_.load());
  std::string text = doing_ + " " + (total > 0 ? std::to_string(files) + "/" : "");
  text += Plural(total > 0 ? total : files, "file") + ", " + Bytes(bytes) + ", " +
          Bytes(bytes / seconds) + "/s";
  if (files == 0 || files > total) return text;
  const double each = seconds / static_cast<double>(files);
  return text + ", " + Minutes(each * static_cast<double>(total - files)) + " left";
}

}  // namespace vesk2_command
