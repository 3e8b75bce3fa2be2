// SPDX-License-Identifier: Apache-2.0
// The test of names against the list of names that a directory ignores: a forward merge, so each
// sequence of names that is asked in ascending order needs a walk of its own.
#ifndef VESK2_SRC_MANIFEST_IGNORE_H
#define VESK2_SRC_MANIFEST_IGNORE_H

#include <cstdint>

#include <vesk2/pointer_array.h>

namespace ZvVesk2 {

// The last component of a path that does not end in a separator, borrowed.
const char* BareName(const char* path);

class IgnoreWalk {
 public:
  // `ignored` is sorted and outlives the walk.
  explicit IgnoreWalk(const PointerArray<char>& ignored) : ignored_(ignored) {}
  // Whether the name, or the last component of the path, is ignored. Every call must ask for a name
  // that is not smaller than the one before.
  bool Ignores(const char* name);

 private:
  const PointerArray<char>& ignored_;
  uint32_t cursor_ = 0;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_MANIFEST_IGNORE_H
