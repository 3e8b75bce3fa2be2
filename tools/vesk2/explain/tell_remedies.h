// SPDX-License-Identifier: Apache-2.0
// tell_remedies.h: remedies as lines for people and as "remedies" of the result.
#ifndef VESK2_TOOLS_TELL_REMEDIES_H
#define VESK2_TOOLS_TELL_REMEDIES_H

#include <vector>

#include "tools/vesk2/explain/remedy.h"

namespace vesk2_command {

void TellRemedies(const std::vector<Remedy>& remedies);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_TELL_REMEDIES_H
