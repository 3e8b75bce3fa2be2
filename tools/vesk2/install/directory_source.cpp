// SPDX-License-Identifier: Apache-2.0
// directory_source.cpp: installing from a directory, which somebody may be changing.
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "tools/vesk2/files/descriptor.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/install/below.h"
#include "tools/vesk2/install/source.h"
#include "tools/vesk2/tree/names.h"

namespace vesk2_command {
namespace {

class DirectorySource : public Source {
 public:
  DirectorySource(std::string path, int directory, const Wanted& wanted)
      : path_(std::move(path)),
        directory_(directory),
        next_(wanted.entries().begin()),
        end_(wanted.entries().end()) {}

  // Directories need no look: the listing says which there are.
  std::optional<SourceEntry> Next() override {
    while (next_ != end_ && next_->second != EntryKind::kFile) ++next_;
    if (next_ == end_) return std::nullopt;
    current_ = Join(path_, next_->first);
    return Open((next_++)->first);
  }

  size_t Read(char* out, size_t size) override {
    ssize_t got = -1;
    do {
      got = read(file_.get(), out, size);
    } while (got < 0 && errno == EINTR);
    if (got < 0) throw FileTrouble(current_, std::strerror(errno), "io");
    return static_cast<size_t>(got);
  }

 private:
  SourceEntry Open(const std::string& path) {
    SourceEntry entry{path};
    // Without O_NONBLOCK, opening a FIFO that nobody writes to would never return.
    file_.Take(OpenBelow(directory_.get(), path, O_RDONLY | O_NONBLOCK | O_NOCTTY));
    if (file_.get() < 0) {
      entry.problem = WhyNot(errno);
      return entry;
    }
    struct stat status = {};
    if (fstat(file_.get(), &status) != 0) throw FileTrouble(current_, std::strerror(errno), "io");
    if (!S_ISREG(status.st_mode)) {
      entry.problem = "not a regular file";
      return entry;
    }
    entry.kind = EntryKind::kFile;
    entry.executable = (status.st_mode & S_IXUSR) != 0;
    entry.size = static_cast<uint64_t>(status.st_size);
    return entry;
  }

  // What is not there, or not to be read, is told with what the verification finds. A resource that
  // ran out is no such thing.
  std::string WhyNot(int error) const {
    if (error == EXDEV) return "a link that leads out of the tree";
    if (error == EWOULDBLOCK) return "held by another process";
    for (const int absent : {ENOENT, ENOTDIR, ELOOP, EACCES, ENXIO, ENAMETOOLONG}) {
      if (error == absent) return std::strerror(error);
    }
    throw FileTrouble(current_, std::strerror(error), "io");
  }

  const std::string path_;
  const Descriptor directory_;
  std::map<std::string, EntryKind>::const_iterator next_;
  const std::map<std::string, EntryKind>::const_iterator end_;
  std::string current_;
  Descriptor file_;
};

}  // namespace

std::unique_ptr<Source> OpenDirectory(const std::string& path, int directory,
                                      const Wanted& wanted) {
  return std::make_unique<DirectorySource>(path, directory, wanted);
}

std::unique_ptr<Source> OpenSource(const std::string& path, const std::string& below,
                                   const Wanted& wanted) {
  constexpr int kFlags = O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY;
  const int file =
      path == kStandard ? fcntl(STDIN_FILENO, F_DUPFD_CLOEXEC, 0) : open(path.c_str(), kFlags);
  if (file < 0) throw FileTrouble(path, std::strerror(errno), "io");
  Descriptor opened(file);
  struct stat status = {};
  if (fstat(file, &status) != 0) throw FileTrouble(path, std::strerror(errno), "io");
  if (S_ISDIR(status.st_mode)) {
    if (!below.empty()) {
      throw Trouble("--below is for archives; " + Escape(path) + " is a directory", "usage");
    }
    return OpenDirectory(path, opened.Give(), wanted);
  }
  if (path != kStandard && !S_ISREG(status.st_mode)) {
    throw FileTrouble(path, "neither a directory nor an archive", "io");
  }
  return OpenArchive(path, opened.Give(), below);
}

}  // namespace vesk2_command
