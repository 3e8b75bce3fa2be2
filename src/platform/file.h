// SPDX-License-Identifier: Apache-2.0
// Files and directories over POSIX. Only regular files are opened for reading: a FIFO, socket or
// device in a tree that is being judged must neither block nor feed us without end.
//
// What fails tells so by its code alone. VESK2_ERR_MEM_ALLOC is a resource that ran out, memory or
// descriptors; opening a file answers VESK2_ERR_READ_FILE when the file is there and another
// process held it until the wait was over (wait.h). Neither says that there is no such file.
#ifndef VESK2_SRC_PLATFORM_FILE_H
#define VESK2_SRC_PLATFORM_FILE_H

#include <sys/stat.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <memory>

#include <vesk2/platform.h>

namespace ZVsysutil {

// Where a file stands: a name that is looked up in a directory held open, or a path. `listed`: that
// directory just said that it is a regular file and no link, which spares the question before it is
// opened.
struct ZvPlace {
  // A descriptor, or kZvNoDirectory.
  int directory;
  const char* name;
  bool listed = false;
};
extern const int kZvNoDirectory;  // names are paths then

// A file opened by zv_open. Readers copy out of `block`; writers go through the stream.
struct ZvFile {
  const unsigned char* next = nullptr;  // unread bytes of `block`
  const unsigned char* end = nullptr;
  unsigned char* block = nullptr;
  int fd = -1;
  // Bytes read from the file so far.
  uint64_t taken = 0;
  // They are all that it held.
  bool ended = false;
  // The code of a read error that happened: kept, as reads only tell how many bytes there were.
  int failure = 0;
  // Writing only.
  FILE* stream = nullptr;
  // Reading only: the file as it was when it was opened.
  struct stat opened {};
};

enum ZvOpenMode : int {
  ZV_WRITE = 1,  // follows links, as any program's output does
  ZV_READ = 2,
  ZV_WRITE_STORE = 3,   // refuses a link: what stands in a store must not lead out of it
  ZV_WRITE_SHARED = 4,  // the same, readable by all (kZvSharedFile) whatever the umask
};

// The modes of what everybody must be able to read: with a revocation list that only its writer can
// read, the revoked key passes for all others.
inline constexpr mode_t kZvSharedFile = 0644;
inline constexpr mode_t kZvSharedDirectory = 0755;

// zv_error_code is the code of a system call that failed with `error`: VESK2_ERR_MEM_ALLOC where a
// resource ran out, else `otherwise`. No other place makes a code of errno.
[[nodiscard]] int zv_error_code(int error, int otherwise);

// zv_close closes, flushing first. 0, or VESK2_ERR_WRITE_FILE when written bytes could not be kept.
[[nodiscard]] int zv_close(ZvFile* file);
struct ZvFileCloser {
  void operator()(ZvFile* file) const { static_cast<void>(zv_close(file)); }
};
// Owns an open file on the paths where the result of closing does not matter.
using ZvFileOwner = std::unique_ptr<ZvFile, ZvFileCloser>;
// zv_open opens for writing (create or truncate) or for reading. 0; VESK2_ERR_MEM_ALLOC;
// VESK2_ERR_READ_FILE (see above); VESK2_ERR_FILE_OPEN for a null path, for anything but a regular
// file, and for all else that fails. `out` is null after a failure.
[[nodiscard]] int zv_open(ZvFileOwner& out, const char* path, int mode);
// zv_reader makes a file to read with that is not open yet; null without memory. zv_reopen opens it
// at a place, in the stead of what it was at before, with the codes of zv_open; zv_shut closes it.
// Many files are read with one block so.
[[nodiscard]] ZvFileOwner zv_reader();
[[nodiscard]] int zv_reopen(ZvFile* file, const ZvPlace& place);
void zv_shut(ZvFile* file);
// The stream behind a file opened for writing, for PrintCanonical.
inline FILE* zv_stream(ZvFile* file) { return file->stream; }

// zv_read copies up to `length` bytes and returns how many; 0 at the end and on an error, which
// zv_read_error then tells. A file that yields more bytes than it held when it was opened is an
// error: it could grow as fast as we read. Small reads stay inline; a loop of them goes through a
// ZvReader.
size_t zv_read_slow(ZvFile* file, unsigned char* out, size_t length);
inline size_t zv_read(ZvFile* file, unsigned char* out, size_t length) {
  if (static_cast<size_t>(file->end - file->next) >= length) [[likely]] {
    std::memcpy(out, file->next, length);
    file->next += length;
    return length;
  }
  return zv_read_slow(file, out, length);
}

// A reader's place in an open file, held by value: a loop of 4-byte reads keeps it in registers,
// which the processor's store unit could not keep up with otherwise. Nothing else may read the file
// until the reader is gone.
class ZvReader {
 public:
  explicit ZvReader(ZvFile* file) : file_(file), next_(file->next), end_(file->end) {}
  ~ZvReader() { file_->next = next_; }
  ZvReader(const ZvReader&) = delete;
  ZvReader& operator=(const ZvReader&) = delete;

  // The bytes that are at hand, and passing over them.
  const unsigned char* Next() const { return next_; }
  size_t Ready() const { return static_cast<size_t>(end_ - next_); }
  void Skip(size_t length) { next_ += length; }

  size_t Read(unsigned char* out, size_t length) {
    if (static_cast<size_t>(end_ - next_) >= length) [[likely]] {
      std::memcpy(out, next_, length);
      next_ += length;
      return length;
    }
    file_->next = next_;
    const size_t count = zv_read_slow(file_, out, length);
    next_ = file_->next;
    end_ = file_->end;
    return count;
  }

 private:
  ZvFile* file_;
  const unsigned char* next_;
  const unsigned char* end_;
};

inline size_t zv_read(ZvReader& reader, unsigned char* out, size_t length) {
  return reader.Read(out, length);
}

// zv_read_whole reads a regular file of at most `limit` bytes, without the block of the readers
// above. Codes of zv_open; VESK2_ERR_FILE_OPEN also for a read error, and for a file that yields
// other than the *size bytes that it held when it was opened.
[[nodiscard]] int zv_read_whole(std::unique_ptr<unsigned char[]>& out, size_t* size,
                                const ZvPlace& place, uint64_t limit);
// zv_buffer_adopt makes a buffer of an array from new[], which is deleted on failure. Null for
// null, and without memory.
ZvBuffer* zv_buffer_adopt(unsigned char* data, size_t size);
// zv_buffer_read_file is zv_buffer_wrap_file with the codes of zv_read_whole; *out is null after a
// failure.
[[nodiscard]] int zv_buffer_read_file(ZvBuffer** out, const ZvPlace& place);

// The code of a read error that happened, else 0: VESK2_ERR_READ_FILE, VESK2_ERR_MEM_ALLOC.
[[nodiscard]] inline int zv_read_error(const ZvFile* file) { return file->failure; }
// Whether a file opened for reading is still the one that was opened: same inode, size and time. 0;
// VESK2_ERR_READ_FILE; VESK2_ERR_MEM_ALLOC when it cannot be told.
[[nodiscard]] int zv_check_unchanged(const ZvFile* file);

// zv_write writes to a stream and returns the bytes written (short on an error).
size_t zv_write(FILE* stream, const void* data, size_t length);

// zv_stat fills *out, following links. 0, VESK2_ERR_STAT_FILE, VESK2_ERR_MEM_ALLOC.
[[nodiscard]] int zv_stat(const ZvPlace& place, struct stat* out);
[[nodiscard]] inline int zv_stat(const char* path, struct stat* out) {
  return zv_stat(ZvPlace{kZvNoDirectory, path}, out);
}
// zv_mkdir makes one directory, of mode `mode` whatever the umask. 0 when it is there already, else
// VESK2_ERR_CREATE_DIR.
[[nodiscard]] int zv_mkdir(const char* path, mode_t mode);

// What a directory itself says of an entry. Of links and on some disks it says nothing.
enum class ZvKind : unsigned char { kUnknown, kFile, kDirectory, kOther };

// ZvListing goes through the entries of one directory, in the order of the disk, without "." and
// "..". The directory stays open until the listing is closed: files are opened from it by name.
class ZvListing {
 public:
  ZvListing() = default;
  ~ZvListing() { Close(); }
  ZvListing(const ZvListing&) = delete;
  ZvListing& operator=(const ZvListing&) = delete;

  // 0; VESK2_ERR_FIND_DIR for a null, absent or unreadable directory; VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int Open(const ZvPlace& place);
  // Next gives a name, borrowed until the next call, or null at the end. 0; VESK2_ERR_FIND_DIR for
  // a directory that stopped being readable half-way; VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int Next(const char** name, ZvKind* kind);
  [[nodiscard]] int Descriptor() const { return descriptor_; }
  void Close();

 private:
  void* stream_ = nullptr;  // a DIR
  int descriptor_ = -1;
};

// ZvDir reads the names of a directory that match a pattern ("*" or "*.ext"), sorted bytewise,
// never "." or "..". The order decides which store file is found first, so it must not depend on
// the disk.
class ZvDir {
 public:
  ZvDir() = default;
  ~ZvDir() { close(); }
  ZvDir(const ZvDir&) = delete;
  ZvDir& operator=(const ZvDir&) = delete;

  // 0; VESK2_ERR_FIND_DIR for a null, absent or unreadable directory, or one that stopped being
  // readable half-way; VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int open(const char* directory, const char* pattern);
  // The next name (or "directory/name" with fullPath), borrowed until the next call; null at the
  // end or when memory runs out (see failed()).
  const char* read(bool fullPath);
  // Where the file of the name that was read last is to be opened.
  ZvPlace place() const {
    const Entry& entry = entries_[cursor_ - 1];
    return {listing_.Descriptor(), entry.name, entry.regular};
  }
  void close();
  // Whether the last null of read() was for lack of memory.
  bool failed() const { return failed_; }

 private:
  struct Entry {
    char* name;
    bool regular;
  };
  [[nodiscard]] int Load(const char* directory, const char* pattern);
  [[nodiscard]] int Add(const char* name, bool regular);

  ZvListing listing_;
  char* directory_ = nullptr;
  Entry* entries_ = nullptr;
  size_t count_ = 0;
  size_t capacity_ = 0;
  size_t cursor_ = 0;
  char* path_ = nullptr;
  bool failed_ = false;
};

}  // namespace ZVsysutil

#endif  // VESK2_SRC_PLATFORM_FILE_H
