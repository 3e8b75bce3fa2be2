// SPDX-License-Identifier: Apache-2.0
// explain.h: why an answer about authority is what it is, and what would make a refusal a yes: for
// people as notes, for machines in Result().
//
// The verdict is the library's. These functions look at what the library kept of it, open no file,
// and never change it.
#ifndef VESK2_TOOLS_EXPLAIN_H
#define VESK2_TOOLS_EXPLAIN_H

#include "tools/vesk2/explain/evidence.h"

namespace vesk2_command {

// ExplainRefusal tells of every certificate, where authority was lost, and of the smallest changes
// that would turn the answer: "chain", "acl", "lost", "approvals" and "remedies" of the
// result.
void ExplainRefusal(const Question& question, int code);
// ExplainTree names what mends a tree that is not as its authorized signer signed it.
void ExplainTree(const Question& question);
// ExplainGrant tells of every certificate, of the path of authority, when it ends, and how old the
// revocation data is: "chain", "acl" and "authority" of the result.
void ExplainGrant(const Question& question);
// ExplainTrouble tells machines of what was read, and names the credentials that the reduction
// cannot read.
void ExplainTrouble(const Question& question, int code);
// StartExplanation puts those members into the result, null until they are known.
void StartExplanation();

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_EXPLAIN_H
