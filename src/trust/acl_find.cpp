// SPDX-License-Identifier: Apache-2.0
// The questions that are put to the ACL store. All of them walk its files in the same way, hold one
// entry at a time, and let the first accepted one decide; they differ in what they accept. None of
// them decides about a chain: that is the reduction's work, which sees all entries at once. They
// are for who looks for an entry, and answer as programs have come to expect, the ends of periods
// included.
//
// An answer costs a read and a parse of each file up to the one that decides, and one tag
// comparison each, with a budget of its own (limits.h).
#include <vesk2/acl_entry.h>
#include <vesk2/cert.h>

#include "src/trust/lists.h"
#include "src/trust/scan.h"

namespace ZvVesk2 {
namespace {

// Hands out the readable entries of the store, one at a time. A file that is malformed is passed
// over; one that was not read for want of memory, or because another process held it, ends the scan
// with that code, so that "no such entry" is never said of an entry that is there (see Scan).
class EntryScan {
 public:
  explicit EntryScan(Vesk2ContextStruct* ctx) : context_(ctx) {}

  [[nodiscard]] int Open() {
    return scan_.OpenStore(AclEntry::DirectoryName(true), "*.acl", StorageGlobal);
  }
  // Next moves on to another entry; false at the end, and when the scan was ended.
  [[nodiscard]] bool Next() {
    while (scan_.Next()) {
      entry_.Reset(TryNew<AclEntry>(context_));
      const int read = entry_ ? scan_.Read(*entry_, VESK2_ERR_FILE_OPEN) : VESK2_ERR_MEM_ALLOC;
      if (scan_.Took(read)) return true;
    }
    return false;
  }
  AclEntry* Entry() const { return entry_.get(); }
  // See Scan.
  [[nodiscard]] int Result(int notFound) const { return scan_.Result(notFound); }

 private:
  Vesk2ContextStruct* context_;
  Scan scan_;
  Ref<AclEntry> entry_;
};

// One member of a k-of-n is enough here: who asks is told k, and counts.
bool IsGrantee(AclEntry* entry, Principal* principal) {
  auto* threshold = dynamic_cast<ThresholdSubject*>(entry->GetSubject());
  return threshold != nullptr ? threshold->HasMember(principal)
                              : entry->GetSubject()->IsEqual(principal);
}

// Whether an entry holds at `from` (may be null: not asked) and now. The two look-ups differ at the
// very ends of the period, and keep to what each has always answered: here an entry has ended at
// its not-after, and not begun at its not-before when that is now. Both ends are compared with the
// start of the caller's period; its end plays no part.
bool HoldsStrictly(const AclEntry* entry, const TimeStamp* from, const TimeStamp* now) {
  const TimeStamp* const begin = entry->GetNotBefore();
  const TimeStamp* const end = entry->GetNotAfter();
  if (begin != nullptr && from != nullptr && !begin->IsBeforeOrEqual(from)) return false;
  if (end != nullptr && from != nullptr && !from->IsBefore(end)) return false;
  if (begin != nullptr && begin->IsAfterOrEqual(now)) return false;
  return end == nullptr || !end->IsBeforeOrEqual(now);
}

// The same with the ends included.
bool HoldsInclusively(const AclEntry* entry, const TimeStamp* from, const TimeStamp* now) {
  const TimeStamp* const begin = entry->GetNotBefore();
  const TimeStamp* const end = entry->GetNotAfter();
  if (begin != nullptr && from != nullptr && from->IsBefore(begin)) return false;
  if (end != nullptr && from != nullptr && !from->IsBefore(end)) return false;
  if (begin != nullptr && begin->IsAfter(now)) return false;
  return end == nullptr || !end->IsBefore(now);
}

// The answer for an accepted entry: both values are successes. Callers show an exact match
// differently from one by a wider entry.
[[nodiscard]] int Granted(SExpression* tag, AclEntry* entry) {
  return tag->IsEqual(entry->GetTag()) ? VESK2_ERR_AUTH_TAGS_ARE_EQUAL : 0;
}

// Asks whether each signer is a member too. The answers do not count: the one member that was asked
// about is enough, and whoever asks counts to k.
void WalkSigners(ThresholdSubject* threshold, SExpression* signers) {
  for (auto it = signers->Begin(); it; it.Next()) {
    auto* cert = dynamic_cast<Cert*>(it.Value());
    auto* signer = cert != nullptr ? dynamic_cast<Principal*>(cert->GetSubject()) : nullptr;
    if (signer != nullptr) static_cast<void>(threshold->HasMember(signer));
  }
}

}  // namespace

// The first entry that passes decides, in byte order of the file names, so that an administrator
// can tell which one it is. The caller's end is not looked at: see HoldsStrictly.
int AclEntry::Find(Principal* principal, SExpression* tag, TimeStamp* notBefore, TimeStamp*,
                   unsigned int& k) {
  VESK2_REQUIRE(tag != nullptr, VESK2_ERR_PARAM_NULL);
  k = 0;
  EntryScan scan(tag->GetContext());
  VESK2_TRY(scan.Open());
  Ref<TimeStamp> now;
  VESK2_TRY(MakeNow(now, tag->GetContext()));

  // Which of the two refusals it is: "you are not known here" or "not for this".
  bool principalSeen = false;
  while (scan.Next()) {
    AclEntry* const entry = scan.Entry();
    if (principal != nullptr) {
      if (!IsGrantee(entry, principal)) continue;
      principalSeen = true;
    }
    if (!entry->GetPropagate() || !tag->IsSubset(entry->GetTag())) continue;
    if (!HoldsStrictly(entry, notBefore, now.get())) continue;

    auto* threshold = dynamic_cast<ThresholdSubject*>(entry->GetSubject());
    if (threshold != nullptr) k = threshold->GetK();
    return Granted(tag, entry);
  }
  return scan.Result(principalSeen ? VESK2_ERR_ACL_ENTRY_NOT_FOUND : VESK2_ERR_ACL_KEY_NOT_FOUND);
}

// Find for one member of a group. The order of the tests is that of Find, and of the two refusals
// as well.
int AclEntry::FindThresholdEntry(Principal* principal, SExpression* signers, SExpression* tag,
                                 TimeStamp* notBefore, TimeStamp*, unsigned int& k) {
  VESK2_REQUIRE(principal != nullptr && tag != nullptr, VESK2_ERR_PARAM_NULL);
  k = 0;
  EntryScan scan(tag->GetContext());
  VESK2_TRY(scan.Open());
  Ref<TimeStamp> now;
  VESK2_TRY(MakeNow(now, tag->GetContext()));

  bool principalSeen = false;
  while (scan.Next()) {
    AclEntry* const entry = scan.Entry();
    auto* threshold = dynamic_cast<ThresholdSubject*>(entry->GetSubject());
    if (threshold == nullptr || !threshold->HasMember(principal)) continue;
    principalSeen = true;
    if (signers != nullptr) WalkSigners(threshold, signers);
    if (!entry->GetPropagate() || !tag->IsSubset(entry->GetTag())) continue;
    if (!HoldsInclusively(entry, notBefore, now.get())) continue;

    k = threshold->GetK();
    return Granted(tag, entry);
  }
  return scan.Result(principalSeen ? VESK2_ERR_ACL_ENTRY_NOT_FOUND : VESK2_ERR_ACL_KEY_NOT_FOUND);
}

// Equality and not containment: a source of revocation lists is one tag, and a wider entry is no
// source of it. No time is asked.
int AclEntry::Find(SExpression* tag) {
  VESK2_REQUIRE(tag != nullptr, VESK2_ERR_PARAM_NULL);
  EntryScan scan(tag->GetContext());
  VESK2_TRY(scan.Open());
  while (scan.Next()) {
    if (scan.Entry()->GetPropagate() && tag->IsEqual(scan.Entry()->GetTag())) return 0;
  }
  return scan.Result(VESK2_ERR_ACL_ENTRY_NOT_FOUND);
}

// Whether anything here would cover the tag, now or at another time: what an editor of entries asks
// before it adds one.
int AclEntry::FindSuperSet(SExpression* tag, bool needPropagate) {
  VESK2_REQUIRE(tag != nullptr, VESK2_ERR_INVALID_PARAM);
  EntryScan scan(tag->GetContext());
  VESK2_TRY(scan.Open());
  while (scan.Next()) {
    if (needPropagate && !scan.Entry()->GetPropagate()) continue;
    if (tag->IsSubset(scan.Entry()->GetTag())) return 0;
  }
  return scan.Result(VESK2_ERR_ACL_ENTRY_NOT_FOUND);
}

int AclEntry::FindRevocationEntry(SExpression* revocationTag) {
  VESK2_REQUIRE(revocationTag != nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(EndsInRevoke(revocationTag), VESK2_ERR_INVALID_REVOCATION_TAG);
  // Who may grant what lies between the keyword and (revoke ...) may take it back.
  Ref<SExpression> tag;
  VESK2_TRY(MakeTag(tag, revocationTag, true));
  return Find(tag.get());
}

}  // namespace ZvVesk2
