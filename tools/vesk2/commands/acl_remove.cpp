// SPDX-License-Identifier: Apache-2.0
// acl_remove.cpp: vesk2 acl remove.
#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/grant.h"

namespace vesk2_command {
namespace {

struct Options {
  std::vector<std::string> names;
  bool dryRun = false;
};

std::string ExistingPath(const std::string& name) {
  const std::string path = EntryPath(name, "\"" + Escape(name) + "\"");
  if (faccessat(AT_FDCWD, path.c_str(), F_OK, AT_SYMLINK_NOFOLLOW) != 0)
    throw FileTrouble(path, std::strerror(errno), "io");
  return path;
}

ExitCode Run(const Options& options) {
  std::vector<std::string> paths;
  for (const std::string& name : options.names) paths.push_back(ExistingPath(name));
  for (const std::string& path : paths) {
    if (!options.dryRun && unlink(path.c_str()) != 0) {
      throw FileTrouble(path, std::strerror(errno), "io");
    }
    Note((options.dryRun ? "would remove " : "removed ") + Escape(path));
    Result()[options.dryRun ? "would_remove" : "removed"].push_back(Escape(path));
  }
  return kYes;
}

}  // namespace

Action DefineAclRemove(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("names", options->names, "Entries, by the names that acl list shows").Required();
  list.Add("-n,--dry-run", options->dryRun, "Say what would be removed, and remove nothing");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
