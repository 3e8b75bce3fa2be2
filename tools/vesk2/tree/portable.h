// SPDX-License-Identifier: Apache-2.0
// portable.h: names of files that another machine may not have under the same name.
#ifndef VESK2_TOOLS_PORTABLE_H
#define VESK2_TOOLS_PORTABLE_H

#include <map>
#include <string>
#include <vector>

#include "tools/vesk2/tree/names.h"

namespace vesk2_command {

// What is to be said of entries, each with the paths of those that it is said of.
using Remarks = std::map<std::string, std::vector<std::string>>;

// RemarkOnNames looks at all the names of one directory, whose path is `directory` (empty for the
// root of the tree).
void RemarkOnNames(const std::string& directory, const std::vector<Name>& names, Remarks& remarks);

// Notes each remark once, with the first few of its paths.
void NoteRemarks(const Remarks& remarks);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_PORTABLE_H
