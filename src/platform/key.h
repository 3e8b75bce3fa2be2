// SPDX-License-Identifier: Apache-2.0
// What a key and a number are inside, for the files that define, export and use them.
#ifndef VESK2_SRC_PLATFORM_KEY_H
#define VESK2_SRC_PLATFORM_KEY_H

#include <openssl/evp.h>

#include <array>
#include <memory>

#include <vesk2/platform.h>

#include "src/platform/crypto.h"
#include "src/platform/openssl.h"

// A number as its bytes, the first of which is not 0; cleared when it goes.
struct ZVCLMBigInt {
  ~ZVCLMBigInt();
  ZVsysutil::ZvBytes get() const { return {bytes.get(), length}; }

  std::unique_ptr<unsigned char[]> bytes;
  size_t length = 0;
};

// A key is its numbers, in the order of its record: n, e for RSA and p, q, g, y for DSA. They stay
// bytes, the first of which is not 0: most keys of a store are never verified with. What libcrypto
// makes of them is found out when they are used: a key is an identity first, and one odd key in a
// store must not keep the others from being read.
struct ZVCLMPublicKeyData {
  static constexpr size_t kMaxNumbers = 4;

  int type = ZVCLM_KEY_RSA;
  std::array<ZVsysutil::ZvBytes, kMaxNumbers> numbers;
  std::unique_ptr<unsigned char[]> bytes;  // of all numbers
};

namespace ZVsysutil {

enum RsaNumber : size_t { kRsaN, kRsaE };
enum DsaNumber : size_t { kDsaP, kDsaQ, kDsaG, kDsaY };

using PkeyOwner = Evp<EVP_PKEY, EVP_PKEY_free>;

// The key as libcrypto's own object, which takes any numbers: null is a lack of memory.
PkeyOwner MakePkey(const ZVCLMPublicKeyData& key);

}  // namespace ZVsysutil

#endif  // VESK2_SRC_PLATFORM_KEY_H
