// SPDX-License-Identifier: Apache-2.0
// files.cpp: file contents in and out.
#include "tools/vesk2/files/files.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <optional>

#include "tools/vesk2/files/descriptor.h"
#include "tools/vesk2/files/leftovers.h"
#include "tools/vesk2/say/interrupt.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/limits.h>

namespace vesk2_command {
namespace {

[[noreturn]] void Fail(const std::string& path, int error) {
  throw FileTrouble(path, std::strerror(error), "io");
}

void WriteAll(int file, std::string_view bytes, const std::string& path) {
  while (!bytes.empty()) {
    const ssize_t written = write(file, bytes.data(), bytes.size());
    if (written < 0 && errno == EINTR) continue;
    if (written <= 0) Fail(path, errno);
    bytes.remove_prefix(static_cast<size_t>(written));
  }
}

std::string ReadAll(int file, size_t limit, const std::string& path) {
  constexpr size_t kStep = 64 << 10;
  std::string text;
  size_t size = 0;
  while (size <= limit) {
    text.resize(std::min(size + kStep, limit + 1));
    const ssize_t got = read(file, text.data() + size, text.size() - size);
    if (got < 0 && errno == EINTR) continue;
    if (got < 0) Fail(path, errno);
    if (got == 0) break;
    size += static_cast<size_t>(got);
  }
  if (size > limit) throw FileTrouble(path, "too large", "io");
  text.resize(size);
  return text;
}

const std::string& StandardInput() {
  static const std::string text =
      ReadAll(STDIN_FILENO, ZvVesk2::Limits::kMaxFile, "standard input");
  return text;
}

std::filesystem::path Directory(const std::string& path) {
  std::filesystem::path directory = std::filesystem::path(path).parent_path();
  return directory.empty() ? "." : directory;
}

// A file that has no name until it is finished: nothing is left of it whatever ends the process.
// Where the file system cannot do that, and while it replaces another, it has a temporary name. A
// process that is killed outright leaves the file under it, to the next one that writes the target.
class NewFile {
 public:
  NewFile(const std::string& target, mode_t mode) : target_(target), directory_(Directory(target)) {
    RemoveLeftoverFiles(target);
    file_.Take(open(directory_.c_str(), O_TMPFILE | O_RDWR | O_CLOEXEC, mode));
    const bool supported = file_.get() >= 0 || (errno != EOPNOTSUPP && errno != EISDIR);
    if (!supported || (file_.get() >= 0 && access(file_.Path().c_str(), F_OK) != 0)) {
      OpenNamed(mode);
    }
    if (file_.get() < 0) Fail(target_, errno);
    (void)flock(file_.get(), LOCK_EX | LOCK_NB);  // where there are no locks, nobody gets one
  }
  ~NewFile() { Unname(); }
  NewFile(const NewFile&) = delete;
  NewFile& operator=(const NewFile&) = delete;

  std::string Path() const { return name_.empty() ? file_.Path() : name_; }

  void Write(std::string_view bytes) {
    WriteAll(file_.get(), bytes, target_);
    if (fsync(file_.get()) != 0) Fail(target_, errno);
  }

  void Keep(bool force) {
    if (name_.empty() && !force) {
      if (Link(target_) != 0) Fail(target_, errno);
      return;
    }
    if (name_.empty()) {
      Guard();
      if (Link(name_) != 0) Fail(target_, errno);
    }
    Rename(force);
    Unname();
  }

 private:
  int Link(const std::string& name) {
    return linkat(AT_FDCWD, file_.Path().c_str(), AT_FDCWD, name.c_str(), AT_SYMLINK_FOLLOW);
  }

  // From now on the file may have a temporary name, which an interruption removes.
  void Guard() {
    const std::string name = DrawName(StemOf(std::filesystem::path(target_).filename()));
    if (name.empty()) Fail(target_, EIO);
    name_ = directory_ / name;
    guard_.emplace(name_);
  }

  // Whoever removes leftovers can find it before it is locked, and remove it: giving it its name
  // then fails.
  void OpenNamed(mode_t mode) {
    Guard();
    file_.Take(open(name_.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, mode));
  }

  void Rename(bool force) {
    int result =
        force ? -1
              : renameat2(AT_FDCWD, name_.c_str(), AT_FDCWD, target_.c_str(), RENAME_NOREPLACE);
    // Some file systems cannot rename without replacing; the target was looked for before.
    if (force || (result != 0 && (errno == EINVAL || errno == ENOSYS))) {
      result = rename(name_.c_str(), target_.c_str());
    }
    if (result != 0) Fail(target_, errno);
  }

  void Unname() {
    if (name_.empty()) return;
    unlink(name_.c_str());  // gone already when it was renamed
    guard_.reset();
    name_.clear();
  }

  const std::string target_;
  const std::filesystem::path directory_;
  std::string name_;  // the temporary name, if it may have one
  std::optional<RemoveOnInterrupt> guard_;
  Descriptor file_;
};

// While it lives, what is made is for all to read.
class Umask {
 public:
  explicit Umask(bool shared) : old_(umask(022)) {
    if (!shared) umask(old_);
  }
  ~Umask() { umask(old_); }
  Umask(const Umask&) = delete;
  Umask& operator=(const Umask&) = delete;

 private:
  mode_t old_;
};

void CheckInMemory(std::string_view bytes, const WriteOptions& options) {
  if (!options.check) return;
  const Descriptor file(MemoryFile(bytes));
  options.check(file.Path());
}

void WriteStandardOutput(std::string_view bytes, const WriteOptions& options) {
  if (GetStyle().json) {
    throw Trouble("--json and --output -: both would write to standard output", "usage");
  }
  CheckInMemory(bytes, options);
  if (options.flags.dryRun) return;
  std::fflush(stdout);
  WriteAll(STDOUT_FILENO, bytes, "standard output");
}

void WriteNamed(const std::string& path, std::string_view bytes, const WriteOptions& options) {
  RefuseExisting(path, options.flags.force);
  std::error_code error;
  const std::filesystem::path directory = Directory(path);
  if (!options.inStore) RequireDirectory(path);
  if (options.flags.dryRun) return CheckInMemory(bytes, options);
  const Umask mask(options.inStore);
  if (options.inStore && !std::filesystem::create_directories(directory, error) && error) {
    Fail(directory.string(), error.value());
  }
  NewFile file(path, options.mode);
  file.Write(bytes);
  if (options.check) options.check(file.Path());
  file.Keep(options.flags.force);
}

}  // namespace

int MemoryFile(std::string_view bytes) {
  const int file = memfd_create("vesk2", MFD_CLOEXEC);
  if (file < 0) Fail("a file in memory", errno);
  WriteAll(file, bytes, "a file in memory");
  (void)lseek(file, 0, SEEK_SET);
  return file;
}

std::string InputName(const std::string& path) {
  return path == kStandard ? "standard input" : Escape(path);
}

Trouble FileTrouble(const std::string& path, const std::string& text, const std::string& reason) {
  Trouble trouble(InputName(path) + ": " + text, reason);
  trouble.file = InputName(path);
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
  Detail("reads " + InputName(path));
  if (path == kStandard) {
    if (StandardInput().size() > limit) throw FileTrouble("standard input", "too large", "io");
    return StandardInput();
  }
  // Without O_NONBLOCK, opening a FIFO that nobody writes to would never return.
  const Descriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
  if (file.get() < 0) Fail(path, errno);
  struct stat status = {};
  if (fstat(file.get(), &status) != 0) Fail(path, errno);
  if (!S_ISREG(status.st_mode)) throw FileTrouble(path, "not a regular file", "io");
  return ReadAll(file.get(), limit, path);
}

std::string InputPath(const std::string& path) {
  if (path != kStandard) return path;
  static const Descriptor file(MemoryFile(StandardInput()));
  return file.Path();
}

void RefuseExisting(const std::string& path, bool force) {
  struct stat status = {};
  if (path == kStandard || lstat(path.c_str(), &status) != 0) return;
  if (!force) throw FileTrouble(path, "exists; --force replaces it", "exists");
  // Renaming a file over it would replace a device, or the link to one.
  if (stat(path.c_str(), &status) == 0 && !S_ISREG(status.st_mode)) {
    throw FileTrouble(path, "not a file that could be replaced", "exists");
  }
}

void RequireDirectory(const std::string& path) {
  std::error_code error;
  if (path != kStandard && !std::filesystem::is_directory(Directory(path), error)) {
    Fail(path, error ? error.value() : ENOTDIR);
  }
}

bool WriteFile(const std::string& path, std::string_view bytes, const WriteOptions& options) {
  path == kStandard ? WriteStandardOutput(bytes, options) : WriteNamed(path, bytes, options);
  Result()[options.flags.dryRun ? "would_write" : "written"].push_back(Escape(path));
  if (options.flags.dryRun) {
    Note("would write " + Escape(path));
  } else if (path != kStandard || !options.said.empty()) {
    Note("wrote " + Escape(path) + options.said);
  }
  return !options.flags.dryRun;
}

void AddWriteFlags(OptionList& list, WriteFlags& flags, const std::string& dryRun) {
  list.Add("-f,--force", flags.force, "Replace what is there");
  list.Add("-n,--dry-run", flags.dryRun, dryRun);
}

}  // namespace vesk2_command
