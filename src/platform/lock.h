// SPDX-License-Identifier: Apache-2.0
// A lock among the threads of a caller; the library itself has none. It is held for the time of
// handing out work, never while files are read.
#ifndef VESK2_SRC_PLATFORM_LOCK_H
#define VESK2_SRC_PLATFORM_LOCK_H

#include <pthread.h>

namespace ZVsysutil {

class ZvLock {
 public:
  ZvLock() = default;
  ZvLock(const ZvLock&) = delete;
  ZvLock& operator=(const ZvLock&) = delete;

 private:
  friend class ZvLocked;
  pthread_mutex_t mutex_ = PTHREAD_MUTEX_INITIALIZER;
};

// Holds the lock for as long as it lives. pthreads' own calls are used, as they do not throw.
class ZvLocked {
 public:
  explicit ZvLocked(ZvLock& lock) : mutex_(&lock.mutex_) { pthread_mutex_lock(mutex_); }
  ~ZvLocked() { pthread_mutex_unlock(mutex_); }
  ZvLocked(const ZvLocked&) = delete;
  ZvLocked& operator=(const ZvLocked&) = delete;

 private:
  pthread_mutex_t* mutex_;
};

}  // namespace ZVsysutil

#endif  // VESK2_SRC_PLATFORM_LOCK_H
