// command.h: the shape of a subcommand. main.cpp holds the table of them; each lives in a file of
// its own and is one function that declares its options and returns what to do with them.
#ifndef VESK2_TOOLS_COMMAND_H
#define VESK2_TOOLS_COMMAND_H

#include <CLI/CLI.hpp>
#include <functional>

namespace vesk2_command {

// What a script can rely on: anything but kYes is a refusal. Trouble means that the question could
// not be answered: wrong usage, a file that cannot be read or parsed, no store, no memory.
enum ExitCode : int { kYes = 0, kNo = 1, kTrouble = 2 };

// Runs a subcommand whose options have been parsed; throws Trouble (report.h) for exit 2.
using Action = std::function<ExitCode()>;

struct Command {
  const char* noun;
  const char* verb;
  const char* about;
  Action (*define)(CLI::App& app);
};

Action DefineKeyNew(CLI::App& app);
Action DefineKeyShow(CLI::App& app);
Action DefineAclGrant(CLI::App& app);
Action DefineCertIssue(CLI::App& app);
Action DefineCertShow(CLI::App& app);
Action DefineCertVerify(CLI::App& app);
Action DefineCertFind(CLI::App& app);
Action DefineCrlIssue(CLI::App& app);
Action DefineCrlImport(CLI::App& app);
Action DefineCrlShow(CLI::App& app);
Action DefineCrlVerify(CLI::App& app);
Action DefineManifestSign(CLI::App& app);
Action DefineManifestVerify(CLI::App& app);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_COMMAND_H
