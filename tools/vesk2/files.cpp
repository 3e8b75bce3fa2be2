// files.cpp: file contents in and out.
#include "tools/vesk2/files.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>

#include "tools/vesk2/report.h"

#include <vesk2/limits.h>

namespace vesk2_command {
namespace {

[[noreturn]] void Fail(const std::string& path, int error) {
  throw FileTrouble(path, std::strerror(error), "io");
}

class Descriptor {
 public:
  explicit Descriptor(int number) : number_(number) {}
  ~Descriptor() {
    if (number_ >= 0) close(number_);
  }
  Descriptor(const Descriptor&) = delete;
  Descriptor& operator=(const Descriptor&) = delete;
  int get() const { return number_; }

 private:
  int number_;
};

// A file that is removed again unless it was given its final name.
class Temporary {
 public:
  explicit Temporary(const std::string& target) {
    const std::filesystem::path path(target);
    path_ =
        path.parent_path() / ("." + path.filename().string() + ".tmp" + std::to_string(getpid()));
  }
  ~Temporary() {
    if (made_) unlink(path_.c_str());
  }
  Temporary(const Temporary&) = delete;
  Temporary& operator=(const Temporary&) = delete;

  const std::string& path() const { return path_; }

  void Write(std::string_view bytes, mode_t mode) {
    const Descriptor file(open(path_.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, mode));
    if (file.get() < 0) Fail(path_, errno);
    made_ = true;
    while (!bytes.empty()) {
      const ssize_t written = write(file.get(), bytes.data(), bytes.size());
      if (written < 0 && errno == EINTR) continue;
      if (written <= 0) Fail(path_, errno);
      bytes.remove_prefix(static_cast<size_t>(written));
    }
    if (fsync(file.get()) != 0) Fail(path_, errno);
  }

  void MoveTo(const std::string& target, bool force) {
    int result =
        force ? -1 : renameat2(AT_FDCWD, path_.c_str(), AT_FDCWD, target.c_str(), RENAME_NOREPLACE);
    // Some file systems cannot rename without replacing; the target was looked for before.
    if (force || (result != 0 && (errno == EINVAL || errno == ENOSYS))) {
      result = rename(path_.c_str(), target.c_str());
    }
    if (result != 0) Fail(target, errno);
    made_ = false;
  }

 private:
  std::string path_;
  bool made_ = false;
};

}  // namespace

Trouble FileTrouble(const std::string& path, const std::string& text, const std::string& reason) {
  Trouble trouble(Escape(path) + ": " + text, reason);
  trouble.file = Escape(path);
  return trouble;
}

std::string WhyUnreadable(const std::string& path) {
  struct stat status = {};
  if (stat(path.c_str(), &status) != 0) return std::strerror(errno);
  if (!S_ISREG(status.st_mode)) return "not a regular file";
  if (access(path.c_str(), R_OK) != 0) return std::strerror(errno);
  if (static_cast<uint64_t>(status.st_size) > ZvVesk2::Limits::kMaxFile) return "too large";
  return "cannot be read";
}

std::string ReadFile(const std::string& path, size_t limit) {
  // Without O_NONBLOCK, opening a FIFO that nobody writes to would never return.
  const Descriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
  if (file.get() < 0) Fail(path, errno);
  struct stat status = {};
  if (fstat(file.get(), &status) != 0) Fail(path, errno);
  if (!S_ISREG(status.st_mode)) throw FileTrouble(path, "not a regular file", "io");
  std::string text(limit + 1, '\0');
  size_t size = 0;
  while (size < text.size()) {
    const ssize_t got = read(file.get(), text.data() + size, text.size() - size);
    if (got < 0 && errno == EINTR) continue;
    if (got < 0) Fail(path, errno);
    if (got == 0) break;
    size += static_cast<size_t>(got);
  }
  if (size > limit) throw FileTrouble(path, "too large", "io");
  text.resize(size);
  return text;
}

void RefuseExisting(const std::string& path, bool force) {
  struct stat status = {};
  if (force || lstat(path.c_str(), &status) != 0) return;
  throw FileTrouble(path, "exists; --force replaces it", "exists");
}

void WriteFile(const std::string& path, std::string_view bytes, const WriteOptions& options) {
  RefuseExisting(path, options.force);
  Temporary temporary(path);
  temporary.Write(bytes, options.mode);
  if (options.check) options.check(temporary.path());
  temporary.MoveTo(path, options.force);
}

}  // namespace vesk2_command
