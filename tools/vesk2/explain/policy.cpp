// SPDX-License-Identifier: Apache-2.0
// policy.cpp: what no advice may undo.
#include "tools/vesk2/explain/policy.h"

#include <algorithm>

namespace vesk2_command {

using ZvVesk2::CrlSequence;
using ZvVesk2::Principal;
using ZvVesk2::Subject;
using ZvVesk2::ThresholdSubject;

Policy::Policy(const Question& question, const Evidence& evidence)
    : evidence_(evidence), entries_(AllEntries(evidence)), lists_(LoadLists(evidence)) {
  for (const CertEvidence& each : evidence.certs) {
    if (IsListed(each)) revoked_.push_back(each.cert->GetSubject());
  }
  wantsSeveral_ =
      std::any_of(evidence.entries.begin(), evidence.entries.end(),
                  [&](const EntryEvidence& each) { return StandsInTheWay(question, each); });
}

bool Policy::IsListed(const CertEvidence& each) const {
  return each.source && CrlSequence::CheckStatusNonCritical(
                            entries_.get(), lists_.get(), each.source.get(), each.cert.get(),
                            nullptr, nullptr) == VESK2_ERR_CERT_REVOKED;
}

bool Policy::StandsInTheWay(const Question& question, const EntryEvidence& each) const {
  auto* several = dynamic_cast<ThresholdSubject*>(each.entry->GetSubject());
  if (several == nullptr || several->GetK() < 2) return false;
  if (each.relevant) return true;
  SExpression* tag = each.entry->GetTag();
  if (question.request == nullptr) return false;
  const auto& members = question.request->members;
  return std::any_of(members.begin(), members.end(), [&](const Request::Member& member) {
    return member.tag->IsSubset(tag) || tag->IsSubset(member.tag.get());
  });
}

bool Policy::IsRevoked(Subject* subject) const {
  if (CrlSequence::CheckStatusCritical(entries_.get(), lists_.get(), nullptr, subject) != 0) {
    return true;
  }
  const bool listed = std::any_of(revoked_.begin(), revoked_.end(), [&](Subject* other) {
    return Names(other, subject) || Names(subject, other);
  });
  auto* several = dynamic_cast<ThresholdSubject*>(subject);
  if (listed || several == nullptr) return listed;
  const std::vector<Subject*> members = MembersOf(*several);
  return std::any_of(members.begin(), members.end(),
                     [&](Subject* member) { return IsRevoked(member); });
}

bool Policy::IsOutermost(Principal* key) const {
  return std::none_of(
      evidence_.certs.begin(), evidence_.certs.end(), [&](const CertEvidence& each) {
        return !each.cert->GetIssuer()->IsEqual(key) && Names(each.cert->GetSubject(), key);
      });
}

}  // namespace vesk2_command
