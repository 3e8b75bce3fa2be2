// SPDX-License-Identifier: Apache-2.0
// with_page.cpp: the page of an answer that a command gave.
#include <ctime>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/page/page.h"

namespace vesk2_command {
namespace {

// A stamp as everywhere in the answers: "2026-11-23_15:42:04", in UTC.
std::string Now() {
  const std::time_t now = std::time(nullptr);
  std::tm parts = {};
  gmtime_r(&now, &parts);
  char text[32];
  return {text, std::strftime(text, sizeof text, "%Y-%m-%d_%H:%M:%S", &parts)};
}

// Asked before the work, and before anything is said.
void RequirePlace(const PageOptions& options) {
  if (options.file == kStandard) {
    throw Trouble("--report -: the verdict is written to standard output", "usage");
  }
  RefuseExisting(options.file, options.force);
  RequireDirectory(options.file);
}

void WritePage(const PageOptions& options, ExitCode code) {
  const Json answer = MakeAnswer(code);
  try {
    WriteOptions how;
    how.flags.force = options.force;
    WriteFile(options.file, MakePage(answer), how);
  } catch (const Trouble& trouble) {
    // The verdict has been said: without these words, it would be taken for that of the exit
    // status.
    Trouble told("the answer was " + answer["verdict"].get<std::string>() +
                     ", but its report cannot be written: " + trouble.what(),
                 trouble.reason);
    told.file = trouble.file;
    throw told;
  }
}

}  // namespace

void AddPageOptions(OptionList& list, PageOptions& options) {
  list.Add("--report", options.file,
           "Write the answer as a page to look at, too: HTML that needs nothing else");
  list.Add("-f,--force", options.force, "Replace the report that is there");
}

std::function<ExitCode()> WithPage(const PageOptions& options, std::function<ExitCode()> action) {
  return [&options, action = std::move(action)] {
    const bool wanted = !options.file.empty();
    if (wanted) {
      RequirePlace(options);
      CollectFacts();
    }
    ExitCode code = kTrouble;
    try {
      code = action();
    } catch (const Trouble& trouble) {
      Result()["answered_at"] = Now();
      RecordTrouble(trouble);
      if (wanted) WritePage(options, kTrouble);
      throw;
    }
    Result()["answered_at"] = Now();
    if (wanted) WritePage(options, code);
    return code;
  };
}

}  // namespace vesk2_command
