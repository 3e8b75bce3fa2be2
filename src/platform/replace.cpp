// SPDX-License-Identifier: Apache-2.0
// See replace.h. Stores are read by others while they are written, and a writer can be killed at
// any call: after each of these calls the directory holds the old file or the new one under the
// name, and at most one temporary file beside it.
#include "src/platform/replace.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/random.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <new>
#include <string_view>
#include <utility>

#include <vesk2.h>

#include "src/platform/file.h"
#include "src/platform/text.h"

namespace ZVsysutil {
namespace {

constexpr char kMark[] = ".tmp-";
constexpr size_t kMarkLength = sizeof kMark - 1;
constexpr size_t kRandomBytes = 16;
constexpr size_t kSuffix = kMarkLength + 2 * kRandomBytes;
// The longest name that a file system takes.
constexpr size_t kMaxFileName = 255;
// Names drawn before giving up. Each is new; a second one is needed only when somebody who removes
// leftovers comes between the making of a file and its locking. What is lost so comes in runs:
// making the file lets go on who waited for the directory, on a busy machine in the maker's place.
constexpr int kAttempts = 100;

// By the form of the name alone, so that the file of another program is hardly ever meant; who has
// its lock is asked before it goes.
bool IsLeftover(std::string_view name) {
  if (name.size() <= kSuffix) return false;
  const std::string_view suffix = name.substr(name.size() - kSuffix);
  return suffix.starts_with(kMark) &&
         suffix.find_first_not_of("0123456789abcdef", kMarkLength) == std::string_view::npos;
}

// Whether a name (in `directory`, or a path) leads to the open file, and through no link. Names can
// be moved between any two calls: what is about to be removed is compared with what is locked.
bool LeadsTo(int directory, const char* name, int fd) {
  struct stat named {};
  struct stat opened {};
  return fstatat(directory, name, &named, AT_SYMLINK_NOFOLLOW) == 0 && fstat(fd, &opened) == 0 &&
         named.st_dev == opened.st_dev && named.st_ino == opened.st_ino;
}

// Only who has the lock may remove the file, and only under a name that still is the file's: its
// writer may have given it the final name before it let the lock go. O_NOFOLLOW and O_NONBLOCK, as
// the directory may hold anything by such a name.
void RemoveLeftover(int directory, const char* name) {
  constexpr int kFlags = O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC | O_NOCTTY;
  const int fd = openat(directory, name, kFlags);
  if (fd < 0) return;
  if (flock(fd, LOCK_EX | LOCK_NB) == 0 && LeadsTo(directory, name, fd)) {
    static_cast<void>(unlinkat(directory, name, 0));
  }
  close(fd);
}

}  // namespace

// Whoever did not keep the file wants none of it.
ZvReplacement::~ZvReplacement() {
  if (fd_ < 0) return;
  // Removed before the lock goes with the descriptor.
  static_cast<void>(unlink(temporary_.get()));
  static_cast<void>(stream_ != nullptr ? fclose(stream_) : close(fd_));
}

// In the same directory, as only there a renaming is one step. A name that would grow too long is
// shortened; the mark and the random part never are.
int ZvReplacement::Open(const char* path, mode_t mode) {
  if (path == nullptr || path_ != nullptr) return VESK2_ERR_FILE_OPEN;
  path_.reset(zv_fstrdup(path));
  const size_t size = std::strlen(path);
  temporary_.reset(new (std::nothrow) char[size + kSuffix + 1]);
  if (path_ == nullptr || temporary_ == nullptr) return VESK2_ERR_MEM_ALLOC;
  const char* const slash = std::strrchr(path, '/');
  const size_t directory = slash != nullptr ? static_cast<size_t>(slash - path) + 1 : 0;
  stem_ = directory + std::min(size - directory, kMaxFileName - kSuffix);
  std::memcpy(temporary_.get(), path, stem_);
  if (const int code = MakeNamed(mode)) return code;
  stream_ = fdopen(fd_, "w");
  return stream_ != nullptr ? 0 : VESK2_ERR_MEM_ALLOC;
}

// Writes a new temporary name. From the kernel, so that two processes, or one and its fork, never
// draw the same.
int ZvReplacement::Name() {
  unsigned char random[kRandomBytes];
  if (getrandom(random, sizeof random, 0) != sizeof random) return VESK2_ERR_FILE_OPEN;
  std::memcpy(temporary_.get() + stem_, kMark, kMarkLength);
  zv_binhex(temporary_.get() + stem_ + kMarkLength, random, sizeof random);
  return 0;
}

// Makes the file and takes its lock. Somebody who removes leftovers can find it in between, and
// remove it: it is then made anew. Exclusive, so that nobody's file is ever opened here, and closed
// to others until the mode is set.
int ZvReplacement::MakeNamed(mode_t mode) {
  constexpr int kFlags = O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC;
  for (int attempt = 0; attempt < kAttempts; ++attempt) {
    if (const int code = Name()) return code;
    const int fd = open(temporary_.get(), kFlags, 0600);
    if (fd < 0 && errno == EEXIST) continue;
    if (fd < 0) return zv_error_code(errno, VESK2_ERR_FILE_OPEN);
    fd_ = fd;
    if (!HasLock()) {
      close(std::exchange(fd_, -1));
      continue;
    }
    return fchmod(fd_, mode) == 0 ? 0 : VESK2_ERR_FILE_OPEN;
  }
  return VESK2_ERR_FILE_OPEN;
}

// Where there are no locks, nobody gets one, and nobody removes the file. Whoever has the lock
// instead of us removes it; with the lock, a file that is not known to have its name goes here.
// Without the second look a remover that came first could take the name away unseen.
bool ZvReplacement::HasLock() const {
  if (flock(fd_, LOCK_EX | LOCK_NB) != 0 && errno == EWOULDBLOCK) return false;
  if (LeadsTo(AT_FDCWD, temporary_.get(), fd_)) return true;
  static_cast<void>(unlink(temporary_.get()));  // nobody else's: its name was drawn
  return false;
}

// On the disk before it has the name: after a power cut an empty list under the name would revoke
// nothing. Closing the descriptor gives the lock back, and by then the name is final.
int ZvReplacement::Keep(bool replace) {
  if (stream_ == nullptr) return VESK2_ERR_WRITE_FILE;
  const bool written = ferror(stream_) == 0 && fflush(stream_) == 0 && fsync(fd_) == 0;
  if (!written || !Publish(replace)) return VESK2_ERR_WRITE_FILE;
  fd_ = -1;
  static_cast<void>(fclose(std::exchange(stream_, nullptr)));  // flushed before
  return 0;
}

// One call that either happened or did not. Without leave to replace, the kernel refuses where a
// file has come meanwhile.
bool ZvReplacement::Publish(bool replace) const {
  const char* const from = temporary_.get();
  const char* const to = path_.get();
  if (replace) return rename(from, to) == 0;
  if (renameat2(AT_FDCWD, from, AT_FDCWD, to, RENAME_NOREPLACE) == 0) return true;
  if (errno != EINVAL && errno != ENOSYS) return false;
  // Some file systems cannot rename without replacing; a link never replaces anything.
  if (link(from, to) != 0) return false;
  static_cast<void>(unlink(from));
  return true;
}

// Failures are nobody's: a leftover that stays is only a file too many.
void zv_remove_leftovers(const char* directory) {
  if (directory == nullptr) return;
  DIR* const opened = opendir(directory);
  if (opened == nullptr) return;
  while (const dirent* entry = readdir(opened)) {
    if (IsLeftover(entry->d_name)) RemoveLeftover(dirfd(opened), entry->d_name);
  }
  closedir(opened);
}

}  // namespace ZVsysutil
