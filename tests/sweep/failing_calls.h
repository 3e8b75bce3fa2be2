// SPDX-License-Identifier: Apache-2.0
// Calls of the C library that fail on demand, whoever makes them: the program, the library,
// libcrypto or the C++ runtime. A shared library that stands before the C library, because a
// program was linked with it, or by LD_PRELOAD. It counts the calls of one kind and fails the n-th.
#ifndef VESK2_TESTS_SWEEP_FAILING_CALLS_H
#define VESK2_TESTS_SWEEP_FAILING_CALLS_H

#ifdef __cplusplus
extern "C" {
#endif

enum FailingCall {
  kMemory,  // malloc and its kin
  kOpen,    // open, openat, fopen, opendir: what takes a descriptor
  kRead,
  kScan,  // readdir
  kStat,  // stat and its kin, access, readlink, realpath
  kClock,
};

// In place of an errno, for kRead: half of what was asked for, and an end of file.
enum { kShortRead = -1, kEarlyEnd = -2 };

// From FailCalls on, the n-th call of the kind (from 0) fails with `error`; with `lasting` all that
// follow too. The first to fail is told on the descriptor `record`: its name, and with `trace` what
// it was about and who made it.
void FailCalls(int call, long n, int error, int lasting, int record, int trace);
void LetCallsBe(void);

// TraceCalls fails none, and writes a TracedCall to `record` for each.
struct TracedCall {
  long call;
  unsigned long way;  // the same for calls that came the same way
};
void TraceCalls(int record);

// A program that is run with this variable fails from its start on, by the arguments of FailCalls,
// between blanks.
#define VESK2_FAIL_CALLS "VESK2_FAIL_CALLS"

#ifdef __cplusplus
}
#endif

#endif  // VESK2_TESTS_SWEEP_FAILING_CALLS_H
