// Opening, reading, writing and testing files.
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

constexpr size_t kReadBlock = size_t{64} << 10;
constexpr mode_t kFileMode = 0666;

// The pauses between attempts to open a file that is held, in milliseconds.
constexpr uint32_t kFirstPause = 1;
constexpr uint32_t kLongestPause = 100;

// A descriptor that is closed unless it is handed over.
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

[[nodiscard]] int OpenError() { return zv_error_code(errno, VESK2_ERR_FILE_OPEN); }

// 0 for a regular file. Opening a device can do something by itself, so what is none is not even
// opened.
[[nodiscard]] int RequireRegular(const char* path) {
  struct stat about {};
  if (path == nullptr) return VESK2_ERR_FILE_OPEN;
  if (stat(path, &about) != 0) return OpenError();
  return S_ISREG(about.st_mode) ? 0 : VESK2_ERR_FILE_OPEN;
}

[[nodiscard]] int OpenNow(Descriptor& out, const char* path, int flags) {
  do {
    out.Reset(open(path, flags | O_NONBLOCK | O_CLOEXEC | O_NOCTTY, kFileMode));
  } while (out.get() < 0 && errno == EINTR);
  if (out.get() >= 0) return 0;
  return errno == EAGAIN ? VESK2_ERR_READ_FILE : OpenError();
}

// Opens a file, waiting for one that is held. Every attempt is made without blocking, and only
// after a look that it is still a regular file: a FIFO or a device can take its place meanwhile.
[[nodiscard]] int OpenOrWait(Descriptor& out, const char* path, int flags) {
  int code = OpenNow(out, path, flags);
  if (code != VESK2_ERR_READ_FILE) return code;
  ZvCall call;
  uint32_t pause = kFirstPause;
  while (code == VESK2_ERR_READ_FILE) {
    const bool again = call.Pause(pause);
    if (const int gone = RequireRegular(path)) return gone;
    if (!again) break;
    pause = std::min(2 * pause, kLongestPause);
    code = OpenNow(out, path, flags);
  }
  return code;
}

// O_NONBLOCK keeps the open itself from waiting on a FIFO or a device, or for the holder of a
// lease. What was opened is judged by its descriptor, so nobody can swap it in between.
[[nodiscard]] int OpenRegular(Descriptor& out, const char* path, int flags, struct stat* opened) {
  if (path == nullptr) return VESK2_ERR_FILE_OPEN;
  if (const int code = OpenOrWait(out, path, flags)) return code;
  if (fstat(out.get(), opened) != 0) return OpenError();
  return S_ISREG(opened->st_mode) ? 0 : VESK2_ERR_FILE_OPEN;
}

[[nodiscard]] int OpenForReading(ZvFileOwner& out, const char* path) {
  if (const int code = RequireRegular(path)) return code;
  ZvFileOwner file(new (std::nothrow) ZvFile);
  if (file == nullptr) return VESK2_ERR_MEM_ALLOC;
  file->block = new (std::nothrow) unsigned char[kReadBlock];
  if (file->block == nullptr) return VESK2_ERR_MEM_ALLOC;
  Descriptor fd;
  if (const int code = OpenRegular(fd, path, O_RDONLY, &file->opened)) return code;
  file->fd = fd.release();
  file->next = file->end = file->block;
  out = std::move(file);
  return 0;
}

// Makes a file one that all can read, and tells whether it is. Another's file may be one already.
bool Share(int fd, mode_t mode) {
  constexpr mode_t kReadable = 0444;
  return fchmod(fd, kZvSharedFile) == 0 || (mode & kReadable) == kReadable;
}

[[nodiscard]] int OpenForWriting(ZvFileOwner& out, const char* path, int mode) {
  ZvFileOwner file(new (std::nothrow) ZvFile);
  if (file == nullptr) return VESK2_ERR_MEM_ALLOC;
  Descriptor fd;
  const int flags = O_WRONLY | O_CREAT | O_TRUNC | (mode == ZV_WRITE ? 0 : O_NOFOLLOW);
  if (const int code = OpenRegular(fd, path, flags, &file->opened)) return code;
  if (mode == ZV_WRITE_SHARED && !Share(fd.get(), file->opened.st_mode)) return VESK2_ERR_FILE_OPEN;
  file->stream = fdopen(fd.get(), "w");
  if (file->stream == nullptr) return OpenError();
  static_cast<void>(fd.release());  // the stream's now
  out = std::move(file);
  return 0;
}

// Reads once, at most `length` bytes. 0 at the end, -1 for an error.
ssize_t ReadDescriptor(int fd, unsigned char* out, size_t length) {
  ssize_t count;
  do {
    count = read(fd, out, length);
  } while (count < 0 && errno == EINTR);
  return count;
}

// The same with the bytes counted. 0 at the end and on an error.
size_t ReadOnce(ZvFile* file, unsigned char* out, size_t length) {
  const ssize_t count = ReadDescriptor(file->fd, out, length);
  if (count > 0) file->taken += static_cast<size_t>(count);
  if (count < 0) {
    file->failure = zv_error_code(errno, VESK2_ERR_READ_FILE);
  } else if (file->taken > static_cast<uint64_t>(file->opened.st_size)) {
    file->failure = VESK2_ERR_READ_FILE;
  }
  return file->failure != 0 ? 0 : static_cast<size_t>(count);
}

}  // namespace

int zv_error_code(int error, int otherwise) {
  const bool ranOut = error == ENOMEM || error == EMFILE || error == ENFILE;
  return ranOut ? VESK2_ERR_MEM_ALLOC : otherwise;
}

int zv_open(ZvFileOwner& out, const char* path, int mode) {
  out.reset();
  return mode == ZV_READ ? OpenForReading(out, path) : OpenForWriting(out, path, mode);
}

int zv_close(ZvFile* file) {
  if (file == nullptr) return 0;
  const std::unique_ptr<ZvFile> owner(file);
  delete[] file->block;
  if (file->fd >= 0) close(file->fd);
  if (file->stream == nullptr) return 0;
  const bool lost = ferror(file->stream) != 0;
  return fclose(file->stream) != 0 || lost ? VESK2_ERR_WRITE_FILE : 0;
}

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
    if (file->failure != 0 || file->block == nullptr) break;
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

int zv_read_whole(std::unique_ptr<unsigned char[]>& out, size_t* size, const char* path,
                  uint64_t limit, bool listed) {
  if (!listed)
    if (const int code = RequireRegular(path)) return code;
  struct stat opened {};
  // What was listed as a file is no link; one that took its place could lead to a device.
  Descriptor fd;
  if (const int code = OpenRegular(fd, path, O_RDONLY | (listed ? O_NOFOLLOW : 0), &opened))
    return code;
  const auto held = static_cast<uint64_t>(opened.st_size);
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

int zv_check_unchanged(const ZvFile* file) {
  struct stat now {};
  if (fstat(file->fd, &now) != 0) return zv_error_code(errno, VESK2_ERR_READ_FILE);
  const struct stat& then = file->opened;
  const bool same = now.st_dev == then.st_dev && now.st_ino == then.st_ino &&
                    now.st_size == then.st_size && now.st_mtim.tv_sec == then.st_mtim.tv_sec &&
                    now.st_mtim.tv_nsec == then.st_mtim.tv_nsec;
  return same ? 0 : VESK2_ERR_READ_FILE;
}

size_t zv_write(FILE* stream, const void* data, size_t length) {
  return length > 0 ? fwrite(data, 1, length, stream) : 0;
}

int zv_stat(const char* path, struct stat* out) {
  if (path == nullptr) return VESK2_ERR_STAT_FILE;
  return stat(path, out) == 0 ? 0 : zv_error_code(errno, VESK2_ERR_STAT_FILE);
}

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
