// SPDX-License-Identifier: Apache-2.0
// names.h: what a directory on disk holds.
#ifndef VESK2_TOOLS_NAMES_H
#define VESK2_TOOLS_NAMES_H

#include <string>
#include <vector>

namespace vesk2_command {

// A name in a directory, and whether it may be a link, as far as the directory says.
struct Name {
  std::string text;
  bool maybeLink;
};

// The names in a directory, in byte order; false with errno set when it cannot be read.
bool ReadNames(const std::string& directory, std::vector<Name>& names);

// A path, and a name below it.
std::string Join(const std::string& directory, const std::string& name);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_NAMES_H
