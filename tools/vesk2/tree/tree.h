// SPDX-License-Identifier: Apache-2.0
// tree.h: a directory tree on disk: listing it for a manifest, and looking for links that lead out
// of it.
#ifndef VESK2_TOOLS_TREE_H
#define VESK2_TOOLS_TREE_H

#include <sys/stat.h>

#include <cstdint>
#include <set>
#include <string>
#include <vector>

#include "tools/vesk2/tree/ignore.h"
#include "tools/vesk2/tree/portable.h"

#include <vesk2/manifest_body.h>
#include <vesk2/manifest_writer.h>

namespace vesk2_command {

// The real path of a directory; Trouble when it is none.
std::string RealDirectory(const std::string& directory);

// Whether `path` is a symbolic link that leads out of the tree whose real path is `realRoot`, or
// nowhere.
bool LeavesTree(const std::string& path, const std::string& realRoot);

struct ListingOptions {
  const IgnoreRules& ignore;
  bool allowLinks = false;  // list what links outside the tree lead to
  std::string output;       // a file that is not listed although it may lie in the root
  const Vesk2FileCallbacks* callbacks = nullptr;  // told about the files, or null
};

// Which file a name leads to, and when it was changed last. Whatever is written to a file moves the
// second, which nobody but the system sets.
struct FileStamp {
  explicit FileStamp(const struct stat& status);
  bool operator==(const FileStamp&) const = default;

  dev_t device;
  ino_t inode;
  off_t bytes;
  time_t changed;  // seconds, and the nanoseconds behind them
  long changedPart;
};

struct ListedEntry {
  std::string path;    // below the root; that of a directory ends in "/"
  std::string digest;  // SHA-256 in hexadecimal; empty for a directory
  FileStamp stamp;     // from before it was read
};

struct Listing {
  std::vector<ListedEntry> entries;
  uint64_t files = 0;
  uint64_t bytes = 0;
  std::vector<std::string> problems;  // entries that cannot be signed, with the reason
  Remarks remarks;                    // on entries that can, but perhaps not verified elsewhere
  std::set<std::string> ignored;      // what was left out
  time_t begun = 0;                   // when the first entry was looked at
};

// ListTree reads and hashes the whole tree, in byte order of the names, follows links, and writes
// the body of a manifest. Entries that could not be verified later are problems, and the body is
// then of no use: special files, links that lead nowhere or out of the tree, directories that hold
// themselves, files that cannot be read, paths that are too long.
Listing ListTree(const std::string& directory, const ListingOptions& options,
                 ZvVesk2::ManifestWriter& writer);

// ChangedSince returns the paths of what is no longer as ListTree found it: files, and directories
// below the root that hold other names. A file is hashed again only if it was changed so shortly
// before the listing that its stamp may not show another change.
std::vector<std::string> ChangedSince(const std::string& directory, const Listing& listing,
                                      const ListingOptions& options);

// What the library's verdict does not speak of, for a tree that it compared with `body`.
struct TreeNotes {
  std::vector<std::string> leaving;  // listed entries that are links out of the tree, or behind one
  std::vector<std::string> unlisted;  // entries directly in the root that the body does not list
};
TreeNotes InspectTree(ZvVesk2::BodyDirectory& root, const std::set<std::string>& ignored);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_TREE_H
