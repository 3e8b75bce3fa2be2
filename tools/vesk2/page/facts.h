// SPDX-License-Identifier: Apache-2.0
// facts.h: any member of an answer in lists and tables.
#ifndef VESK2_TOOLS_FACTS_H
#define VESK2_TOOLS_FACTS_H

#include <string>

#include "tools/vesk2/page/markup.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {

// The most items of one list that a page holds; it says how many there were.
inline constexpr size_t kMostListed = 5000;

// The name of a member as a heading.
std::string Heading(const std::string& member);
// Adds a value with all that is in it: a list of objects as a table, or one after the other where
// they hold more.
void AddFacts(Markup& page, const Json& value);
// The section of one member; none for one that is null or an empty list.
void AddSection(Markup& page, const std::string& member, const Json& value);
// What would make the answer yes, with its command lines as a shell reads them.
void AddRemedies(Markup& page, const Json& remedies);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_FACTS_H
