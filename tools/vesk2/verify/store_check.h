// SPDX-License-Identifier: Apache-2.0
// store_check.h: files of the stores that a verification had to pass over.
//
// The library answers from what it can read. An entry or a list that is there and cannot be read
// may be the one that revokes: an answer without it is none.
#ifndef VESK2_TOOLS_STORE_CHECK_H
#define VESK2_TOOLS_STORE_CHECK_H

#include <set>
#include <string>

#include "tools/vesk2/explain/evidence.h"
#include "tools/vesk2/options/options.h"

namespace vesk2_command {

struct StoreCheck {
  bool ignoreEntries = false;
  bool ignoreLists = false;
};
void AddStoreCheckOptions(OptionList& list, StoreCheck& check);

// CheckStores throws the Trouble for an entry that cannot be read, and for the stored list of a
// source that an entry in force names when it cannot be read or does not verify; notes instead for
// what is ignored, and for entries that are malformed. It returns the canonical tags of the sources
// whose list is broken.
std::set<std::string> CheckStores(const Question& question, const StoreCheck& check);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_STORE_CHECK_H
