// SPDX-License-Identifier: Apache-2.0
// key_names.h: the pet names that a user gave to keys, in the file "names" of the home store:
//
//   vesk2-names 1
//   sha256:<64 digits> NAME
//
// a line a key, in the order of the fingerprints, each key and each name once. The file is replaced
// whole, under a lock on names.lock beside it. Nothing is decided by a name: it is for people.
#ifndef VESK2_TOOLS_KEY_NAMES_H
#define VESK2_TOOLS_KEY_NAMES_H

#include <functional>
#include <string>

#include "tools/vesk2/say/names.h"

namespace vesk2_command {

// The file of the names; empty without a home store.
std::string NamesPath();
// ReadNames returns the names, none where there is no file. Trouble for a file that cannot be read
// or that says anything else: somebody else may have written there.
KeyNames ReadNames();
// ChangeNames reads them under the lock, has them changed, and writes them. Trouble without a home
// store.
void ChangeNames(const std::function<void(KeyNames&)>& change);
// Why a text cannot be a name; empty for one that can: it is shown as it is, and cannot be taken
// for a fingerprint.
std::string WhyNoName(const std::string& text);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_KEY_NAMES_H
