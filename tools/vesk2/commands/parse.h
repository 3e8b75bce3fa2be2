// SPDX-License-Identifier: Apache-2.0
// parse.h: from the words of a command line to a subcommand and what was given to it.
#ifndef VESK2_TOOLS_PARSE_H
#define VESK2_TOOLS_PARSE_H

#include <memory>
#include <string>
#include <vector>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/options/options.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {

// What every subcommand takes.
struct Common {
  Style style;
  bool noColor = false;
  bool noProgress = false;
  bool help = false;  // the parser answers it
  StoreOptions stores;
};

// Lists the options of a command, the common ones last. `options` and `common` must live as long as
// the action may run.
Action DefineOptions(const Command& command, OptionList& options, Common& common);
// The same, to tell of them only: nothing is behind their targets.
std::vector<Option> DescribeOptions(const Command& command);

struct Given {
  const Option* option;
  std::vector<std::string> values;  // none of a flag
};

struct CommandLine {
  std::string command;  // "noun verb"; empty for --help and --version, which were answered
  Action action;
  Common common;
  OptionList options;
  std::vector<Given> given;
};

// Throws Trouble for what is no command line.
std::unique_ptr<CommandLine> ParseCommandLine(int argc, const char* const* argv);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_PARSE_H
