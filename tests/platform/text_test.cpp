// Paths, names, numbers and order.
#include "src/platform/text.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <optional>
#include <random>
#include <string>
#include <vector>

namespace ZVsysutil {
namespace {

using Text = std::optional<std::string>;  // nothing is null

Text Take(char* text) {
  const std::unique_ptr<char[]> owner(text);
  return text != nullptr ? Text(text) : std::nullopt;
}

TEST(TextTest, JoinsWithOneSeparator) {
  const std::string longest(4096 - 2, 'x');
  const struct {
    const char* a;
    const char* b;
    Text joined;
  } cases[] = {
      {"a", "b", "a/b"},
      {"/a/", "b", "/a/b"},
      {"/", "b", "/b"},
      {"a", "/b", "a/b"},
      {"a/", "/b", "a/b"},
      {"a//", "b", "a//b"},  // names are only joined, never tidied
      {"", "b", "b"},
      {"", "/b", "/b"},
      {nullptr, "b", "b"},
      {"a", nullptr, "a"},
      {"a/", "", "a/"},
      {nullptr, nullptr, std::nullopt},
      {"a", longest.c_str(), "a/" + longest},
      {"ab", longest.c_str(), std::nullopt},  // a path with its terminator is 4097 bytes at most
  };
  for (const auto& row : cases) {
    const std::string label = std::string(row.a ? row.a : "-") + " + " + (row.b ? row.b : "-");
    EXPECT_EQ(Take(zv_concat_path(row.a, row.b)), row.joined) << label.substr(0, 30);
  }
  char out[4];
  EXPECT_TRUE(zv_concat_path_to(out, sizeof out, "a", "b"));
  EXPECT_STREQ(out, "a/b");
  EXPECT_FALSE(zv_concat_path_to(out, sizeof out, "a", "bc"));
  EXPECT_STREQ(out, "");  // a path that had to be cut is never used
}

TEST(TextTest, TakesPathsApart) {
  const struct {
    const char* path;
    const char* name;
    const char* extension;
  } cases[] = {
      {"/a/b.acl", "b.acl", ".acl"},
      {"b", "b", nullptr},
      {"/d.x/b", "b", nullptr},
      {"/a/b.c.req", "b.c.req", ".req"},
      {"a/b/", "b", nullptr},
      {"a//", "a", nullptr},
      {"/", "/", nullptr},
      {"//", "/", nullptr},
      {"", "", nullptr},
      {"/s/.acl", ".acl", ".acl"},
      {"a/..", "..", "."},
      {"x.REQ", "x.REQ", ".REQ"},
  };
  for (const auto& row : cases) {
    EXPECT_EQ(Take(zv_basename(row.path)), row.name) << row.path;
    const char* extension = zv_extname(row.path);
    EXPECT_EQ(extension ? Text(extension) : std::nullopt,
              row.extension ? Text(row.extension) : std::nullopt)
        << row.path;
  }
  char out[4];
  EXPECT_TRUE(zv_basename("/a/bcd", out, sizeof out));
  EXPECT_STREQ(out, "bcd");
  EXPECT_FALSE(zv_basename("/a/bcde", out, sizeof out));
  EXPECT_STREQ(out, "bcd");
  EXPECT_NE(zv_filenamecmp("x.REQ", "x.req"), 0);
  EXPECT_EQ(zv_filenamencmp("/d/a", "/d/b", 3), 0);
}

TEST(TextTest, CopiesWithinBounds) {
  const unsigned char bytes[] = {0x9f, 0x0b};
  char out[5] = {'x', 'x', 'x', 'x', 'x'};
  zv_binhex(out, bytes, sizeof bytes);
  EXPECT_STREQ(out, "9f0b");
  EXPECT_TRUE(zv_fstrcpy(out, sizeof out, "abcd"));
  EXPECT_FALSE(zv_fstrcpy(out, sizeof out, "abcde"));
  EXPECT_STREQ(out, "abcd");
  EXPECT_EQ(Take(zv_atof_copy_n("ab\0cd", 5)), "ab");
  const char unterminated[] = {'a', 'b', 'c'};
  EXPECT_EQ(Take(zv_ftoa_copy_n(unterminated, 2)), "ab");
  EXPECT_EQ(Take(zv_strdup(nullptr)), std::nullopt);
  EXPECT_EQ(Take(zv_concat_string("a", nullptr)), "a");
}

TEST(TextTest, ScansNumbersSplitAtSingleNonDigits) {
  const struct {
    std::string text;
    std::vector<int> numbers;
  } cases[] = {
      {"23:59:58", {23, 59, 58}},
      {"2031-02-28_01:02:03", {2031, 2, 28, 1, 2, 3}},
      {"1:2:3:4:5:6:7", {1, 2, 3, 4, 5, 6}},  // no more than were asked for
      {"07", {7}},
      {"1::2", {1}},
      {":1", {}},
      {"12:", {12}},
      {"5:1234567890", {5}},  // too long for a number
  };
  for (const auto& row : cases) {
    std::vector<int> values(6);
    const auto* bytes = reinterpret_cast<const unsigned char*>(row.text.data());
    const int found = zv_scan_numbers(bytes, row.text.size(), values.data(), 6);
    values.resize(static_cast<size_t>(found));
    EXPECT_EQ(values, row.numbers) << row.text;
  }
}

TEST(TextTest, SortsAsAStableSortDoes) {
  using Item = std::pair<int, int>;
  const auto compare = [](const void* a, const void* b) {
    return static_cast<const Item*>(a)->first - static_cast<const Item*>(b)->first;
  };
  std::mt19937 random(1);
  for (int count = 0; count < 70; ++count) {
    std::vector<Item> items;
    for (int i = 0; i < count; ++i) items.emplace_back(random() % 10, i);
    std::vector<Item> expected = items;
    std::stable_sort(expected.begin(), expected.end(),
                     [](const Item& a, const Item& b) { return a.first < b.first; });
    zv_sort(items.data(), items.size(), sizeof(Item), compare);
    EXPECT_EQ(items, expected) << count;
  }
}

}  // namespace
}  // namespace ZVsysutil
