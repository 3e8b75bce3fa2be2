// SPDX-License-Identifier: Apache-2.0
// acl_install.cpp: vesk2 acl install.
#include <filesystem>
#include <set>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/objects/acl_file.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/grant.h"

namespace vesk2_command {
namespace {

struct Options {
  std::vector<std::string> files;
  std::string name;
  WriteFlags flags;
};

std::string EntryName(const Options& options, const std::string& path) {
  if (!options.name.empty()) return options.name;
  if (path == kStandard) throw Trouble("an entry from standard input needs a --name", "usage");
  return std::filesystem::path(path).stem().string();
}

ExitCode Run(const Options& options) {
  if (!options.name.empty() && options.files.size() > 1) {
    throw Trouble("--name is for one entry", "usage");
  }
  // All are checked before the first is trusted.
  std::vector<Ref<ZvVesk2::AclEntry>> entries;
  std::set<std::string> names;
  for (const std::string& path : options.files) {
    entries.push_back(ReadEntry(path));
    CheckEntry(*entries.back(), path);
    const std::string name = EntryName(options, path);
    if (!names.insert(name).second) throw Trouble("two entries " + Escape(name), "usage");
    RefuseTaken(*entries.back(), {name, options.flags});
  }
  for (size_t i = 0; i < entries.size(); ++i) {
    const std::string name = EntryName(options, options.files[i]);
    GrantEntry(*entries[i], {name, options.flags});
    Result()["entries"].push_back(DescribeEntry(*entries[i], name + ".acl").members());
  }
  return kYes;
}

}  // namespace

Action DefineAclInstall(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("files", options->files, "Entry files (.acl) that this machine is to trust").Required();
  list.Add("--name", options->name, "Name of the entry, where there is one [the file's name]");
  AddWriteFlags(list, options->flags);
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
