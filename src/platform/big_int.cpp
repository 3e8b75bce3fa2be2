// SPDX-License-Identifier: Apache-2.0
// Big integers: unsigned, big-endian, written without leading zeros. Zero is one 0 byte, because an
// empty byte string could not be read back everywhere. Numbers are taken as they come, of any size
// that fits an int: what is too large to verify with is refused where it would be used
// (verify.cpp).
#include <openssl/crypto.h>

#include <algorithm>
#include <climits>
#include <new>

#include "src/platform/key.h"

ZVCLMBigInt::~ZVCLMBigInt() { OPENSSL_cleanse(bytes.get(), length); }

// An output that is not null is refused: overwriting it would lose a number.
int zvclm_BigIntFromBuffer(ZVCLMBigInt** number, const unsigned char* data, uint32_t length) {
  if (number == nullptr || *number != nullptr) return ZVCLM_ERR_NULL_PARAM;
  if (data == nullptr && length > 0) return ZVCLM_ERR_NULL_PARAM;
  // libcrypto counts in ints.
  if (length > INT_MAX) return ZVCLM_ERR_NO_MEM;
  const ZVsysutil::ZvBytes bytes = ZVsysutil::WithoutZeros({data, length});
  std::unique_ptr<ZVCLMBigInt> made(new (std::nothrow) ZVCLMBigInt);
  if (made == nullptr) return ZVCLM_ERR_NO_MEM;
  made->bytes.reset(new (std::nothrow) unsigned char[bytes.size()]);
  if (made->bytes == nullptr) return ZVCLM_ERR_NO_MEM;
  std::ranges::copy(bytes, made->bytes.get());
  made->length = bytes.size();
  *number = made.release();
  return 0;
}

int zvclm_BigIntGetBufferSize(const ZVCLMBigInt* number) {
  if (number == nullptr) return -1;
  return static_cast<int>(std::max<size_t>(1, number->length));
}

// As long as was told, so that the two calls cannot disagree.
int zvclm_BigIntToBuffer(const ZVCLMBigInt* number, unsigned char* out, uint32_t* size) {
  if (number == nullptr || out == nullptr || size == nullptr) return ZVCLM_ERR_NULL_PARAM;
  const auto wanted = static_cast<uint32_t>(zvclm_BigIntGetBufferSize(number));
  if (*size < wanted) return ZVCLM_ERR_BUFFER_TOO_SMALL;
  out[0] = 0;
  std::ranges::copy(number->get(), out);
  *size = wanted;
  return 0;
}
