// SPDX-License-Identifier: Apache-2.0
// effort.cpp: counting what an explanation costs.
#include "tools/vesk2/explain/effort.h"

#include <algorithm>
#include <cstdint>

#include "tools/vesk2/say/report.h"

#include <vesk2/verify.h>

namespace vesk2_command {
namespace {

// What an explanation may cost when the answer took next to nothing, and else the multiple of the
// answer's cost.
constexpr uint64_t kLeastWork = 20'000'000;
constexpr uint64_t kLeastBytes = uint64_t{48} << 20;
constexpr uint64_t kMultiple = 2;
// Of a search: so many times that.
constexpr uint64_t kSearches = 50;

struct Effort {
  bool started = false;
  uint64_t times = 1;
  uint64_t begin = 0;  // the work done before the answer, and before its explanation
  uint64_t answered = 0;
  uint64_t bytes = 0;
  const ZvVesk2::Evidence* sized = nullptr;  // whose size is known
  uint64_t size = 0;
};
Effort effort;

}  // namespace

void StartAnswer() {
  effort = Effort();
  effort.begin = ZvVesk2::Verify::WorkDone();
}

void StartEffort() {
  if (effort.started) return;  // one answer, one explanation
  effort.started = true;
  effort.answered = ZvVesk2::Verify::WorkDone();
}

void StartSearch() {
  StartAnswer();
  StartEffort();
  effort.times = kSearches;
}

void SpendEffort(uint64_t bytes) {
  effort.bytes += bytes;
  SpendEffort();
}

void SpendEffort(const ZvVesk2::Evidence& judged) {
  if (effort.sized != &judged) {
    effort.sized = &judged;
    effort.size = judged.Size();
  }
  SpendEffort(effort.size);
}

void SpendEffort() {
  if (!effort.started) return;
  const uint64_t work = ZvVesk2::Verify::WorkDone() - effort.answered;
  if (work <= effort.times * std::max(kLeastWork, kMultiple * (effort.answered - effort.begin)) &&
      effort.bytes <= effort.times * std::max(kLeastBytes, kMultiple * effort.size)) {
    return;
  }
  if (effort.times > 1) throw Trouble("the search takes too long; name fewer certificates");
  throw Trouble("it has cost several times as much as the answer");
}

}  // namespace vesk2_command
