// SPDX-License-Identifier: Apache-2.0
// See replace.h.
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
// Names drawn before giving up: each is new, so that a second one is hardly ever needed.
constexpr int kAttempts = 8;

bool IsLeftover(std::string_view name) {
  if (name.size() <= kSuffix) return false;
  const std::string_view suffix = name.substr(name.size() - kSuffix);
  return suffix.starts_with(kMark) &&
         suffix.find_first_not_of("0123456789abcdef", kMarkLength) == std::string_view::npos;
}

// Whether a name (in `directory`, or a path) leads to the open file, and through no link.
bool LeadsTo(int directory, const char* name, int fd) {
  struct stat named {};
  struct stat opened {};
  return fstatat(directory, name, &named, AT_SYMLINK_NOFOLLOW) == 0 && fstat(fd, &opened) == 0 &&
         named.st_dev == opened.st_dev && named.st_ino == opened.st_ino;
}

// Only who has the lock may remove the file, and only under a name that still is the file's: its
// writer may have given it the final name before it let the lock go.
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

ZvReplacement::~ZvReplacement() {
  if (fd_ < 0) return;
  // Removed before the lock goes with the descriptor.
  static_cast<void>(unlink(temporary_.get()));
  static_cast<void>(stream_ != nullptr ? fclose(stream_) : close(fd_));
}

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

// Writes a new temporary name.
int ZvReplacement::Name() {
  unsigned char random[kRandomBytes];
  if (getrandom(random, sizeof random, 0) != sizeof random) return VESK2_ERR_FILE_OPEN;
  std::memcpy(temporary_.get() + stem_, kMark, kMarkLength);
  zv_binhex(temporary_.get() + stem_ + kMarkLength, random, sizeof random);
  return 0;
}

// Makes the file and takes its lock. Somebody who removes leftovers can find it in between, and
// remove it: it is then made anew.
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
bool ZvReplacement::HasLock() const {
  if (flock(fd_, LOCK_EX | LOCK_NB) != 0 && errno == EWOULDBLOCK) return false;
  if (LeadsTo(AT_FDCWD, temporary_.get(), fd_)) return true;
  static_cast<void>(unlink(temporary_.get()));  // nobody else's: its name was drawn
  return false;
}

int ZvReplacement::Keep(bool replace) {
  if (stream_ == nullptr) return VESK2_ERR_WRITE_FILE;
  const bool written = ferror(stream_) == 0 && fflush(stream_) == 0 && fsync(fd_) == 0;
  if (!written || !Publish(replace)) return VESK2_ERR_WRITE_FILE;
  fd_ = -1;
  static_cast<void>(fclose(std::exchange(stream_, nullptr)));  // flushed before
  return 0;
}

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
