// SPDX-License-Identifier: Apache-2.0
// options.cpp: what every subcommand takes, and the options told in words.
#include "tools/vesk2/commands/options.h"

#include <algorithm>
#include <sstream>

namespace vesk2_command {
namespace {

constexpr const char* kCommonGroup = "Common options";
constexpr const char* kEmpty = "the value is empty; leave out what is not meant";

// What the value of an option is; an option means the same wherever it is taken.
constexpr struct {
  const char* value;
  const char* options;  // and positionals
} kValues[] = {
    {"COMMAND", " sign-with "},
    {"DIR", " acl-dir global home tree "},
    {"FILE",
     " cert chain crl floor ignore-from items-of key output passphrase-file request revoke-key "
     "subject "},
    {"FILE[:N]", " issuer-of revoke-cert subject-of "},
    {"N", " bits jobs passphrase-fd threshold "},
    {"NAME", " name names "},
    {"PATH", " ignore "},
    {"PATTERN", " ignore-pattern "},
    {"TAG", " asked grant granted revocation tag "},
    {"TIME", " at date not-after not-before time "},
};

void AddCommonOptions(CLI::App& app, Common& common) {
  AddStoreOptions(app, common.stores);
  app.add_flag("--json", common.style.json, "Answer with one JSON object");
  app.add_flag("-q,--quiet", common.style.quiet, "No notes; the verdict and errors only");
  app.add_flag("-v,--verbose", common.style.verbose, "More notes")->excludes("--quiet");
  app.add_flag("--no-color", common.noColor, "No colour, on a terminal either");
  app.add_flag("--no-progress", common.noProgress, "No progress line, on a terminal either");
}

std::string ValueOf(const CLI::Option& option) {
  const std::string& name =
      option.get_lnames().empty() ? option.get_name(true) : option.get_lnames().front();
  for (const auto& row : kValues) {
    if (std::string(row.options).find(" " + name + " ") != std::string::npos) return row.value;
  }
  std::string value = option.get_positional() ? name : "TEXT";
  std::transform(value.begin(), value.end(), value.begin(), ::toupper);
  return value;
}

// The parser tells a choice as "TEXT:{a,b}".
std::vector<std::string> ChoicesOf(const CLI::Option& option) {
  std::vector<std::string> choices;
  const std::string type = option.get_type_name();
  const size_t open = type.find('{');
  if (open == std::string::npos) return choices;
  std::istringstream words(type.substr(open + 1, type.find('}') - open - 1));
  for (std::string word; std::getline(words, word, ',');) choices.push_back(word);
  return choices;
}

// A script whose variable is unset hands over an empty word. Taken for "not given", it would turn
// an end, a place or a limit into none.
void RefuseEmptyValues(CLI::App& app) {
  for (CLI::Option* option : app.get_options()) {
    if (option->get_expected_min() == 0) continue;  // a flag
    // As a transform it comes before the checks of the option's own.
    option->transform(CLI::Validator(
        [](const std::string& value) { return std::string(value.empty() ? kEmpty : ""); }, ""));
  }
}

}  // namespace

Action DefineOptions(CLI::App& app, const Command& command, Common& common) {
  Action action = command.define(app);
  app.set_help_flag("-h,--help", "Show this help")->group(kCommonGroup);
  const size_t own = app.get_options().size();
  AddCommonOptions(app, common);
  const std::vector<CLI::Option*> options = app.get_options();
  for (size_t i = own; i < options.size(); ++i) options[i]->group(kCommonGroup);
  RefuseEmptyValues(app);
  return action;
}

OptionText DescribeOption(const CLI::Option& option) {
  OptionText text;
  for (const std::string& name : option.get_snames()) text.names.push_back("-" + name);
  for (const std::string& name : option.get_lnames()) text.names.push_back("--" + name);
  text.about = option.get_description();
  if (!option.get_default_str().empty()) text.about += " [" + option.get_default_str() + "]";
  text.required = option.get_required();
  text.repeats = option.get_expected_max() == CLI::detail::expected_max_vector_size;
  text.common = option.get_group() == kCommonGroup;
  if (option.get_expected_min() == 0) return text;  // a flag
  text.choices = ChoicesOf(option);
  text.value = text.choices.empty() ? ValueOf(option) : Join(text.choices, "|");
  constexpr std::string_view kNoFiles[] = {"TAG", "TIME",    "TEXT",   "NAME",
                                           "N",   "COMMAND", "PATTERN"};
  text.takesFile =
      text.choices.empty() && std::ranges::find(kNoFiles, text.value) == std::ranges::end(kNoFiles);
  return text;
}

std::vector<OptionText> DescribeOptions(const Command& command) {
  CLI::App app;
  Common common;
  const Action keepsTheVariables = DefineOptions(app, command, common);
  std::vector<OptionText> texts;
  for (const CLI::Option* option : app.get_options()) texts.push_back(DescribeOption(*option));
  return texts;
}

std::string Synopsis(const OptionText& option) {
  std::string text = option.names.empty() ? "" : option.names.back();
  if (!option.value.empty()) text += (text.empty() ? "" : " ") + option.value;
  if (!option.required) text = "[" + text + "]";
  return option.repeats ? text + "..." : text;
}

std::string CommandName(const Command& command) {
  return *command.verb == '\0' ? command.noun : std::string(command.noun) + " " + command.verb;
}

std::string Join(const std::vector<std::string>& words, const std::string& between) {
  std::string text;
  for (const std::string& word : words) text += (text.empty() ? "" : between) + word;
  return text;
}

}  // namespace vesk2_command
