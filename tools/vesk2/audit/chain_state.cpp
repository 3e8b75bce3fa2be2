// SPDX-License-Identifier: Apache-2.0
// chain_state.cpp: asking about a stored chain.
#include "tools/vesk2/audit/chain_state.h"

#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/crl.h>

namespace vesk2_command {

using ZvVesk2::Cert;

ChainState::ChainState(const CertChain& chain, const std::string& path) : proved_(nullptr) {
  SExpression* const granted = ChainLinks(chain, path)[0].cert->GetTag();
  const Ref<SExpression> everything = granted == nullptr ? ParseTag("(*)") : Ref<SExpression>();
  const Ref<TimeStamp> now = ParseTime("now", false);
  code_ = chain->Verify(nullptr, granted != nullptr ? granted : everything.get(), now.get(),
                        now.get(), proved_);
  if (code_ == VESK2_ERR_MEM_ALLOC || code_ == VESK2_ERR_READ_FILE) Check(code_, Escape(path));
}

std::string ChainState::Revocation(size_t index) const {
  const int32_t status = proved_.GetRevocationStatus(index);
  if (status == Cert::NotRevoked) return "";
  const std::string name = "certificate " + std::to_string(index + 1);
  SExpression* const source = proved_.GetRevocationSource(index);
  if (status == Cert::Undetermined) {
    return name + ": not known whether it is revoked: there is no current list of " +
           (source != nullptr ? TagText(source) : "its source");
  }
  const CrlSequence* const list = proved_.GetRevocationList(index);
  const TimeStamp* const since = proved_.GetRevokedSince(index);
  return name + (status == Cert::KeyRevoked ? ": its key is revoked" : ": revoked") +
         (list != nullptr ? " by " + TagText(list->GetCert()->GetTag()) : "") +
         (since != nullptr ? " since " + StampText(*since) : "");
}

std::vector<std::string> ChainState::Revocations() const {
  std::vector<std::string> all;
  for (size_t i = 0; i < proved_.CountCerts(); ++i) {
    std::string text = Revocation(i);
    if (!text.empty()) all.push_back(std::move(text));
  }
  return all;
}

}  // namespace vesk2_command
