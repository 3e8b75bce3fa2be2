// SPDX-License-Identifier: Apache-2.0
// ignore_pattern.h: a pattern of names that are to be left out, in a part of what .gitignore files
// hold:
//
//   #...          a comment; so is an empty line
//   *             any bytes of one component but "/", none too
//   ?             one byte but "/"
//   **            as a whole component: any number of components, none too (at the end: at least
//   one) \c            the byte c itself a/b  /a       with "/" before its end the pattern is about
//   paths from the root of the tree, a             without one about the names in every directory
//   a/            directories only
//   !a            not left out after all: of several patterns that match, the last one decides
//
// What is left out with its directory does not come back. "[" has no meaning here, and is refused
// unless it is written "\[", as is a blank at the end: such a pattern was meant for something else.
#ifndef VESK2_TOOLS_IGNORE_PATTERN_H
#define VESK2_TOOLS_IGNORE_PATTERN_H

#include <string>
#include <string_view>
#include <vector>

namespace vesk2_command {

class IgnorePattern {
 public:
  // A pattern of that text, which is neither empty nor a comment. Trouble, which begins with
  // `where`, for what is none.
  IgnorePattern(const std::string& text, const std::string& where);

  // Whether it is about the entry at a path below the root, without "./" and closing "/". The work
  // is at most the product of both lengths.
  bool Matches(std::string_view path, bool isDirectory) const;
  bool IsNegated() const { return negated_; }

 private:
  // A byte to compare with, or one of the two wildcards.
  struct Item {
    enum Kind : char { kByte, kOne, kAny } kind;
    char byte = 0;
  };
  using Component = std::vector<Item>;

  static bool MatchesName(const Component& component, std::string_view name);
  static bool IsAnyDepth(const Component& component);
  bool MatchesPath(std::string_view path) const;

  std::vector<Component> components_;
  bool negated_ = false;
  bool directoriesOnly_ = false;
  bool anchored_ = false;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_IGNORE_PATTERN_H
