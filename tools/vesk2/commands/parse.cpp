// SPDX-License-Identifier: Apache-2.0
// parse.cpp: the parser of command lines, made from the table of subcommands. The parsing library
// is met here only.
#include "tools/vesk2/commands/parse.h"

#include <CLI/CLI.hpp>
#include <charconv>

#include "tools/vesk2/commands/words.h"

#include <vesk2.h>

namespace vesk2_command {
namespace {

constexpr const char* kCommonGroup = "Common options";
constexpr const char* kHelp = "-h,--help";
constexpr const char* kEmpty = "the value is empty; leave out what is not meant";

void AddCommonOptions(OptionList& list, Common& common) {
  const size_t own = list.options().size();
  list.Add(kHelp, common.help, "Show this help");
  AddStoreOptions(list, common.stores);
  list.Add("--json", common.style.json, "Answer with one JSON object");
  list.Add("-q,--quiet", common.style.quiet, "No notes; the verdict and errors only");
  list.Add("-v,--verbose", common.style.verbose, "More notes").Excludes("--quiet");
  list.Add("--no-color", common.noColor, "No colour, on a terminal either");
  list.Add("--no-progress", common.noProgress, "No progress line, on a terminal either");
  list.MakeCommon(own);
}

// ---- From the list of options to the parser's ----

CLI::Validator WithinLimits(const Option& option) {
  const int lowest = option.lowest(), highest = option.highest();
  std::string limits = "of at least " + std::to_string(lowest);
  if (highest != std::numeric_limits<int>::max()) {
    limits = "from " + std::to_string(lowest) + " to " + std::to_string(highest);
  }
  const auto refuse = [=](const std::string& value) {
    int number = 0;
    const auto [end, error] = std::from_chars(value.data(), value.data() + value.size(), number);
    const bool read = error == std::errc() && end == value.data() + value.size();
    return read && number >= lowest && number <= highest ? ""
                                                         : value + " is not a number " + limits;
  };
  return {refuse, ""};
}

void AddToParser(CLI::App& app, const Option& option) {
  if (option.names() == kHelp) {
    app.set_help_flag(kHelp, option.about())->group(kCommonGroup);
    return;
  }
  CLI::Option* added = std::visit(
      [&](auto* target) {
        if constexpr (std::is_same_v<decltype(target), bool*>) {
          return app.add_flag(option.names(), *target, option.about());
        } else {
          return app.add_option(option.names(), *target, option.about());
        }
      },
      option.target());
  if (!option.IsOperand() && !option.IsFlag()) added->allow_extra_args(option.several());
  if (!option.IsFlag() && !option.Repeats()) added->expected(1);
  if (option.limited()) added->check(WithinLimits(option));
  if (!option.choices().empty()) added->check(CLI::IsMember(option.choices()));
  if (!option.IsFlag()) {
    // A script whose variable is unset hands over an empty word. Taken for "not given", it would
    // turn an end, a place or a limit into none. As a transform it comes before the other checks.
    added->transform(CLI::Validator(
        [](const std::string& value) { return std::string(value.empty() ? kEmpty : ""); }, ""));
  }
  if (option.common()) added->group(kCommonGroup);
  added->required(option.required());
}

void AddAllToParser(CLI::App& app, const OptionList& list) {
  for (const Option& option : list.options()) AddToParser(app, option);
  for (const Option& option : list.options()) {
    for (const std::string& other : option.excluded()) {
      app.get_option(option.LongName())->excludes(other);
    }
  }
  app.footer(list.footer());
}

const Option* FindOption(const OptionList& list, const CLI::Option& parsed) {
  for (const Option& option : list.options()) {
    if (parsed.check_name(option.LongName())) return &option;
  }
  return nullptr;
}

// Help that leads with what a reader wants to copy.
class HelpText : public CLI::Formatter {
 public:
  explicit HelpText(const OptionList& options) : options_(options) {}

  std::string make_description(const CLI::App* app) const override {
    std::string text = app->get_description() + "\n";
    for (const Command& command : Commands()) {
      const bool verb = app->get_parent() != nullptr && app->get_name() == command.verb &&
                        app->get_parent()->get_name() == command.noun;
      // "show" is a command, and a verb of others.
      const bool lone = *command.verb == '\0' && app->get_name() == command.noun &&
                        app->get_parent() != nullptr && app->get_parent()->get_parent() == nullptr;
      if (verb || lone) text += "\nExamples:\n" + Indented(command.examples);
    }
    return text + "\n";
  }

  std::string make_option_opts(const CLI::Option* parsed) const override {
    const Option* option = FindOption(options_, *parsed);
    if (option == nullptr) return "";
    const bool told = option->IsFlag() || (option->IsOperand() && option->choices().empty());
    return (told ? "" : " " + option->ValueName()) + (option->Repeats() ? "..." : "") +
           (option->required() ? " (required)" : "");
  }
  std::string make_option_desc(const CLI::Option* parsed) const override {
    const Option* option = FindOption(options_, *parsed);
    return option == nullptr ? parsed->get_description() : option->Description();
  }

 private:
  static std::string Indented(std::string_view lines) {
    std::string text = "  ";
    for (const char c : lines) text += c == '\n' ? std::string("\n  ") : std::string(1, c);
    return text + "\n";
  }

  const OptionList& options_;
};

// ---- The command line ----

// Without a chosen command all are defined, for the help; else that one alone, since defining the
// others takes longer than a small verification.
void Define(CLI::App& app, const Command* chosen, CommandLine& line) {
  app.formatter(std::make_shared<HelpText>(line.options));
  app.set_help_flag(kHelp, "Show this help");
  app.set_version_flag("--version", "vesk2 " + LibraryVersion() + " (" + Vesk2VersionExtra() + ")",
                       "Show the version");
  app.require_subcommand(1);
  for (const Noun& noun : Nouns()) {
    if (chosen != nullptr && std::string_view(chosen->noun) != noun.name) continue;
    CLI::App* group = app.add_subcommand(noun.name, noun.about);
    for (const Command& command : Commands()) {
      if (std::string_view(command.noun) != noun.name) continue;
      if (chosen != nullptr && &command != chosen) continue;
      const bool lone = *command.verb == '\0';
      if (!lone) group->require_subcommand(1);
      CLI::App* own = lone ? group : group->add_subcommand(command.verb, command.about);
      if (&command == chosen) AddAllToParser(*own, line.options);
    }
  }
  app.footer(
      "Exit status: 0 yes, 1 a clean no, 2 usage or trouble. The verdict is on standard output,\n"
      "everything else on standard error.\n");
}

// The words, last first, as the parser takes them. It would read the word behind "--option=" as the
// value: that value is empty.
std::vector<std::string> ParserWords(const std::vector<std::string>& arranged) {
  std::vector<std::string> words;
  bool options = true;
  for (const std::string& word : arranged) {
    options = options && word != "--";
    const bool empty = options && word.starts_with("--") && word.find('=') + 1 == word.size();
    words.push_back(empty ? word.substr(0, word.size() - 1) : word);
    if (empty) words.emplace_back();
  }
  return {words.rbegin(), words.rend()};
}

void CollectGiven(const CLI::App& app, CommandLine& line) {
  for (const CLI::Option* parsed : app.get_options()) {
    // Asked first: of some thirty options few are given, and finding one compares all names.
    if (parsed->count() == 0) continue;
    const Option* option = FindOption(line.options, *parsed);
    if (option == nullptr) continue;
    line.given.push_back(
        {option, option->IsFlag() ? std::vector<std::string>() : parsed->results()});
  }
  for (const CLI::App* verb : app.get_subcommands()) CollectGiven(*verb, line);
}

}  // namespace

Action DefineOptions(const Command& command, OptionList& options, Common& common) {
  Action action = command.define(options);
  AddCommonOptions(options, common);
  return action;
}

std::vector<Option> DescribeOptions(const Command& command) {
  OptionList options;
  Common common;
  DefineOptions(command, options, common);
  return {options.options().begin(), options.options().end()};
}

std::unique_ptr<CommandLine> ParseCommandLine(int argc, const char* const* argv) {
  auto line = std::make_unique<CommandLine>();
  OptionList common;
  AddCommonOptions(common, line->common);
  std::vector<std::string> words = ArrangeWords(argc, argv, common);
  const Command* command = FindCommand(words);
  if (command != nullptr) {
    line->command = CommandName(*command);
    line->action = DefineOptions(*command, line->options, line->common);
    words = CheckOptions(words, line->options);
  }
  CLI::App app{"Signed manifests and SPKI certificates, checked offline.", "vesk2"};
  try {
    Define(app, command, *line);
    app.parse(ParserWords(words));
  } catch (const CLI::ParseError& error) {
    if (error.get_exit_code() != 0) throw Trouble(Escape(error.what()), "usage");
    app.exit(error);  // --help and --version end the parsing, too
    line->command.clear();
    return line;
  }
  CollectGiven(app, *line);
  return line;
}

}  // namespace vesk2_command
