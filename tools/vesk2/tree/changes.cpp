// SPDX-License-Identifier: Apache-2.0
// changes.cpp: whether a tree is still as it was listed, without hashing all of it again.
#include <sys/stat.h>

#include <algorithm>

#include "tools/vesk2/say/report.h"
#include "tools/vesk2/tree/names.h"
#include "tools/vesk2/tree/tree.h"

#include <vesk2/hash.h>

namespace vesk2_command {
namespace {

// How coarse the times of a file system may be: two changes within it can leave the same stamp.
constexpr time_t kTick = 2;

class Comparer {
 public:
  Comparer(const Listing& listing, const ListingOptions& options)
      : listing_(listing), options_(options) {}

  // Compares the directory's entries, which come next in the listing. `relative` is empty for the
  // root or ends in "/".
  void Directory(const std::string& path, const std::string& relative) {
    std::vector<std::string> listed;
    const auto& entries = listing_.entries;
    while (next_ < entries.size() && entries[next_].path.starts_with(relative)) {
      const ListedEntry& entry = entries[next_++];
      std::string name = entry.path.substr(relative.size());
      if (entry.digest.empty()) {
        name.pop_back();
        Directory(Join(path, name), entry.path);
      } else {
        File(Join(path, name), entry);
      }
      listed.push_back(std::move(name));
    }
    if (!relative.empty() && !HoldsOnly(path, relative, listed)) changed.push_back(path);
  }

  std::vector<std::string> changed;

 private:
  bool HoldsOnly(const std::string& path, const std::string& relative,
                 const std::vector<std::string>& listed) const {
    std::vector<Name> names;
    if (!ReadNames(path, names)) return false;
    std::erase_if(names, [&](const Name& name) {
      return IgnoresEntry(options_.ignore, Join(path, name.text), relative + name.text);
    });
    return std::ranges::equal(names, listed, {}, &Name::text);
  }

  void File(const std::string& path, const ListedEntry& entry) {
    struct stat status = {};
    const bool same = stat(path.c_str(), &status) == 0 && FileStamp(status) == entry.stamp;
    const bool settled = entry.stamp.changed < listing_.begun - kTick;
    if (!same || (!settled && Digest(path) != entry.digest)) changed.push_back(path);
  }

  static std::string Digest(const std::string& path) {
    unsigned char digest[32];
    unsigned int length = sizeof digest;
    const int code = ZvVesk2::Hash::HashFile(path.c_str(), digest, &length, nullptr);
    return code == 0 ? Hex({reinterpret_cast<char*>(digest), length}) : "";
  }

  const Listing& listing_;
  const ListingOptions& options_;
  size_t next_ = 0;
};

}  // namespace

std::vector<std::string> ChangedSince(const std::string& directory, const Listing& listing,
                                      const ListingOptions& options) {
  Comparer comparer(listing, options);
  comparer.Directory(directory, "");
  return std::move(comparer.changed);
}

}  // namespace vesk2_command
