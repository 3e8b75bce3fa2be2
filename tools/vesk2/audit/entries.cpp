// SPDX-License-Identifier: Apache-2.0
// entries.cpp: what is wrong with the entries of the ACL store.
#include "tools/vesk2/audit/checks.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/objects/acl_file.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/stores/crl_store.h"

#include <vesk2/evidence.h>

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;
using ZvVesk2::Principal;
using ZvVesk2::Subject;
using ZvVesk2::ThresholdSubject;

// Why an entry that can be read is of no use; empty for one that is.
std::string WhyUnusable(AclEntry& entry) {
  const TimeStamp* const begin = entry.GetNotBefore();
  if (begin != nullptr && entry.GetNotAfter() != nullptr && begin->IsAfter(entry.GetNotAfter())) {
    return "it ends before it begins";
  }
  SExpression* const tag = entry.GetTag();
  if (!IsRevocationTag(tag)) return "";
  if (entry.GetSubject()->IsThresholdSubject()) {
    return "a revocation list has one issuer; a k-of-n can sign none";
  }
  return NamesFile(tag) ? "" : "its tag is too long to name a list of the store";
}

// The entry that decides whose lists of a source count is the last one.
void CheckOverruled(const Stored<AclEntry>& each, const Sources& sources, Findings& findings) {
  SExpression* const tag = each.object->GetTag();
  if (!IsRevocationTag(tag)) return;
  const Ref<SExpression> deciding = sources.AclsFor(tag);
  if (deciding->Count() < 2 || deciding->Last()->IsEqual(each.object.get())) return;
  findings.Add("overruled", each.path,
               "a later entry of the source " + TagText(tag) + " decides whose lists count");
}

// ---- Revoked keys ----

// The keys of entries, each with the file that names it. The library looks up subjects of
// certificates only: what an entry trusts stays trusted, whatever a list says.
class EntryKeys {
 public:
  explicit EntryKeys(const Stores& stores) : evidence_(nullptr) {
    for (const Stored<AclEntry>& each : stores.entries) Take(each);
    evidence_.SetEntries(stores.acls.get());
    evidence_.SetLists(stores.believed.get(), nullptr);
  }

  void Report(Findings& findings) {
    evidence_.SetRevocationTime(findings.now());
    Check(evidence_.MarkRevoked(), "judging revocation");
    for (size_t i = 0; i < paths_.size(); ++i) {
      if (evidence_.GetRevocationStatus(i) != Cert::KeyRevoked) continue;
      Subject& key = *evidence_.GetCert(i)->GetSubject();
      const CrlSequence* list = evidence_.GetRevocationList(i);
      StoreFinding& finding =
          findings.Add("revoked", paths_[i],
                       "trusts " + SubjectText(key) + ", which is revoked" +
                           (list != nullptr ? " by " + TagText(list->GetCert()->GetTag()) : "") +
                           "; no list takes back what an entry says");
      finding.when = Ref<TimeStamp>::Share(evidence_.GetRevokedSince(i));
    }
  }

 private:
  void Take(const Stored<AclEntry>& each) {
    Subject* const subject = each.object->GetSubject();
    auto* threshold = dynamic_cast<ThresholdSubject*>(subject);
    if (threshold == nullptr) return Add(each.path, subject);
    for (Subject* const member : MembersOf(*threshold)) Add(each.path, member);
  }

  // The library is asked about subjects of certificates: this one says nothing else.
  void Add(const std::string& path, DExpression* key) {
    auto* const principal = dynamic_cast<Principal*>(key);
    if (principal == nullptr) return;
    const Ref<Cert> cert(new Cert(nullptr));
    Check(cert->Set(principal, principal, false, nullptr, nullptr, nullptr, nullptr, nullptr),
          "building a certificate");
    Check(evidence_.AddCert(cert.get(), nullptr, 0), "judging revocation");
    paths_.push_back(path);
  }

  ZvVesk2::Evidence evidence_;
  std::vector<std::string> paths_;
};

void CheckEntryItself(const Stored<AclEntry>& each, const Sources& sources, Findings& findings) {
  AclEntry& entry = *each.object;
  try {
    CheckEntry(entry, each.path);
  } catch (const Trouble& trouble) {
    findings.Add("stops-all", each.path,
                 "it would stop every verification: " + Reason(trouble.code));
    return;
  }
  if (findings.AddEnd(each.path, "the entry", entry.GetNotAfter())) return;
  const std::string why = WhyUnusable(entry);
  if (!why.empty()) findings.Add("unusable", each.path, why);
  CheckOverruled(each, sources, findings);
}

}  // namespace

void CheckEntries(const Stores& stores, Findings& findings) {
  if (stores.acls->Count() < 2) {
    findings.Add("no-entry", AclDirectory(),
                 "there is no entry: nothing is trusted on this machine");
  }
  const Sources sources(stores.acls.get());
  for (const Stored<AclEntry>& each : stores.entries) CheckEntryItself(each, sources, findings);
  EntryKeys(stores).Report(findings);
}

}  // namespace vesk2_command
