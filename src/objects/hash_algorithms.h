// SPDX-License-Identifier: Apache-2.0
// The three hash algorithms, as identifier, name in expressions and digest length. Everything that
// is not in this table is refused. SHA-1 is among them because stored keys, entries and lists use
// it; nothing new should. The reduction takes the first two only.
#ifndef VESK2_SRC_OBJECTS_HASH_ALGORITHMS_H
#define VESK2_SRC_OBJECTS_HASH_ALGORITHMS_H

#include <array>
#include <string_view>

#include <vesk2/platform.h>

namespace ZvVesk2 {

struct HashAlgorithm {
  ZvclmHashID id;
  const char* name;
  unsigned int digestLength;
};

inline constexpr std::array<HashAlgorithm, 3> kHashAlgorithms{{
    {ZVCLM_HASH_SHA256, "sha256", 32},
    {ZVCLM_HASH_SHA1, "sha1", 20},
    {ZVCLM_HASH_RMD160, "rmd160", 20},
}};

// Null for an unknown one.
inline const HashAlgorithm* FindHashAlgorithm(ZvclmHashID id) {
  for (const HashAlgorithm& algorithm : kHashAlgorithms) {
    if (algorithm.id == id) return &algorithm;
  }
  return nullptr;
}
// The whole name: "sha" is none.
inline const HashAlgorithm* FindHashAlgorithm(std::string_view name) {
  for (const HashAlgorithm& algorithm : kHashAlgorithms) {
    if (name == algorithm.name) return &algorithm;
  }
  return nullptr;
}

}  // namespace ZvVesk2

#endif  // VESK2_SRC_OBJECTS_HASH_ALGORITHMS_H
