// SPDX-License-Identifier: Apache-2.0
// ignore.cpp: the rules of what is left out, and what they come to.
#include "tools/vesk2/tree/ignore.h"

#include <sys/stat.h>

#include <filesystem>
#include <sstream>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

// Whoever asks writes the patterns; these keep a wrong file from taking for ever.
constexpr size_t kLongestFile = 1 << 20;
constexpr size_t kMostPatterns = 10'000;

// A name as the library compares it.
std::string PlainRelative(std::string name) {
  while (name.starts_with("./")) name.erase(0, 2);
  while (name.size() > 1 && name.ends_with('/')) name.pop_back();
  return name;
}

}  // namespace

void AddIgnoreOptions(OptionList& list, IgnoreOptions& options) {
  list.Add("--ignore", options.names, "Leave this entry out (a path below the directory)");
  list.Add("--ignore-pattern", options.patterns,
           "Leave out what matches: *, ?, **/, a leading or closing /, and ! for what stays");
  list.Add("--ignore-from", options.files,
           "Take such patterns from this file, one a line; the last that matches decides");
}

std::vector<std::string> IgnoreWords(const IgnoreOptions& options) {
  std::vector<std::string> words;
  const auto add = [&](const std::string& option, const std::vector<std::string>& values) {
    for (const std::string& value : values) {
      if (value.starts_with('-')) {  // which would be read as an option
        words.push_back(option + "=" + value);
      } else {
        words.insert(words.end(), {option, value});
      }
    }
  };
  add("--ignore", options.names);
  add("--ignore-from", options.files);
  add("--ignore-pattern", options.patterns);
  return words;
}

IgnoreRules::IgnoreRules(const IgnoreOptions& options, const std::string& directory) {
  for (const std::string& name : options.names) names_.insert(PlainRelative(name));
  for (const std::string& path : options.files) AddFile(path, directory);
  for (const std::string& text : options.patterns) {
    patterns_.push_back({IgnorePattern(text, "--ignore-pattern"), text});
  }
}

void IgnoreRules::AddFile(const std::string& path, const std::string& directory) {
  std::error_code error;
  const std::string real =
      path == kStandard ? "" : std::filesystem::canonical(path, error).string();
  if (real.starts_with(std::filesystem::canonical(directory, error).string() + "/")) {
    throw FileTrouble(path, "lies in the tree that it is about: whoever writes that decides",
                      "ignore-pattern");
  }
  std::istringstream lines(ReadFile(path, kLongestFile));
  size_t number = 0;
  for (std::string line; std::getline(lines, line);) {
    ++number;
    if (line.empty() || line.starts_with('#')) continue;
    patterns_.push_back(
        {IgnorePattern(line, Escape(path) + ": line " + std::to_string(number)), line});
    if (patterns_.size() <= kMostPatterns) continue;
    throw FileTrouble(path, "more than " + std::to_string(kMostPatterns) + " patterns",
                      "ignore-pattern");
  }
}

bool IgnoreRules::Ignores(const std::string& relative, bool isDirectory) const {
  bool ignores = false;
  for (const Rule& rule : patterns_) {
    if (!rule.pattern.Matches(relative, isDirectory)) continue;
    rule.used = true;
    ignores = !rule.pattern.IsNegated();
  }
  const bool named = names_.count(relative) != 0;
  if (named) usedNames_.insert(relative);
  return ignores || named;
}

std::vector<std::string> IgnoreRules::Unused() const {
  std::vector<std::string> unused;
  for (const std::string& name : names_) {
    if (usedNames_.count(name) == 0) unused.push_back(name);
  }
  for (const Rule& rule : patterns_) {
    if (!rule.used) unused.push_back(rule.text);
  }
  return unused;
}

bool IgnoresEntry(const IgnoreRules& rules, const std::string& path, const std::string& relative) {
  if (rules.IsEmpty()) return false;
  struct stat status = {};
  const bool isDirectory = stat(path.c_str(), &status) == 0 && S_ISDIR(status.st_mode);
  return rules.Ignores(relative, isDirectory);
}

void NoteUnused(const IgnoreRules& rules) {
  Json& nothing = Result()["ignored_nothing"] = Json::array();
  for (const std::string& rule : rules.Unused()) {
    Note("warning: nothing is ignored by " + Escape(rule));
    nothing.push_back(Escape(rule));
  }
}

Json IgnoredJson(const std::set<std::string>& ignored) {
  Json list = Json::array();
  for (const std::string& name : ignored) list.push_back(Escape(name));
  return list;
}

std::string IgnoredText(size_t count) {
  return count == 0 ? "" : "; ignored: " + std::to_string(count);
}

}  // namespace vesk2_command
