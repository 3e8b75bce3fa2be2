// SPDX-License-Identifier: Apache-2.0
#include "tools/vesk2/tree/ignore_pattern.h"

#include <gtest/gtest.h>

#include <string>

#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

TEST(IgnorePattern, MatchesPathsBelowTheRoot) {
  // A path that ends in "/" is a directory's.
  constexpr struct {
    const char* pattern;
    const char* matching;
    const char* others;
  } kCases[] = {
      {"a", "a a/ x/a x/y/a/", "b aa xa a/b"},
      {"*.o", "a.o .o x/a.o x/y/.o/", "a.oo a.o/x o"},
      {"/*.o", "a.o .o", "x/a.o"},
      {"?", "a x/b", "ab"},
      {"a?c", "abc x/a.c", "ac abbc a/c"},
      {"a*c", "ac abc abcbc x/ac", "acb a/c"},
      {"a*b*c*", "abc axbxcx aabbcc", "ab acb xabc"},
      {"build/", "build/ x/build/", "build x/build build/x"},
      {"/build/", "build/", "x/build/ build"},
      {"x/a", "x/a x/a/", "y/x/a a x/a/b"},
      {"x/*", "x/a x/b/", "x x/a/b a"},
      {"**/a", "a x/a x/y/a", "b x/b"},
      {"**/x/a", "x/a y/x/a z/y/x/a", "a x/b"},
      {"x/**", "x/a x/a/b", "x/ x y/x/a"},
      {"x/**/a", "x/a x/y/a x/y/z/a", "a x/b x/y/b xa"},
      {"x/**/y/**/z", "x/y/z x/a/y/b/c/z x/y/y/z", "x/z x/a/z"},
      {"**", "a x/a", ""},
      {"/**", "a x/a", ""},
      {"\\*", "* x/*", "a"},
      {"\\!a", "!a", "a"},
      {"a\\[1]", "a[1]", "a1"},
      {"\xff*", "\xff \xff\xfe", "a"},
  };
  for (const auto& each : kCases) {
    const IgnorePattern pattern(each.pattern, "here");
    for (const bool wanted : {true, false}) {
      std::istringstream paths(wanted ? each.matching : each.others);
      for (std::string path; paths >> path;) {
        const bool isDirectory = path.ends_with('/');
        if (isDirectory) path.pop_back();
        EXPECT_EQ(pattern.Matches(path, isDirectory), wanted) << each.pattern << " " << path;
      }
    }
  }
  EXPECT_TRUE(IgnorePattern("!a", "here").IsNegated());
  EXPECT_TRUE(IgnorePattern("a\\ ", "here").Matches("a ", false));
  EXPECT_TRUE(IgnorePattern("a\\\\\\ ", "here").Matches("a\\ ", false));
}

TEST(IgnorePattern, RefusesWhatMeantSomethingElse) {
  for (const char* text :
       {"/", "!", "!/", "//a", "a//b", "[ab]", "a\\", "a\\/b", "a ", "a\r", "a\\\\ "}) {
    EXPECT_THROW(IgnorePattern(text, "here"), Trouble) << text;
  }
}

TEST(IgnorePattern, TakesNoLongerThanTheProductOfBothLengths) {
  std::string name(4000, 'a');
  std::string path = "a";
  std::string stars;
  std::string depths;
  for (int i = 0; i < 1000; ++i) {
    stars += "a*";
    depths += "**/a/";
    path += "/a";
  }
  EXPECT_FALSE(IgnorePattern(stars + "b", "here").Matches(name, false));
  EXPECT_FALSE(IgnorePattern(depths + "b", "here").Matches(path, false));
}

}  // namespace
}  // namespace vesk2_command
