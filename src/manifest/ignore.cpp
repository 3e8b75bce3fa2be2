// SPDX-License-Identifier: Apache-2.0
// Matching of ignored names.
#include "src/manifest/ignore.h"

#include <cstring>

#include "src/platform/text.h"

namespace ZvVesk2 {

const char* BareName(const char* path) {
  const char* const separator = std::strrchr(path, '/');
  return separator != nullptr ? separator + 1 : path;
}

bool IgnoreWalk::Ignores(const char* name) {
  const char* const bare = BareName(name);
  while (const char* const entry = ignored_.at(cursor_)) {
    const int order = ZVsysutil::zv_filenamecmp(bare, entry);
    if (order < 0) return false;
    // An entry that matched is used up: it ignores one listing of its name.
    ++cursor_;
    if (order == 0) return true;
  }
  return false;
}

}  // namespace ZvVesk2
