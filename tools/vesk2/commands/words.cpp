// SPDX-License-Identifier: Apache-2.0
// words.cpp: words of a command line, put in order.
#include "tools/vesk2/commands/words.h"

#include <algorithm>
#include <numeric>

#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

using Words = std::vector<std::string>;

// How many letters must be changed, added or left out to come from one word to the other.
size_t Distance(const std::string& from, const std::string& to) {
  std::vector<size_t> row(to.size() + 1);
  std::iota(row.begin(), row.end(), size_t{0});
  for (size_t i = 0; i < from.size(); ++i) {
    size_t diagonal = row[0]++;
    for (size_t j = 0; j < to.size(); ++j) {
      const size_t changed = diagonal + (from[i] == to[j] ? 0 : 1);
      diagonal = row[j + 1];
      row[j + 1] = std::min({changed, row[j] + 1, diagonal + 1});
    }
  }
  return row.back();
}

// "; did you mean X?" where one of the words is near enough to be told.
std::string DidYouMean(const std::string& typed, const Words& known) {
  const std::string* nearest = nullptr;
  size_t best = typed.size() / 3 + 1;
  if (typed.size() > 64) return "";
  for (const std::string& word : known) {
    const size_t distance = Distance(typed, word);
    if (distance > best || (nearest != nullptr && distance == best)) continue;
    nearest = &word;
    best = distance;
  }
  return nearest == nullptr ? "" : "; did you mean \"" + *nearest + "\"?";
}

[[noreturn]] void Usage(const std::string& text) { throw Trouble(text, "usage"); }

const Option* FindOption(const OptionList& options, const std::string& name) {
  for (const Option& option : options.options()) {
    const Words names = option.Names();
    if (std::ranges::find(names, name) != names.end()) return &option;
  }
  return nullptr;
}

// The option that a word names: "--name", "--name=value", "-n" or "-nVALUE".
std::string OptionName(const std::string& word) {
  return word.starts_with("--") ? word.substr(0, word.find('=')) : word.substr(0, 2);
}
// "-:2" is a certificate of standard input.
bool IsOptionWord(const std::string& word) {
  return word.size() > 1 && word.starts_with('-') && !word.starts_with("-:");
}
// Whether the value of an option is the next word.
bool TakesNext(const Option& option, const std::string& word) {
  return !option.IsFlag() && word == OptionName(word);
}

const Option& KnownOption(const OptionList& options, const std::string& word) {
  const std::string name = OptionName(word);
  if (const Option* option = FindOption(options, name)) return *option;
  Words known;
  for (const Option& option : options.options()) {
    if (!option.IsOperand()) known.push_back(option.LongName());
  }
  Usage("no option " + Escape(name) + DidYouMean(name, known));
}

bool IsNoun(const std::string& word) {
  return std::ranges::any_of(Nouns(), [&](const Noun& noun) { return word == noun.name; });
}

Words VerbsOf(const std::string& noun) {
  Words verbs;
  for (const Command& command : Commands()) {
    if (noun == command.noun && *command.verb != '\0') verbs.emplace_back(command.verb);
  }
  return verbs;
}

[[noreturn]] void RefuseNoun(const std::string& typed) {
  Words nouns;
  for (const Noun& noun : Nouns()) nouns.emplace_back(noun.name);
  Words whose;  // a verb without its noun
  for (const Command& command : Commands()) {
    if (typed == command.verb) whose.push_back("vesk2 " + CommandName(command));
  }
  if (whose.empty()) Usage("no command \"" + Escape(typed) + "\"" + DidYouMean(typed, nouns));
  Usage("\"" + typed + "\" of what? " + Join(whose, ", "));
}

void RequireVerb(const std::string& noun, const std::string& typed) {
  const Words verbs = VerbsOf(noun);
  if (verbs.empty() || std::ranges::find(verbs, typed) != verbs.end()) return;
  if (typed.empty()) Usage("vesk2 " + noun + " does what? " + Join(verbs, ", "));
  if (IsOptionWord(typed)) return;
  Usage("no command \"" + noun + " " + Escape(typed) + "\"" + DidYouMean(typed, verbs));
}

// Takes the options that stand before the subcommand from `words`.
Words TakeEarlyOptions(Words& words, const OptionList& common) {
  size_t end = 0;
  while (end < words.size() && IsOptionWord(words[end])) {
    end += TakesNext(KnownOption(common, words[end]), words[end]) ? 2 : 1;
  }
  const auto behind = words.begin() + static_cast<std::ptrdiff_t>(std::min(end, words.size()));
  Words early(words.begin(), behind);
  words.erase(words.begin(), behind);
  return early;
}

}  // namespace

std::vector<std::string> ArrangeWords(int argc, const char* const* argv, const OptionList& common) {
  Words words(argv + std::min(argc, 1), argv + argc);
  if (!words.empty() && (words[0] == "--version" || words[0] == "--help" || words[0] == "-h")) {
    return {words[0]};
  }
  const Words early = TakeEarlyOptions(words, common);
  if (words.empty()) Usage("a command is needed; vesk2 --help lists them");
  if (words[0] == "help") {
    words.erase(words.begin());
    words.emplace_back("--help");
    if (words.size() == 1) return words;
  }
  if (!IsNoun(words[0])) RefuseNoun(words[0]);
  RequireVerb(words[0], words.size() > 1 ? words[1] : "");
  const std::ptrdiff_t own = FindCommand(words) == nullptr || VerbsOf(words[0]).empty() ? 1 : 2;
  words.insert(words.begin() + own, early.begin(), early.end());
  return words;
}

const Command* FindCommand(const std::vector<std::string>& words) {
  for (const Command& command : Commands()) {
    if (words.empty() || words[0] != command.noun) continue;
    if (*command.verb == '\0' || (words.size() > 1 && words[1] == command.verb)) return &command;
  }
  return nullptr;
}

std::vector<std::string> CheckOptions(const std::vector<std::string>& words,
                                      const OptionList& options) {
  Words checked;
  Words last = {"--"};
  for (size_t i = 0; i < words.size(); ++i) {
    if (words[i] == "--") {
      last.insert(last.end(), words.begin() + static_cast<std::ptrdiff_t>(i) + 1, words.end());
      break;
    }
    if (words[i].starts_with("-:")) {
      last.push_back(words[i]);
      continue;
    }
    checked.push_back(words[i]);
    const bool next = IsOptionWord(words[i]) && TakesNext(KnownOption(options, words[i]), words[i]);
    if (next && i + 1 < words.size()) checked.push_back(words[++i]);
  }
  if (last.size() > 1) checked.insert(checked.end(), last.begin(), last.end());
  return checked;
}

}  // namespace vesk2_command
