// SPDX-License-Identifier: Apache-2.0
// keep_lists.cpp: whether a carried revocation list takes the place of the stored one.
#include "tools/vesk2/verify/keep_lists.h"

#include <map>

#include "tools/vesk2/objects/crl_file.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/crl_compare.h"
#include "tools/vesk2/stores/crl_store.h"

namespace vesk2_command {
namespace {

bool EndsEarlier(const TimeStamp* end, const TimeStamp* other) {
  if (other == nullptr) return end != nullptr;
  return end != nullptr && end->IsBefore(other);
}

// Whether the store should be offered `carried` in the place of `stored`.
bool IsWanted(CrlSequence& carried, CrlSequence& stored, bool yes) {
  const std::vector<Revoked> gone = WhatIsLetGo(*stored.GetCrl(), *carried.GetCrl());
  const TimeStamp* end = carried.GetCert()->GetNotAfter();
  const TimeStamp* storedEnd = stored.GetCert()->GetNotAfter();
  const bool earlier = EndsEarlier(end, storedEnd);
  const bool later = EndsEarlier(storedEnd, end);
  if (earlier || gone.empty()) return !earlier;
  if (yes && later) return true;
  Note("note: the stored list of " + TagText(carried.GetCert()->GetTag()) +
       " is kept: the one that the manifest carries lets go what it revokes (" + gone[0].Text() +
       (gone.size() > 1 ? " and " + std::to_string(gone.size() - 1) + " more)" : ")"));
  return false;
}

}  // namespace

void KeepLists(const ZvVesk2::Evidence& proved, bool yes, const std::set<std::string>& broken) {
  if (proved.GetEntries() == nullptr) return;
  std::map<std::string, CrlSequence*> stored = ListsBySource(proved.GetStoredLists());
  const Ref<TimeStamp> now = ParseTime("now", false);
  for (CrlSequence* const list : ItemsOf<CrlSequence>(proved.GetCarriedLists())) {
    SExpression* const tag = list->GetCert()->GetTag();
    if (tag == nullptr || !IsRevocationTag(tag)) continue;
    const std::string source = Canonical(*tag);
    if (broken.count(source) != 0 || list->VerifySelf(proved.GetEntries()) != 0) continue;
    CrlSequence*& known = stored[source];
    if (known != nullptr &&
        (Canonical(*known) == Canonical(*list) || !IsWanted(*list, *known, yes))) {
      continue;
    }
    (void)list->UpdateStore(proved.GetEntries());
    const TimeStamp* begin = list->GetCert()->GetNotBefore();
    if (begin == nullptr || !begin->IsAfter(now.get())) known = list;
  }
}

}  // namespace vesk2_command
