// SPDX-License-Identifier: Apache-2.0
// Allocation that fails on demand, by replacing the program's operator new and libcrypto's
// allocator. The library asks with std::nothrow, and only such requests fail; test code, whose
// requests throw, runs as ever.
#ifndef VESK2_TESTS_SWEEP_FAILING_MEMORY_H
#define VESK2_TESTS_SWEEP_FAILING_MEMORY_H

namespace vesk2test {

// From Arm(n) on, the n-th allocation (from 0) fails: once, or it and all that follow. Disarm ends
// that and tells whether it came to it, and whose allocation was the first.
enum class Shortage { kOnce, kLasting };
enum class Fired { kNot, kLibrary, kLibcrypto };
void Arm(long n, Shortage shortage);
Fired Disarm();

}  // namespace vesk2test

#endif  // VESK2_TESTS_SWEEP_FAILING_MEMORY_H
