// SPDX-License-Identifier: Apache-2.0
// acl_install.cpp: vesk2 acl install.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"
#include "tools/vesk2/files/stores.h"
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

ExitCode Run(const Options& options) {
  const std::vector<std::string> names = StoreNames(options.files, options.name, ".acl");
  // All are checked before the first is trusted.
  std::vector<Ref<ZvVesk2::AclEntry>> entries;
  for (size_t i = 0; i < names.size(); ++i) {
    entries.push_back(ReadEntry(options.files[i]));
    CheckEntry(*entries[i], options.files[i]);
    RefuseTaken(*entries[i], {names[i], options.flags});
  }
  for (size_t i = 0; i < names.size(); ++i) {
    const std::string file = GrantEntry(*entries[i], {names[i], options.flags});
    Result()["entries"].push_back(DescribeEntry(*entries[i], file).members());
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
