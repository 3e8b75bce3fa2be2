// SPDX-License-Identifier: Apache-2.0
// chain_state.h: what the library says now of a chain that lies in the user's store.
#ifndef VESK2_TOOLS_CHAIN_STATE_H
#define VESK2_TOOLS_CHAIN_STATE_H

#include <string>
#include <vector>

#include "tools/vesk2/objects/cert_chain.h"

#include <vesk2/evidence.h>

namespace vesk2_command {

class ChainState {
 public:
  // Asks about what the first certificate grants, now.
  ChainState(const CertChain& chain, const std::string& path);
  // The same of many chains: the entries and the lists were read already.
  ChainState(const CertChain& chain, const std::string& path, SExpression* acls,
             SExpression* lists);

  // The code of the verification: 0, or the first refusal; a code of the engine is negative.
  int code() const { return code_; }
  const ZvVesk2::Evidence& proved() const { return proved_; }

  // A certificate that is revoked, or of which that is not known, in words; empty for another.
  std::string Revocation(size_t index) const;
  // Of all of them.
  std::vector<std::string> Revocations() const;

 private:
  ZvVesk2::Evidence proved_;
  int code_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_CHAIN_STATE_H
