// SPDX-License-Identifier: Apache-2.0
// Explanation: by which way authority came. One entry is enough for most answers, and most of a
// chain is needed: the entry is found by letting each grant alone, and the certificates by leaving
// out each of them. The library's own rules judge what is left. It costs a judgement for each entry
// that names a key of the chain and one for each certificate, all of them charged (Afford). When
// that is too much, no path is told at all: half of one would name certificates that are not
// needed.
#include <utility>

#include <vesk2/crl.h>

#include "src/trust/explanation_state.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {

int ExplanationPath::Find() {
  VESK2_TRY(FindEntry());
  if (state_.entry == nullptr) return 0;  // several entries together
  VESK2_TRY(FindCerts());
  if (!state_.complete) {
    state_.entry = nullptr;
    state_.pathCount = 0;
    return 0;
  }
  FindEnd();
  return 0;
}

// The first that suffices, in the order of the store. An answer that needs two entries together has
// no single one to name.
int ExplanationPath::FindEntry() {
  for (auto it = state_.relevant->Begin(); it && state_.entry == nullptr; it.Next()) {
    auto* const entry = static_cast<AclEntry*>(it.Value());
    if (!state_.Afford(evidence_.Size())) return 0;
    bool granted = false;
    VESK2_TRY(GrantAlone(granted, entry));
    if (!state_.complete) return 0;  // whether it grants is not known
    if (granted) state_.entry = entry;
  }
  return 0;
}

// The other entries still vouch for revocation lists: without them it would be another question.
int ExplanationPath::GrantAlone(bool& granted, AclEntry* entry) {
  Ref<SExpression> list;
  VESK2_TRY(SExpression::Create(list.Out(), "acl", evidence_.GetContext()));
  VESK2_TRY(AppendShared(list.get(), entry));
  VESK2_TRY(alone_.Copy(evidence_));
  alone_.SetGrantingEntries(list.get());
  const int code = state_.ProveMembers(alone_);
  VESK2_REQUIRE(!LacksMemory(code), code);
  granted = code == 0;
  return 0;
}

// From the root on, as it is told. What could go is left out at once, so that of two ways the one
// is found and not the union.
int ExplanationPath::FindCerts() {
  const size_t count = evidence_.CountCerts();
  state_.path.reset(TryNewArray<size_t>(count));
  VESK2_REQUIRE(state_.path, VESK2_ERR_MEM_ALLOC);
  // A manifest's signer certificate and the signer's own have their places.
  size_t second = 1;
  while (second < count && evidence_.GetRevocationStatus(second) != Cert::NotRevoked) ++second;
  for (size_t i = count; i-- > 0;) {
    bool gone = false;
    VESK2_TRY(CanGo(gone, i, second));
    if (!state_.complete) return 0;
    if (!gone) state_.path[state_.pathCount++] = i;
  }
  return 0;
}

// The last certificate of a chain stays: without any there is no question.
int ExplanationPath::CanGo(bool& gone, size_t index, size_t second) {
  const bool manifest = state_.IsManifest();
  if (manifest ? index == 0 || index == second : alone_.CountCerts() == 1) return 0;
  if (manifest && evidence_.GetRevocationStatus(index) != Cert::NotRevoked) {
    gone = true;  // it was left out already
    alone_.RemoveCert(index);
    return 0;
  }
  if (!state_.Afford(evidence_.Size())) return 0;
  Evidence without(evidence_.GetContext());
  VESK2_TRY(without.Copy(alone_));
  without.RemoveCert(index);
  const int code = state_.ProveMembers(without);
  VESK2_REQUIRE(!LacksMemory(code), code);
  gone = code == 0;
  if (gone) alone_.RemoveCert(index);
  return 0;
}

// ---- Until when ----

// Only ends count: what has begun stays begun, and what will be revoked no list of today tells.
void ExplanationPath::FindEnd() {
  EndsAt(state_.entry->GetNotAfter(), Explanation::EntryEnds, kNone);
  for (size_t i = 0; i < state_.pathCount; ++i) {
    const size_t cert = state_.path[i];
    EndsAt(evidence_.GetCert(cert)->GetNotAfter(), Explanation::CertEnds, cert);
    const CrlSequence* const list = evidence_.GetRevocationList(cert);
    if (list != nullptr) EndsAt(list->GetCert()->GetNotAfter(), Explanation::ListEnds, cert);
  }
}

// Of equal ends the entry is named, then the earlier on the path: what is looked at first.
void ExplanationPath::EndsAt(TimeStamp* end, End kind, size_t cert) {
  if (end == nullptr || (state_.end != nullptr && !end->IsBefore(state_.end))) return;
  state_.end = end;
  state_.endKind = kind;
  state_.endCert = cert;
}

}  // namespace ZvVesk2
