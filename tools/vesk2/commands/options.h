// SPDX-License-Identifier: Apache-2.0
// options.h: what every subcommand takes, and the options of a subcommand as the help, the manual
// pages and the shells' completion tell them.
#ifndef VESK2_TOOLS_OPTIONS_H
#define VESK2_TOOLS_OPTIONS_H

#include <string>
#include <vector>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {

struct Common {
  Style style;
  bool noColor = false;
  bool noProgress = false;
  StoreOptions stores;
};

// Declares the options of a command, the common ones too, and says of each value what it is.
Action DefineOptions(CLI::App& app, const Command& command, Common& common);

struct OptionText {
  std::vector<std::string> names;  // "-o", "--output"; empty for a positional
  std::string value;               // "FILE"; empty for a flag; a positional's name
  std::vector<std::string> choices;
  std::string preset;  // what the value is unless given
  std::string about;
  bool required = false;
  bool repeats = false;
  bool common = false;
  bool takesFile = false;
};

OptionText DescribeOption(const CLI::Option& option);
std::vector<OptionText> DescribeOptions(const Command& command);
// "--output FILE", "[FILE]"
std::string Synopsis(const OptionText& option);

// "key new", or the noun alone.
std::string CommandName(const Command& command);
std::string Join(const std::vector<std::string>& words, const std::string& between);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_OPTIONS_H
