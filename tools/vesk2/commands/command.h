// SPDX-License-Identifier: Apache-2.0
// command.h: the shape of a subcommand. commands.cpp holds the table of them; each lives in a file
// of its own and is one function that declares its options and returns what to do with them. What
// every subcommand takes (--json, --quiet, the store roots, ...) is declared and used by run.cpp.
#ifndef VESK2_TOOLS_COMMAND_H
#define VESK2_TOOLS_COMMAND_H

#include <functional>
#include <memory>
#include <span>

#include "tools/vesk2/options/options.h"
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
  Action (*define)(OptionList& list);
};
// "key new", or the noun alone.
std::string CommandName(const Command& command);

struct Noun {
  const char* name;
  const char* about;
  const char* description;  // paragraphs for the manual page
};
std::span<const Command> Commands();
std::span<const Noun> Nouns();

// Runs one command line, argv[0] included, and returns its exit status. Nothing throws.
int RunCommand(int argc, const char* const* argv);

Action DefineKeyNew(OptionList& list);
Action DefineKeyShow(OptionList& list);
Action DefineKeyImport(OptionList& list);
Action DefineKeyExport(OptionList& list);
Action DefineKeyName(OptionList& list);
Action DefineAclGrant(OptionList& list);
Action DefineAclList(OptionList& list);
Action DefineAclInstall(OptionList& list);
Action DefineAclRemove(OptionList& list);
Action DefineCertRequest(OptionList& list);
Action DefineCertIssue(OptionList& list);
Action DefineCertRenew(OptionList& list);
Action DefineCertCosign(OptionList& list);
Action DefineCertJoin(OptionList& list);
Action DefineCertShow(OptionList& list);
Action DefineCertVerify(OptionList& list);
Action DefineCertFind(OptionList& list);
Action DefineCertInstall(OptionList& list);
Action DefineCrlIssue(OptionList& list);
Action DefineCrlImport(OptionList& list);
Action DefineCrlShow(OptionList& list);
Action DefineCrlVerify(OptionList& list);
Action DefineManifestSign(OptionList& list);
Action DefineManifestApprove(OptionList& list);
Action DefineManifestVerify(OptionList& list);
Action DefineManifestInstall(OptionList& list);
Action DefineManifestShow(OptionList& list);
Action DefineManifestCompare(OptionList& list);
Action DefineWho(OptionList& list);
Action DefineUntil(OptionList& list);
Action DefineFloorShow(OptionList& list);
Action DefineFloorSet(OptionList& list);
Action DefineFloorReset(OptionList& list);
Action DefineTagCheck(OptionList& list);
Action DefineShow(OptionList& list);
Action DefineStoreShow(OptionList& list);
Action DefineStoreCheck(OptionList& list);
Action DefineVersion(OptionList& list);
Action DefineCompletion(OptionList& list);
Action DefineManual(OptionList& list);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_COMMAND_H
