// SPDX-License-Identifier: Apache-2.0
// progress.cpp: the progress line.
#include "tools/vesk2/say/progress.h"

#include <cstdio>
#include <filesystem>

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

ProgressLine::ProgressLine(const std::string& doing, const std::string& directory)
    : doing_(doing),
      wanted_(GetStyle().progress),
      callbacks_{sizeof callbacks_, this, nullptr,
                 [](void* user, uint64_t bytes) {
                   return static_cast<ProgressLine*>(user)->Add(0, bytes);
                 },
                 [](void* user, const char*, int) { static_cast<ProgressLine*>(user)->Add(1, 0); }},
      expected_(wanted_ ? LookThrough(directory) : Sums()),
      start_(Clock::now()),
      next_(start_ + kPause) {}

ProgressLine::~ProgressLine() {
  if (wanted_) EraseLine();
}

// An estimate: links are not followed, and what cannot be read is left out.
ProgressLine::Sums ProgressLine::LookThrough(const std::string& directory) {
  namespace fs = std::filesystem;
  Sums sums;
  std::error_code error;
  fs::recursive_directory_iterator each(directory, fs::directory_options::skip_permission_denied,
                                        error);
  while (!error && each != fs::recursive_directory_iterator()) {
    std::error_code ignored;
    if (each->is_regular_file(ignored)) {
      const uintmax_t size = each->file_size(ignored);
      if (!ignored) sums = {sums.files + 1, sums.bytes + size};
    }
    each.increment(error);
  }
  return sums;
}

int ProgressLine::Add(uint64_t files, uint64_t bytes) {
  const std::lock_guard<std::mutex> locked(mutex_);
  done_ = {done_.files + files, done_.bytes + bytes};
  const Clock::time_point now = Clock::now();
  if (now < next_) return 0;
  next_ = now + kPause;
  DrawLine(Text(std::chrono::duration<double>(now - start_).count()));
  return 0;
}

std::string ProgressLine::Text(double seconds) const {
  const auto bytes = static_cast<double>(done_.bytes);
  const double rate = bytes / seconds;
  std::string text = doing_ + " " + std::to_string(done_.files);
  const bool known = done_.files <= expected_.files && done_.bytes <= expected_.bytes;
  if (known) text += "/" + std::to_string(expected_.files);
  text += " files, " + Bytes(bytes);
  if (known) text += " of " + Bytes(static_cast<double>(expected_.bytes));
  text += ", " + Bytes(rate) + "/s";
  if (!known || rate <= 0) return text;
  return text + ", " + Minutes(static_cast<double>(expected_.bytes - done_.bytes) / rate) + " left";
}

}  // namespace vesk2_command
