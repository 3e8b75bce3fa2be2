// SPDX-License-Identifier: Apache-2.0
// Hash::DumpFingerprint: the line that people compare by eye. The text comes from a record
// (hashText), whose digest is raw bytes: it is taken by length, and looked at no further than that.
#include <vesk2/hash.h>

#include <cstring>
#include <string_view>

#include "src/objects/hash_algorithms.h"
#include "src/platform/text.h"

namespace ZvVesk2 {

// "(hash " <name> " " <bytes> ")". The bytes are raw and may hold blanks and parentheses, so only
// the first blank and the last byte count.
char* Hash::DumpFingerprint(char* out, const unsigned char* text, unsigned int length) {
  constexpr std::string_view kPrefix = "(hash ";
  const std::string_view all(reinterpret_cast<const char*>(text), text != nullptr ? length : 0);
  const size_t space = all.starts_with(kPrefix) ? all.find(' ', kPrefix.size()) : all.npos;
  // The last byte is the closing parenthesis and never part of the name.
  if (space == all.npos || space == all.size() - 1) {
    std::memcpy(out, "(null)", sizeof("(null)"));
    return out;
  }
  const std::string_view name = all.substr(kPrefix.size(), space - kPrefix.size());
  std::memcpy(out, name.data(), name.size());
  char* const end = out + name.size();
  *end = '\0';
  if (FindHashAlgorithm(name) != nullptr) {
    *end = ' ';
    ZVsysutil::zv_binhex(end + 1, text + space + 1, all.size() - space - 2);
  }
  return out;
}

}  // namespace ZvVesk2
