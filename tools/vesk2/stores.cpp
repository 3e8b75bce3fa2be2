// stores.cpp: the store roots.
#include "tools/vesk2/stores.h"

#include <cstdlib>

#include "tools/vesk2/report.h"

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

std::string Root(const std::string& flag, const char* variable, const std::string& standard) {
  std::string root = flag.empty() ? Environment(variable) : flag;
  if (root.empty()) root = standard;
  // The library cuts a longer root, and would then look somewhere else.
  if (root.size() >= ZvVesk2::Limits::kPathBuffer - 1) throw Trouble("a store root is too long");
  return root;
}

}  // namespace

void AddStoreOptions(CLI::App& app, StoreOptions& options) {
  app.add_option("--home", options.home, "Root of the user's store [VESK2_HOME]");
  app.add_option("--global", options.global,
                 "Root of the machine's store, whose acl/ holds what is trusted [VESK2_GLOBAL]");
}

void UseStores(const StoreOptions& options) {
  using ZvVesk2::VeskConf;
  VeskConf::SetHomeDirectory(Root(options.home, "VESK2_HOME", DefaultHome()).c_str());
  VeskConf::SetGlobalDirectory(Root(options.global, "VESK2_GLOBAL", "/etc/vesk2").c_str());
}

std::string AclDirectory() { return std::string(ZvVesk2::VeskConf::GetGlobalDirectory()) + "/acl"; }

}  // namespace vesk2_command
