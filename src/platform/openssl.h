// SPDX-License-Identifier: Apache-2.0
// Owners of libcrypto's objects, and what the files over libcrypto share. Nothing of libcrypto is
// seen outside this folder: its errors become codes here, and its queue is left as it was found.
#ifndef VESK2_SRC_PLATFORM_OPENSSL_H
#define VESK2_SRC_PLATFORM_OPENSSL_H

#include <openssl/err.h>
#include <openssl/types.h>

#include <cstdint>
#include <memory>

namespace ZVsysutil {

template <auto Free>
struct EvpDeleter {
  template <typename T>
  void operator()(T* object) const {
    Free(object);
  }
};
// An owned libcrypto object with the function that frees it: Evp<EVP_PKEY, EVP_PKEY_free>.
template <typename T, auto Free>
using Evp = std::unique_ptr<T, EvpDeleter<Free>>;

// Takes back the entries that a failing call left in libcrypto's error queue, and only those: the
// queue belongs to the thread, and the caller may be reading it.
class ErrorMark {
 public:
  ErrorMark() { ERR_set_mark(); }
  ~ErrorMark() { ERR_pop_to_mark(); }
  ErrorMark(const ErrorMark&) = delete;
  ErrorMark& operator=(const ErrorMark&) = delete;
};

// The bytes of the digests of a ZvclmHashID, 0 for an unknown one.
uint32_t HashLength(int64_t id);
// libcrypto's algorithm, borrowed; null for an unknown one and without memory.
const EVP_MD* HashAlgorithm(int64_t id);

}  // namespace ZVsysutil

#endif  // VESK2_SRC_PLATFORM_OPENSSL_H
