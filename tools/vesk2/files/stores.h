// SPDX-License-Identifier: Apache-2.0
// stores.h: where the stores are: what the flags say, else VESK2_HOME and VESK2_GLOBAL, else
// $XDG_DATA_HOME/vesk2 (~/.local/share/vesk2) and /etc/vesk2.
#ifndef VESK2_TOOLS_STORES_H
#define VESK2_TOOLS_STORES_H

#include <string>
#include <vector>

#include "tools/vesk2/options/options.h"

namespace vesk2_command {

struct StoreOptions {
  std::string home;
  std::string global;
};
void AddStoreOptions(OptionList& list, StoreOptions& options);

// A store's root, and who named it: "--home", "VESK2_HOME" or "default".
struct StoreRoot {
  std::string path;
  std::string from;
};
StoreRoot HomeRoot(const StoreOptions& options);
StoreRoot GlobalRoot(const StoreOptions& options);

// Sets the library's store roots.
void UseStores(const StoreOptions& options);
// What UseStores was given.
const StoreOptions& GetStoreOptions();

// The directory of ACL entries below the global root.
std::string AclDirectory();

// The files of a directory whose names end in `extension`, in byte order. Trouble when the
// directory cannot be read.
std::vector<std::string> FilesOf(const std::string& directory, const std::string& extension);
// The same of a store's directory, which need not be there.
std::vector<std::string> StoreFilesOf(const std::string& directory, const std::string& extension);
// The names that files get in a store: `name`, which can be that of one, or each file's own without
// its extension. Trouble for two alike.
std::vector<std::string> StoreNames(const std::vector<std::string>& files, const std::string& name,
                                    const std::string& extension);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_STORES_H
