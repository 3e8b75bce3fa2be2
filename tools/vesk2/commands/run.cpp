// SPDX-License-Identifier: Apache-2.0
// run.cpp: one command line: from the table to a parser, from the parser to an action, and the one
// place that turns failures into exit codes.
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <string>

#include "tools/vesk2/commands/options.h"
#include "tools/vesk2/confine/confine.h"
#include "tools/vesk2/files/files.h"

#include <vesk2.h>

namespace vesk2_command {
namespace {

struct Choice {
  std::string command;  // "noun verb"
  Action action;
};

// Help that leads with what a reader wants to copy.
class HelpText : public CLI::Formatter {
 public:
  std::string make_description(const CLI::App* app) const override {
    std::string text = app->get_description() + "\n";
    for (const Command& command : Commands()) {
      const bool verb = app->get_parent() != nullptr && app->get_name() == command.verb &&
                        app->get_parent()->get_name() == command.noun;
      const bool lone = *command.verb == '\0' && app->get_name() == command.noun;
      if (verb || lone) text += "\nExamples:\n" + Indented(command.examples);
    }
    return text + "\n";
  }

  std::string make_option_opts(const CLI::Option* option) const override {
    const OptionText text = DescribeOption(*option);
    const bool told = text.value.empty() || (option->get_positional() && text.choices.empty());
    return (told ? "" : " " + text.value) + (text.repeats ? "..." : "") +
           (text.required ? " (required)" : "");
  }
  std::string make_option_desc(const CLI::Option* option) const override {
    return DescribeOption(*option).about;
  }

 private:
  static std::string Indented(std::string_view lines) {
    std::string text = "  ";
    for (const char c : lines) text += c == '\n' ? std::string("\n  ") : std::string(1, c);
    return text + "\n";
  }
};

// The options of a command are defined when its words were met: those of the others take longer
// than a small verification.
void DefineCommand(CLI::App& app, const Command& command, Common& common, Choice& choice) {
  app.preparse_callback([&](size_t) {
    if (!choice.command.empty()) return;
    choice = {CommandName(command), DefineOptions(app, command, common)};
  });
}

void Define(CLI::App& app, Common& common, Choice& choice) {
  app.formatter(std::make_shared<HelpText>());
  app.set_help_flag("-h,--help", "Show this help");
  app.set_version_flag("--version", "vesk2 " + LibraryVersion() + " (" + Vesk2VersionExtra() + ")",
                       "Show the version");
  app.require_subcommand(1);
  for (const Noun& noun : Nouns()) {
    CLI::App* group = app.add_subcommand(noun.name, noun.about);
    for (const Command& command : Commands()) {
      if (std::string_view(command.noun) != noun.name) continue;
      const bool lone = *command.verb == '\0';
      if (!lone) group->require_subcommand(1);
      DefineCommand(lone ? *group : *group->add_subcommand(command.verb, command.about), command,
                    common, choice);
    }
  }
  app.footer(
      "Exit status: 0 yes, 1 a clean no, 2 usage or trouble. The verdict is on standard output,\n"
      "everything else on standard error.\n");
}

// The words behind the command's name, last first, as the parser takes them. It would read the word
// behind "--option=" as the value: that value is empty.
std::vector<std::string> ParserWords(int argc, const char* const* argv) {
  std::vector<std::string> words;
  bool options = true;
  for (int i = 1; i < argc; ++i) {
    const std::string word = argv[i];
    options = options && word != "--";
    const bool empty = options && word.starts_with("--") && word.find('=') + 1 == word.size();
    words.push_back(empty ? word.substr(0, word.size() - 1) : word);
    if (empty) words.emplace_back();
  }
  return {words.rbegin(), words.rend()};
}

// Whether a command line that could not be parsed asked for JSON.
bool WantsJson(int argc, const char* const* argv) {
  for (int i = 1; i < argc; ++i) {
    const std::string_view word = argv[i];
    if (word == "--") return false;
    if (word == "--json") return true;
  }
  return false;
}

// Standard input can be read for one argument only.
void RefuseSharedInput(const CLI::App& app) {
  size_t readers = 0;
  for (const CLI::Option* option : app.get_options()) {
    if (option->check_name("--output")) continue;
    for (const std::string& value : option->results()) readers += value == kStandard ? 1 : 0;
  }
  if (readers > 1) throw Trouble("standard input (-) is asked for more than once", "usage");
  for (const CLI::App* verb : app.get_subcommands()) RefuseSharedInput(*verb);
}

// ---- What a command that only looks gives up ----

bool OnlyLooks(const std::string& command) {
  if (command.starts_with("key")) return false;  // keys are in programs and devices, too
  return command.ends_with("verify") || command.ends_with("show");
}

std::string DirectoryOf(const std::string& path) {
  const size_t slash = path.rfind('/');
  return slash == std::string::npos ? "." : path.substr(0, slash + 1);
}

// Every path that the command line names.
void AddNamedPaths(const CLI::App& app, Reach& reach) {
  for (const CLI::Option* option : app.get_options()) {
    if (!DescribeOption(*option).takesFile) continue;
    const bool written = option->check_name("--output") || option->check_name("--floor");
    for (const std::string& value : option->results()) {
      if (written) reach.writable.push_back(DirectoryOf(value));
      reach.readable.push_back(value);
      const size_t colon = value.rfind(':');  // FILE:N
      if (colon != std::string::npos) reach.readable.push_back(value.substr(0, colon));
    }
  }
  for (const CLI::App* verb : app.get_subcommands()) AddNamedPaths(*verb, reach);
}

bool Asked(const CLI::App& app, const std::string& flag) {
  const CLI::Option* option = app.get_option_no_throw(flag);
  if (option != nullptr && option->count() > 0) return true;
  return std::ranges::any_of(app.get_subcommands(),
                             [&](const CLI::App* verb) { return Asked(*verb, flag); });
}

// The stores are written to by a verification whose manifest carries lists; a passphrase is asked
// for on the terminal.
void GiveUpTheRest(const CLI::App& app, const StoreOptions& stores) {
  Reach reach;
  for (const std::string& root : {HomeRoot(stores).path, GlobalRoot(stores).path}) {
    for (const char* below : {"", "/acl", "/cert"}) reach.readable.push_back(root + below);
  }
  reach.writable = {HomeRoot(stores).path, GlobalRoot(stores).path, "/dev/tty"};
  AddNamedPaths(app, reach);
  if (Asked(app, "--allow-links")) reach.readable = {"/"};  // they may lead anywhere
  Confine(reach);
}

bool TerminalTakesColor() {
  const char* noColor = std::getenv("NO_COLOR");
  if (noColor != nullptr && *noColor != '\0') return false;
  const char* terminal = std::getenv("TERM");
  return terminal != nullptr && std::string_view(terminal) != "dumb" && isatty(STDOUT_FILENO) == 1;
}

Style ResolveStyle(const Common& common) {
  Style style = common.style;
  style.color = !style.json && !common.noColor && TerminalTakesColor();
  style.brief = isatty(STDERR_FILENO) == 1;
  style.progress = !style.quiet && !common.noProgress && isatty(STDERR_FILENO) == 1;
  return style;
}

// Help and version end the parsing with an exception too; they are no failure.
ExitCode EndParsing(const CLI::App& app, const CLI::ParseError& error) {
  if (error.get_exit_code() == 0) return app.exit(error) == 0 ? FinishReport(kYes) : kTrouble;
  const ExitCode code = FinishReport(Trouble(Escape(error.what()), "usage"));
  if (!GetStyle().json) Note("vesk2: --help after any subcommand shows its options");
  return code;
}

ExitCode Run(int argc, const char* const* argv) {
  CLI::App app{"Signed manifests and SPKI certificates, checked offline.", "vesk2"};
  Common common;
  Choice choice;
  try {
    Define(app, common, choice);
    app.parse(ParserWords(argc, argv));
  } catch (const CLI::ParseError& error) {
    const bool help = error.get_exit_code() == 0;
    StartReport("", {.json = !help && WantsJson(argc, argv)});
    return EndParsing(app, error);
  }
  StartReport(choice.command, ResolveStyle(common));
  RefuseSharedInput(app);
  UseStores(common.stores);
  if (OnlyLooks(choice.command)) GiveUpTheRest(app, common.stores);
  return FinishReport(choice.action());
}

int RunOrTell(int argc, const char* const* argv) {
  try {
    return Run(argc, argv);
  } catch (const Trouble& trouble) {
    return FinishReport(trouble);
  } catch (const std::bad_alloc&) {
    return FinishReport(Trouble("out of memory", "mem-alloc"));
  } catch (const std::exception& error) {
    return FinishReport(Trouble(error.what()));
  }
}

}  // namespace

int RunCommand(int argc, const char* const* argv) {
  try {
    return RunOrTell(argc, argv);
  } catch (...) {
    // Not even the words for it could be made: these are here already.
    constexpr std::string_view kWords = "vesk2: out of memory\n";
    const ssize_t written = write(STDERR_FILENO, kWords.data(), kWords.size());
    static_cast<void>(written);
    return kTrouble;
  }
}

}  // namespace vesk2_command
