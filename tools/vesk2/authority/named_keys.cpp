// SPDX-License-Identifier: Apache-2.0
// named_keys.cpp: keys, and what names them.
#include "tools/vesk2/authority/named_keys.h"

#include <algorithm>
#include <deque>
#include <set>

#include "tools/vesk2/objects/texts.h"

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;
using ZvVesk2::Subject;
using ZvVesk2::ThresholdSubject;

// How subjects can name a key.
std::vector<std::string> NamesOf(PublicKey& key) {
  return {Fingerprint(key), SubjectText(*HashOf(key, ZVCLM_HASH_SHA1, true))};
}

}  // namespace

NamedKeys::NamedKeys(const Holdings& holdings, const SExpression& entries)
    : holdings_(holdings), entryList_(ItemsOf<AclEntry>(&entries)) {
  for (size_t i = 0; i < entryList_.size(); ++i) {
    AddSubject(entryList_[i]->GetSubject(), i, entriesFor_);
  }
  for (size_t i = 0; i < holdings_.certs.size(); ++i) {
    const Cert& cert = *holdings_.certs[i].cert;
    AddSubject(cert.GetSubject(), i, certsFor_);
    AddKey(cert.GetIssuer());
  }
}

void NamedKeys::AddKey(DExpression* subject) {
  auto* const key = dynamic_cast<PublicKey*>(subject);
  if (key != nullptr) keys_.emplace(Fingerprint(*key), Ref<PublicKey>::Share(key));
}

void NamedKeys::AddSubject(Subject* subject, size_t number, Named& named) {
  auto* const several = dynamic_cast<ThresholdSubject*>(subject);
  if (several == nullptr) {
    AddKey(subject);
    named[SubjectText(*subject)].push_back(number);
    return;
  }
  Signers group{{}, several->GetK()};
  for (Subject* const member : MembersOf(*several)) {
    auto* const key = dynamic_cast<PublicKey*>(member);
    if (key == nullptr) continue;
    AddKey(key);
    named[Fingerprint(*key)].push_back(number);
    group.keys.push_back(Ref<PublicKey>::Share(key));
  }
  if (group.IsGroup()) groups_.emplace(SubjectText(*subject), std::move(group));
}

std::vector<Signers> NamedKeys::Candidates() const {
  std::vector<Signers> candidates;
  for (const auto& [fingerprint, key] : keys_) {
    if (Numbers(entriesFor_, *key).empty() && Numbers(certsFor_, *key).empty()) continue;
    candidates.push_back(OneKey(key));
  }
  for (const auto& [text, group] : groups_) {
    Signers copy{{}, group.k};
    for (const auto& key : group.keys) copy.keys.push_back(Ref<PublicKey>::Share(key.get()));
    candidates.push_back(std::move(copy));
  }
  return candidates;
}

Signers OneKey(const Ref<PublicKey>& key) {
  Signers one;
  one.keys.push_back(Ref<PublicKey>::Share(key.get()));
  return one;
}

Ref<PublicKey> NamedKeys::FindKey(const std::string& fingerprint) const {
  const auto found = keys_.find(fingerprint);
  return found != keys_.end() ? Ref<PublicKey>::Share(found->second.get()) : Ref<PublicKey>();
}

bool NamedKeys::IsInGroup(PublicKey& key) const {
  return std::any_of(groups_.begin(), groups_.end(), [&](const auto& each) {
    const auto& keys = each.second.keys;
    return std::any_of(keys.begin(), keys.end(),
                       [&](const auto& member) { return member->IsEqual(&key); });
  });
}

std::vector<size_t> NamedKeys::Numbers(const Named& named, PublicKey& key) {
  std::vector<size_t> numbers;
  for (const std::string& name : NamesOf(key)) {
    const auto found = named.find(name);
    if (found == named.end()) continue;
    numbers.insert(numbers.end(), found->second.begin(), found->second.end());
  }
  return numbers;
}

std::vector<size_t> NamedKeys::Reach(const std::vector<PublicKey*>& keys) const {
  std::vector<size_t> reached;
  std::set<std::string> seen;
  std::set<size_t> taken;
  std::deque<PublicKey*> next(keys.begin(), keys.end());
  for (; !next.empty(); next.pop_front()) {
    if (!seen.insert(Fingerprint(*next.front())).second) continue;
    for (const size_t number : Numbers(certsFor_, *next.front())) {
      if (!taken.insert(number).second) continue;
      reached.push_back(number);
      auto* const issuer = dynamic_cast<PublicKey*>(CertOf(number).GetIssuer());
      if (issuer != nullptr) next.push_back(issuer);
    }
  }
  return reached;
}

std::vector<AclEntry*> NamedKeys::EntriesFor(const std::vector<PublicKey*>& keys,
                                             const std::vector<size_t>& reached) const {
  std::set<size_t> numbers;
  const auto add = [&](PublicKey* key) {
    if (key == nullptr) return;
    const std::vector<size_t> named = Numbers(entriesFor_, *key);
    numbers.insert(named.begin(), named.end());
  };
  for (PublicKey* const key : keys) add(key);
  for (const size_t cert : reached) add(dynamic_cast<PublicKey*>(CertOf(cert).GetIssuer()));
  std::vector<AclEntry*> entries;
  for (const size_t number : numbers) entries.push_back(entryList_[number]);
  return entries;
}

}  // namespace vesk2_command
