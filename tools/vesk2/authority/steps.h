// SPDX-License-Identifier: Apache-2.0
// steps.h: a way to a signer as it is told: from the entry to the certificate that names the
// signer.
#ifndef VESK2_TOOLS_STEPS_H
#define VESK2_TOOLS_STEPS_H

#include <string>
#include <vector>

#include "tools/vesk2/authority/search.h"

namespace vesk2_command {

// The file of the entry, then "FILE:N" of each certificate; no entry where several do together.
std::vector<std::string> PathOf(const Search& search, const Way& way);
// For machines what each of them says, in the same order, and what the lists say of it at `at`.
Json StepsOf(const Search& search, const Way& way, TimeStamp* at);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_STEPS_H
