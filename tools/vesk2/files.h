// files.h: reading small files whole, and writing files whole or not at all.
#ifndef VESK2_TOOLS_FILES_H
#define VESK2_TOOLS_FILES_H

#include <sys/types.h>

#include <functional>
#include <string>
#include <string_view>

#include "tools/vesk2/report.h"

namespace vesk2_command {

// A Trouble "PATH: TEXT" that names the file for machines too.
Trouble FileTrouble(const std::string& path, const std::string& text, const std::string& reason);

// Why a file that the library could not open cannot be read, in words.
std::string WhyUnreadable(const std::string& path);

// ReadFile returns the contents of a regular file; Trouble when it cannot, or past `limit` bytes.
std::string ReadFile(const std::string& path, size_t limit);

// Trouble if something is at `path`, unless `force`.
void RefuseExisting(const std::string& path, bool force);

struct WriteOptions {
  mode_t mode = 0666;  // less the umask
  bool force = false;  // replace what is there
  // Called with the finished file's temporary path; throws to refuse it.
  std::function<void(const std::string&)> check = nullptr;
};

// WriteFile puts `bytes` under a temporary name beside `path`, checks it, and only then gives it
// its name: what stands at `path` is the old file or the whole new one. Throws Trouble.
void WriteFile(const std::string& path, std::string_view bytes, const WriteOptions& options);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_FILES_H
