// SPDX-License-Identifier: Apache-2.0
// Writing a file whole or not at all: its bytes go to a temporary file beside it, which takes its
// place when they are on the disk.
//
// The temporary name, "<name>.tmp-<32 hexadecimal digits>", is drawn at random: processes of the
// same number, in containers that share a directory, must not meet in one file. The writer holds
// the file's lock (flock) until it has its final name, so that whoever gets the lock knows that no
// writer is left.
#ifndef VESK2_SRC_PLATFORM_REPLACE_H
#define VESK2_SRC_PLATFORM_REPLACE_H

#include <sys/stat.h>

#include <cstdio>
#include <memory>

namespace ZVsysutil {

class ZvReplacement {
 public:
  ZvReplacement() = default;
  // Removes the temporary file, unless it was kept.
  ~ZvReplacement();
  ZvReplacement(const ZvReplacement&) = delete;
  ZvReplacement& operator=(const ZvReplacement&) = delete;

  // Open makes the temporary file beside `path`, of mode `mode` whatever the umask. Once an object.
  // VESK2_ERR_MEM_ALLOC, VESK2_ERR_FILE_OPEN.
  [[nodiscard]] int Open(const char* path, mode_t mode);
  // The stream to write to, until the file is kept.
  FILE* Stream() const { return stream_; }
  // Keep flushes the file to the disk and gives it its name. What had the name (a link itself, not
  // what it leads to) is replaced, or unless `replace` keeps it. VESK2_ERR_WRITE_FILE, with what
  // had the name as it was.
  [[nodiscard]] int Keep(bool replace);

 private:
  [[nodiscard]] int Name();
  [[nodiscard]] int MakeNamed(mode_t mode);
  bool HasLock() const;
  bool Publish(bool replace) const;

  std::unique_ptr<char[]> path_;
  std::unique_ptr<char[]> temporary_;
  size_t stem_ = 0;  // what the temporary path keeps of `path_`
  // Also what the lock hangs on: it goes with the last descriptor of the file.
  int fd_ = -1;
  FILE* stream_ = nullptr;  // owns fd_
};

// zv_remove_leftovers removes the temporary files that dead writers left in a directory. One that
// is being written, or whose name has gone to another file meanwhile, is left alone.
void zv_remove_leftovers(const char* directory);

}  // namespace ZVsysutil

#endif  // VESK2_SRC_PLATFORM_REPLACE_H
