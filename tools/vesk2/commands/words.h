// SPDX-License-Identifier: Apache-2.0
// words.h: the words of a command line before they are parsed: where they may stand, and what was
// probably meant by one that is none.
#ifndef VESK2_TOOLS_WORDS_H
#define VESK2_TOOLS_WORDS_H

#include <string>
#include <vector>

#include "tools/vesk2/commands/command.h"

namespace vesk2_command {

// ArrangeWords returns the words behind argv[0] with the subcommand's own in front. Options of
// every command, which `common` lists, may stand before it, and "help NOUN VERB" is "NOUN VERB
// --help". Trouble for words that are no subcommand.
std::vector<std::string> ArrangeWords(int argc, const char* const* argv, const OptionList& common);

// The subcommand that arranged words begin with; null when they ask for help only.
const Command* FindCommand(const std::vector<std::string>& words);

// CheckOptions is Trouble for the first word of a subcommand's line that looks like an option and
// is none. It returns the words, with operands that look like one ("-:2") behind a "--".
std::vector<std::string> CheckOptions(const std::vector<std::string>& words,
                                      const OptionList& options);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_WORDS_H
