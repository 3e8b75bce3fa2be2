// SPDX-License-Identifier: Apache-2.0
// What is printed as a command line is read back by a shell word by word, and runs nothing else.
#include "tools/vesk2/say/shell_words.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <random>

#include "tests/support/temp_dir.h"

namespace vesk2_command {
namespace {

using Words = std::vector<std::string>;

constexpr const char* kHostile[] = {
    "",
    "plain-_./:=,+@%",
    "=ls",
    "-e",
    "-e\033[31m",
    "it's",
    "x'`touch pwned`'",
    "x'$(touch pwned)'.m",
    "a\"b$HOME\\c\\\\",
    "!!",
    "\033[2J!!%s%n\\033",
    "two\nlines",
    "\nx'$(touch pwned)'\n\033",
    "Gr\xc3\xb6\xc3\x9f-e",
    "\xff\xfe'\\'`touch pwned`",
    "\xe2\x80\xae';touch pwned;'",
    "~root",
    "{a,b} *?[a] #&;|<>()",
    "\t \x7f\r",
    "\n\n",
    "'`touch pwned`\033\n\n",
};

Words Random() {
  std::mt19937 random(20261123);
  constexpr std::string_view kBytes = "a-'\"`$(){}\\!%n \n\t\033\177\303\266\377#~=;&0";
  Words words;
  for (int i = 0; i < 500; ++i) {
    std::string word;
    for (auto left = random() % 9; left > 0; --left) word += kBytes[random() % kBytes.size()];
    words.push_back(word);
  }
  return words;
}

std::string Read(FILE* stream) {
  std::string text;
  for (int c = std::fgetc(stream); c != EOF; c = std::fgetc(stream)) text += static_cast<char>(c);
  return text;
}

// What a shell makes of the words: each with its length before it.
std::string ReadBack(const std::string& shell, const Words& words, const std::string& directory) {
  const std::string script = directory + "/script";
  std::ofstream out(script, std::ios::binary);
  for (const std::string& word : words) {
    EXPECT_TRUE(std::all_of(word.begin(), word.end(), [](char c) { return c != 0; }));
    out << "printf '%s;' " << ShellLine({word}) << "\n";
  }
  out.close();
  FILE* stream = popen(("cd '" + directory + "' && " + shell + " script 2>&1").c_str(), "r");
  std::string text = Read(stream);
  EXPECT_EQ(pclose(stream), 0) << shell;
  return text;
}

bool IsPrintable(const std::string& word) {
  return std::all_of(word.begin(), word.end(), [](char c) { return c >= ' ' && c <= '~'; });
}

class ShellWords : public testing::TestWithParam<const char*> {};

// Debian's sh does not know $'...': it reads another word, but runs nothing.
TEST_P(ShellWords, AreReadBack) {
  const vesk2test::TempDir directory;
  Words words(std::begin(kHostile), std::end(kHostile));
  for (const std::string& word : Random()) words.push_back(word);
  std::string all = ReadBack(GetParam(), words, directory.Path());
  if (std::string(GetParam()) == "sh") {
    std::erase_if(words, [](const std::string& word) { return !IsPrintable(word); });
    all = ReadBack("sh", words, directory.Path());
  }
  std::string wanted;
  for (const std::string& word : words) wanted += word + ";";
  EXPECT_EQ(all, wanted);
  EXPECT_NE(access(directory.File("pwned").c_str(), F_OK), 0);
  for (const std::string& word : words) EXPECT_TRUE(IsPrintable(ShellWord(word)));
}

INSTANTIATE_TEST_SUITE_P(Shells, ShellWords, testing::Values("sh", "bash"));

TEST(ShellWords, InJsonAreRaw) {
  EXPECT_EQ(JsonWords({"x'$(a)'", "\033\n", "\xc3\xb6", "\xff-"}).dump(),
            "[\"x'$(a)'\",\"\\u001b\\n\",\"\xc3\xb6\",{\"hex\":\"ff2d\"}]");
}

}  // namespace
}  // namespace vesk2_command
