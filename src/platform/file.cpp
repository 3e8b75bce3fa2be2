// SPDX-License-Identifier: Apache-2.0
// Opening, reading, writing and testing files. A path is a stranger's choice, and what lies there
// can change between two looks. So what was opened is judged by its descriptor, nothing is opened
// that could block or act, and every wait is counted (wait.h).
#include "src/platform/file.h"

#include <fcntl.h>
#include <unistd.h>
#include <algorithm>
#include <cerrno>
#include <new>
#include <utility>

#include "src/platform/wait.h"

namespace ZVsysutil {
namespace {

// As much as a read call needs to cost next to nothing for each byte.
constexpr size_t kReadBlock = size_t{64} << 10;
constexpr mode_t kFileMode = 0666;

// The pauses between attempts to open a file that is held, in milliseconds: short at first, as most
// holders let go at once, then rare.
constexpr uint32_t kFirstPause = 1;
constexpr uint32_t kLongestPause = 100;

// A descriptor that is closed unless it is handed over. Every path out of a function closes it.
class Descriptor {
 public:
  Descriptor() = default;
  ~Descriptor() { Reset(-1); }
  Descriptor(const Descriptor&) = delete;
  Descriptor& operator=(const Descriptor&) = delete;
  [[nodiscard]] int get() const { return fd_; }
  [[nodiscard]] int release() { return std::exchange(fd_, -1); }
  void Reset(int fd) {
    if (fd_ >= 0) close(fd_);
    fd_ = fd;
  }

 private:
  int fd_ = -1;
};

// The code of the call that failed just now: nothing may come between it and this.
[[nodiscard]] int OpenError() { return zv_error_code(errno, VESK2_ERR_FILE_OPEN); }

// 0 for a regular file. Opening a device can do something by itself, so what is none is not even
// opened. A tape rewinds, a terminal answers, a FIFO makes its writer go on: looking first costs a
// call for each file that no listing vouched for.
[[nodiscard]] int RequireRegular(const ZvPlace& place) {
  struct stat about {};
  if (place.name == nullptr) return VESK2_ERR_FILE_OPEN;
  if (fstatat(place.directory, place.name, &about, 0) != 0) return OpenError();
  return S_ISREG(about.st_mode) ? 0 : VESK2_ERR_FILE_OPEN;
}

// O_NOCTTY: a terminal that is opened must not become ours. EAGAIN is what a lease answers to
// O_NONBLOCK, and nothing else of a regular file.
[[nodiscard]] int OpenNow(Descriptor& out, const ZvPlace& place, int flags) {
  constexpr int kAlways = O_NONBLOCK | O_CLOEXEC | O_NOCTTY;
  do {
    out.Reset(openat(place.directory, place.name, flags | kAlways, kFileMode));
  } while (out.get() < 0 && errno == EINTR);
  if (out.get() >= 0) return 0;
  return errno == EAGAIN ? VESK2_ERR_READ_FILE : OpenError();
}

// Opens a file, waiting for one that is held. Every attempt is made without blocking, and only
// after a look that it is still a regular file: a FIFO or a device can take its place meanwhile.
// Twice as long each time up to a tenth of a second, so that the kernel's own end of a lease is
// noticed soon.
[[nodiscard]] int OpenOrWait(Descriptor& out, const ZvPlace& place, int flags) {
  int code = OpenNow(out, place, flags);
  if (code != VESK2_ERR_READ_FILE) return code;
  ZvCall call;
  uint32_t pause = kFirstPause;
  while (code == VESK2_ERR_READ_FILE) {
    const bool again = call.Pause(pause);
    if (const int gone = RequireRegular(place)) return gone;
    if (!again) break;
    pause = std::min(2 * pause, kLongestPause);
    code = OpenNow(out, place, flags);
  }
  return code;
}

// O_NONBLOCK keeps the open itself from waiting on a FIFO or a device, or for the holder of a
// lease. What was opened is judged by its descriptor, so nobody can swap it in between.
[[nodiscard]] int OpenRegular(Descriptor& out, const ZvPlace& place, int flags,
                              struct stat* opened) {
  if (place.name == nullptr) return VESK2_ERR_FILE_OPEN;
  if (const int code = OpenOrWait(out, place, flags)) return code;
  if (fstat(out.get(), opened) != 0) return OpenError();
  return S_ISREG(opened->st_mode) ? 0 : VESK2_ERR_FILE_OPEN;
}

// Opens a file to read that is not listed, or is no longer what it was listed as.
[[nodiscard]] int OpenAfterLook(Descriptor& out, const ZvPlace& place, struct stat* opened) {
  if (const int code = RequireRegular(place)) return code;
  return OpenRegular(out, place, O_RDONLY, opened);
}

// What was listed as a file is no link; one that took its place could lead to a device. When it is
// none any more, O_NOFOLLOW makes that an error, and the caller looks again.
[[nodiscard]] int OpenListed(Descriptor& out, const ZvPlace& place, struct stat* opened) {
  return OpenRegular(out, place, O_RDONLY | O_NOFOLLOW, opened);
}

// Makes a file one that all can read, and tells whether it is. Another's file may be one already. A
// file that we may not change and that all can read is as good.
bool Share(int fd, mode_t mode) {
  constexpr mode_t kReadable = 0444;
  return fchmod(fd, kZvSharedFile) == 0 || (mode & kReadable) == kReadable;
}

// Truncated by the opening. Store files that must be whole are not written here but by
// ZvReplacement.
[[nodiscard]] int OpenForWriting(ZvFileOwner& out, const char* path, int mode) {
  ZvFileOwner file(new (std::nothrow) ZvFile);
  if (file == nullptr) return VESK2_ERR_MEM_ALLOC;
  Descriptor fd;
  const int flags = O_WRONLY | O_CREAT | O_TRUNC | (mode == ZV_WRITE ? 0 : O_NOFOLLOW);
  const ZvPlace place = {kZvNoDirectory, path};
  if (const int code = OpenRegular(fd, place, flags, &file->opened)) return code;
  if (mode == ZV_WRITE_SHARED && !Share(fd.get(), file->opened.st_mode)) return VESK2_ERR_FILE_OPEN;
  file->stream = fdopen(fd.get(), "w");
  if (file->stream == nullptr) return OpenError();
  static_cast<void>(fd.release());  // the stream's now
  out = std::move(file);
  return 0;
}

// Reads once, at most `length` bytes. 0 at the end, -1 for an error. A signal that came between is
// no error.
ssize_t ReadDescriptor(int fd, unsigned char* out, size_t length) {
  ssize_t count;
  do {
    count = read(fd, out, length);
  } while (count < 0 && errno == EINTR);
  return count;
}

// The same with the bytes counted. 0 at the end and on an error. More than it held when it was
// opened is an error, as else a file that grows as fast as it is read would never end.
size_t ReadOnce(ZvFile* file, unsigned char* out, size_t length) {
  const ssize_t count = ReadDescriptor(file->fd, out, length);
  if (count > 0) file->taken += static_cast<size_t>(count);
  if (count < 0) {
    file->failure = zv_error_code(errno, VESK2_ERR_READ_FILE);
  } else if (file->taken > static_cast<uint64_t>(file->opened.st_size)) {
    file->failure = VESK2_ERR_READ_FILE;
  }
  // A read that came short and brought all that the file held met its end. Whether the file grew
  // since is the question of zv_check_unchanged.
  file->ended = count > 0 && static_cast<size_t>(count) < length &&
                file->taken == static_cast<uint64_t>(file->opened.st_size);
  return file->failure != 0 ? 0 : static_cast<size_t>(count);
}

}  // namespace

const int kZvNoDirectory = AT_FDCWD;

// Descriptors count as memory does: a process that is driven out of either must not conclude that
// files are gone.
int zv_error_code(int error, int otherwise) {
  const bool ranOut = error == ENOMEM || error == EMFILE || error == ENFILE;
  return ranOut ? VESK2_ERR_MEM_ALLOC : otherwise;
}

// For reading it takes a block; a reader of many files keeps one (zv_reader).
int zv_open(ZvFileOwner& out, const char* path, int mode) {
  out.reset();
  if (mode != ZV_READ) return OpenForWriting(out, path, mode);
  ZvFileOwner file = zv_reader();
  if (file == nullptr) return VESK2_ERR_MEM_ALLOC;
  const int code = zv_reopen(file.get(), {kZvNoDirectory, path});
  if (code == 0) out = std::move(file);
  return code;
}

ZvFileOwner zv_reader() {
  ZvFileOwner file(new (std::nothrow) ZvFile);
  if (file != nullptr) file->block = new (std::nothrow) unsigned char[kReadBlock];
  if (file != nullptr && file->block == nullptr) file.reset();
  return file;
}

// A file that a listing called regular and that does not open so is tried as any other: what it was
// may have changed for a good reason. The state of the file before is forgotten whole.
int zv_reopen(ZvFile* file, const ZvPlace& place) {
  zv_shut(file);
  Descriptor fd;
  int code = VESK2_ERR_FILE_OPEN;
  if (place.listed) code = OpenListed(fd, place, &file->opened);
  if (code == VESK2_ERR_FILE_OPEN) code = OpenAfterLook(fd, place, &file->opened);
  if (code != 0) return code;
  file->fd = fd.release();
  file->next = file->end = file->block;
  file->taken = 0;
  file->ended = false;
  file->failure = 0;
  return 0;
}

void zv_shut(ZvFile* file) {
  if (file->fd >= 0) close(std::exchange(file->fd, -1));
}

// Errors of earlier writes count as well: a stream keeps them, and its last flush may go well.
int zv_close(ZvFile* file) {
  if (file == nullptr) return 0;
  const std::unique_ptr<ZvFile> owner(file);
  delete[] file->block;
  zv_shut(file);
  if (file->stream == nullptr) return 0;
  const bool lost = ferror(file->stream) != 0;
  return fclose(file->stream) != 0 || lost ? VESK2_ERR_WRITE_FILE : 0;
}

// Reads on until all is there or the file has ended: a short read of the system is not the end. As
// much as a block goes past the block.
size_t zv_read_slow(ZvFile* file, unsigned char* out, size_t length) {
  size_t copied = 0;
  while (copied < length) {
    const auto ready = static_cast<size_t>(file->end - file->next);
    if (ready > 0) {
      const size_t count = std::min(ready, length - copied);
      std::memcpy(out + copied, file->next, count);
      file->next += count;
      copied += count;
      continue;
    }
    if (file->failure != 0 || file->ended || file->block == nullptr) break;
    const bool whole = length - copied >= kReadBlock;  // as much as a block needs no block
    const size_t count = whole ? ReadOnce(file, out + copied, length - copied)
                               : ReadOnce(file, file->block, kReadBlock);
    if (count == 0) break;
    if (whole) {
      copied += count;
    } else {
      file->next = file->block;
      file->end = file->block + count;
    }
  }
  return copied;
}

// Everything that is parsed comes through here, so that the parsed bytes are one state of the file
// or none: other than the size that it had when it was opened is refused.
int zv_read_whole(std::unique_ptr<unsigned char[]>& out, size_t* size, const ZvPlace& place,
                  uint64_t limit) {
  struct stat opened {};
  Descriptor fd;
  const int code =
      place.listed ? OpenListed(fd, place, &opened) : OpenAfterLook(fd, place, &opened);
  if (code != 0) return code;
  const auto held = static_cast<uint64_t>(opened.st_size);
  // Before memory is taken for it.
  if (held > limit) return VESK2_ERR_FILE_OPEN;
  // One byte more than it held is asked for, so that the read that gets it all meets the end.
  std::unique_ptr<unsigned char[]> bytes(new (std::nothrow) unsigned char[held + 1]);
  if (bytes == nullptr) return VESK2_ERR_MEM_ALLOC;
  size_t taken = 0;
  do {
    const ssize_t count = ReadDescriptor(fd.get(), bytes.get() + taken, held + 1 - taken);
    if (count < 0) return OpenError();
    if (count == 0) break;
    taken += static_cast<size_t>(count);
  } while (taken < held);
  if (taken != held) return VESK2_ERR_FILE_OPEN;
  *size = taken;
  out = std::move(bytes);
  return 0;
}

// A writer that restores size and time is not noticed: whoever can write the tree while it is read
// is beyond what this can promise.
int zv_check_unchanged(const ZvFile* file) {
  struct stat now {};
  if (fstat(file->fd, &now) != 0) return zv_error_code(errno, VESK2_ERR_READ_FILE);
  const struct stat& then = file->opened;
  const bool same = now.st_dev == then.st_dev && now.st_ino == then.st_ino &&
                    now.st_size == then.st_size && now.st_mtim.tv_sec == then.st_mtim.tv_sec &&
                    now.st_mtim.tv_nsec == then.st_mtim.tv_nsec;
  return same ? 0 : VESK2_ERR_READ_FILE;
}

// Short when the disk is full; the stream remembers it.
size_t zv_write(FILE* stream, const void* data, size_t length) {
  return length > 0 ? fwrite(data, 1, length, stream) : 0;
}

// By a place, so that a file in a directory held open is asked about there.
int zv_stat(const ZvPlace& place, struct stat* out) {
  if (place.name == nullptr) return VESK2_ERR_STAT_FILE;
  const bool told = fstatat(place.directory, place.name, out, 0) == 0;
  return told ? 0 : zv_error_code(errno, VESK2_ERR_STAT_FILE);
}

// The mode is set behind the umask, as others must be able to read what is shared, and nobody what
// is not. What is there already is left as it is: its mode is its owner's choice.
int zv_mkdir(const char* path, mode_t mode) {
  if (path == nullptr) return VESK2_ERR_CREATE_DIR;
  if (mkdir(path, mode) == 0) {
    if (chmod(path, mode) == 0) return 0;
    static_cast<void>(rmdir(path));  // the next attempt must not find it closed to others
    return VESK2_ERR_CREATE_DIR;
  }
  struct stat there {};
  const bool isDirectory = stat(path, &there) == 0 && S_ISDIR(there.st_mode);
  return isDirectory ? 0 : VESK2_ERR_CREATE_DIR;
}

}  // namespace ZVsysutil
