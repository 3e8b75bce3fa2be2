// SPDX-License-Identifier: Apache-2.0
// command.h: the shape of a subcommand. commands.cpp holds the table of them; each lives in a file
// of its own and is one function that declares its options and returns what to do with them. What
// every subcommand takes (--json, --quiet, the store roots, ...) is declared and used by run.cpp.
#ifndef VESK2_TOOLS_COMMAND_H
#define VESK2_TOOLS_COMMAND_H

#include <CLI/CLI.hpp>
#include <functional>
#include <memory>
#include <span>

#include "tools/vesk2/say/report.h"

namespace vesk2_command {

// Runs a subcommand whose options have been parsed; throws Trouble for exit 2.
using Action = std::function<ExitCode()>;

// A row of the table, from which parsing, --help, the manual pages and the shells' completion come.
struct Command {
  const char* noun;
  const char* verb;      // empty for a noun that is a command itself
  const char* about;     // one line
  const char* examples;  // a command line a line
  Action (*define)(CLI::App& app);
};
struct Noun {
  const char* name;
  const char* about;
  const char* description;  // paragraphs for the manual page
};
std::span<const Command> Commands();
std::span<const Noun> Nouns();

// Runs one command line, argv[0] included, and returns its exit status. Nothing throws.
int RunCommand(int argc, const char* const* argv);

Action DefineKeyNew(CLI::App& app);
Action DefineKeyShow(CLI::App& app);
Action DefineKeyImport(CLI::App& app);
Action DefineKeyExport(CLI::App& app);
Action DefineAclGrant(CLI::App& app);
Action DefineAclList(CLI::App& app);
Action DefineAclInstall(CLI::App& app);
Action DefineAclRemove(CLI::App& app);
Action DefineCertRequest(CLI::App& app);
Action DefineCertIssue(CLI::App& app);
Action DefineCertRenew(CLI::App& app);
Action DefineCertCosign(CLI::App& app);
Action DefineCertJoin(CLI::App& app);
Action DefineCertShow(CLI::App& app);
Action DefineCertVerify(CLI::App& app);
Action DefineCertFind(CLI::App& app);
Action DefineCrlIssue(CLI::App& app);
Action DefineCrlImport(CLI::App& app);
Action DefineCrlShow(CLI::App& app);
Action DefineCrlVerify(CLI::App& app);
Action DefineManifestSign(CLI::App& app);
Action DefineManifestApprove(CLI::App& app);
Action DefineManifestVerify(CLI::App& app);
Action DefineManifestShow(CLI::App& app);
Action DefineManifestCompare(CLI::App& app);
Action DefineFloorShow(CLI::App& app);
Action DefineFloorSet(CLI::App& app);
Action DefineFloorReset(CLI::App& app);
Action DefineTagCheck(CLI::App& app);
Action DefineShow(CLI::App& app);
Action DefineStoreShow(CLI::App& app);
Action DefineVersion(CLI::App& app);
Action DefineCompletion(CLI::App& app);
Action DefineManual(CLI::App& app);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_COMMAND_H
