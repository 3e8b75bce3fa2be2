// SPDX-License-Identifier: Apache-2.0
// lists.cpp: what is wrong with the revocation lists of the store.
#include <sys/stat.h>

#include <cerrno>

#include "tools/vesk2/audit/checks.h"
#include "tools/vesk2/files/descriptor.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/stores/crl_store.h"

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;

int RequireMemory(int code) {
  if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
  return code;
}

// Whether a list counts, but for its period. One of another source's name is never looked at.
bool CheckVoucher(const Stored<CrlSequence>& each, SExpression* acls, Findings& findings) {
  CrlSequence& list = *each.object;
  const int own = RequireMemory(CheckIssuerWord(list));
  if (own != 0) {
    findings.Add("unverifiable", each.path, Reason(own));
    return false;
  }
  const int code = RequireMemory(list.VerifySelf(acls));
  if (code != 0) {
    findings.Add("unvouched", each.path, WhyNotVouched(list, code));
    return false;
  }
  const std::string why = WhyListUnusable(list, each.path, acls);
  if (!why.empty()) findings.Add("misplaced", each.path, why);
  return why.empty();
}

bool IsValidAt(CrlSequence& list, const TimeStamp& moment) {
  long first = moment.ToTime();
  long last = first;
  return list.VerifyValidity(&first, &last) == 0;
}

void CheckPeriod(const Stored<CrlSequence>& each, Findings& findings) {
  CrlSequence& list = *each.object;
  if (IsValidAt(list, *findings.soon())) return;
  const TimeStamp* const end = list.GetCert()->GetNotAfter();
  if (end == nullptr) {
    findings.Add("unusable", each.path,
                 "it has no end: it proves of nothing that it is not revoked");
  } else {
    (void)findings.AddEnd(each.path, "the list", end);
  }
}

// A source that an entry in force names, and of which no list is stored.
void CheckMissing(const Stored<AclEntry>& each, Findings& findings) {
  SExpression* const tag = each.object->GetTag();
  const TimeStamp* const end = each.object->GetNotAfter();
  if (!IsRevocationTag(tag) || (end != nullptr && end->IsBefore(findings.now()))) return;
  const std::string path = ListPath(tag);
  struct stat status = {};
  if (path.empty() || lstat(path.c_str(), &status) == 0 || !IsNothing(errno)) return;
  findings.Add(
      "no-list", each.path,
      "there is no list of its source " + TagText(tag) + ": nothing is known to be revoked");
}

}  // namespace

void CheckLists(const Stores& stores, Findings& findings) {
  const Sources sources(stores.acls.get());
  for (const Stored<CrlSequence>& each : stores.lists) {
    const Ref<SExpression> acls = sources.AclsFor(each.object->GetCert()->GetTag());
    if (CheckVoucher(each, acls.get(), findings)) CheckPeriod(each, findings);
  }
  for (const Stored<AclEntry>& each : stores.entries) CheckMissing(each, findings);
}

}  // namespace vesk2_command
