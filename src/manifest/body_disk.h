// SPDX-License-Identifier: Apache-2.0
// The walk through a listed tree on disk: what the directories say of their entries, and the listed
// files that are to be hashed, a few at a time.
//
// Directories are listed before their files are opened, and what they say of an entry's kind is
// believed; of links and where a disk says nothing, the entry is asked. A listed file that a
// directory calls regular is opened from that directory without a look of its own. A walk belongs
// to one caller at a time: threads that share one take turns under a lock (body_verify.cpp).
#ifndef VESK2_SRC_MANIFEST_BODY_DISK_H
#define VESK2_SRC_MANIFEST_BODY_DISK_H

#include <memory>

#include <vesk2/manifest_body.h>

#include "src/platform/file.h"

namespace ZvVesk2 {

// What is known of a listed file: one of these, or the code of what kept it from being read. Codes
// of the library are positive and 0 is kSame, so that one int holds both without meeting.
enum FileState : int {
  kSame = 0,
  kDiffers = -1,
  kHeldByOther = -2,
  kIgnored = -3,
  kNotSeen = -4,      // not yet hashed; its directory does not call it a regular file
  kSeenRegular = -5,  // not yet hashed
};

// A directory that is held open.
struct OpenDirectory {
  // Open as long as this is.
  ZVsysutil::ZvListing listing;
  // The bytes of the paths below it that it stands for.
  size_t prefix = 0;
  unsigned users = 1;  // the walk, and files that are being hashed
};

// Where to look up a path that lies below `open`, or anywhere if that is null. It is borrowed from
// both.
ZVsysutil::ZvPlace PlaceOf(const OpenDirectory* open, const char* path);

// What was found in one listed directory.
struct DirectoryFound {
  BodyDirectory* directory;
  // A FileState for each, in their order. Threads write those of their chunks, and the walk those
  // that it has not handed out: never two at one place.
  std::unique_ptr<int[]> files;
  // Entries of the disk, ignored ones too, sorted: files by bare name, directories by path.
  PointerArray<BodyObject> unlisted;
  // Why it was not searched for them, or 0. VESK2_ERR_FIND_DIR, mostly.
  int reason = 0;
  DirectoryFound* next = nullptr;
};

// Some files of one directory: the work that a thread takes at once.
struct FileChunk {
  DirectoryFound* found = nullptr;
  OpenDirectory* open = nullptr;  // null: they are opened by their paths
  uint32_t first = 0;
  uint32_t end = 0;
};

// The longest path that the system takes.
inline constexpr size_t kLongestPath = 4095;

class DiskWalk {
 public:
  // Hands out at most `chunkSize` files at once.
  DiskWalk(BodyDirectory& root, uint32_t chunkSize) : root_(root), chunkSize_(chunkSize) {}
  ~DiskWalk();
  DiskWalk(const DiskWalk&) = delete;
  DiskWalk& operator=(const DiskWalk&) = delete;

  // Next hands out files, ignored ones too; chunk.found is null when there are no more. Done takes
  // them back. VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int Next(FileChunk& chunk);
  void Done(const FileChunk& chunk) { Release(chunk.open); }
  // What was found, a directory a call, in the order in which a recursion comes to them.
  std::unique_ptr<DirectoryFound> TakeFound();

 private:
  // A directory whose subdirectories are being visited.
  struct Level;

  [[nodiscard]] int Enter(BodyDirectory& directory);
  [[nodiscard]] int Search(DirectoryFound& found);
  [[nodiscard]] int GoOn(bool& more);
  void Leave();
  static void Release(OpenDirectory* open);

  BodyDirectory& root_;
  const uint32_t chunkSize_;
  // The root has been entered.
  bool begun_ = false;
  DirectoryFound* first_ = nullptr;
  DirectoryFound* last_ = nullptr;  // whose files are handed out
  OpenDirectory* open_ = nullptr;   // that directory
  // The first file of `last_` that was not handed out.
  uint32_t nextFile_ = 0;
  // The directory whose subdirectories are visited now; those above hang behind it.
  Level* top_ = nullptr;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_MANIFEST_BODY_DISK_H
