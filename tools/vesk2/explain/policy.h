// SPDX-License-Identifier: Apache-2.0
// policy.h: what no advice may undo. A change can turn a refusal and still be one that nobody who
// decided about the store and its lists would make.
#ifndef VESK2_TOOLS_POLICY_H
#define VESK2_TOOLS_POLICY_H

#include <vector>

#include "tools/vesk2/explain/evidence.h"

namespace vesk2_command {

class Policy {
 public:
  Policy(const Question& question, const Evidence& evidence);

  // Whether a subject is, names or counts a key that is revoked, or whose certificate was, at any
  // time: lists that have ended count. What cannot be asked about reads as revoked.
  bool IsRevoked(ZvVesk2::Subject* subject) const;
  // Whether the store lets only several keys together do what was asked, or has the keys of this
  // chain agree with others: one key's grant would stand in for all of them.
  bool WantsSeveral() const { return wantsSeveral_; }
  // Whether no other key of the chain certifies this one. A grant to a certified key passes by
  // those who certify it, and what revokes or bounds their word.
  bool IsOutermost(ZvVesk2::Principal* key) const;

 private:
  bool IsListed(const CertEvidence& each) const;
  bool StandsInTheWay(const Question& question, const EntryEvidence& each) const;

  const Evidence& evidence_;
  Ref<SExpression> entries_;
  Ref<SExpression> lists_;
  std::vector<ZvVesk2::Subject*> revoked_;  // the subjects of certificates on a list
  bool wantsSeveral_ = false;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_POLICY_H
