// SPDX-License-Identifier: Apache-2.0
// See ignore.h. Both sides are sorted, so that all names of a directory are asked in one pass: with
// a list of n and a directory of m names it costs their sum.
#include "src/manifest/ignore.h"

#include <cstring>

#include "src/platform/text.h"

namespace ZvVesk2 {

const char* BareName(const char* path) {
  const char* const separator = std::strrchr(path, '/');
  return separator != nullptr ? separator + 1 : path;
}

// Of a path the last component counts: a directory of the listing is asked by its path, and its
// list holds bare names.
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
