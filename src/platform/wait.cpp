// SPDX-License-Identifier: Apache-2.0
// See wait.h. The marks lie on the stacks of the calls, linked by one pointer for each thread:
// nothing is allocated, as waiting must work when memory has run out.
#include "src/platform/wait.h"

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <ctime>

#include <vesk2/limits.h>

namespace ZVsysutil {
namespace {

// In the block that every thread has from its start: storage that is made on demand cannot be
// refused, so without memory the process would end.
__attribute__((tls_model("initial-exec"))) thread_local ZvCall* outermost = nullptr;

// Atomic, as threads of a comparison read it while a test may set it.
std::atomic<uint32_t> allowance{ZvVesk2::Limits::kMaxHeldWait};

// By a clock that nobody sets; a signal does not shorten it.
void Sleep(uint32_t milliseconds) {
  timespec left{};
  left.tv_sec = static_cast<time_t>(milliseconds / 1000);
  left.tv_nsec = static_cast<long>(milliseconds % 1000) * 1'000'000;
  while (clock_nanosleep(CLOCK_MONOTONIC, 0, &left, &left) == EINTR) {
  }
}

}  // namespace

ZvCall::ZvCall() : outer_(outermost), shared_(outer_ != nullptr ? outer_ : this) {
  outermost = shared_;
}

// It starts with what the call has waited already, so that threads which come late do not wait a
// minute more.
ZvCall::ZvCall(ZvCall& begun)
    : outer_(outermost), begun_(begun.shared_), shared_(outer_ == begun_ ? outer_ : this) {
  if (shared_ == this) waited_ = begun_->waited_.load();
  outermost = shared_;
}

// What the longest of its threads waited counts for the call, not the sum: they waited at the same
// time.
ZvCall::~ZvCall() {
  outermost = outer_;
  if (shared_ != this || begun_ == nullptr) return;
  uint32_t known = begun_->waited_;
  while (known < waited_ && !begun_->waited_.compare_exchange_weak(known, waited_)) {
  }
}

// Asked for the last time, it gives what is left, and then nothing.
bool ZvCall::Pause(uint32_t milliseconds) {
  std::atomic<uint32_t>& waited = shared_->waited_;
  const uint32_t most = allowance;
  const uint32_t pause = std::min(milliseconds, most - std::min<uint32_t>(most, waited));
  if (pause == 0) return false;
  Sleep(pause);
  waited += pause;
  return true;
}

void zv_limit_waits(uint32_t milliseconds) {
  allowance = milliseconds != 0 ? milliseconds : ZvVesk2::Limits::kMaxHeldWait;
}

}  // namespace ZVsysutil
