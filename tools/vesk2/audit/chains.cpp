// SPDX-License-Identifier: Apache-2.0
// chains.cpp: what is wrong with the chains of the user's store.
#include "tools/vesk2/audit/chain_state.h"
#include "tools/vesk2/audit/checks.h"
#include "tools/vesk2/objects/texts.h"

namespace vesk2_command {
namespace {

using ZvVesk2::Cert;
using ZvVesk2::CertSequence;

// Whether what it finds is why the chain is refused.
bool CheckCert(const std::string& path, const ChainState& state, size_t index, bool judged,
               Findings& findings) {
  const ZvVesk2::Evidence& proved = state.proved();
  const std::string name = "certificate " + std::to_string(index + 1);
  const int code = proved.GetSignatureCode(index);
  if (code != 0) {
    findings.Add("unverifiable", path, name + ": " + Reason(code)).certificate = index + 1;
  }
  const bool ended = findings.AddEnd(path, name, proved.GetCert(index)->GetNotAfter(), index + 1);
  const std::string revocation = judged ? state.Revocation(index) : "";
  if (revocation.empty()) return ended || code != 0;
  const bool unknown = proved.GetRevocationStatus(index) == Cert::Undetermined;
  StoreFinding& finding = unknown ? findings.Add("no-list", path, revocation)
                                  : findings.Add("revoked", path, revocation);
  finding.certificate = index + 1;
  finding.when = Ref<TimeStamp>::Share(proved.GetRevokedSince(index));
  return true;
}

// Where nothing is trusted no chain leads anywhere: that is told once, of the store.
void CheckChain(const Stored<CertSequence>& each, const Stores& stores, Findings& findings) {
  const bool anyEntry = stores.acls->Count() > 1;
  const CertChain chain = CertChain::Share(each.object.get());
  const ChainState state(chain, each.path, stores.acls.get(), stores.believed.get());
  bool told = false;
  for (size_t i = 0; i < state.proved().CountCerts(); ++i) {
    told |= CheckCert(each.path, state, i, anyEntry, findings);
  }
  const Cert& first = *ChainLinks(chain, each.path)[0].cert;
  // A k-of-n can present no chain by itself.
  if (told || !anyEntry || state.code() == 0 || first.GetSubject()->IsThresholdSubject()) return;
  if (state.code() < 0) {
    findings.Add("unverifiable", each.path, "it cannot be judged: " + Reason(state.code()));
  } else {
    findings.Add("unauthorized", each.path,
                 "no entry grants " + TagText(first.GetTag()) + " by it: " + Reason(state.code()));
  }
}

}  // namespace

void CheckChains(const Stores& stores, Findings& findings) {
  for (const Stored<CertSequence>& each : stores.chains) CheckChain(each, stores, findings);
}

}  // namespace vesk2_command
