// SPDX-License-Identifier: Apache-2.0
// change.cpp: the moments at which an answer can change.
#include "tools/vesk2/authority/change.h"

#include <vesk2/acl_entry.h>
#include <vesk2/crl.h>
#include <vesk2/explanation.h>
#include <vesk2/wording.h>

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::CrlSequence;
using ZvVesk2::Explanation;

// Stamps in files hold whatever their writer put there.
std::optional<long> SecondOf(const TimeStamp* stamp) {
  if (stamp == nullptr) return {};
  const std::string text(BytesOf(*stamp));
  const Ref<TimeStamp> parsed(new TimeStamp(nullptr));
  if (parsed->Set(text.c_str(), false) != 0 || BytesOf(*parsed) != text) return {};
  return parsed->ToTime();
}

// The dates of certificates that a list announces: a revoked key is revoked always.
void AddItems(const SExpression& items, Moments& moments) {
  for (const SExpression* const item : ItemsOf<SExpression>(&items)) {
    moments.AddPeriod(dynamic_cast<TimeStamp*>(item->Last()), nullptr);
  }
}

bool Turns(const TimeStamp* notBefore, const TimeStamp* notAfter, long second) {
  const std::optional<long> begin = SecondOf(notBefore);
  const std::optional<long> end = SecondOf(notAfter);
  return begin == second || (end && *end + 1 == second);
}

// How well a reason accounts for a change at that second.
int Fitness(const Explanation::Reason& reason, const ZvVesk2::Evidence& evidence, long second) {
  switch (reason.kind) {
    case Explanation::OutOfPeriod: {
      if (reason.entry != nullptr) {
        return Turns(reason.entry->GetNotBefore(), reason.entry->GetNotAfter(), second) ? 3 : 1;
      }
      if (reason.cert == Explanation::kNone) return 1;
      const ZvVesk2::Cert& cert = *evidence.GetCert(reason.cert);
      return Turns(cert.GetNotBefore(), cert.GetNotAfter(), second) ? 3 : 1;
    }
    case Explanation::Revoked:
      return SecondOf(evidence.GetRevokedSince(reason.cert)) == second ? 3 : 2;
    case Explanation::Undetermined:
      return 2;
    default:
      return 0;
  }
}

std::string PeriodCause(const TimeStamp* notBefore, long second) {
  return SecondOf(notBefore) == second ? " begins" : " ends";
}

std::string TextOf(const Explanation::Reason& reason, const Cause& cause,
                   const ZvVesk2::Evidence& evidence, long second) {
  if (reason.kind == Explanation::OutOfPeriod && reason.entry != nullptr) {
    return "ACL entry " + cause.entry + PeriodCause(reason.entry->GetNotBefore(), second);
  }
  if (cause.certificate.empty()) return reason.text;
  const std::string name = "certificate " + cause.certificate;
  if (reason.kind == Explanation::OutOfPeriod) {
    return name + PeriodCause(evidence.GetCert(reason.cert)->GetNotBefore(), second);
  }
  if (reason.kind == Explanation::Revoked) return name + " is revoked from then on";
  if (reason.kind == Explanation::Undetermined && !cause.source.empty()) {
    return "the list of " + cause.source + " ends, which tells whether " + name + " is revoked";
  }
  return reason.text;
}

}  // namespace

int JudgeMembers(ZvVesk2::Evidence& evidence, const Request& request) {
  int code = evidence.Judge(request.members.at(0).tag.get());
  for (size_t i = 1; i < request.members.size() && code == 0; ++i) {
    code = evidence.Prove(request.members[i].tag.get());
  }
  if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
  return code;
}

Ref<TimeStamp> StampOf(long second) {
  Ref<TimeStamp> stamp(new TimeStamp(nullptr));
  Check(stamp->Set(second), "a time");
  return stamp;
}

void Moments::AddPeriod(const TimeStamp* notBefore, const TimeStamp* notAfter) {
  const std::optional<long> begin = SecondOf(notBefore);
  const std::optional<long> end = SecondOf(notAfter);
  if (begin) seconds_.insert(*begin);
  if (end) seconds_.insert(*end + 1);  // the last second belongs to it
}

void Moments::AddCert(const ZvVesk2::Cert& cert) {
  AddPeriod(cert.GetNotBefore(), cert.GetNotAfter());
}

void Moments::AddEntries(const SExpression* entries) {
  for (const AclEntry* const entry : ItemsOf<AclEntry>(entries)) {
    AddPeriod(entry->GetNotBefore(), entry->GetNotAfter());
  }
}

void Moments::AddLists(const SExpression* lists) {
  for (const CrlSequence* const list : ItemsOf<CrlSequence>(lists)) {
    if (list->First() == nullptr) continue;
    AddPeriod(nullptr, list->GetCert()->GetNotAfter());
    AddItems(*list->GetCrl()->GetList1(), *this);
  }
}

std::optional<long> Moments::FirstChange(long from,
                                         const std::function<bool(TimeStamp*)>& answer) const {
  const bool now = answer(StampOf(from).get());
  constexpr long kLast = 253402300799;  // the year 9999: no stamp is later
  for (auto it = seconds_.upper_bound(from); it != seconds_.end() && *it <= kLast; ++it) {
    if (answer(StampOf(*it).get()) != now) return *it;
  }
  return {};
}

Cause FindCause(ZvVesk2::Evidence& refused, const Request& request, long second,
                const std::vector<std::string>& places) {
  const int code = JudgeMembers(refused, request);
  Explanation why(nullptr);
  Check(why.Explain(refused, code, request.tag.get(), MemberList(request).get()), "explaining");
  if (why.CountReasons() == 0) return {"combination", CodeWords(code), "", "", ""};
  size_t best = 0;
  for (size_t i = 1; i < why.CountReasons(); ++i) {
    const int fits = Fitness(why.GetReason(i), refused, second);
    if (fits > Fitness(why.GetReason(best), refused, second)) best = i;
  }
  const Explanation::Reason& reason = why.GetReason(best);
  Cause cause{Explanation::Word(reason.kind), "", "", "", ""};
  if (reason.cert < places.size()) cause.certificate = places[reason.cert];
  if (reason.entry != nullptr) cause.entry = Owned(ZvVesk2::Wording::OfEntry(reason.entry));
  if (reason.source != nullptr) cause.source = TagText(reason.source);
  cause.text = TextOf(reason, cause, refused, second);
  return cause;
}

Json CauseJson(const Cause& cause) {
  return {{"kind", cause.kind},
          {"text", cause.text},
          {"certificate", OrNull(cause.certificate)},
          {"entry", OrNull(cause.entry)},
          {"source", OrNull(cause.source)}};
}

}  // namespace vesk2_command
