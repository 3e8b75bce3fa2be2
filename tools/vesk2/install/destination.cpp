// SPDX-License-Identifier: Apache-2.0
// destination.cpp: putting an installation in its place.
#include "tools/vesk2/install/destination.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <utility>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/install/below.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/tree/names.h"

namespace vesk2_command {
namespace {

bool IsBareName(const std::string& name) {
  return !name.empty() && name != "." && name != ".." && name.find('/') == std::string::npos;
}

// Whether nothing has this name.
bool IsFree(int directory, const std::string& name) {
  struct stat status = {};
  return fstatat(directory, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0 && errno == ENOENT;
}

}  // namespace

void AddDestinationOptions(OptionList& list, DestinationOptions& options) {
  Option& replace = list.Add("--replace", options.replace,
                             "Take the place of the directory that is there, and remove it");
  list.Add("--keep-old", options.keepOld,
           "Take its place, and give the old one this name beside it")
      .Excludes(replace);
}

Destination::Destination(const std::string& path, const DestinationOptions& options)
    : keepOld_(options.keepOld) {
  const std::string bare = path.substr(0, path.find_last_not_of('/') + 1);
  const size_t slash = bare.rfind('/');
  name_ = slash == std::string::npos ? bare : bare.substr(slash + 1);
  above_ = slash == std::string::npos ? "" : bare.substr(0, slash + 1);
  if (!IsBareName(name_)) throw Trouble(Escape(path) + " names no directory to be made", "usage");
  const std::string above = above_.empty() ? "." : above_;
  parent_.Take(open(above.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (parent_.get() < 0) throw FileTrouble(above, std::strerror(errno), "io");
  if (!keepOld_.empty() && (!IsBareName(keepOld_) || keepOld_ == name_)) {
    throw Trouble("--keep-old takes another name in the same directory, not a path", "usage");
  }
  if (!keepOld_.empty() && !IsFree(parent_.get(), keepOld_)) {
    throw FileTrouble(Join(above_, keepOld_), "exists", "exists");
  }
  if (IsFree(parent_.get(), name_)) return;
  if (!options.replace && keepOld_.empty()) {
    throw FileTrouble(path, "exists; --replace removes it, --keep-old keeps it", "exists");
  }
  old_.Take(OpenBelow(parent_.get(), name_, O_PATH | O_DIRECTORY | O_NOFOLLOW));
  if (old_.get() < 0) throw FileTrouble(path, "not a directory that could be replaced", "exists");
}

Destination::~Destination() {
  if (!toRemove_.empty()) RemoveDrawn(parent_.get(), toRemove_, old_.get());
}

void Destination::Fail(const std::string& name) const {
  throw FileTrouble(Join(above_, name), std::strerror(errno), errno == EEXIST ? "exists" : "io");
}

std::string Destination::KeptOld() const {
  return done_ && old_.get() >= 0 && !keepOld_.empty() ? Join(above_, keepOld_) : "";
}

void Destination::Put(Stage& stage) {
  DrawnDirectory& ready = stage.directory();
  if (!LeadsTo(parent_.get(), ready.name(), ready.file())) {
    throw FileTrouble(Join(above_, ready.name()), "somebody has moved it", "io");
  }
  if (old_.get() >= 0) {
    Exchange(stage);
  } else if (renameat2(parent_.get(), ready.name().c_str(), parent_.get(), name_.c_str(),
                       RENAME_NOREPLACE) != 0) {
    Fail(name_);
  }
  ready.Rename("");
  done_ = true;
  if (fsync(parent_.get()) != 0) Fail(name_);
}

// An old one that is to be kept must never have a drawn name, under which the next installation
// would remove it. So the new one goes first to the name that the old one shall have.
void Destination::Exchange(Stage& stage) {
  DrawnDirectory& ready = stage.directory();
  const int parent = parent_.get();
  if (!LeadsTo(parent, name_, old_.get())) {
    throw FileTrouble(Join(above_, name_), "somebody has replaced it meanwhile", "exists");
  }
  if (!keepOld_.empty()) {
    if (renameat2(parent, ready.name().c_str(), parent, keepOld_.c_str(), RENAME_NOREPLACE) != 0) {
      Fail(keepOld_);
    }
    ready.Rename(keepOld_);
  }
  const std::string& name = ready.name();
  if (renameat2(parent, name.c_str(), parent, name_.c_str(), RENAME_EXCHANGE) != 0) Fail(name_);
  if (keepOld_.empty()) toRemove_ = name;
}

void Destination::RemoveOld() {
  const std::string name = std::exchange(toRemove_, "");
  if (name.empty() || RemoveDrawn(parent_.get(), name, old_.get())) return;
  Note("note: what was there before could not be removed: " + Escape(Join(above_, name)));
}

}  // namespace vesk2_command
