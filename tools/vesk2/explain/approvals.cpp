// SPDX-License-Identifier: Apache-2.0
// approvals.cpp: who has approved.
#include "tools/vesk2/explain/approvals.h"

#include <set>

#include "tools/vesk2/explain/effort.h"
#include "tools/vesk2/explain/policy.h"
#include "tools/vesk2/objects/acl_file.h"

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Subject;
using ZvVesk2::ThresholdSubject;

class Finder {
 public:
  Finder(const Question& question, const Evidence& evidence)
      : question_(question), evidence_(evidence), policy_(question, evidence) {
    for (const CertEvidence& each : evidence.certs) {
      issuers_.insert(Fingerprint(*each.cert->GetIssuer()));
    }
  }

  Approvals Find(const EntryEvidence& entry, ThresholdSubject& several) const {
    Approvals found{&entry, several.GetK(), several.GetN()};
    for (Subject* const member : MembersOf(several)) {
      std::string name = Fingerprint(*member);
      // Who issued nothing has approved nothing.
      if (issuers_.count(name) != 0 && Approves(*entry.entry, *member)) {
        found.approved.push_back(std::move(name));
      } else if (policy_.IsRevoked(member)) {
        found.revoked.push_back(std::move(name));
      } else {
        found.awaited.push_back(std::move(name));
      }
    }
    return found;
  }

 private:
  bool Approves(const AclEntry& entry, Subject& member) const {
    SpendEffort(*evidence_.proved);
    ZvVesk2::Evidence alone(nullptr);
    Check(alone.Copy(*evidence_.proved), "looking for approvals");
    const Request* const request = question_.request;
    SExpression* const tag = request != nullptr ? request->tag.get() : entry.GetTag();
    const Ref<AclEntry> trusted =
        BuildEntry({Ref<Subject>::Share(&member), true, Ref<SExpression>::Share(tag)});
    const Ref<SExpression> entries = ListOf({trusted.get()}, "acl");
    alone.SetGrantingEntries(entries.get());
    if (request == nullptr) return GrantsAnything(alone);
    for (const Request::Member& each : request->members) {
      if (!Grants(alone, each.tag.get())) return false;
    }
    return true;
  }

  static bool Grants(ZvVesk2::Evidence& evidence, SExpression* tag) {
    const int code = evidence.Prove(tag);
    if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
    return code == 0;
  }

  static bool GrantsAnything(ZvVesk2::Evidence& evidence) {
    Ref<SExpression> tag;
    Ref<SExpression> notBefore;
    Ref<SExpression> notAfter;
    const int code = evidence.Grants(tag.Out(), notBefore.Out(), notAfter.Out());
    if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
    return code == 0 && tag && Grants(evidence, tag.get());
  }

  const Question& question_;
  const Evidence& evidence_;
  Policy policy_;
  std::set<std::string> issuers_;
};

std::string Joined(const std::vector<std::string>& words, const std::string& last) {
  std::string text;
  for (size_t i = 0; i < words.size(); ++i) {
    if (i > 0) text += i + 1 == words.size() ? last : ", ";
    text += words[i];
  }
  return text;
}

}  // namespace

std::vector<Approvals> FindApprovals(const Question& question, const Evidence& evidence) {
  std::vector<Approvals> found;
  const Finder finder(question, evidence);
  for (const EntryEvidence& each : evidence.entries) {
    auto* several = dynamic_cast<ThresholdSubject*>(each.entry->GetSubject());
    if (several == nullptr || several->GetK() < 2 || !each.relevant) continue;
    found.push_back(finder.Find(each, *several));
  }
  return found;
}

std::string ApprovalsText(const Approvals& approvals) {
  const size_t count = approvals.approved.size();
  std::string text = std::to_string(count) + " of " + Plural(approvals.k, "approval");
  if (count > 0) text += ", by " + Joined(approvals.approved, " and ");
  if (approvals.Missing() == 0) return text;
  text += "; " + std::to_string(approvals.Missing()) +
          (approvals.Missing() == 1 ? " is missing" : " are missing");
  const auto& awaited = approvals.awaited;
  if (awaited.empty()) return text + ", and no other key could approve";
  return text + ", and that of " + Joined(awaited, " or ") + " would count";
}

Json ApprovalsJson(const Approvals& approvals) {
  return {{"entry", Escape(approvals.entry->file)},
          {"k", approvals.k},
          {"n", approvals.n},
          {"approved", approvals.approved},
          {"missing", approvals.Missing()},
          {"would_count", approvals.awaited},
          {"revoked", approvals.revoked}};
}

}  // namespace vesk2_command
