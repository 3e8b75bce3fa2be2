// SPDX-License-Identifier: Apache-2.0
// chain_state.cpp: asking about a stored chain.
#include "tools/vesk2/audit/chain_state.h"

#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/crl.h>

namespace vesk2_command {

using ZvVesk2::Cert;

namespace {

// What is asked about a chain: all that its first certificate grants.
Ref<SExpression> TagOf(const ChainLink& first) {
  SExpression* const granted = first.cert->GetTag();
  return granted != nullptr ? Ref<SExpression>::Share(granted) : ParseTag("(*)");
}

// Memory that ran out, and a file that another process holds, are no answer.
int RequireAnswer(int code, const std::string& path) {
  if (code == VESK2_ERR_MEM_ALLOC || code == VESK2_ERR_READ_FILE) Check(code, Escape(path));
  return code;
}

}  // namespace

ChainState::ChainState(const CertChain& chain, const std::string& path) : proved_(nullptr) {
  const Ref<SExpression> tag = TagOf(ChainLinks(chain, path)[0]);
  const Ref<TimeStamp> now = ParseTime("now", false);
  code_ = RequireAnswer(chain->Verify(nullptr, tag.get(), now.get(), now.get(), proved_), path);
}

ChainState::ChainState(const CertChain& chain, const std::string& path, SExpression* acls,
                       SExpression* lists)
    : proved_(nullptr) {
  const std::vector<ChainLink> links = ChainLinks(chain, path);
  for (const ChainLink& link : links) {
    const int code = RequireAnswer(link.signature->Verify(link.cert), path);
    Check(proved_.AddCert(link.cert, link.signature, code), Escape(path));
  }
  const Ref<TimeStamp> now = ParseTime("now", false);
  proved_.SetEntries(acls);
  proved_.SetLists(lists, nullptr);
  proved_.SetPeriod(now.get(), now.get());
  Check(proved_.MarkRevoked(), Escape(path));
  code_ = RequireAnswer(proved_.Judge(TagOf(links[0]).get()), path);
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
