// stores.h: where the stores are: what the flags say, else VESK2_HOME and VESK2_GLOBAL, else
// $XDG_DATA_HOME/vesk2 (~/.local/share/vesk2) and /etc/vesk2.
#ifndef VESK2_TOOLS_STORES_H
#define VESK2_TOOLS_STORES_H

#include <CLI/CLI.hpp>
#include <string>

namespace vesk2_command {

struct StoreOptions {
  std::string home;
  std::string global;
};
void AddStoreOptions(CLI::App& app, StoreOptions& options);

// Sets the library's store roots.
void UseStores(const StoreOptions& options);

// The directory of ACL entries below the global root.
std::string AclDirectory();

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_STORES_H
