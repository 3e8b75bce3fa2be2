// SPDX-License-Identifier: Apache-2.0
// Propagation of error codes. Every operation of the library returns an int code, 0 for success;
// these two helpers and a plain `return code` are the only ways a failure travels.
#ifndef VESK2_SRC_FRAME_CHECK_H
#define VESK2_SRC_FRAME_CHECK_H

#include <new>
#include <utility>

#include <vesk2.h>

// Returns the code of `expression` from the enclosing function unless it is 0. The good path is
// then the one that is not indented, and no result can be dropped on the way.
#define VESK2_TRY(expression)                                               \
  do {                                                                      \
    if (const int vesk2_code = (expression); vesk2_code) return vesk2_code; \
  } while (false)

// Returns `code` from the enclosing function unless `condition` holds.
#define VESK2_REQUIRE(condition, code) \
  do {                                 \
    if (!(condition)) return (code);   \
  } while (false)

namespace ZvVesk2 {

// Whether a code tells of a lack of memory, the crypto layer's included. Where a file or an object
// that fails is passed over, one that only lacked memory is not: what it says may be what matters.
[[nodiscard]] constexpr bool LacksMemory(int code) {
  constexpr int kCryptoNoMemory = 1007;
  return code == VESK2_ERR_MEM_ALLOC || code == kCryptoNoMemory;
}

// InOwnWords turns the crypto layer's lack of memory into the library's: whoever asks the library
// for a verdict knows one code for it, whichever layer ran short.
[[nodiscard]] constexpr int InOwnWords(int code) {
  return LacksMemory(code) ? VESK2_ERR_MEM_ALLOC : code;
}

// Whether what failed with `code` may not be passed over as if it were absent: it lacked memory, or
// it is a file that is there and that another process holds (VESK2_ERR_READ_FILE).
[[nodiscard]] constexpr bool IsNoAbsence(int code) {
  return LacksMemory(code) || code == VESK2_ERR_READ_FILE;
}

// The library is built without exceptions: memory that cannot be had is a null pointer, tested
// where it is asked for. Plain values only: a class that may throw in its constructor has no place
// here.
template <typename T, typename... Args>
[[nodiscard]] T* TryNew(Args&&... args) {
  return new (std::nothrow) T(std::forward<Args>(args)...);
}
template <typename T>
[[nodiscard]] T* TryNewArray(std::size_t count) {
  return new (std::nothrow) T[count];
}

}  // namespace ZvVesk2

#endif  // VESK2_SRC_FRAME_CHECK_H
