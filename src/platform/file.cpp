// Opening, reading, writing and testing files.
#include "src/platform/file.h"

#include <fcntl.h>
#include <unistd.h>
#include <algorithm>
#include <cerrno>
#include <new>
#include <utility>

namespace ZVsysutil {
namespace {

constexpr size_t kReadBlock = size_t{64} << 10;
constexpr mode_t kFileMode = 0666;

// A descriptor that is closed unless it is handed over.
class Descriptor {
 public:
  explicit Descriptor(int fd) : fd_(fd) {}
  ~Descriptor() {
    if (fd_ >= 0) close(fd_);
  }
  Descriptor(const Descriptor&) = delete;
  Descriptor& operator=(const Descriptor&) = delete;
  int get() const { return fd_; }
  int release() { return std::exchange(fd_, -1); }

 private:
  int fd_;
};

// O_NONBLOCK keeps the open itself from waiting on a FIFO or a device; on a regular file it means
// nothing. What was opened is judged by its descriptor, so nobody can swap it in between.
int OpenRegular(const char* path, int flags, struct stat* opened) {
  if (path == nullptr) return -1;
  Descriptor fd(open(path, flags | O_NONBLOCK | O_CLOEXEC | O_NOCTTY, kFileMode));
  if (fd.get() < 0 || fstat(fd.get(), opened) != 0 || !S_ISREG(opened->st_mode)) return -1;
  return fd.release();
}

// Opening a device can do something by itself, so what is no regular file is not even opened.
bool IsRegular(const char* path) {
  struct stat about {};
  return path != nullptr && stat(path, &about) == 0 && S_ISREG(about.st_mode);
}

ZvFile* OpenForReading(const char* path) {
  if (!IsRegular(path)) return nullptr;
  std::unique_ptr<ZvFile> file(new (std::nothrow) ZvFile);
  std::unique_ptr<unsigned char[]> block(new (std::nothrow) unsigned char[kReadBlock]);
  if (file == nullptr || block == nullptr) return NoMemory();
  file->fd = OpenRegular(path, O_RDONLY, &file->opened);
  if (file->fd < 0) return nullptr;
  file->block = block.release();
  file->next = file->end = file->block;
  return file.release();
}

ZvFile* OpenForWriting(const char* path, int flags) {
  std::unique_ptr<ZvFile> file(new (std::nothrow) ZvFile);
  if (file == nullptr) return NoMemory();
  Descriptor fd(OpenRegular(path, O_WRONLY | O_CREAT | O_NOFOLLOW | flags, &file->opened));
  if (fd.get() < 0) return nullptr;
  file->stream = fdopen(fd.get(), "w");
  if (file->stream == nullptr) return nullptr;
  fd.release();  // the stream's now
  return file.release();
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
  file->failed = count < 0 || file->taken > static_cast<uint64_t>(file->opened.st_size);
  return file->failed ? 0 : static_cast<size_t>(count);
}

}  // namespace

ZvFile* zv_open(const char* path, int mode) {
  if (mode == ZV_READ) return OpenForReading(path);
  if (mode == ZV_WRITE) return OpenForWriting(path, O_TRUNC);
  return nullptr;
}

ZvFile* zv_create_new(const char* path) { return OpenForWriting(path, O_EXCL); }

int zv_close(ZvFile* file) {
  if (file == nullptr) return 0;
  const std::unique_ptr<ZvFile> owner(file);
  delete[] file->block;
  if (file->fd >= 0) close(file->fd);
  if (file->stream == nullptr) return 0;
  const bool lost = ferror(file->stream) != 0;
  return fclose(file->stream) != 0 || lost ? VESK2_ERR_WRITE_FILE : 0;
}

int zv_sync(ZvFile* file) {
  if (file == nullptr || file->stream == nullptr) return VESK2_ERR_WRITE_FILE;
  const bool kept = fflush(file->stream) == 0 && fsync(fileno(file->stream)) == 0;
  return kept ? 0 : VESK2_ERR_WRITE_FILE;
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
    if (file->failed || file->block == nullptr) break;
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

unsigned char* zv_read_whole(const char* path, uint64_t limit, size_t* size, bool listed) {
  if (!listed && !IsRegular(path)) return nullptr;
  struct stat opened {};
  // What was listed as a file is no link; one that took its place could lead to a device.
  const Descriptor fd(OpenRegular(path, O_RDONLY | (listed ? O_NOFOLLOW : 0), &opened));
  if (fd.get() < 0) return nullptr;
  const auto held = static_cast<uint64_t>(opened.st_size);
  if (held > limit) return nullptr;
  // One byte more than it held is asked for, so that the read that gets it all meets the end.
  std::unique_ptr<unsigned char[]> bytes(new (std::nothrow) unsigned char[held + 1]);
  if (bytes == nullptr) return NoMemory();
  size_t taken = 0;
  do {
    const ssize_t count = ReadDescriptor(fd.get(), bytes.get() + taken, held + 1 - taken);
    if (count < 0) return nullptr;
    if (count == 0) break;
    taken += static_cast<size_t>(count);
  } while (taken < held);
  if (taken != held) return nullptr;
  *size = taken;
  return bytes.release();
}

bool zv_unchanged(const ZvFile* file) {
  struct stat now {};
  if (fstat(file->fd, &now) != 0) return false;
  const struct stat& then = file->opened;
  return now.st_dev == then.st_dev && now.st_ino == then.st_ino && now.st_size == then.st_size &&
         now.st_mtim.tv_sec == then.st_mtim.tv_sec && now.st_mtim.tv_nsec == then.st_mtim.tv_nsec;
}

size_t zv_write(FILE* stream, const void* data, size_t length) {
  return length > 0 ? fwrite(data, 1, length, stream) : 0;
}

int zv_stat(const char* path, struct stat* out) {
  return path != nullptr && stat(path, out) == 0 ? 0 : VESK2_ERR_STAT_FILE;
}

int zv_mkdir(const char* path, mode_t mode) {
  if (path == nullptr) return VESK2_ERR_CREATE_DIR;
  if (mkdir(path, mode) == 0) return 0;
  struct stat there {};
  const bool isDirectory = stat(path, &there) == 0 && S_ISDIR(there.st_mode);
  return isDirectory ? 0 : VESK2_ERR_CREATE_DIR;
}

}  // namespace ZVsysutil
