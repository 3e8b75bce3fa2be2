// SPDX-License-Identifier: Apache-2.0
// checks.h: what the audit asks about what the stores hold. The library judges; the checks say what
// its judgement means for the store.
#ifndef VESK2_TOOLS_CHECKS_H
#define VESK2_TOOLS_CHECKS_H

#include "tools/vesk2/audit/stored.h"

namespace vesk2_command {

// Entries that have ended or will, that stop every verification, that nothing can use, or whose
// keys are revoked.
void CheckEntries(const Stores& stores, Findings& findings);
// Lists that do not count, and sources of which there is none.
void CheckLists(const Stores& stores, Findings& findings);
// Chains that a verification would refuse now, or soon.
void CheckChains(const Stores& stores, Findings& findings);
// Keys and digests that are weaker than what is made today.
void CheckStrength(const Stores& stores, Findings& findings);
// Directories and files of the stores that others can write, and what lies above them.
void CheckWriters(Findings& findings);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_CHECKS_H
