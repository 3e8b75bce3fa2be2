// SPDX-License-Identifier: Apache-2.0
// co_sign.cpp: edits that have more of several keys say what one of them did.
#include <algorithm>
#include <set>

#include "tools/vesk2/explain/edits.h"

namespace vesk2_command {

using ZvVesk2::Cert;
using ZvVesk2::Subject;
using ZvVesk2::ThresholdSubject;

void EditMaker::CoSign(std::vector<Edit>& edits) const {
  if (question_.manifest) {
    for (const Approvals& each : FindApprovals(question_, evidence_)) Approve(edits, each);
  } else {
    for (const EntryEvidence& each : evidence_.entries) CoSign(edits, each.entry->GetSubject());
  }
  for (const CertEvidence& each : evidence_.certs) CoSign(edits, each.cert->GetSubject());
}

// The members of a k-of-n that certify whom the certificate at an index certifies, the others, and
// the certificate: the first that a member issued for that subject.
void EditMaker::CoSign(std::vector<Edit>& edits, Subject* subject) const {
  auto* several = dynamic_cast<ThresholdSubject*>(subject);
  if (several == nullptr || several->GetK() < 2) return;
  const std::vector<Subject*> members = MembersOf(*several);
  const size_t first = question_.manifest ? 1 : 0;  // a manifest's first is for its content
  for (size_t i = first; i < evidence_.certs.size(); ++i) {
    const Cert& cert = *evidence_.certs[i].cert;
    if (!several->HasMember(cert.GetIssuer()) || policy_.IsRevoked(cert.GetSubject())) continue;
    size_t agreed = 0;
    std::vector<Ref<PublicKey>> others;
    for (Subject* const member : members) {
      const bool certified = std::any_of(
          evidence_.certs.begin(), evidence_.certs.end(), [&](const CertEvidence& each) {
            return each.cert->GetIssuer()->IsEqual(member) &&
                   each.cert->GetSubject()->IsEqual(cert.GetSubject());
          });
      auto* key = dynamic_cast<PublicKey*>(member);
      agreed += certified ? 1 : 0;
      if (!certified && key != nullptr && !policy_.IsRevoked(key)) {
        others.push_back(Ref<PublicKey>::Share(key));
      }
    }
    if (agreed >= several->GetK() || agreed + others.size() < several->GetK()) continue;
    others.resize(several->GetK() - agreed);
    Add(edits, CoSignature(i, std::move(others)));
  }
}

void EditMaker::Approve(std::vector<Edit>& edits, const Approvals& approvals) const {
  const size_t missing = approvals.Missing();
  if (missing == 0 || approvals.awaited.size() < missing) return;
  auto* several = dynamic_cast<ThresholdSubject*>(approvals.entry->entry->GetSubject());
  const std::set<std::string> asked(
      approvals.awaited.begin(), approvals.awaited.begin() + static_cast<std::ptrdiff_t>(missing));
  Edit edit;
  edit.target = "co-signers";
  edit.cost = 10;  // behind renewals: the certificates are taken as they are then
  edit.remedy = {"approve", "have another of the keys that must agree approve this manifest:"};
  for (Subject* const member : MembersOf(*several)) {
    auto* key = dynamic_cast<PublicKey*>(member);
    const std::string name = Fingerprint(*member);
    if (key == nullptr || asked.count(name) == 0) continue;
    edit.remedy.text += " " + name;
    edit.remedy.keys.push_back(name);
    edit.remedy.commands.push_back(
        {"vesk2", "manifest", "approve", PathWord(question_.file), "--key", KeyWord(*key)});
    edit.approvers.push_back(Ref<PublicKey>::Share(key));
  }
  Add(edits, std::move(edit));
}

Edit EditMaker::CoSignature(size_t index, std::vector<Ref<PublicKey>> keys) const {
  Edit edit;
  edit.target = "co-signers";
  edit.cost = 10;  // behind renewals: the certificate is taken as it is then
  edit.index = index;
  edit.remedy = {"co-sign", "have another of the keys that must agree certify what certificate " +
                                std::to_string(index + 1) + " certifies:"};
  for (const auto& key : keys) {
    edit.remedy.text += " " + Fingerprint(*key);
    edit.remedy.keys.push_back(Fingerprint(*key));
    edit.remedy.commands.push_back({"vesk2", "cert", "cosign", At(index), "--key", KeyWord(*key),
                                    "-o", PathWord(question_.file), "--force"});
  }
  edit.coSigners = std::move(keys);
  return edit;
}

}  // namespace vesk2_command
