// SPDX-License-Identifier: Apache-2.0
// An option with an empty value is not one that was left out, whichever option it is.
#include "tools/vesk2/commands/parse.h"

#include <gtest/gtest.h>

namespace vesk2_command {
namespace {

using Words = std::vector<std::string>;

std::string ErrorOf(const Words& words) {
  std::vector<const char*> arguments;
  for (const std::string& word : words) arguments.push_back(word.c_str());
  testing::internal::CaptureStdout();
  testing::internal::CaptureStderr();
  const int code = RunCommand(static_cast<int>(arguments.size()), arguments.data());
  (void)testing::internal::GetCapturedStdout();
  const std::string error = testing::internal::GetCapturedStderr();
  return code == kTrouble ? error.substr(0, error.find('\n')) : "exit " + std::to_string(code);
}

TEST(Options, AnEmptyValueIsAnError) {
  size_t tried = 0;
  for (const Command& command : Commands()) {
    Words begin = {"vesk2", command.noun};
    if (*command.verb != '\0') begin.push_back(command.verb);
    for (const Option& option : DescribeOptions(command)) {
      if (option.IsFlag()) continue;  // a flag
      std::vector<Words> ways = {{""}};
      const std::string name = option.LongName();
      if (!option.IsOperand()) ways = {{name, ""}, {name + "="}};
      for (const Words& way : ways) {
        Words words = begin;
        words.insert(words.end(), way.begin(), way.end());
        words.push_back("--quiet");  // which the parser must not take for the value
        const std::string error = ErrorOf(words);
        EXPECT_NE(error.find("value is empty"), std::string::npos)
            << CommandName(command) << " " << way[0] << ": " << error;
        if (option.IsOperand()) continue;
        EXPECT_NE(error.find(name + ":"), std::string::npos) << error;
        ++tried;
      }
    }
  }
  EXPECT_GT(tried, 200U);
}

}  // namespace
}  // namespace vesk2_command
