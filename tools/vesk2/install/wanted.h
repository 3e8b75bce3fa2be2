// SPDX-License-Identifier: Apache-2.0
// wanted.h: what an installation takes: the names that a manifest lists, and nothing else.
#ifndef VESK2_TOOLS_WANTED_H
#define VESK2_TOOLS_WANTED_H

#include <map>
#include <string>

#include <vesk2/manifest_body.h>

namespace vesk2_command {

enum class EntryKind { kFile, kDirectory, kOther };

class Wanted {
 public:
  // Takes the paths of a listing that is proved. Trouble, about the manifest's file `path`, for a
  // listing that no tree can be like: one name as a file and as a directory.
  Wanted(ZvVesk2::BodyDirectory& listing, const std::string& path);

  // By path below the root, a directory before what is in it.
  const std::map<std::string, EntryKind>& entries() const { return entries_; }
  // kOther for what is not listed.
  EntryKind KindOf(const std::string& path) const;
  size_t files() const { return files_; }

 private:
  void Add(const std::string& path, EntryKind kind, const std::string& manifest);
  void AddAll(ZvVesk2::BodyDirectory& directory, const std::string& relative,
              const std::string& manifest);

  std::map<std::string, EntryKind> entries_;
  size_t files_ = 0;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_WANTED_H
