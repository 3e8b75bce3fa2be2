// SPDX-License-Identifier: Apache-2.0
// steps.cpp: the steps of a way.
#include "tools/vesk2/authority/steps.h"

#include <algorithm>

#include "tools/vesk2/explain/tell_facts.h"
#include "tools/vesk2/objects/shapes.h"

#include <vesk2/wording.h>

namespace vesk2_command {

std::vector<std::string> PathOf(const Search& search, const Way& way) {
  std::vector<std::string> path;
  if (way.entry != nullptr) path.push_back(Owned(ZvVesk2::Wording::OfEntry(way.entry)));
  const std::vector<std::string> places = search.Places(way);
  std::copy_if(places.rbegin(), places.rend(), std::back_inserter(path),
               [](const std::string& place) { return !place.empty(); });
  return path;
}

Json StepsOf(const Search& search, const Way& way, TimeStamp* at) {
  Json steps = Json::array();
  if (way.entry != nullptr) {
    steps.push_back(EntryJson(*way.entry, Owned(ZvVesk2::Wording::OfEntry(way.entry))));
  }
  ZvVesk2::Evidence evidence(nullptr);
  search.MakeEvidence(way, at, evidence);
  Check(evidence.MarkRevoked(), "asking what is revoked");
  const std::vector<const HeldCert*> carried = search.Carried(way);
  for (size_t i = carried.size(); i-- > 0;) {
    if (carried[i] == nullptr) continue;
    Json step = CertJson(*carried[i]->cert);
    step["certificate"] = carried[i]->number;
    step["signature"] = SignatureJson(0);  // another is passed over when it is read
    step["revocation"] = AskedRevocation(evidence, i);
    steps.push_back(std::move(step));
  }
  return steps;
}

}  // namespace vesk2_command
