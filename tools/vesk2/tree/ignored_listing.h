// SPDX-License-Identifier: Apache-2.0
// ignored_listing.h: what the rules of who asks come to, for a manifest and a tree.
#ifndef VESK2_TOOLS_IGNORED_LISTING_H
#define VESK2_TOOLS_IGNORED_LISTING_H

#include <set>
#include <string>

#include "tools/vesk2/files/descriptor.h"
#include "tools/vesk2/tree/ignore.h"

namespace vesk2_command {

// What the rules leave out of a comparison of a tree with a manifest: entries of the listing, each
// of the kind that it is listed as, and of what lies in the directories that are listed. With rules
// the manifest is read here once, and `path` leads to those bytes: what is ignored is found in what
// is verified, whatever stands at the manifest's own path by then.
class IgnoredListing {
 public:
  IgnoredListing(const std::string& manifest, const IgnoreRules& rules,
                 const std::string& directory);
  const std::string& path() const { return path_; }
  const std::set<std::string>& ignored() const { return ignored_; }
  // How many of them are listed files, those in ignored directories too.
  size_t files() const { return files_; }

 private:
  std::string path_;
  Descriptor copy_;
  std::set<std::string> ignored_;
  size_t files_ = 0;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_IGNORED_LISTING_H
