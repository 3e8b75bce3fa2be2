// SPDX-License-Identifier: Apache-2.0
// names.cpp: reading directories.
#include "tools/vesk2/tree/names.h"

#include <dirent.h>

#include <algorithm>
#include <cerrno>
#include <memory>

namespace vesk2_command {
namespace {

struct CloseDirectory {
  void operator()(DIR* stream) const { closedir(stream); }
};

}  // namespace

bool ReadNames(const std::string& directory, std::vector<Name>& names) {
  const std::unique_ptr<DIR, CloseDirectory> stream(opendir(directory.c_str()));
  if (!stream) return false;
  errno = 0;
  while (const dirent* entry = readdir(stream.get())) {
    const std::string name = entry->d_name;
    const bool maybeLink = entry->d_type == DT_LNK || entry->d_type == DT_UNKNOWN;
    if (name != "." && name != "..") names.push_back({name, maybeLink});
    errno = 0;
  }
  std::ranges::sort(names, {}, &Name::text);
  return errno == 0;
}

std::string Join(const std::string& directory, const std::string& name) {
  return directory.empty() || directory.ends_with('/') ? directory + name : directory + "/" + name;
}

}  // namespace vesk2_command
