// SPDX-License-Identifier: Apache-2.0
// Waiting for files that other processes hold.
//
// A process can hold a lease on a file (file servers do); opening it without blocking fails until
// the holder lets go. Such a file is not absent, and it is worth a wait; but whoever may hold files
// of a tree or of a store must not be able to stop us for a time of his choosing. All waits within
// one call of the library therefore share one allowance, Limits::kMaxHeldWait.
#ifndef VESK2_SRC_PLATFORM_WAIT_H
#define VESK2_SRC_PLATFORM_WAIT_H

#include <atomic>
#include <cstdint>

namespace ZVsysutil {

// ZvCall marks one operation as its caller sees it: what opens more than one file makes one first.
// The outermost of a thread brings the allowance, those inside share it. They live on the stack.
class ZvCall {
 public:
  ZvCall();
  // The same inside an operation that `begun` marks, on a thread that works for it: it may wait as
  // long as was left when it came, since threads that wait at the same time keep nobody longer.
  explicit ZvCall(ZvCall& begun);
  ~ZvCall();
  ZvCall(const ZvCall&) = delete;
  ZvCall& operator=(const ZvCall&) = delete;

  // Sleeps up to `milliseconds` of what is left of the allowance; false, at once, when that is
  // nothing.
  bool Pause(uint32_t milliseconds);
  // The milliseconds that were slept.
  uint32_t Waited() const { return shared_->waited_; }

 private:
  ZvCall* const outer_;            // of this thread, before
  ZvCall* const begun_ = nullptr;  // the outermost of the thread that is worked for
  ZvCall* shared_;                 // the outermost
  std::atomic<uint32_t> waited_ = 0;
};

// Sets the allowance of every call, for tests that cannot wait; 0 is as long as ever.
void zv_limit_waits(uint32_t milliseconds);

}  // namespace ZVsysutil

#endif  // VESK2_SRC_PLATFORM_WAIT_H
