// SPDX-License-Identifier: Apache-2.0
// floor.h: the newest time of signing that was accepted for a tag. What was signed before is
// refused from then on: a release that was genuine once is an attack when a newer one is known.
//
//   vesk2-floor 1
//   tag sha256:<64 digits> <the tag, for people>
//   signed-at 2026-11-23_15:24:14
//
// A floor file is replaced whole. Those who change it hold a lock on FILE.lock beside it, which
// stays. What cannot be read is trouble, never "no floor": only a name at which nothing is says so.
#ifndef VESK2_TOOLS_FLOOR_H
#define VESK2_TOOLS_FLOOR_H

#include <optional>
#include <string>

#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/objects/times.h"
#include "tools/vesk2/stores/file_lock.h"

namespace vesk2_command {

struct Floor {
  std::string digest;  // of the tag
  std::string tag;     // escaped
  Ref<TimeStamp> signedAt;
};

// The directory of the floors that are kept by tag; Trouble without a home store.
std::string FloorDirectory();
// The file there for a tag.
std::string FloorPath(SExpression& tag);

// ReadFloor returns nothing when there is no file; Trouble for one that cannot be read, that is
// malformed, or that is about another tag than `tag` (null: whatever it is about).
std::optional<Floor> ReadFloor(const std::string& path, SExpression* tag);

// While it lives, nobody else changes the floor at a path. It makes the directory of those that are
// kept by tag. Trouble as of FileLock.
class FloorLock {
 public:
  explicit FloorLock(const std::string& path);

 private:
  std::optional<FileLock> lock_;
};
// WriteFloor sets a floor, of a path that is locked: never past the present.
void WriteFloor(const std::string& path, SExpression& tag, const TimeStamp& signedAt);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_FLOOR_H
