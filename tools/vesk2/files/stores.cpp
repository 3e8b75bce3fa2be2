// SPDX-License-Identifier: Apache-2.0
// stores.cpp: the store roots.
#include "tools/vesk2/files/stores.h"

#include <algorithm>
#include <cstdlib>
#include <filesystem>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/context.h>

namespace vesk2_command {
namespace {

std::string Environment(const char* name) {
  const char* value = std::getenv(name);
  return value != nullptr ? value : "";
}

std::string DefaultHome() {
  const std::string data = Environment("XDG_DATA_HOME");
  if (data.starts_with('/')) return data + "/vesk2";  // a relative one must be ignored
  const std::string home = Environment("HOME");
  return home.empty() ? "" : home + "/.local/share/vesk2";
}

StoreOptions used;

// What is given first, of a flag, a variable and the standard place.
StoreRoot Root(const StoreRoot& flag, const char* variable, const std::string& standard) {
  StoreRoot root = flag.path.empty() ? StoreRoot{Environment(variable), variable} : flag;
  if (root.path.empty()) root = {standard, "default"};
  // The library cuts a longer root, and would then look somewhere else.
  if (root.path.size() >= ZvVesk2::Limits::kPathBuffer - 1) {
    throw Trouble("a store root is too long");
  }
  return root;
}

}  // namespace

void AddStoreOptions(OptionList& list, StoreOptions& options) {
  list.Add("--home", options.home, "Root of the user's store [VESK2_HOME]");
  list.Add("--global", options.global,
           "Root of the machine's store, whose acl/ holds what is trusted [VESK2_GLOBAL]");
}

StoreRoot HomeRoot(const StoreOptions& options) {
  return Root({options.home, "--home"}, "VESK2_HOME", DefaultHome());
}

StoreRoot GlobalRoot(const StoreOptions& options) {
  return Root({options.global, "--global"}, "VESK2_GLOBAL", "/etc/vesk2");
}

void UseStores(const StoreOptions& options) {
  using ZvVesk2::VeskConf;
  used = options;
  VeskConf::SetHomeDirectory(HomeRoot(options).path.c_str());
  VeskConf::SetGlobalDirectory(GlobalRoot(options).path.c_str());
}

const StoreOptions& GetStoreOptions() { return used; }

std::string AclDirectory() { return std::string(ZvVesk2::VeskConf::GetGlobalDirectory()) + "/acl"; }

std::vector<std::string> FilesOf(const std::string& directory, const std::string& extension) {
  std::vector<std::string> files;
  std::error_code error;
  std::filesystem::directory_iterator entry(directory, error);
  for (; !error && entry != std::filesystem::directory_iterator(); entry.increment(error)) {
    const std::string path = entry->path().string();
    if (path.ends_with(extension)) files.push_back(path);
  }
  if (error) throw FileTrouble(directory, error.message(), "io");
  std::sort(files.begin(), files.end());
  return files;
}

std::vector<std::string> StoreFilesOf(const std::string& directory, const std::string& extension) {
  std::error_code error;
  const bool exists = std::filesystem::exists(directory, error);
  if (error) throw FileTrouble(directory, error.message(), "io");
  return exists ? FilesOf(directory, extension) : std::vector<std::string>();
}

std::vector<std::string> StoreNames(const std::vector<std::string>& files, const std::string& name,
                                    const std::string& extension) {
  if (!name.empty() && files.size() > 1) throw Trouble("--name is for one file", "usage");
  if (!name.empty()) return {name};
  std::vector<std::string> names;
  for (const std::string& path : files) {
    if (path == kStandard) throw Trouble("standard input has no name: --name gives one", "usage");
    std::string own = std::filesystem::path(path).stem().string();
    while (own.ends_with(extension)) own.resize(own.size() - extension.size());
    if (std::find(names.begin(), names.end(), own) != names.end()) {
      throw Trouble("two files would be " + Escape(own), "usage");
    }
    names.push_back(std::move(own));
  }
  return names;
}

}  // namespace vesk2_command
