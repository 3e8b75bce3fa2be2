// SPDX-License-Identifier: Apache-2.0
// run.cpp: one command line: from its words to an action, and the one place that turns failures
// into exit codes.
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <string>

#include "tools/vesk2/commands/parse.h"
#include "tools/vesk2/confine/confine.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/install/source.h"
#include "tools/vesk2/say/names.h"
#include "tools/vesk2/stores/key_names.h"

#include <vesk2.h>

namespace vesk2_command {
namespace {

// Whether a command line that could not be parsed asked for JSON.
bool WantsJson(int argc, const char* const* argv) {
  for (int i = 1; i < argc; ++i) {
    const std::string_view word = argv[i];
    if (word == "--") return false;
    if (word == "--json") return true;
  }
  return false;
}

// "-", and "-:2", the second certificate in it.
bool IsStandardInput(const std::string& value) {
  return value == kStandard || value.starts_with(std::string(kStandard) + ":");
}

// Standard input can be read for one argument only.
void RefuseSharedInput(const CommandLine& line) {
  size_t readers = 0;
  for (const Given& given : line.given) {
    if (given.option->Opens() != Access::kReads) continue;
    readers += static_cast<size_t>(std::ranges::count_if(given.values, IsStandardInput));
  }
  if (readers > 1) throw Trouble("standard input (-) is asked for more than once", "usage");
}

// ---- What a command that only looks gives up ----

// And one that takes strangers' archives apart.
bool OnlyLooks(const std::string& command) {
  if (command == "manifest install" || command == "who" || command == "until") return true;
  if (command == "store check" || command == "cert find") return true;
  if (command.starts_with("key")) return false;  // keys are in programs and devices, too
  return command.ends_with("verify") || command.ends_with("show");
}

std::string DirectoryOf(const std::string& named) {
  const std::string path = named.substr(0, named.find_last_not_of('/') + 1);
  const size_t slash = path.rfind('/');
  return slash == std::string::npos ? "." : path.substr(0, slash + 1);
}

// Every path that the command line names.
void AddNamedPaths(const CommandLine& line, Reach& reach) {
  for (const Given& given : line.given) {
    const Access access = given.option->Opens();
    if (access == Access::kAnywhere) reach.readable.push_back("/");
    if (access == Access::kNone) continue;
    for (const std::string& value : given.values) {
      if (access == Access::kWrites) reach.writable.push_back(DirectoryOf(value));
      reach.readable.push_back(value);
      const size_t colon = value.rfind(':');  // FILE:N
      if (colon != std::string::npos) reach.readable.push_back(value.substr(0, colon));
    }
  }
}

// The stores are written to by a verification whose manifest carries lists; a passphrase is asked
// for on the terminal.
void GiveUpTheRest(const CommandLine& line) {
  Reach reach;
  const std::string home = HomeRoot(line.common.stores).path;
  const std::string global = GlobalRoot(line.common.stores).path;
  for (const std::string& root : {home, global}) {
    for (const char* below : {"", "/acl", "/cert"}) reach.readable.push_back(root + below);
  }
  reach.writable = {home, global, "/dev/tty"};
  AddNamedPaths(line, reach);
  Confine(reach);
}

// An answer does not depend on names: without them it is given all the same.
void LoadNames() {
  UseNames({});
  try {
    UseNames(ReadNames());
  } catch (const Trouble& trouble) {
    Note(std::string("note: ") + trouble.what() + "; keys are told without their names");
  }
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

ExitCode Run(int argc, const char* const* argv) {
  std::unique_ptr<CommandLine> line;
  try {
    line = ParseCommandLine(argc, argv);
  } catch (const Trouble& trouble) {
    StartReport("", {.json = WantsJson(argc, argv)});
    const ExitCode code = FinishReport(trouble);
    if (!GetStyle().json) Note("vesk2: --help after any command shows its options");
    return code;
  }
  if (line->command.empty()) {
    StartReport("", {});
    return FinishReport(kYes);
  }
  StartReport(line->command, ResolveStyle(line->common));
  RefuseSharedInput(*line);
  UseStores(line->common.stores);
  if (line->command == "manifest install") LoadArchiveLibrary();
  if (OnlyLooks(line->command)) GiveUpTheRest(*line);
  LoadNames();
  return FinishReport(line->action());
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
