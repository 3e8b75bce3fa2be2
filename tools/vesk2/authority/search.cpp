// SPDX-License-Identifier: Apache-2.0
// search.cpp: what is put to the library. One entry alone grants nearly always, and what covers all
// that is asked only ever adds to a grant: so for each entry all such certificates are tried
// together, and then what is not needed is left out. Certificates and entries for less can stand in
// the way of others, as a reduction looks at its first result: the way that is found is judged with
// all entries, and where none is good, all certificates together are tried too.
#include "tools/vesk2/authority/search.h"

#include <algorithm>
#include <set>
#include <utility>

#include "tools/vesk2/explain/effort.h"

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;
using ZvVesk2::Hash;
using ZvVesk2::Principal;
using ZvVesk2::Subject;

constexpr const char* kWhat = "looking for who may sign";

Ref<Cert> NewCert(Principal& issuer, Subject& subject, bool propagate) {
  Ref<Cert> cert(new Cert(nullptr));
  Check(cert->Set(&issuer, &subject, propagate, nullptr, nullptr, nullptr, nullptr, nullptr),
        kWhat);
  return cert;
}

// Some content, which nobody has signed.
Ref<Hash> Content() { return MakeHash(ZVCLM_HASH_SHA256, std::string(32, '\x5a')); }

void AddTo(ZvVesk2::Evidence& evidence, Cert& cert, ZvVesk2::Signature* signature = nullptr) {
  Check(evidence.AddCert(&cert, signature, 0), kWhat);
}

}  // namespace

Search::Search(const Holdings& holdings, const Request& request, const Supposition& supposition)
    : holdings_(holdings),
      request_(request),
      supposition_(supposition),
      entries_(supposition.Entries(holdings.entries.get())),
      keys_(holdings, *entries_) {
  for (const HeldCert& each : holdings_.certs) covers_.push_back(Covers(each.cert->GetTag()));
}

bool Search::Covers(SExpression* tag) const {
  if (tag == nullptr) return true;
  const ByteString* const head = dynamic_cast<ByteString*>(tag->First());
  if (head == nullptr || !head->IsEqual("tag") || tag->Count() < 2) return true;
  return std::all_of(request_.members.begin(), request_.members.end(),
                     [&](const auto& member) { return member.tag->IsSubset(tag); });
}

// Those that name the signer as a manifest's second certificate must.
std::vector<size_t> Search::OwnCerts(PublicKey& signer, const std::vector<size_t>& reached) const {
  std::vector<size_t> own;
  for (const size_t number : reached) {
    if (keys_.CertOf(number).GetSubject()->IsEqual(&signer)) own.push_back(number);
  }
  own.push_back(Way::kSelf);
  return own;
}

// ---- Judging ----

void Search::MakeEvidence(const Way& way, TimeStamp* at, ZvVesk2::Evidence& evidence) const {
  evidence.Clear(ZvVesk2::Evidence::SignedManifest);
  const Ref<Hash> content = Content();
  AddTo(evidence, *NewCert(*way.signer, *content, false));
  const auto add = [&](size_t number) {
    AddTo(evidence, keys_.CertOf(number), holdings_.certs[number].signature.get());
  };
  if (way.own == Way::kSelf) AddTo(evidence, *NewCert(*way.signer, *way.signer, true));
  if (way.own != Way::kSelf) add(way.own);
  for (const size_t number : way.rest) add(number);
  for (PublicKey* const key : way.approvers) AddTo(evidence, *NewCert(*key, *content, false));
  evidence.SetEntries(entries_.get());
  evidence.SetLists(holdings_.lists.get(), nullptr);
  evidence.SetSigningTime(at);
  evidence.SetRevocationTime(at);
  supposition_.Revoke(evidence);
}

std::vector<const HeldCert*> Search::Carried(const Way& way) const {
  std::vector<const HeldCert*> carried(1);
  carried.push_back(way.own != Way::kSelf ? &holdings_.certs[way.own] : nullptr);
  for (const size_t number : way.rest) carried.push_back(&holdings_.certs[number]);
  carried.resize(carried.size() + way.approvers.size());
  return carried;
}

std::vector<std::string> Search::Places(const Way& way) const {
  std::vector<std::string> places;
  for (const HeldCert* const each : Carried(way)) {
    places.push_back(each != nullptr ? each->Place() : "");
  }
  return places;
}

int Search::Judge(const Way& way, TimeStamp* at, bool alone) const {
  ZvVesk2::Evidence evidence(nullptr);
  MakeEvidence(way, at, evidence);
  SpendEffort(evidence.Size());
  Ref<SExpression> granting;
  if (alone && way.entry != nullptr) granting = ListOf({way.entry}, "acl");
  evidence.SetGrantingEntries(granting.get());
  return JudgeMembers(evidence, request_);
}

bool Search::IsRevoked(PublicKey& key, TimeStamp* at) const {
  Way self;
  self.signer = &key;
  ZvVesk2::Evidence evidence(nullptr);
  MakeEvidence(self, at, evidence);
  Check(evidence.MarkRevoked(), kWhat);
  return evidence.GetRevocationStatus(1) != Cert::NotRevoked;
}

// ---- Ways ----

// What ends first goes first: of two ways the one that lasts longer is left.
void Search::Shorten(Way& way, TimeStamp* at, bool alone) const {
  std::vector<size_t> order = way.rest;
  std::stable_sort(order.begin(), order.end(), [&](size_t a, size_t b) {
    const TimeStamp* const end = keys_.CertOf(a).GetNotAfter();
    const TimeStamp* const other = keys_.CertOf(b).GetNotAfter();
    return end != nullptr && (other == nullptr || end->IsBefore(other));
  });
  for (const size_t number : order) {
    Way shorter = way;
    std::erase(shorter.rest, number);
    if (Judge(shorter, at, alone) == 0) way = std::move(shorter);
  }
}

void Search::FindFor(const std::vector<PublicKey*>& keys, TimeStamp* at, size_t most,
                     std::vector<Way>& ways) const {
  const std::vector<size_t> reached = keys_.Reach(keys);
  std::vector<size_t> covering;
  std::copy_if(reached.begin(), reached.end(), std::back_inserter(covering),
               [&](size_t number) { return covers_[number]; });
  std::vector<AclEntry*> entries = keys_.EntriesFor(keys, reached);
  std::erase_if(entries, [&](const AclEntry* each) { return !Covers(each->GetTag()); });
  std::set<std::pair<AclEntry*, std::set<size_t>>> found;
  // Adds a way, unless it is none when all entries are there.
  const auto add = [&](Way& way, bool alone) {
    if (Judge(way, at, alone) != 0) return;
    Shorten(way, at, alone);
    std::set<size_t> certs(way.rest.begin(), way.rest.end());
    if (way.own != Way::kSelf) certs.insert(way.own);
    if (alone && Judge(way, at) != 0) return;
    if (found.emplace(way.entry, std::move(certs)).second) ways.push_back(way);
  };
  Way start;
  start.signer = keys.front();
  start.approvers.assign(keys.begin() + 1, keys.end());
  const std::vector<size_t> owns = OwnCerts(*keys.front(), reached);
  for (const size_t own : owns) {
    start.own = own;
    start.rest = covering;
    std::erase(start.rest, own);
    for (AclEntry* const entry : entries) {
      if (ways.size() >= most) return;
      Way way = start;
      way.entry = entry;
      add(way, true);
    }
  }
  for (const auto* certs : {&std::as_const(covering), &reached}) {
    for (const size_t own : owns) {
      if (!ways.empty()) return;
      Way way = start;
      way.own = own;
      way.rest = *certs;
      std::erase(way.rest, own);
      add(way, false);
    }
  }
}

std::vector<Way> Search::FindWays(const Signers& signers, TimeStamp* at, size_t most) const {
  std::vector<Way> ways;
  ForEachChoice(signers, at, [&](const std::vector<PublicKey*>& keys) {
    FindFor(keys, at, most, ways);
    return ways.empty();
  });
  return ways;
}

// The key itself; of a group each choice of as many as must agree, with each of them as the signer,
// up to a number of choices: what one member has of its own can make it the only signer. Those that
// are revoked nobody should ask.
void Search::ForEachChoice(
    const Signers& signers, TimeStamp* at,
    const std::function<bool(const std::vector<PublicKey*>&)>& goesOn) const {
  constexpr size_t kMostChoices = 200;
  std::vector<PublicKey*> asked;
  for (const auto& key : signers.keys) {
    if (!signers.IsGroup() || !IsRevoked(*key, at)) asked.push_back(key.get());
  }
  if (asked.size() < signers.k) return;
  std::vector<bool> chosen(asked.size());
  std::fill_n(chosen.begin(), signers.k, true);
  size_t choices = 0;
  do {
    std::vector<PublicKey*> keys;
    for (size_t i = 0; i < asked.size(); ++i) {
      if (chosen[i]) keys.push_back(asked[i]);
    }
    for (size_t i = 0; i < keys.size(); ++i) {
      if (!goesOn(keys) || ++choices == kMostChoices) return;
      std::rotate(keys.begin(), keys.begin() + 1, keys.end());
    }
  } while (std::prev_permutation(chosen.begin(), chosen.end()));
}

Signers Search::Agreeing(const Signers& signers, TimeStamp* at) const {
  Signers agreeing{{}, signers.k};
  std::set<PublicKey*> good;
  ForEachChoice(signers, at, [&](const std::vector<PublicKey*>& keys) {
    std::vector<Way> ways;
    FindFor(keys, at, 1, ways);
    if (!ways.empty()) good.insert(keys.begin(), keys.end());
    return true;
  });
  for (const auto& key : signers.keys) {
    if (good.count(key.get()) != 0) agreeing.keys.push_back(Ref<PublicKey>::Share(key.get()));
  }
  return agreeing;
}

Moments Search::MomentsOf(const Signers& signers) const {
  std::vector<PublicKey*> keys;
  for (const auto& key : signers.keys) keys.push_back(key.get());
  const std::vector<size_t> reached = keys_.Reach(keys);
  Moments moments;
  for (const size_t number : reached) moments.AddCert(keys_.CertOf(number));
  for (const AclEntry* entry : keys_.EntriesFor(keys, reached)) {
    moments.AddPeriod(entry->GetNotBefore(), entry->GetNotAfter());
  }
  moments.AddLists(holdings_.lists.get());
  return moments;
}

bool Search::MaySign(const Signers& signers, TimeStamp* at, std::vector<Way>& known) const {
  for (const Way& way : known) {
    if (Judge(way, at) == 0) return true;
  }
  std::vector<Way> ways = FindWays(signers, at, 1);
  known.insert(known.end(), ways.begin(), ways.end());
  return !ways.empty();
}

}  // namespace vesk2_command
