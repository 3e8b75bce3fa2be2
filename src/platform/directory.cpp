// SPDX-License-Identifier: Apache-2.0
// ZvListing: the entries of one directory as the disk has them. ZvDir: the names of one directory,
// all read and sorted when it is opened. Both say when they could not go on: a list of names that
// was cut short hides files, and with a revocation list what it revokes.
#include <dirent.h>
#include <fcntl.h>
#include <unistd.h>
#include <algorithm>
#include <cerrno>
#include <cstring>
#include <new>
#include <string_view>

#include "src/platform/file.h"
#include "src/platform/text.h"

namespace ZVsysutil {
namespace {

// A link is asked about where it matters: what it leads to may be anything.
ZvKind KindOf(unsigned char type) {
  if (type == DT_REG) return ZvKind::kFile;
  if (type == DT_DIR) return ZvKind::kDirectory;
  return type == DT_UNKNOWN || type == DT_LNK ? ZvKind::kUnknown : ZvKind::kOther;
}

// The directory itself and the one above are entries of no store and no tree.
bool IsDots(std::string_view name) { return name == "." || name == ".."; }

// "*" and what follows it: a suffix. Anything else is a name.
bool Matches(std::string_view pattern, std::string_view name) {
  if (!pattern.starts_with('*')) return name == pattern;
  return name.ends_with(pattern.substr(1));
}

}  // namespace

// O_DIRECTORY refuses what is none, before anything is opened that could block or act; O_NONBLOCK
// is for what takes its place in that moment.
int ZvListing::Open(const ZvPlace& place) {
  Close();
  if (place.name == nullptr) return VESK2_ERR_FIND_DIR;
  constexpr int kFlags = O_RDONLY | O_DIRECTORY | O_NONBLOCK | O_CLOEXEC;
  int opened;
  do {
    opened = openat(place.directory, place.name, kFlags);
  } while (opened < 0 && errno == EINTR);
  if (opened < 0) return zv_error_code(errno, VESK2_ERR_FIND_DIR);
  stream_ = fdopendir(opened);
  if (stream_ == nullptr) {
    const int code = zv_error_code(errno, VESK2_ERR_FIND_DIR);
    close(opened);
    return code;
  }
  descriptor_ = opened;
  return 0;
}

// readdir tells its end and its failure by the same null: errno decides, which is cleared before.
int ZvListing::Next(const char** name, ZvKind* kind) {
  const dirent* entry;
  do {
    errno = 0;
    // NOLINTNEXTLINE(clang-analyzer-core.NonNullParamChecker): Open answered 0
    entry = readdir(static_cast<DIR*>(stream_));
  } while (entry != nullptr && IsDots(entry->d_name));
  *name = entry != nullptr ? entry->d_name : nullptr;
  if (entry != nullptr) *kind = KindOf(entry->d_type);
  return entry == nullptr && errno != 0 ? zv_error_code(errno, VESK2_ERR_FIND_DIR) : 0;
}

void ZvListing::Close() {
  if (stream_ != nullptr) closedir(static_cast<DIR*>(stream_));
  stream_ = nullptr;
  descriptor_ = -1;
}

// All names are read at once and sorted: the search goes by them whatever is added to the directory
// meanwhile.
int ZvDir::open(const char* directory, const char* pattern) {
  close();
  const int code = Load(directory, pattern);
  if (code != 0) close();
  return code;
}

// The directory stays open behind it, so that files are opened from the one that was listed.
int ZvDir::Load(const char* directory, const char* pattern) {
  if (directory == nullptr || pattern == nullptr) return VESK2_ERR_FIND_DIR;
  if (const int code = listing_.Open({kZvNoDirectory, directory})) return code;
  directory_ = zv_fstrdup(directory);
  if (directory_ == nullptr) return VESK2_ERR_MEM_ALLOC;
  for (;;) {
    const char* name = nullptr;
    ZvKind kind = ZvKind::kUnknown;
    // A list cut short would hide files.
    if (const int code = listing_.Next(&name, &kind)) return code;
    if (name == nullptr) break;
    if (!Matches(pattern, name)) continue;
    if (const int code = Add(name, kind == ZvKind::kFile)) return code;
  }
  zv_sort(entries_, count_, sizeof(Entry), [](const void* a, const void* b) {
    return std::strcmp(static_cast<const Entry*>(a)->name, static_cast<const Entry*>(b)->name);
  });
  return 0;
}

// Grows by doubling; the names are copies, since a listing's name lives until the next.
int ZvDir::Add(const char* name, bool regular) {
  if (count_ == capacity_) {
    const size_t larger = capacity_ > 0 ? 2 * capacity_ : 32;
    Entry* entries = new (std::nothrow) Entry[larger];
    if (entries == nullptr) return VESK2_ERR_MEM_ALLOC;
    std::copy_n(entries_, count_, entries);
    delete[] entries_;
    entries_ = entries;
    capacity_ = larger;
  }
  char* copy = zv_fstrdup(name);
  if (copy == nullptr) return VESK2_ERR_MEM_ALLOC;
  entries_[count_++] = {copy, regular};
  return 0;
}

// A null for want of memory is told apart (failed): else it would be the end.
const char* ZvDir::read(bool fullPath) {
  failed_ = false;
  if (cursor_ == count_) return nullptr;
  const char* name = entries_[cursor_++].name;
  if (!fullPath) return name;
  delete[] path_;
  path_ = zv_join_path(directory_, name);
  failed_ = path_ == nullptr;
  return path_;
}

void ZvDir::close() {
  listing_.Close();
  for (size_t i = 0; i < count_; ++i) delete[] entries_[i].name;
  delete[] entries_;
  delete[] directory_;
  delete[] path_;
  entries_ = nullptr;
  directory_ = nullptr;
  path_ = nullptr;
  count_ = capacity_ = cursor_ = 0;
  failed_ = false;
}

}  // namespace ZVsysutil
