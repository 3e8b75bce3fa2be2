// SPDX-License-Identifier: Apache-2.0
// tree.cpp: listing a tree, and its links.
#include "tools/vesk2/tree/tree.h"

#include <openssl/rand.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <memory>
#include <optional>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/tree/names.h"

#include <vesk2/hash.h>

namespace vesk2_command {
namespace {

using ZvVesk2::BodyDirectory;
using ZvVesk2::BodyObject;
using ZvVesk2::ManifestWriter;

std::string RealPath(const std::string& path) {
  const std::unique_ptr<char, decltype(&std::free)> real(realpath(path.c_str(), nullptr),
                                                         &std::free);
  return real ? real.get() : "";
}

bool IsLink(const std::string& path) {
  struct stat status = {};
  if (lstat(path.c_str(), &status) == 0) return S_ISLNK(status.st_mode);
  // What is not there is told elsewhere; what could not be looked at may be a link.
  for (const int gone : {ENOENT, ENOTDIR, ENAMETOOLONG, ELOOP}) {
    if (errno == gone) return false;
  }
  throw FileTrouble(path, std::strerror(errno), "io");
}

class Lister {
 public:
  Lister(const std::string& root, const ListingOptions& options, ManifestWriter& writer)
      : options_(options), writer_(writer), realRoot_(RealDirectory(root)) {
    struct stat status = {};
    if (!options.output.empty() && stat(options.output.c_str(), &status) == 0) {
      output_.emplace(status.st_dev, status.st_ino);
    }
    listing_.begun = std::time(nullptr);
  }

  // Appends the entries of a directory. `relative` is its path below the root, empty for the root.
  void List(const std::string& path, const std::string& relative, unsigned depth) {
    struct stat status = {};
    std::vector<Name> names;
    if (stat(path.c_str(), &status) != 0 || !ReadNames(path, names)) {
      return Problem(path, std::strerror(errno));
    }
    const Identity identity(status.st_dev, status.st_ino);
    if (!open_.insert(identity).second) return Problem(path, "a link to a directory around it");
    std::erase_if(names, [&](const Name& name) {
      return IsIgnored(Join(path, name.text), Join(relative, name.text));
    });
    RemarkOnNames(relative, names, listing_.remarks);
    for (const Name& name : names) {
      Entry(Join(path, name.text), name, Join(relative, name.text), depth);
    }
    open_.erase(identity);
  }

  Listing Take() { return std::move(listing_); }

 private:
  using Identity = std::pair<dev_t, ino_t>;

  bool IsIgnored(const std::string& path, const std::string& relative) {
    if (!IgnoresEntry(options_.ignore, path, relative)) return false;
    listing_.ignored.insert(relative);
    return true;
  }

  void Problem(const std::string& path, const std::string& reason) {
    listing_.problems.push_back(Escape(path) + ": " + reason);
  }

  void Entry(const std::string& path, const Name& name, const std::string& relative,
             unsigned depth) {
    struct stat status = {};
    if (path.size() > ZvVesk2::Limits::kMaxBodyPath) return Problem(path, "path too long");
    if (name.maybeLink && !options_.allowLinks && LeavesTree(path, realRoot_)) {
      return Problem(path, "a link that leads out of the tree (--allow-links follows it)");
    }
    if (stat(path.c_str(), &status) != 0) return Problem(path, std::strerror(errno));
    if (name.maybeLink && IsLink(path)) {
      listing_.remarks["a link; what it leads to is signed, not the link"].push_back(relative);
    }
    if (S_ISDIR(status.st_mode)) {
      if (depth == ZvVesk2::Limits::kMaxDepth) return Problem(path, "nested too deeply");
      listing_.entries.push_back({relative + "/", "", FileStamp(status)});
      Check(writer_.OpenDirectory(name.text.c_str()), Escape(path));
      List(path, relative, depth + 1);
      Check(writer_.CloseDirectory(), Escape(path));
    } else if (!S_ISREG(status.st_mode)) {
      Problem(path, "neither a file nor a directory");
    } else if (!output_ || *output_ != Identity(status.st_dev, status.st_ino) ||
               RealPath(path) != RealPath(options_.output)) {
      File(path, name.text, {relative, "", FileStamp(status)});
    }
  }

  void File(const std::string& path, const std::string& name, ListedEntry entry) {
    unsigned char digest[32];
    unsigned int length = sizeof digest;
    const int code =
        ZvVesk2::Hash::HashFile(path.c_str(), digest, &length, nullptr, options_.callbacks);
    if (code == VESK2_ERR_FILE_OPEN) return Problem(path, WhyUnreadable(path));
    if (code == VESK2_ERR_READ_FILE) return Problem(path, "unreadable, or changed while read");
    if (code != 0) return Problem(path, Reason(code));
    Check(writer_.AddFile(name.c_str(), digest), Escape(path));
    ++listing_.files;
    listing_.bytes += static_cast<uint64_t>(entry.stamp.bytes);
    entry.digest = Hex({reinterpret_cast<char*>(digest), length});
    listing_.entries.push_back(std::move(entry));
  }

  const ListingOptions& options_;
  ManifestWriter& writer_;
  std::string realRoot_;
  std::optional<Identity> output_;  // nothing unless the output exists already
  std::set<Identity> open_;         // the directories that are being listed
  Listing listing_;
};

class Inspector {
 public:
  Inspector(const std::string& root, const std::set<std::string>& ignored)
      : ignored_(ignored), realRoot_(RealDirectory(root)) {}

  // The directory says of most of its entries that they are no links: they need no look.
  void Inspect(BodyDirectory& directory, const std::string& relative) {
    std::vector<Name> names;
    if (!ReadNames(directory.GetName(), names)) names.clear();
    const auto mayBeLink = [&](const std::string& name) {
      const auto found = std::ranges::lower_bound(names, name, {}, &Name::text);
      return found == names.end() || found->text != name || found->maybeLink;
    };
    auto& files = directory.GetFiles();
    for (BodyObject* file = files.begin(); file != nullptr; file = files.next()) {
      const std::string name = file->GetName();
      if (mayBeLink(name)) Check(Join(directory.GetName(), name), Join(relative, name));
    }
    auto& subdirectories = directory.GetSubdirectories();
    for (BodyObject* each = subdirectories.begin(); each != nullptr; each = subdirectories.next()) {
      const std::string path = each->GetName();
      const std::string name = path.substr(path.rfind('/') + 1);
      const std::string below = Join(relative, name);
      if (ignored_.count(below) != 0) continue;
      // What lies behind a link out of the tree is told by the link.
      if (mayBeLink(name) && !Check(path, below)) continue;
      Inspect(static_cast<BodyDirectory&>(*each), below);
    }
  }

  std::vector<std::string> leaving;

 private:
  // Whether the entry stays within the tree.
  bool Check(const std::string& path, const std::string& relative) {
    if (ignored_.count(relative) != 0) return false;
    const bool leaves = LeavesTree(path, realRoot_);
    if (leaves) leaving.push_back(path);
    return !leaves;
  }

  const std::set<std::string>& ignored_;
  std::string realRoot_;
};

std::set<std::string> ListedInRoot(BodyDirectory& root) {
  std::set<std::string> listed;
  for (auto* entries : {&root.GetFiles(), &root.GetSubdirectories()}) {
    for (BodyObject* entry = entries->begin(); entry != nullptr; entry = entries->next()) {
      const std::string path = entry->GetName();
      listed.insert(path.substr(path.rfind('/') + 1));
    }
  }
  return listed;
}

}  // namespace

FileStamp::FileStamp(const struct stat& status)
    : device(status.st_dev),
      inode(status.st_ino),
      bytes(status.st_size),
      changed(status.st_ctim.tv_sec),
      changedPart(status.st_ctim.tv_nsec) {}

std::string RealDirectory(const std::string& directory) {
  struct stat status = {};
  if (stat(directory.c_str(), &status) != 0) {
    throw FileTrouble(directory, std::strerror(errno), "io");
  }
  if (!S_ISDIR(status.st_mode)) throw FileTrouble(directory, "not a directory", "io");
  const std::string real = RealPath(directory);
  if (real.empty()) throw FileTrouble(directory, std::strerror(errno), "io");
  return real;
}

bool LeavesTree(const std::string& path, const std::string& realRoot) {
  if (!IsLink(path)) return false;
  const std::string target = RealPath(path);
  return target != realRoot && !target.starts_with(Join(realRoot, ""));
}

Listing ListTree(const std::string& directory, const ListingOptions& options,
                 ManifestWriter& writer) {
  unsigned char token[4];
  if (RAND_bytes(token, sizeof token) != 1) throw Trouble("no random bytes");
  Lister lister(directory, options, writer);
  Check(writer.BeginBody(token), "listing the tree");
  lister.List(directory, "", 1);
  Check(writer.EndBody(), "listing the tree");
  return lister.Take();
}

TreeNotes InspectTree(BodyDirectory& root, const std::set<std::string>& ignored) {
  Inspector inspector(root.GetName(), ignored);
  inspector.Inspect(root, "");
  TreeNotes notes{std::move(inspector.leaving), {}};
  std::vector<Name> names;
  if (!ReadNames(root.GetName(), names)) {
    throw FileTrouble(root.GetName(), std::strerror(errno), "io");
  }
  const std::set<std::string> listed = ListedInRoot(root);
  for (const Name& name : names) {
    if (listed.count(name.text) == 0 && ignored.count(name.text) == 0) {
      notes.unlisted.push_back(name.text);
    }
  }
  return notes;
}

}  // namespace vesk2_command
