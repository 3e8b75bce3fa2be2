// SPDX-License-Identifier: Apache-2.0
// keep_lists.h: keeping the revocation lists that a manifest carried.
#ifndef VESK2_TOOLS_KEEP_LISTS_H
#define VESK2_TOOLS_KEEP_LISTS_H

#include <set>
#include <string>

#include "tools/vesk2/explain/evidence.h"

namespace vesk2_command {

// KeepLists stores the carried lists that verify. After a yes one takes the place of the stored
// list as the store decides, by their ends, unless it ends at the same time and lets something go.
// After a no anybody may have put it there: it must let nothing go and end no earlier. `broken` are
// the sources whose stored list could not be compared: those are kept as they are.
void KeepLists(const ZvVesk2::Evidence& proved, bool yes, const std::set<std::string>& broken);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_KEEP_LISTS_H
