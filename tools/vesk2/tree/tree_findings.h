// SPDX-License-Identifier: Apache-2.0
// tree_findings.h: how a tree differs from what was signed.
#ifndef VESK2_TOOLS_TREE_FINDINGS_H
#define VESK2_TOOLS_TREE_FINDINGS_H

#include <map>
#include <set>
#include <string>
#include <vector>

#include <vesk2/manifest.h>

namespace vesk2_command {

// One kind of finding: what it is called, for machines too, and the entries, sorted.
struct Finding {
  const char* kind;
  const char* member;
  std::vector<std::string> entries;
  std::map<std::string, std::string> reasons;  // of entries that were not compared
};

struct TreeQuestion {
  std::string directory;
  std::string manifest;  // which may lie in the tree, unlisted
  std::set<std::string> ignored;
  bool allowExtra = false;
  bool allowLinks = false;
  bool all = false;  // notes of any number
};

// FindInTree returns what a verification found, and what it does not look for: links that lead out
// of the tree, and unlisted entries directly in it.
std::vector<Finding> FindInTree(const ZvVesk2::Manifest& manifest, const TreeQuestion& question);

// TellFindings notes each entry, and puts the lists and their counts into the result. On a terminal
// the notes of a kind stop after 20, unless `all`; what lies in a directory of which nothing is
// there, or nothing is listed, is one note.
void TellFindings(const std::vector<Finding>& findings, const TreeQuestion& question,
                  const ZvVesk2::Manifest& manifest);
// "1 changed, 2 missing"; empty when there is nothing.
std::string Summary(const std::vector<Finding>& findings);
bool Found(const std::vector<Finding>& findings, const std::string& kind);

inline constexpr char kUnlisted[] = "not listed";

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_TREE_FINDINGS_H
