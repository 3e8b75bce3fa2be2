// SPDX-License-Identifier: Apache-2.0
// shell_words.h: command lines that are printed to be pasted into a shell, or run by a program.
//
// A name or a tag may have been chosen by a stranger so that the shell would run a part of it.
// Words are therefore quoted last, from their true bytes, and by these functions only.
#ifndef VESK2_TOOLS_SHELL_WORDS_H
#define VESK2_TOOLS_SHELL_WORDS_H

#include <string>
#include <vector>

#include "tools/vesk2/say/report.h"

namespace vesk2_command {

// ShellWord writes a word in printable ASCII so that a shell reads it back, byte by byte: as it is,
// in single quotes, or as $'...' where a byte is neither ASCII nor printable. Every shell reads the
// first two; $'...' is for those that people paste into (bash, ksh, zsh): another one takes it for
// another word, and runs nothing of it either.
std::string ShellWord(const std::string& word);
std::string ShellLine(const std::vector<std::string>& words);

// JsonWord is the word itself, or {"hex": digits} when it is no UTF-8 text.
Json JsonWord(const std::string& word);
Json JsonWords(const std::vector<std::string>& words);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_SHELL_WORDS_H
