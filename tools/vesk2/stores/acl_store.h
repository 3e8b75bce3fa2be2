// SPDX-License-Identifier: Apache-2.0
// acl_store.h: the entries of this machine's ACL store, and why there are none.
#ifndef VESK2_TOOLS_ACL_STORE_H
#define VESK2_TOOLS_ACL_STORE_H

#include <string>
#include <vector>

#include "tools/vesk2/objects/objects.h"

namespace vesk2_command {

// LoadAcls returns the entries of the ACL store; Trouble, and the reasons noted, when there are
// none.
Ref<SExpression> LoadAcls();

// Why the ACL store yields no entry.
std::vector<std::string> ExplainStore();
// Whether there is no store at all: nothing at its place, or no entry in it; nor any in the
// directory that is trusted beside it, if one was named. What is there and cannot be read is no
// absence.
bool HasNoStore(const std::string& extraDirectory);
// NoEntries answers for a store from which no entry could be loaded: an empty list, and how to make
// entries noted, where there is none; else ThrowNoStore.
Ref<SExpression> NoEntries(const std::string& extraDirectory, int code);
void TellHowToTrust();
// Notes why there is no entry, and how to make one where there is none, and throws the Trouble for
// a store without which nothing can be answered.
[[noreturn]] void ThrowNoStore(int code);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_ACL_STORE_H
