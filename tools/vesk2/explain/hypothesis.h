// SPDX-License-Identifier: Apache-2.0
// hypothesis.h: what the answer about authority would be if something were different.
//
// The library judges a changed copy of what it proved, by the rules of its verifications.
#ifndef VESK2_TOOLS_HYPOTHESIS_H
#define VESK2_TOOLS_HYPOTHESIS_H

#include <map>
#include <string>
#include <vector>

#include "tools/vesk2/explain/evidence.h"

namespace vesk2_command {

struct Hypothesis {
  std::map<size_t, ZvVesk2::Cert*> certs;  // these instead, with good signatures
  std::multimap<size_t, ZvVesk2::PublicKey*>
      coSigners;                                      // who certify the same as these, beside them
  std::vector<ZvVesk2::PublicKey*> approvers;         // who certify a manifest's content too
  std::map<std::string, ZvVesk2::AclEntry*> entries;  // these in the store, by file name
  std::vector<SExpression*> freshLists;  // sources with a current list that revokes no more
  // Signed again: these certificates alone and those of the approvers, at this moment unless a
  // period was asked about.
  std::vector<ZvVesk2::Cert*> signedAgain;
  TimeStamp* at = nullptr;
};

// Judge returns the code that the library would give for the authority of the chain or manifest: 0
// or the first refusal. A set is granted when each member is.
int Judge(const Question& question, const Evidence& evidence, const Hypothesis& hypothesis = {});

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_HYPOTHESIS_H
