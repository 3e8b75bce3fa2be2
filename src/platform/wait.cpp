// SPDX-License-Identifier: Apache-2.0
// See wait.h.
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

std::atomic<uint32_t> allowance{ZvVesk2::Limits::kMaxHeldWait};

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

ZvCall::ZvCall(ZvCall& begun)
    : outer_(outermost), begun_(begun.shared_), shared_(outer_ == begun_ ? outer_ : this) {
  if (shared_ == this) waited_ = begun_->waited_.load();
  outermost = shared_;
}

ZvCall::~ZvCall() {
  outermost = outer_;
  if (shared_ != this || begun_ == nullptr) return;
  uint32_t known = begun_->waited_;
  while (known < waited_ && !begun_->waited_.compare_exchange_weak(known, waited_)) {
  }
}

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
