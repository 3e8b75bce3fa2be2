// SPDX-License-Identifier: Apache-2.0
// tell_remedies.cpp: remedies, in words and as command lines.
#include "tools/vesk2/explain/tell_remedies.h"

#include "tools/vesk2/say/report.h"
#include "tools/vesk2/say/shell_words.h"

namespace vesk2_command {
namespace {

std::string TextOf(const Remedy& remedy) {
  if (remedy.foreign.empty()) return remedy.text;
  return remedy.text + "; look at " + ShellLine(remedy.foreign) +
         " before you run it: whoever made the refused file chose it";
}

}  // namespace

void TellRemedies(const std::vector<Remedy>& remedies) {
  Json& list = Result()["remedies"] = Json::array();
  const char* lead = "would pass: ";
  for (const Remedy& remedy : remedies) {
    Note((remedy.commands.empty() ? "to mend: " : lead) + TextOf(remedy));
    if (!remedy.commands.empty()) lead = "or: ";
    Json commands = Json::array();
    for (const auto& words : remedy.commands) {
      NoteCommand("  " + ShellLine(words));
      commands.push_back(JsonWords(words));
    }
    list.push_back({{"kind", remedy.kind},
                    {"text", TextOf(remedy)},
                    {"commands", commands},
                    {"keys", remedy.keys},
                    {"foreign_words", JsonWords(remedy.foreign)}});
  }
}

}  // namespace vesk2_command
