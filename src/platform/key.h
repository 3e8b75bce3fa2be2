// SPDX-License-Identifier: Apache-2.0
// What a key and a number are inside, for the files that define, export and use them.
#ifndef VESK2_SRC_PLATFORM_KEY_H
#define VESK2_SRC_PLATFORM_KEY_H

#include <openssl/bn.h>
#include <openssl/evp.h>

#include <array>

#include <vesk2/platform.h>

#include "src/platform/openssl.h"

// A number, in libcrypto's form, cleared when it goes.
struct ZVCLMBigInt {
  ZVsysutil::Evp<BIGNUM, BN_clear_free> value;
};

// A key is its numbers, in the order of its record: n, e for RSA and p, q, g, y for DSA. What
// libcrypto makes of them is found out when they are used: a key is an identity first, and one odd
// key in a store must not keep the others from being read.
struct ZVCLMPublicKeyData {
  static constexpr size_t kMaxNumbers = 4;
  const BIGNUM* number(size_t index) const { return numbers[index].get(); }

  int type = ZVCLM_KEY_RSA;
  std::array<ZVsysutil::Evp<BIGNUM, BN_clear_free>, kMaxNumbers> numbers;
};

namespace ZVsysutil {

enum RsaNumber : size_t { kRsaN, kRsaE };
enum DsaNumber : size_t { kDsaP, kDsaQ, kDsaG, kDsaY };

using PkeyOwner = Evp<EVP_PKEY, EVP_PKEY_free>;

// The key as libcrypto's own object, which takes any numbers: null is a lack of memory.
PkeyOwner MakePkey(const ZVCLMPublicKeyData& key);

}  // namespace ZVsysutil

#endif  // VESK2_SRC_PLATFORM_KEY_H
