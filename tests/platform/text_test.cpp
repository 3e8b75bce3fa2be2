// SPDX-License-Identifier: Apache-2.0
// Paths, names, numbers and order.
#include "src/platform/text.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

namespace ZVsysutil {
namespace {

// The text of a new array, "null" for none.
std::string Take(char* text) {
  const std::unique_ptr<char[]> owner(text);
  return text != nullptr ? text : "null";
}

TEST(TextTest, JoinsWithOneSeparator) {
  const std::tuple<const char*, const char*, const char*> cases[] = {
      {"/a/", "b", "/a/b"}, {"a", "/b", "a/b"},  {"a/", "/b", "a/b"}, {"a//", "b", "a//b"},
      {"", "/b", "/b"},     {nullptr, "b", "b"}, {"a", nullptr, "a"}, {nullptr, nullptr, ""}};
  for (const auto& [a, b, joined] : cases) EXPECT_EQ(Take(zv_join_path(a, b)), joined);
  char out[4];
  EXPECT_TRUE(zv_concat_path_to(out, sizeof out, "a", "b") && std::string(out) == "a/b");
  EXPECT_FALSE(zv_concat_path_to(out, sizeof out, "a", "bc"));
  EXPECT_STREQ(out, "");  // a path that had to be cut is never used
}

TEST(TextTest, TakesPathsApart) {
  const std::tuple<const char*, const char*, const char*> cases[] = {
      {"/d.x/b", "b", nullptr},    {"/a/b.c.req", "b.c.req", ".req"},
      {"a/b//", "b", nullptr},     {"x.REQ", "x.REQ", ".REQ"},
      {"/s/.acl", ".acl", ".acl"}, {"//", "/", nullptr},
      {"a/..", "..", "."},         {"", "", nullptr}};
  for (const auto& [path, name, extension] : cases) {
    EXPECT_EQ(Take(zv_basename(path)), name) << path;
    EXPECT_STREQ(zv_extname(path), extension) << path;
  }
  EXPECT_NE(zv_filenamecmp("x.REQ", "x.req"), 0);
}

TEST(TextTest, CopiesWithinBounds) {
  const unsigned char bytes[] = {0x9f, 0x0b};
  char out[5];
  zv_binhex(out, bytes, sizeof bytes);
  EXPECT_STREQ(out, "9f0b");
  EXPECT_TRUE(zv_fstrcpy(out, sizeof out, "abcd") && !zv_fstrcpy(out, sizeof out, "abcde"));
  EXPECT_STREQ(out, "abcd");
  EXPECT_EQ(Take(zv_atof_copy_n("ab", 50)), "ab");
  EXPECT_EQ(Take(zv_ftoa_copy_n(bytes, 1)), "\x9f");
  EXPECT_EQ(Take(zv_strdup(nullptr)), "null");
}

TEST(TextTest, ScansNumbersSplitAtSingleNonDigits) {
  std::string found;
  for (const std::string text : {"31-02_3:4", "9:123456789", "9:1234567890", "1::2", ":1", "12:"}) {
    int values[3];
    const auto* bytes = reinterpret_cast<const unsigned char*>(text.data());
    const int count = zv_scan_numbers(bytes, text.size(), values, 3);
    for (int i = 0; i < count; ++i) found += std::to_string(values[i]) + " ";
    found += "| ";
  }
  EXPECT_EQ(found, "31 2 3 | 9 123456789 | 9 | 1 | | 12 | ");
}

TEST(TextTest, SortsAsAStableSortDoes) {
  using Item = std::pair<int, int>;
  const auto compare = [](const void* a, const void* b) {
    return static_cast<const Item*>(a)->first - static_cast<const Item*>(b)->first;
  };
  for (int count = 0; count < 70; ++count) {
    std::vector<Item> items;
    for (int i = 0; i < count; ++i) items.emplace_back(i * i % 11, i);
    std::vector<Item> expected = items;
    std::sort(expected.begin(), expected.end());  // by the key, then by the place
    zv_sort(items.data(), items.size(), sizeof(Item), compare);
    EXPECT_EQ(items, expected) << count;
  }
}

}  // namespace
}  // namespace ZVsysutil
