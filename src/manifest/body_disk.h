// SPDX-License-Identifier: Apache-2.0
// The walk through a listed tree on disk: what the directories say of their entries, and the listed
// files that are to be hashed, a directory at a time.
//
// Directories are listed before their files are opened, and what they say of an entry's kind is
// believed; of links and where a disk says nothing, the entry is asked. A listed file that a
// directory calls regular is opened from that directory without a look of its own. A walk belongs
// to one caller at a time: threads that share one take turns under a lock (body_verify.cpp). The
// files of a directory they take without it.
#ifndef VESK2_SRC_MANIFEST_BODY_DISK_H
#define VESK2_SRC_MANIFEST_BODY_DISK_H

#include <atomic>
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
  // A FileState for each, in their order. The walk writes them before it hands the directory out,
  // and then each is written by the thread that took the file.
  std::unique_ptr<int[]> files;
  // How often a file was asked for. Past their count there are no more.
  std::atomic<uint32_t> asked = 0;
  // Entries of the disk, ignored ones too, sorted: files by bare name, directories by path.
  PointerArray<BodyObject> unlisted;
  // Why it was not searched for them, or 0. VESK2_ERR_FIND_DIR, mostly.
  int reason = 0;
  DirectoryFound* next = nullptr;

  uint32_t Count() const { return directory->GetFiles().GetCount(); }
  // The place of a file that nobody else takes; Count() or more when all are taken.
  uint32_t Take() { return asked.fetch_add(1, std::memory_order_relaxed); }
  bool AllTaken() const { return asked.load(std::memory_order_relaxed) >= Count(); }
};

// A directory whose files are hashed, by as many threads as come.
struct FilesToHash {
  DirectoryFound* found = nullptr;
  OpenDirectory* open = nullptr;  // null: they are opened by their paths
};

// The longest path that the system takes.
inline constexpr size_t kLongestPath = 4095;

class DiskWalk {
 public:
  explicit DiskWalk(BodyDirectory& root) : root_(root) {}
  ~DiskWalk();
  DiskWalk(const DiskWalk&) = delete;
  DiskWalk& operator=(const DiskWalk&) = delete;

  // Next hands out a directory of which files are left, ignored ones among them; files.found is
  // null when there is none. Done takes it back. Prepare lists the directory after it, so that who
  // is through with this one need not wait for that. VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int Next(FilesToHash& files);
  [[nodiscard]] int Prepare();
  void Done(const FilesToHash& files) { Release(files.open); }
  // What was found, a directory a call, in the order in which a recursion comes to them.
  std::unique_ptr<DirectoryFound> TakeFound();

 private:
  // A directory whose subdirectories are being visited.
  struct Level;

  [[nodiscard]] int Enter(FilesToHash& files, BodyDirectory& directory);
  [[nodiscard]] int Search(FilesToHash& files);
  [[nodiscard]] int GoOn(FilesToHash& files);
  void Leave();
  static void Release(OpenDirectory* open);

  BodyDirectory& root_;
  // The root has been entered.
  bool begun_ = false;
  DirectoryFound* first_ = nullptr;  // of those that were found and not taken
  DirectoryFound* last_ = nullptr;
  FilesToHash current_;  // what is handed out
  FilesToHash ahead_;    // what comes after it, where that is listed already
  // The directory whose subdirectories are visited now; those above hang behind it.
  Level* top_ = nullptr;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_MANIFEST_BODY_DISK_H
