// SPDX-License-Identifier: Apache-2.0
// find_remedies.h: the smallest changes that would make a refusal a yes and keep the policy that
// refused.
//
// Candidates are built in memory and put to the library (hypothesis.h): what is named has been
// found to turn the answer. What restores comes first. What would trust a revoked key, one key
// where several must agree, or a key past those who certify it is no candidate (policy.h).
#ifndef VESK2_TOOLS_FIND_REMEDIES_H
#define VESK2_TOOLS_FIND_REMEDIES_H

#include <vector>

#include "tools/vesk2/explain/evidence.h"
#include "tools/vesk2/explain/remedy.h"

namespace vesk2_command {

// FindRemedies returns alternatives, the smallest first; none when nothing was found. `code` is the
// refusal.
std::vector<Remedy> FindRemedies(const Question& question, const Evidence& evidence, int code);
// What mends a tree that is not as it was signed, by a signer who is authorized.
std::vector<Remedy> MendTree(const Question& question, const Evidence& evidence);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_FIND_REMEDIES_H
