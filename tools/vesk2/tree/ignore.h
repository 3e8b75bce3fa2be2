// SPDX-License-Identifier: Apache-2.0
// ignore.h: what of a tree is left out. Who asks decides that, never a manifest: the library is
// given names, and those are what the rules make of the listing and of the disk.
#ifndef VESK2_TOOLS_IGNORE_H
#define VESK2_TOOLS_IGNORE_H

#include <set>
#include <string>
#include <vector>

#include "tools/vesk2/options/options.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/tree/ignore_pattern.h"

namespace vesk2_command {

struct IgnoreOptions {
  std::vector<std::string> names;     // --ignore
  std::vector<std::string> files;     // --ignore-from
  std::vector<std::string> patterns;  // --ignore-pattern
};
void AddIgnoreOptions(OptionList& list, IgnoreOptions& options);
// The same options as words, to be given again.
std::vector<std::string> IgnoreWords(const IgnoreOptions& options);

class IgnoreRules {
 public:
  // Reads the files of patterns. Trouble for what is no pattern, and for a file that lies in the
  // tree, where whoever writes the tree decides.
  IgnoreRules(const IgnoreOptions& options, const std::string& directory);

  bool IsEmpty() const { return names_.empty() && patterns_.empty(); }
  // Whether an entry is left out: by its name, or by the last pattern that matches it. It is asked
  // of no entry below one that is.
  bool Ignores(const std::string& relative, bool isDirectory) const;
  // The names and patterns that were about no entry of those that were asked.
  std::vector<std::string> Unused() const;

 private:
  struct Rule {
    IgnorePattern pattern;
    std::string text;
    mutable bool used = false;
  };
  void AddFile(const std::string& path, const std::string& directory);

  std::set<std::string> names_;
  mutable std::set<std::string> usedNames_;
  std::vector<Rule> patterns_;
};

// The same of what is at a path on the disk; links are followed.
bool IgnoresEntry(const IgnoreRules& rules, const std::string& path, const std::string& relative);

// NoteUnused warns of each rule that was about nothing, and puts them into "ignored_nothing".
void NoteUnused(const IgnoreRules& rules);
// "; ignored: 3" for an answer; empty for none.
std::string IgnoredText(size_t count);
Json IgnoredJson(const std::set<std::string>& ignored);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_IGNORE_H
