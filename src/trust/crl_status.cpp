// SPDX-License-Identifier: Apache-2.0
// Asking revocation lists whether an object was revoked. One RevocationLists answers all questions
// of a call. Loading hashes the tag of each list once; the first question to a source proves its
// lists and sorts their items; each further one is a few digests and a binary search. So n
// certificates and m items cost about n + m log m, whatever who wrote them had in mind.
#include <vesk2/crl.h>

#include "src/trust/lists.h"
#include "src/trust/revocation_lists.h"

namespace ZvVesk2 {
namespace {

// list2 names keys, list1 certificates.
SExpression* ItemsOf(CrlSequence* sequence, bool critical) {
  return critical ? sequence->GetCrl()->GetList2() : sequence->GetCrl()->GetList1();
}

// Whether an item revokes in a period that starts at `notBefore` (null: whenever). Dates that
// cannot be compared count. A comparison with what is no stamp would say anything; in doubt it is
// revoked.
bool Counts(const ItemIndex::Item& item, const TimeStamp* notBefore) {
  if (item.from == nullptr || notBefore == nullptr || !IsStamp(notBefore)) return true;
  return item.from->IsBeforeOrEqual(notBefore);
}

}  // namespace

// Lists without a tag, or with one that cannot be hashed, are left out: no entry can vouch for
// them.
int RevocationLists::Load() {
  if (loaded_ || store_ == nullptr) return 0;
  const size_t count = store_->Count();
  VESK2_TRY(lists_.Reserve(count));
  for (auto it = store_->Begin(); it; it.Next()) {
    auto* const sequence = dynamic_cast<CrlSequence*>(it.Value());
    // A sequence whose import failed has no list.
    if (sequence == nullptr || sequence->First() == nullptr) continue;
    VESK2_TRY(lists_.Add(sequence->GetCert()->GetTag(), {sequence, Proof::kUnknown}));
  }
  lists_.Sort();
  // A place for each list, as each may be of another source. Only as many are filled as sources are
  // asked about.
  for (auto& answers : bySource_) {
    answers.reset(TryNewArray<Answers>(count));
    VESK2_REQUIRE(answers != nullptr, VESK2_ERR_MEM_ALLOC);
  }
  loaded_ = true;
  return 0;
}

// Only when there is something to prove: lists that were proved before need no entry.
int RevocationLists::LoadRoots() {
  if (rootsLoaded_ || acls_ == nullptr) return 0;
  VESK2_TRY(roots_.Reserve(acls_->Count()));
  for (auto it = acls_->Begin(); it; it.Next()) {
    auto* const entry = dynamic_cast<AclEntry*>(it.Value());
    if (entry != nullptr) VESK2_TRY(roots_.Add(entry->GetTag(), entry));
  }
  roots_.Sort();
  rootsLoaded_ = true;
  return 0;
}

// Only the last entry of a tag decides: the list is proved against that one alone. A proof that was
// made before counts, by whichever entries: an Evidence takes it back first.
int RevocationLists::Prove(Source& list) {
  if (list.value.proof != Proof::kUnknown) return 0;
  CrlSequence* const sequence = list.value.sequence;
  bool holds = sequence->GetCrl()->GetIssuerTag() != nullptr;
  if (!holds) {
    VESK2_TRY(LoadRoots());
    const auto roots = roots_.Find(list.digest);
    Ref<SExpression> last(TryNew<SExpression>(sequence->GetContext()));
    VESK2_REQUIRE(last, VESK2_ERR_MEM_ALLOC);
    if (!roots.empty()) VESK2_TRY(AppendShared(last.get(), roots.back().value));
    const int code = sequence->VerifySelf(last.get());
    // A list that could not be proved for want of memory would let its keys go.
    VESK2_REQUIRE(!LacksMemory(code), VESK2_ERR_MEM_ALLOC);
    holds = code == 0;
  }
  list.value.proof = holds ? Proof::kHolds : Proof::kFails;
  return 0;
}

// Only a proved list counts, also for its end: a forged one must not stand in for one that has run
// out. One that names nothing counts as absent. A list without items of the asked kind is not even
// proved: a list of keys alone covers no certificate. (`count` is with the keyword.)
int RevocationLists::Collect(Answers& answers, bool critical, std::span<Source> lists) {
  size_t items = 0;
  for (Source& list : lists) {
    const size_t count = ItemsOf(list.value.sequence, critical)->Count();
    if (count < 2) continue;
    VESK2_TRY(Prove(list));
    if (list.value.proof == Proof::kHolds) items += count;
  }
  // Counted first and then filled, so that nothing grows by what a stranger wrote.
  VESK2_TRY(answers.items.Reserve(items));
  for (const Source& list : lists) {
    SExpression* const named = ItemsOf(list.value.sequence, critical);
    if (list.value.proof != Proof::kHolds || named->Count() < 2) continue;
    CrlSequence* const sequence = list.value.sequence;
    answers.items.Add(named, sequence);
    const TimeStamp* const end = sequence->GetCert()->GetNotAfter();
    // A list without an end proves nothing about what it does not name.
    if (end == nullptr || (answers.latest != nullptr && !end->IsAfter(answers.latest))) continue;
    answers.latest = end;
    answers.last = sequence;
  }
  answers.items.Sort();
  answers.ready = true;
  return 0;
}

// Null for a source that no list is of. The place of a source among the answers is that of its
// first list, which no other source can have.
int RevocationLists::Find(Answers*& answers, bool critical, SExpression* tag) {
  answers = nullptr;
  VESK2_TRY(Load());
  std::span<Source> lists = lists_.All();
  Answers* found = &all_[critical ? 1 : 0];
  if (tag != nullptr) {
    bool hashed = false;
    TagDigest digest;
    VESK2_TRY(DigestTag(hashed, digest, tag));
    lists = hashed ? lists_.Find(digest) : std::span<Source>();
    if (lists.empty()) return 0;
    found = &bySource_[critical ? 1 : 0][static_cast<size_t>(&lists[0] - &lists_.All()[0])];
  }
  if (!found->ready) VESK2_TRY(Collect(*found, critical, lists));
  answers = found;
  return 0;
}

// No list is no refusal: which sources must speak is said by certificates, and none asks for a list
// of keys. So a list that is lost lets go the keys on it; the store is kept by its administrator.
int RevocationLists::AskCritical(Decision& decision, SExpression* tag, SExpression* object) {
  decision = {};
  VESK2_REQUIRE(object != nullptr, VESK2_ERR_PARAM_NULL);
  Answers* answers = nullptr;
  VESK2_TRY(Find(answers, true, tag));
  if (answers == nullptr) return 0;
  const ItemIndex::Item* item = nullptr;
  VESK2_TRY(answers->items.Find(item, object));
  if (item == nullptr) return 0;
  decision = {item->list, item->from};
  return VESK2_ERR_KEY_REVOKED;
}

// Revoked comes before everything: an item of a list that has ended still names its certificate.
int RevocationLists::AskNonCritical(Decision& decision, SExpression* tag, SExpression* object,
                                    const TimeStamp* notBefore) {
  decision = {};
  VESK2_REQUIRE(object != nullptr, VESK2_ERR_PARAM_NULL);
  Answers* answers = nullptr;
  VESK2_TRY(Find(answers, false, tag));
  VESK2_REQUIRE(answers != nullptr, VESK2_ERR_CRL_NOT_FOUND);
  decision.list = answers->last;
  const ItemIndex::Item* item = nullptr;
  VESK2_TRY(answers->items.Find(item, object));
  if (item != nullptr && Counts(*item, notBefore)) {
    decision = {item->list, item->from};
    return VESK2_ERR_CERT_REVOKED;
  }
  // Some list was current in the period if the latest end is not before the period's start. Asked
  // after the items, so that a list without an end revokes although it covers nothing.
  VESK2_REQUIRE(answers->latest != nullptr, VESK2_ERR_CRL_NOT_FOUND);
  return notBefore != nullptr && answers->latest->IsBefore(notBefore) ? VESK2_ERR_NOT_AFTER : 0;
}

// Whatever fails for one certificate leaves that one undetermined, and the others are asked: an odd
// certificate must not decide for the rest.
int RevocationLists::MarkAll(SExpression* certs, const TimeStamp* notBefore) {
  VESK2_REQUIRE(certs != nullptr, VESK2_ERR_PARAM_NULL);
  for (auto it = certs->Begin(); it; it.Next()) {
    auto* const cert = dynamic_cast<Cert*>(it.Value());
    if (cert == nullptr) continue;
    Decision decision;
    const int code = Mark(decision, cert, notBefore);
    VESK2_REQUIRE(!LacksMemory(code), VESK2_ERR_MEM_ALLOC);
  }
  return 0;
}

int CrlSequence::CheckStatusCritical(SExpression* aclEntries, SExpression* store, SExpression* tag,
                                     SExpression* object) {
  RevocationLists::Decision decision;
  return RevocationLists(aclEntries, store).AskCritical(decision, tag, object);
}

int CrlSequence::CheckStatusNonCritical(SExpression* aclEntries, SExpression* store,
                                        SExpression* tag, SExpression* object, TimeStamp* notBefore,
                                        TimeStamp*) {
  RevocationLists::Decision decision;
  return RevocationLists(aclEntries, store).AskNonCritical(decision, tag, object, notBefore);
}

int CrlSequence::MarkRevoked(SExpression* certs, SExpression* aclEntries, SExpression* store,
                             TimeStamp* notBefore, TimeStamp*) {
  return RevocationLists(aclEntries, store).MarkAll(certs, notBefore);
}

}  // namespace ZvVesk2
