// SPDX-License-Identifier: Apache-2.0
// approvals.h: who of the keys that must agree has approved what is asked about, and whose
// approvals would count.
#ifndef VESK2_TOOLS_APPROVALS_H
#define VESK2_TOOLS_APPROVALS_H

#include <string>
#include <vector>

#include "tools/vesk2/explain/evidence.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {

// Where the members of one k-of-n entry stand; keys by their fingerprints.
struct Approvals {
  const EntryEvidence* entry = nullptr;
  size_t k = 0;
  size_t n = 0;
  std::vector<std::string> approved = {};
  std::vector<std::string> awaited = {};  // would count
  std::vector<std::string> revoked = {};  // nobody should ask these

  size_t Missing() const { return approved.size() < k ? k - approved.size() : 0; }
};

// FindApprovals looks at each entry that wants two or more keys of which the chain knows one. A
// member has approved when the certificates would grant what is asked if it were trusted alone,
// whatever else the entry lacks. A question without a request is about what the entry grants: then
// a member has approved when any of that comes to the end of the chain.
std::vector<Approvals> FindApprovals(const Question& question, const Evidence& evidence);

// "1 of 2 approvals, by X; 1 is missing, and that of Y or Z would count".
std::string ApprovalsText(const Approvals& approvals);
Json ApprovalsJson(const Approvals& approvals);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_APPROVALS_H
