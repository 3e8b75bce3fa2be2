// authority.cpp: following authority from the ACL to the end of a chain.
#include "tools/vesk2/explain/authority.h"

#include <algorithm>

#include "tools/vesk2/explain/effort.h"
#include "tools/vesk2/explain/hypothesis.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/verify.h>

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;
using ZvVesk2::ThresholdSubject;

// The principals along a chain: every issuer, and whom the first certificate is for.
std::vector<DExpression*> Principals(const Evidence& evidence) {
  std::vector<DExpression*> principals;
  for (const CertEvidence& each : evidence.certs) principals.push_back(each.cert->GetIssuer());
  if (!evidence.certs.empty()) principals.push_back(evidence.certs[0].cert->GetSubject());
  return principals;
}

class Search {
 public:
  Search(const Question& question, const Evidence& evidence)
      : question_(question), evidence_(evidence) {}

  void Signatures() {
    for (size_t i = 0; i < evidence_.certs.size(); ++i) {
      const int code = evidence_.certs[i].code;
      if (code != 0) Add("signature", Name(i) + ": " + Reason(code));
    }
  }

  void Order() {
    if (!question_.manifest || evidence_.certs.empty()) return;
    if (!CertAt(0).GetSubject()->IsHash()) {
      return Add("order", Name(0) + " is not for the digest of a manifest");
    }
    ZvVesk2::Principal* signer = CertAt(0).GetIssuer();
    if (evidence_.certs.size() < 2 || CertAt(1).GetSubject()->IsEqual(signer)) return;
    Add("order", Name(1) + " is for " + SubjectText(*CertAt(1).GetSubject()) +
                     ", not for the signer " + Fingerprint(*signer));
  }

  void Content() {
    if (!evidence_.damage.empty()) {
      Add("content", Escape(question_.file) + ": " + evidence_.damage);
    }
    if (!evidence_.certs.empty()) {
      Add("content", Name(0) + " is for another version, time or listing");
    }
  }

  void Revocations() {
    const std::vector<int32_t> states = RevocationStates(evidence_);
    for (size_t i = 0; i < states.size(); ++i) {
      if (states[i] == Cert::RevokedByCrl) Add("revoked", Name(i) + " is revoked");
      if (states[i] == Cert::KeyRevoked) {
        Add("key-revoked",
            Name(i) + " is for a revoked key, " + SubjectText(*CertAt(i).GetSubject()));
      }
      if (states[i] != Cert::Undetermined) continue;
      SExpression* element = CertAt(i).GetRevocationElement();
      Add("undetermined",
          Name(i) + ": no current revocation list tells whether it is revoked" +
              (element != nullptr ? "; its source is " + SourceText(*element) : ""));
    }
  }

  void Certificates() {
    for (size_t i = 0; i < evidence_.certs.size(); ++i) {
      const Cert& cert = CertAt(i);
      Period(Name(i), cert.GetNotBefore(), cert.GetNotAfter());
      Tag(Name(i), cert.GetTag());
      // A manifest's first speaks for the content, and the second is used as if it could be passed
      // on.
      if (i <= (question_.manifest ? 1U : 0U)) continue;
      if (!Leads(i)) {
        Add("link", Name(i) + " is for " + SubjectText(*cert.GetSubject()) +
                        ", which issued no certificate of this chain");
      } else if (!cert.GetPropagate()) {
        Add("propagate", Name(i) + " does not let its subject pass the grant on (no --propagate)");
      }
    }
    Conflicts();
  }

  // ACL entries that name a key of the chain and do not help; none of it when one does.
  void Roots() {
    const std::vector<Loss> before = losses_;
    bool named = false;
    for (const EntryEvidence& each : evidence_.entries) {
      if (!IsRelevant(each, evidence_)) continue;
      named = true;
      const size_t count = losses_.size();
      Root(each);
      if (losses_.size() == count) {
        losses_ = before;
        return;
      }
    }
    if (!named) {
      Add("no-entry",
          "no ACL entry in " + Stores() + " names a key of this chain:" + PrincipalTexts());
    }
  }

  // What the chain does grant, beside what was asked for.
  void Rest() {
    const Granted granted = WhatIsGranted(question_, evidence_);
    if (granted.tag) {
      std::string limits;
      if (const std::string from = LimitText(granted.notBefore); !from.empty()) {
        limits += " from " + from;
      }
      if (const std::string to = LimitText(granted.notAfter); !to.empty()) limits += " until " + to;
      return Add("combination", "the chain grants " + TagText(granted.tag.get()) + limits +
                                    ", asked was " + Request() + " " +
                                    PeriodText(evidence_.first, evidence_.last));
    }
    if (losses_.empty()) {
      Add("combination",
          "the certificates and the ACL entries do not combine to what was asked, " + Request());
    }
  }

  // Credentials that the reduction cannot read; one of them is enough to stop it.
  void Unreadable() {
    for (size_t i = 0; i < evidence_.certs.size(); ++i) {
      const int code = TryReduction("sequence", &CertAt(i));
      if (code < 0) Add("unreadable", Name(i) + ": " + Reason(code));
    }
    for (const EntryEvidence& each : evidence_.entries) {
      const int code = TryReduction("acl", each.entry.get());
      if (code < 0) Add("unreadable", EntryName(each) + ": " + Reason(code));
    }
  }

  std::vector<Loss> Take() { return std::move(losses_); }

 private:
  void Add(const std::string& kind, const std::string& text) { losses_.push_back({kind, text}); }
  Cert& CertAt(size_t index) const { return *evidence_.certs[index].cert; }
  std::string Name(size_t index) const { return CertName(evidence_, index); }
  std::string Request() const { return TagText(question_.request->tag.get()); }

  std::string Stores() const {
    const std::string& extra = question_.aclDirectory;
    return Escape(AclDirectory()) + (extra.empty() ? "" : " or " + Escape(extra));
  }

  std::string Asked() const {
    if (evidence_.first != nullptr && evidence_.first == evidence_.signedAt.get()) {
      return "the manifest was signed at " + StampText(*evidence_.first);
    }
    return "asked was " + PeriodText(evidence_.first, evidence_.last);
  }

  void Period(const std::string& name, const TimeStamp* notBefore, const TimeStamp* notAfter) {
    if (notAfter != nullptr && notAfter->IsBefore(evidence_.first)) {
      Add("period", name + " was valid until " + StampText(*notAfter) + ", " + Asked());
    }
    if (notBefore != nullptr && notBefore->IsAfter(evidence_.last)) {
      Add("period", name + " is not valid before " + StampText(*notBefore) + ", " + Asked());
    }
  }

  void Tag(const std::string& name, SExpression* tag) {
    for (const auto& member : question_.request->members) {
      SpendEffort();
      if (tag == nullptr || member.tag->IsSubset(tag)) continue;
      Add("tag", name + " grants " + TagText(tag) + ", asked was " + TagText(member.tag.get()));
      return;
    }
  }

  // Whether the subject of a certificate issued another one of the chain.
  bool Leads(size_t index) const {
    const auto& certs = evidence_.certs;
    return std::any_of(certs.begin(), certs.end(), [&](const CertEvidence& other) {
      return &other != &certs[index] && Names(CertAt(index).GetSubject(), other.cert->GetIssuer());
    });
  }

  // Periods that each meet what was asked and not one another.
  void Conflicts() {
    for (size_t i = 0; i < evidence_.certs.size(); ++i) {
      for (size_t j = 0; j < evidence_.certs.size(); ++j) {
        const TimeStamp* end = CertAt(i).GetNotAfter();
        const TimeStamp* begin = CertAt(j).GetNotBefore();
        if (end == nullptr || begin == nullptr || !end->IsBefore(begin) || i == j) continue;
        Add("period", Name(i) + " is valid until " + StampText(*end) + ", " + Name(j) +
                          " not before " + StampText(*begin));
      }
    }
  }

  void Root(const EntryEvidence& each) {
    const AclEntry& entry = *each.entry;
    const std::string name = EntryName(each);
    if (!entry.GetPropagate() && NamesIssuer(entry)) {
      Add("propagate", name + " does not let its key pass the grant on");
    }
    Period(name, entry.GetNotBefore(), entry.GetNotAfter());
    Tag(name, entry.GetTag());
    auto* threshold = dynamic_cast<ThresholdSubject*>(entry.GetSubject());
    if (threshold == nullptr) return;
    const size_t present = MembersPresent(*threshold);
    if (present >= threshold->GetK()) return;
    Add("threshold", name + " wants " + std::to_string(threshold->GetK()) + " of " +
                         std::to_string(threshold->GetN()) + " keys, and " +
                         std::to_string(present) + " of them " + (present == 1 ? "is" : "are") +
                         " in this chain");
  }

  size_t MembersPresent(ThresholdSubject& threshold) const {
    Ref<SExpression> members;
    Check(threshold.GetSubjects(members.Out()), "reading a subject");
    const std::vector<DExpression*> principals = Principals(evidence_);
    size_t present = 0;
    for (auto it = members->Begin(); it; it.Next()) {
      const bool found = std::any_of(principals.begin(), principals.end(),
                                     [&](DExpression* each) { return each->IsEqual(it.Value()); });
      present += found ? 1 : 0;
    }
    return present;
  }

  bool NamesIssuer(const AclEntry& entry) const {
    return std::any_of(evidence_.certs.begin(), evidence_.certs.end(),
                       [&](const CertEvidence& each) {
                         return Names(entry.GetSubject(), each.cert->GetIssuer());
                       });
  }

  std::string PrincipalTexts() const {
    std::string text;
    for (const CertEvidence& each : evidence_.certs) {
      const std::string issuer = " " + Fingerprint(*each.cert->GetIssuer());
      if (text.find(issuer) == std::string::npos) text += issuer;
    }
    return text;
  }

  static std::string LimitText(const Ref<SExpression>& limit) {
    const auto* stamp = limit ? dynamic_cast<ByteString*>(limit->Last()) : nullptr;
    if (stamp == nullptr) return "";
    return Escape({reinterpret_cast<const char*>(stamp->GetData()), stamp->GetLength()});
  }

  // The engine's answer about one credential alone.
  int TryReduction(const std::string& head, DExpression* credential) {
    SpendEffort();
    Ref<SExpression> acl;
    Ref<SExpression> sequence;
    Check(SExpression::Create(acl.Out(), "acl", nullptr), "building a list");
    Check(SExpression::Create(sequence.Out(), "sequence", nullptr), "building a list");
    InsertShared(head == "acl" ? *acl : *sequence, credential);
    Ref<SExpression> tag;
    Ref<SExpression> notBefore;
    Ref<SExpression> notAfter;
    return ZvVesk2::Verify::ReductB(nullptr, acl.get(), sequence.get(), CertAt(0).GetSubject(),
                                    tag.Out(), notBefore.Out(), notAfter.Out());
  }

  const Question& question_;
  const Evidence& evidence_;
  std::vector<Loss> losses_;
};

using Step = void (Search::*)();

// Which of the questions above can have led to a code.
constexpr struct {
  int code;
  Step steps[4];
} kSteps[] = {
    {VESK2_ERR_SIGNATURE, {&Search::Signatures}},
    {VESK2_ERR_SIGNATURE_ID, {&Search::Signatures}},
    {VESK2_ERR_HASH_MISMATCH, {&Search::Signatures}},
    {VESK2_ERR_NOT_IMPLEMENTED, {&Search::Signatures}},
    {VESK2_ERR_HASH_MATCH, {&Search::Content}},
    {VESK2_ERR_NOT_OBJECT_CERT, {&Search::Order}},
    {VESK2_ERR_SIGNING_CERT_ORDER, {&Search::Order, &Search::Revocations}},
    {VESK2_ERR_CERT_REVOKED, {&Search::Revocations}},
    {VESK2_ERR_CRL_NOT_FOUND, {&Search::Revocations}},
    {VESK2_ERR_NOT_AUTHORIZED,
     {&Search::Revocations, &Search::Certificates, &Search::Roots, &Search::Rest}},
    {VESK2_ERR_PACKAGE_NOT_GRANTED,
     {&Search::Revocations, &Search::Certificates, &Search::Roots, &Search::Rest}},
};

TimeStamp* Earlier(TimeStamp* a, TimeStamp* b) {
  if (a == nullptr || (b != nullptr && b->IsBefore(a))) return b;
  return a;
}

}  // namespace

std::string CertName(const Evidence& evidence, size_t index) {
  return "certificate " + std::to_string(index + 1) + " (issuer " +
         SubjectText(*evidence.certs[index].cert->GetIssuer()) + ")";
}

std::string EntryName(const EntryEvidence& entry) { return "ACL entry " + Escape(entry.file); }

bool IsRelevant(const EntryEvidence& entry, const Evidence& evidence) {
  const std::vector<DExpression*> principals = Principals(evidence);
  return std::any_of(principals.begin(), principals.end(),
                     [&](DExpression* each) { return Names(entry.entry->GetSubject(), each); });
}

std::vector<Loss> FindLosses(const Question& question, const Evidence& evidence, int code) {
  Search search(question, evidence);
  for (const auto& row : kSteps) {
    if (row.code != code) continue;
    for (const Step step : row.steps) {
      if (step != nullptr) (search.*step)();
    }
  }
  if (code < 0 && !evidence.certs.empty()) search.Unreadable();
  return search.Take();
}

std::optional<AuthorityPath> FindPath(const Question& question, const Evidence& evidence) {
  Hypothesis alone;
  AuthorityPath path;
  for (const EntryEvidence& each : evidence.entries) {
    alone.only = each.entry.get();
    if (!IsRelevant(each, evidence) || Judge(question, evidence, alone) != 0) continue;
    path.entry = &each;
    break;
  }
  if (path.entry == nullptr) return std::nullopt;  // several entries together
  alone.only = path.entry->entry.get();
  path.ends = path.entry->entry->GetNotAfter();
  for (size_t i = evidence.certs.size(); i-- > 0;) {
    // The first two of a manifest have their places.
    if (!question.manifest || i > 1) alone.withoutCerts.insert(i);
    if (alone.withoutCerts.count(i) != 0 && Judge(question, evidence, alone) == 0) continue;
    alone.withoutCerts.erase(i);
    path.certs.push_back(i);
    path.ends = Earlier(path.ends, evidence.certs[i].cert->GetNotAfter());
  }
  return path;
}

}  // namespace vesk2_command
