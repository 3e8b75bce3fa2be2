// SPDX-License-Identifier: Apache-2.0
// ignore_pattern.cpp: matching names.
#include "tools/vesk2/tree/ignore_pattern.h"

#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

// The components of a path.
std::vector<std::string_view> Split(std::string_view path) {
  std::vector<std::string_view> names;
  while (true) {
    const size_t slash = path.find('/');
    names.push_back(path.substr(0, slash));
    if (slash == std::string_view::npos) return names;
    path.remove_prefix(slash + 1);
  }
}

// Matches a text with items of which some stand for any number of units: after a mismatch only the
// last of those that was met takes one unit more, so no work is done twice.
template <typename IsAny, typename Fits>
bool MatchesAll(size_t items, size_t units, IsAny isAny, Fits fits) {
  size_t item = 0;
  size_t unit = 0;
  size_t any = items;  // the last wildcard met, and the first unit behind what it takes
  size_t behind = 0;
  while (unit < units) {
    if (item < items && isAny(item)) {
      any = item++;
      behind = unit;
    } else if (item < items && fits(item, unit)) {
      ++item;
      ++unit;
    } else if (any < items) {
      item = any + 1;
      unit = ++behind;
    } else {
      return false;
    }
  }
  while (item < items && isAny(item)) ++item;
  return item == items;
}

}  // namespace

IgnorePattern::IgnorePattern(const std::string& text, const std::string& where) {
  const auto refuse = [&](const std::string& why) {
    throw Trouble(where + ": \"" + Escape(text) + "\": " + why, "ignore-pattern");
  };
  std::string_view rest = text;
  if (rest.starts_with('!')) {
    negated_ = true;
    rest.remove_prefix(1);
  }
  if (rest.ends_with('/')) {
    directoriesOnly_ = true;
    rest.remove_suffix(1);
  }
  if (rest.starts_with('/')) {
    anchored_ = true;
    rest.remove_prefix(1);
  }
  components_.emplace_back();
  bool escaped = false;
  bool meant = true;  // that the last byte is what it is
  for (const char c : rest) {
    meant = escaped;
    if (c == '/' && !escaped) {
      anchored_ = true;
      components_.emplace_back();
    } else if (escaped || (c != '*' && c != '?' && c != '\\')) {
      if (c == '[' && !escaped) refuse("[...] is not understood; \\[ stands for the byte");
      if (c == '/') refuse("a \\ before /");
      components_.back().push_back({Item::kByte, c});
    } else if (c != '\\') {
      components_.back().push_back({c == '*' ? Item::kAny : Item::kOne});
    }
    escaped = c == '\\' && !escaped;
  }
  if (escaped) refuse("a \\ at the end");
  const bool blank = rest.ends_with(' ') || rest.ends_with('\t') || rest.ends_with('\r');
  if (blank && !(meant && rest.ends_with(' ')))
    refuse("a blank at the end; \\ before it if it is meant");
  for (const Component& component : components_) {
    if (component.empty()) refuse("an empty name");
  }
  // At the end of a path it stands for what is inside, not for the directory itself.
  if (anchored_ && IsAnyDepth(components_.back())) components_.push_back({{Item::kAny}});
}

bool IgnorePattern::IsAnyDepth(const Component& component) {
  return component.size() == 2 && component[0].kind == Item::kAny &&
         component[1].kind == Item::kAny;
}

bool IgnorePattern::MatchesName(const Component& component, std::string_view name) {
  return MatchesAll(
      component.size(), name.size(), [&](size_t i) { return component[i].kind == Item::kAny; },
      [&](size_t i, size_t at) {
        return component[i].kind == Item::kOne || component[i].byte == name[at];
      });
}

bool IgnorePattern::MatchesPath(std::string_view path) const {
  const std::vector<std::string_view> names = Split(path);
  return MatchesAll(
      components_.size(), names.size(), [&](size_t i) { return IsAnyDepth(components_[i]); },
      [&](size_t i, size_t at) { return MatchesName(components_[i], names[at]); });
}

bool IgnorePattern::Matches(std::string_view path, bool isDirectory) const {
  if (directoriesOnly_ && !isDirectory) return false;
  if (anchored_) return MatchesPath(path);
  return MatchesName(components_.front(), path.substr(path.rfind('/') + 1));
}

}  // namespace vesk2_command
