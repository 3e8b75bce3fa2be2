// SPDX-License-Identifier: Apache-2.0
// See body_disk.h. The order of calls is what matters: a directory is opened once, from the one
// above it, listed, and its files are opened from it by bare names. Once it is open, its files are
// read from it, wherever it is moved and whatever is put in its place; and no path is looked up
// from the root a million times.
//
// Descriptors are few and trees are deep: kHeldLevels directories stay open, and those below are
// opened by a longer path from the last of them.
#include "src/manifest/body_disk.h"

#include <sys/stat.h>

#include <cstring>
#include <utility>

#include "src/frame/check.h"
#include "src/manifest/ignore.h"
#include "src/platform/text.h"

namespace ZvVesk2 {
namespace {

using ZVsysutil::ZvKind;
using ZVsysutil::ZvPlace;

// Directories that are held open on the way down; those below are opened from the last of them.
constexpr unsigned kHeldLevels = 64;

// The bytes of the paths below a directory before a name in it. The names in a listed directory are
// paths; on the disk they are bare. Both are compared from here on.
size_t PrefixOf(const BodyDirectory& directory) {
  const size_t length = std::strlen(directory.GetName());
  return length + (length > 0 && directory.GetName()[length - 1] != '/' ? 1 : 0);
}

// The first entry of a sorted list whose name, without its first `prefix` bytes, is not before
// `name`. Searched by halves: a directory on disk may hold a million names that nobody listed.
uint32_t LowerBound(const PointerArray<BodyObject>& entries, size_t prefix, const char* name) {
  uint32_t first = 0;
  uint32_t end = entries.GetCount();
  while (first < end) {
    const uint32_t middle = first + (end - first) / 2;
    const char* const there = entries.at(middle)->GetName() + prefix;
    if (ZVsysutil::zv_filenamecmp(there, name) < 0) {
      first = middle + 1;
    } else {
      end = middle;
    }
  }
  return first;
}

// Past the end of the list there is no entry.
bool IsNamed(const BodyObject* entry, size_t prefix, const char* name) {
  return entry != nullptr && ZVsysutil::zv_filenamecmp(entry->GetName() + prefix, name) == 0;
}

// Notes that a regular file of this name was seen; false when none is listed. A name may be listed
// more than once. All of that name are noted, since each is compared with the one file on disk.
bool NoteSeen(DirectoryFound& found, const char* name, bool regular) {
  const PointerArray<BodyObject>& files = found.directory->GetFiles();
  const uint32_t first = LowerBound(files, 0, name);
  for (uint32_t i = first; regular && IsNamed(files.at(i), 0, name); ++i) {
    if (found.files[i] == kNotSeen) found.files[i] = kSeenRegular;
  }
  return IsNamed(files.at(first), 0, name);
}

// Of the same kind only: a file where a directory is listed is unlisted, and the directory missing.
bool ListsDirectory(BodyDirectory& directory, size_t prefix, const char* name) {
  const PointerArray<BodyObject>& below = directory.GetSubdirectories();
  return IsNamed(below.at(LowerBound(below, prefix, name)), prefix, name);
}

// The kind of an entry of which the directory said nothing, behind links. What nobody can look at
// is no directory. It follows links, as opening the file would. Asked where the listing says
// nothing: of links, and on disks that do not tell kinds.
[[nodiscard]] int Ask(ZvKind& kind, const ZvPlace& place) {
  struct stat about {};
  const int code = ZVsysutil::zv_stat(place, &about);
  VESK2_REQUIRE(code != VESK2_ERR_MEM_ALLOC, code);
  kind = code == 0 && S_ISDIR(about.st_mode) ? ZvKind::kDirectory : ZvKind::kOther;
  return 0;
}

// Keeps an entry that is not listed: a file under its bare name and a directory under its path, the
// way in which a body names them.
[[nodiscard]] int KeepUnlisted(DirectoryFound& found, const char* name, bool isDirectory) {
  std::unique_ptr<BodyObject> entry(TryNew<BodyObject>(found.directory->GetContext()));
  VESK2_REQUIRE(entry, VESK2_ERR_MEM_ALLOC);
  entry->SetIsDirectory(isDirectory);
  entry->SetName(isDirectory ? ZVsysutil::zv_join_path(found.directory->GetName(), name)
                             : ZVsysutil::zv_fstrdup(name));
  VESK2_REQUIRE(entry->GetName() != nullptr && found.unlisted.push(entry.get()),
                VESK2_ERR_MEM_ALLOC);
  static_cast<void>(entry.release());
  return 0;
}

// Ignored files are marked at once, by a walk through both sorted lists: they are never opened.
[[nodiscard]] int MakeFound(std::unique_ptr<DirectoryFound>& out, BodyDirectory& directory) {
  std::unique_ptr<DirectoryFound> found(TryNew<DirectoryFound>());
  VESK2_REQUIRE(found, VESK2_ERR_MEM_ALLOC);
  const PointerArray<BodyObject>& files = directory.GetFiles();
  found->directory = &directory;
  found->files.reset(TryNewArray<int>(files.GetCount()));
  VESK2_REQUIRE(found->files, VESK2_ERR_MEM_ALLOC);
  IgnoreWalk ignore(directory.GetIgnored());
  for (uint32_t i = 0; i < files.GetCount(); ++i) {
    found->files[i] = ignore.Ignores(files.at(i)->GetName()) ? kIgnored : kNotSeen;
  }
  out = std::move(found);
  return 0;
}

// Goes through the entries of a directory; keeps those that are not listed if it is `searched`. The
// root is listed as well, though it is not searched: what is said of its files spares a question
// for each.
[[nodiscard]] int List(DirectoryFound& found, OpenDirectory& open, bool searched) {
  for (;;) {
    const char* name = nullptr;
    ZvKind kind = ZvKind::kUnknown;
    // A listing that breaks off says nothing about what did not come.
    VESK2_TRY(open.listing.Next(&name, &kind));
    if (name == nullptr) break;
    const bool regular = kind == ZvKind::kFile;
    // Only who looks for unlisted entries has to know what they are; a listed file is judged when
    // it is opened.
    if (searched && kind == ZvKind::kUnknown) {
      VESK2_TRY(Ask(kind, {open.listing.Descriptor(), name}));
    }
    // Nobody could look at one whose path is too long.
    const bool isDirectory =
        kind == ZvKind::kDirectory && open.prefix + std::strlen(name) <= kLongestPath;
    const bool listed = isDirectory ? ListsDirectory(*found.directory, open.prefix, name)
                                    : NoteSeen(found, name, regular);
    if (searched && !listed) VESK2_TRY(KeepUnlisted(found, name, isDirectory));
  }
  found.unlisted.sort(BodyObject::Cmp);
  return 0;
}

}  // namespace

// A path below `open` is looked up from there, without its prefix.
ZvPlace PlaceOf(const OpenDirectory* open, const char* path) {
  if (open == nullptr) return {ZVsysutil::kZvNoDirectory, path};
  return {open->listing.Descriptor(), path + open->prefix};
}

// One for each directory on the way down: at most Limits::kMaxDepth.
struct DiskWalk::Level {
  Level(BodyDirectory& entered, Level* outer)
      : directory(entered),
        ignore(entered.GetIgnored()),
        open(outer != nullptr ? outer->open : nullptr),
        above(outer),
        depth(outer != nullptr ? outer->depth + 1 : 0) {}

  BodyDirectory& directory;
  IgnoreWalk ignore;
  uint32_t next = 0;    // its subdirectory that is visited next
  OpenDirectory* open;  // that paths below are looked up in: its own, or one above; may be null
  bool owns = false;    // its own
  Level* const above;
  const unsigned depth;
};

// Whoever stops half-way (no memory, a callback) leaves directories open and findings untaken.
DiskWalk::~DiskWalk() {
  Release(current_.open);
  Release(ahead_.open);
  while (top_ != nullptr) Leave();
  while (TakeFound() != nullptr) {
  }
}

std::unique_ptr<DirectoryFound> DiskWalk::TakeFound() {
  // NOLINTNEXTLINE(clang-analyzer-cplusplus.NewDelete): what went before is no longer linked
  std::unique_ptr<DirectoryFound> found(first_);
  if (found != nullptr) first_ = found->next;
  return found;
}

// Threads hash files of a directory that the walk has left: the last of its users closes it. The
// caller holds the lock.
void DiskWalk::Release(OpenDirectory* open) {
  if (open != nullptr && --open->users == 0) delete open;
}

void DiskWalk::Leave() {
  const std::unique_ptr<Level> left(top_);
  if (left->owns) Release(left->open);
  top_ = left->above;
}

// Threads share a directory until its files are taken. Those without files are passed over here,
// and are found all the same.
int DiskWalk::Next(FilesToHash& files) {
  files = {};
  while (current_.found == nullptr || current_.found->AllTaken()) {
    Release(current_.open);
    current_ = std::exchange(ahead_, {});
    if (current_.found == nullptr) VESK2_TRY(GoOn(current_));
    if (current_.found == nullptr) return 0;
  }
  files = current_;
  if (files.open != nullptr) ++files.open->users;
  return 0;
}

int DiskWalk::Prepare() { return ahead_.found == nullptr ? GoOn(ahead_) : 0; }

// Enters the next directory, the root first; without one, `files` stays empty. Depth first, in the
// order of the listing, as the findings are told. An ignored directory is not even opened.
int DiskWalk::GoOn(FilesToHash& files) {
  if (!std::exchange(begun_, true)) return Enter(files, root_);
  while (top_ != nullptr) {
    while (BodyObject* const entry = top_->directory.GetSubdirectories().at(top_->next)) {
      ++top_->next;
      if (!top_->ignore.Ignores(entry->GetName()))
        return Enter(files, static_cast<BodyDirectory&>(*entry));
    }
    Leave();
  }
  return 0;
}

// The findings are chained in the order in which directories are entered: a recursion through the
// listing takes them off in the same order.
int DiskWalk::Enter(FilesToHash& files, BodyDirectory& directory) {
  std::unique_ptr<DirectoryFound> found;
  VESK2_TRY(MakeFound(found, directory));
  Level* const level = TryNew<Level>(directory, top_);
  VESK2_REQUIRE(level != nullptr, VESK2_ERR_MEM_ALLOC);
  top_ = level;
  FilesToHash entered = {found.get(), nullptr};
  VESK2_TRY(Search(entered));
  (last_ != nullptr ? last_->next : first_) = found.get();
  // Nothing can fail behind the chaining, so that the walk and its findings agree.
  last_ = found.release();
  files = entered;
  return 0;
}

// Opens and lists the directory that was entered last. Files of one that cannot be opened are asked
// by their paths. A directory that is missing or cannot be listed keeps its reason; its files are
// then missing by their own doing. For want of memory or descriptors nothing is decided.
int DiskWalk::Search(FilesToHash& files) {
  DirectoryFound& found = *files.found;
  std::unique_ptr<OpenDirectory> open(TryNew<OpenDirectory>());
  VESK2_REQUIRE(open, VESK2_ERR_MEM_ALLOC);
  const char* const path = found.directory->GetName();
  int code = VESK2_ERR_FIND_DIR;
  // A longer path could be opened from a directory held open, and by nobody else who has the name
  // from us: it counts as not there.
  if (std::strlen(path) <= kLongestPath) code = open->listing.Open(PlaceOf(top_->open, path));
  const bool opened = code == 0;
  // The root is not searched: it may hold more than the manifest lists, the manifest itself for
  // one.
  const bool searched = top_->above != nullptr;
  open->prefix = PrefixOf(*found.directory);
  if (opened) code = List(found, *open, searched);
  VESK2_REQUIRE(code != VESK2_ERR_MEM_ALLOC, code);
  if (searched && code != 0) found.reason = code;
  if (!opened) return 0;
  files.open = open.release();
  if (top_->depth < kHeldLevels && found.directory->GetSubdirectories().GetCount() > 0) {
    ++files.open->users;
    top_->open = files.open;
    top_->owns = true;
  }
  return 0;
}

}  // namespace ZvVesk2
