// SPDX-License-Identifier: Apache-2.0
// page.h: an answer as a page to look at: one HTML file that loads nothing and runs nothing.
//
// It is made of the answer for machines and of nothing else: a graph of how authority came, or
// where it was cut, what mends it, and every member of the answer in lists and tables.
#ifndef VESK2_TOOLS_PAGE_H
#define VESK2_TOOLS_PAGE_H

#include <functional>
#include <string>

#include "tools/vesk2/options/options.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {

// MakePage returns the page of what MakeAnswer returned.
std::string MakePage(const Json& answer);

struct PageOptions {
  std::string file;
  bool force = false;
};
void AddPageOptions(OptionList& list, PageOptions& options);

// WithPage runs a command and writes the page of its answer where one was asked for, of a no and of
// trouble too. "answered_at" of the result says when that was. `action` keeps the options alive.
std::function<ExitCode()> WithPage(const PageOptions& options, std::function<ExitCode()> action);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_PAGE_H
