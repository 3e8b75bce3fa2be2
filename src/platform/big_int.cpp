// SPDX-License-Identifier: Apache-2.0
// Big integers: unsigned, big-endian, written without leading zeros. Zero is one 0 byte, because an
// empty byte string could not be read back everywhere. Numbers are taken as they come, of any size
// that fits an int: what is too large to verify with is refused where it would be used
// (verify.cpp).
#include <climits>
#include <new>

#include "src/platform/key.h"

// An output that is not null is refused: overwriting it would lose a number.
int zvclm_BigIntFromBuffer(ZVCLMBigInt** number, const unsigned char* data, uint32_t length) {
  if (number == nullptr || *number != nullptr) return ZVCLM_ERR_NULL_PARAM;
  if (data == nullptr && length > 0) return ZVCLM_ERR_NULL_PARAM;
  // libcrypto counts in ints.
  if (length > INT_MAX) return ZVCLM_ERR_NO_MEM;
  const ZVsysutil::ErrorMark mark;
  std::unique_ptr<ZVCLMBigInt> made(new (std::nothrow) ZVCLMBigInt);
  if (made == nullptr) return ZVCLM_ERR_NO_MEM;
  made->value.reset(BN_bin2bn(data, static_cast<int>(length), nullptr));
  if (made->value == nullptr) return ZVCLM_ERR_NO_MEM;
  *number = made.release();
  return 0;
}

int zvclm_BigIntGetBufferSize(const ZVCLMBigInt* number) {
  if (number == nullptr) return -1;
  return BN_is_zero(number->value.get()) ? 1 : BN_num_bytes(number->value.get());
}

// Padded to the length that was told, so that the two calls cannot disagree.
int zvclm_BigIntToBuffer(const ZVCLMBigInt* number, unsigned char* out, uint32_t* size) {
  if (number == nullptr || out == nullptr || size == nullptr) return ZVCLM_ERR_NULL_PARAM;
  const int wanted = zvclm_BigIntGetBufferSize(number);
  if (*size < static_cast<uint32_t>(wanted)) return ZVCLM_ERR_BUFFER_TOO_SMALL;
  BN_bn2binpad(number->value.get(), out, wanted);
  *size = static_cast<uint32_t>(wanted);
  return 0;
}
