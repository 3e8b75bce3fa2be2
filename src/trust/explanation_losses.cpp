// SPDX-License-Identifier: Apache-2.0
// Explanation: where authority was lost on its way from the entries to the end of a chain. Each
// step puts one question to every certificate or entry; the code tells which can have led to it. No
// rule is written a second time here: tags are compared by IsSubset, periods as stamps are,
// subjects by Principals. What no step can name is told by Rest, from the library's own reduction.
// A reason never says more than its question asked: an explanation that guesses would be believed.
//
// Names and tags are a stranger's words, and go through the TextWriter, which escapes them.
#include <vesk2/limits.h>
#include <vesk2/verify.h>

#include "src/trust/explanation_state.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {

// What can have led to each code, in the order in which it is told. Codes that are missing speak
// for themselves.
const ExplanationLosses::Row ExplanationLosses::kRows[] = {
    {VESK2_ERR_SIGNATURE, {&ExplanationLosses::Signatures}},
    {VESK2_ERR_SIGNATURE_ID, {&ExplanationLosses::Signatures}},
    {VESK2_ERR_HASH_MISMATCH, {&ExplanationLosses::Signatures}},
    {VESK2_ERR_NOT_IMPLEMENTED, {&ExplanationLosses::Signatures}},
    {VESK2_ERR_HASH_MATCH, {&ExplanationLosses::Content}},
    {VESK2_ERR_NOT_OBJECT_CERT, {&ExplanationLosses::Order}},
    {VESK2_ERR_SIGNING_CERT_ORDER, {&ExplanationLosses::Order, &ExplanationLosses::Revocations}},
    {VESK2_ERR_CERT_REVOKED, {&ExplanationLosses::Revocations}},
    {VESK2_ERR_CRL_NOT_FOUND, {&ExplanationLosses::Revocations}},
    {VESK2_ERR_NOT_AUTHORIZED,
     {&ExplanationLosses::Revocations, &ExplanationLosses::Certificates, &ExplanationLosses::Roots,
      &ExplanationLosses::Rest}},
    {VESK2_ERR_PACKAGE_NOT_GRANTED,
     {&ExplanationLosses::Revocations, &ExplanationLosses::Certificates, &ExplanationLosses::Roots,
      &ExplanationLosses::Rest}},
    {VESK2_ERR_ACL_ENTRY_NOT_FOUND, {&ExplanationLosses::NoStore}},
    {VESK2_ERR_FILE_NOT_FOUND, {&ExplanationLosses::NoStore}},
};

// A negative code is the reduction's, about a credential that it could not read or a budget.
int ExplanationLosses::Find(int code) {
  if (code < 0) return evidence_.CountCerts() > 0 ? Unreadable() : 0;
  for (const Row& row : kRows) {
    if (row.code != code) continue;
    for (const Step step : row.steps) {
      if (step != nullptr && state_.complete) VESK2_TRY((this->*step)());
    }
  }
  return 0;
}

// ---- Names ----

// Certificates are told by number, from 1, and by who issued them: a chain has no other names.
TextWriter& ExplanationLosses::CertName(TextWriter& text, size_t index) const {
  text << "certificate " << index + 1 << " (issuer ";
  return text.Of(evidence_.GetCert(index)->GetIssuer()) << ")";
}

TextWriter& ExplanationLosses::Name(TextWriter& text, const Reason& reason) const {
  if (reason.entry == nullptr) return CertName(text, reason.cert);
  return (text << "ACL entry ").Of(reason.entry);
}

// Where an entry was looked for: who is told that none was found must see where.
TextWriter& ExplanationLosses::Store(TextWriter& text) const {
  text.AclStore();
  return extraDirectory_.empty() ? text : (text << " or ").Escaped(extraDirectory_);
}

// The moment that a manifest was judged at is its signer's word, which the text says.
TextWriter& ExplanationLosses::Asked(TextWriter& text) const {
  const TimeStamp* const first = evidence_.GetFirst();
  if (first != nullptr && first == evidence_.GetSigningTime()) {
    return (text << "the manifest was signed at ").Of(first);
  }
  return (text << "asked was ").Period(first, evidence_.GetLast());
}

// ---- What a certificate is ----

// All that do not hold, though the first was the answer: who mends one wants to know of the next.
int ExplanationLosses::Signatures() {
  for (size_t i = 0; i < evidence_.CountCerts(); ++i) {
    Reason reason = About(Explanation::SignatureFails, i);
    reason.code = evidence_.GetSignatureCode(i);
    if (reason.code == 0) continue;
    TextWriter text;
    (CertName(text, i) << ": ").Code(reason.code);
    VESK2_TRY(state_.Add(reason, text));
  }
  return 0;
}

// Fewer than two certificates cannot be a manifest's: its reader refused that already.
int ExplanationLosses::Order() {
  if (!state_.IsManifest() || evidence_.CountCerts() == 0) return 0;
  TextWriter text;
  if (!evidence_.GetCert(0)->GetSubject()->IsHash()) {
    CertName(text, 0) << " is not for the digest of a manifest";
    return state_.Add(About(Explanation::OutOfOrder, size_t{0}), text);
  }
  Principal* const signer = evidence_.GetCert(0)->GetIssuer();
  if (evidence_.CountCerts() < 2) return 0;
  Subject* const subject = evidence_.GetCert(1)->GetSubject();
  if (subject->IsEqual(signer)) return 0;
  (CertName(text, 1) << " is for ").Of(subject) << ", not for the signer ";
  text.Fingerprint(signer);
  return state_.Add(About(Explanation::OutOfOrder, 1), text);
}

// A listing that cannot be read is named with its byte: mostly the file was damaged on its way, and
// the digest only noticed. What else it can be cannot be told, as a digest does not say what
// differs.
int ExplanationLosses::Content() {
  if (const int code = evidence_.GetListingCode(); code != 0) {
    Reason reason = About(Explanation::OtherContent, kNone);
    reason.code = code;
    TextWriter text;
    if (!file_.empty()) text.Escaped(file_) << ": ";
    (text << "byte " << evidence_.GetListingPosition() << ": ").Code(code);
    VESK2_TRY(state_.Add(reason, text));
  }
  if (evidence_.CountCerts() == 0) return 0;
  TextWriter text;
  CertName(text, 0) << " is for another version, time or listing";
  return state_.Add(About(Explanation::OtherContent, size_t{0}), text);
}

// The status that the verification found, and no list is asked again.
int ExplanationLosses::Revocations() {
  for (size_t i = 0; i < evidence_.CountCerts(); ++i) {
    Reason reason = About(Explanation::Revoked, i);
    reason.source = evidence_.GetRevocationSource(i);
    TextWriter text;
    switch (evidence_.GetRevocationStatus(i)) {
      case Cert::NotRevoked:
        continue;
      case Cert::RevokedByCrl:
        CertName(text, i) << " is revoked";
        break;
      case Cert::KeyRevoked:
        reason.kind = Explanation::KeyRevoked;
        (CertName(text, i) << " is for a revoked key, ").Of(evidence_.GetCert(i)->GetSubject());
        break;
      default:
        reason.kind = Explanation::Undetermined;
        CertName(text, i) << ": no current revocation list tells whether it is revoked";
        if (reason.source != nullptr) (text << "; its source is ").Tag(reason.source);
    }
    VESK2_TRY(state_.Add(reason, text));
  }
  return 0;
}

// A tag that is missing grants everything and loses nothing.
int ExplanationLosses::Certificates() {
  for (size_t i = 0; i < evidence_.CountCerts() && state_.complete; ++i) {
    const Cert* const cert = evidence_.GetCert(i);
    VESK2_TRY(
        Period(About(Explanation::OutOfPeriod, i), cert->GetNotBefore(), cert->GetNotAfter()));
    VESK2_TRY(Tag(About(Explanation::NarrowTag, i), cert->GetTag()));
    // A manifest's first speaks for the content, and the second is used as if it could be passed
    // on.
    if (i > (state_.IsManifest() ? 1U : 0U)) VESK2_TRY(Link(i));
  }
  return Conflicts();
}

// Whether the next one follows from it. Found by keys and digests, without reducing, so that each
// certificate that leads nowhere is told, also when several do.
int ExplanationLosses::Link(size_t index) {
  const Cert* const cert = evidence_.GetCert(index);
  bool leads = false;
  VESK2_TRY(state_.principals.NamesOtherIssuer(leads, cert->GetSubject(), index));
  // It leads somewhere and may: nothing is lost here.
  if (leads && cert->GetPropagate()) return 0;
  TextWriter text;
  if (leads) {
    CertName(text, index) << " does not let its subject pass the grant on (no --propagate)";
    return state_.Add(About(Explanation::NotPassedOn, index), text);
  }
  (CertName(text, index) << " is for ").Of(cert->GetSubject())
      << ", which issued no certificate of this chain";
  return state_.Add(About(Explanation::LeadsNowhere, index), text);
}

// Periods that each meet what was asked and not one another. Pairs are as many as the square of the
// certificates: only those whose period ends before the latest begin are looked at in pairs, and
// all of it is charged by the texts.
int ExplanationLosses::Conflicts() {
  const size_t count = evidence_.CountCerts();
  // A period that ends after this meets all the others.
  const TimeStamp* latest = nullptr;
  for (size_t j = 0; j < count; ++j) {
    const TimeStamp* const begin = evidence_.GetCert(j)->GetNotBefore();
    if (latest == nullptr || (begin != nullptr && begin->IsAfter(latest))) latest = begin;
  }
  for (size_t i = 0; i < count && state_.complete; ++i) {
    const TimeStamp* const end = evidence_.GetCert(i)->GetNotAfter();
    if (end == nullptr || !end->IsBefore(latest)) continue;
    for (size_t j = 0; j < count && state_.complete; ++j) {
      const TimeStamp* const begin = evidence_.GetCert(j)->GetNotBefore();
      if (i == j || begin == nullptr || !end->IsBefore(begin)) continue;
      Reason reason = About(Explanation::OutOfPeriod, i);
      reason.otherCert = j;
      TextWriter text;
      (CertName(text, i) << " is valid until ").Of(end) << ", ";
      (CertName(text, j) << " not before ").Of(begin);
      VESK2_TRY(state_.Add(reason, text));
    }
  }
  return 0;
}

// ---- What was granted ----

// The rule of the reduction: a period must meet the asked one. Stamps that are missing compare as
// false, and lose nothing.
int ExplanationLosses::Period(const Reason& where, const TimeStamp* notBefore,
                              const TimeStamp* notAfter) {
  if (notAfter != nullptr && notAfter->IsBefore(evidence_.GetFirst())) {
    TextWriter text;
    (Name(text, where) << " was valid until ").Of(notAfter) << ", ";
    Asked(text);
    VESK2_TRY(state_.Add(where, text));
  }
  if (notBefore == nullptr || !notBefore->IsAfter(evidence_.GetLast())) return 0;
  TextWriter text;
  (Name(text, where) << " is not valid before ").Of(notBefore) << ", ";
  Asked(text);
  return state_.Add(where, text);
}

// Of a question about several tags the first that is beyond: one example is enough.
int ExplanationLosses::Tag(const Reason& where, SExpression* tag) {
  if (tag == nullptr) return 0;
  SExpression* beyond = nullptr;
  static_cast<void>(state_.EachMember([&](SExpression* member) {
    // Ends the loop without a finding.
    if (!state_.Afford()) return 1;
    if (!member->IsSubset(tag)) beyond = member;
    return beyond != nullptr ? 1 : 0;
  }));
  if (beyond == nullptr) return 0;
  TextWriter text;
  (Name(text, where) << " grants ").Tag(tag) << ", asked was ";
  text.Tag(beyond);
  return state_.Add(where, text);
}

// Entries that name a key of the chain and do not help; none of it when one does. An entry about
// which there is nothing to say could have granted: then the loss lies elsewhere, and the reasons
// of the other entries would mislead.
int ExplanationLosses::Roots() {
  const size_t before = state_.count;
  for (auto it = state_.relevant->Begin(); it && state_.complete; it.Next()) {
    const size_t found = state_.found;
    VESK2_TRY(Root(static_cast<AclEntry*>(it.Value())));
    if (state_.found != found || !state_.complete) continue;
    // One entry that could have granted makes the others no loss.
    state_.DropReasons(before);
    return 0;
  }
  return state_.relevant->Begin() ? 0 : NoEntryAtAll();
}

// Only an entry that names an issuer has to let it pass the grant on; one for the asked subject
// itself need not.
int ExplanationLosses::Root(AclEntry* entry) {
  bool issues = false;
  VESK2_TRY(state_.principals.NamesIssuer(issues, entry->GetSubject()));
  if (!entry->GetPropagate() && issues) {
    const Reason reason = About(Explanation::NotPassedOn, entry);
    TextWriter text;
    Name(text, reason) << " does not let its key pass the grant on";
    VESK2_TRY(state_.Add(reason, text));
  }
  VESK2_TRY(
      Period(About(Explanation::OutOfPeriod, entry), entry->GetNotBefore(), entry->GetNotAfter()));
  VESK2_TRY(Tag(About(Explanation::NarrowTag, entry), entry->GetTag()));
  auto* const threshold = dynamic_cast<ThresholdSubject*>(entry->GetSubject());
  return threshold != nullptr ? Threshold(entry, threshold) : 0;
}

// How many of its keys take part in the chain at all, which is the most that can have been counted.
int ExplanationLosses::Threshold(AclEntry* entry, ThresholdSubject* threshold) {
  size_t present = 0;
  VESK2_TRY(state_.principals.CountMembers(present, threshold));
  if (present >= threshold->GetK()) return 0;
  const Reason reason = About(Explanation::TooFewKeys, entry);
  TextWriter text;
  Name(text, reason) << " wants " << size_t{threshold->GetK()} << " of "
                     << size_t{threshold->GetN()} << " keys, and " << present << " of them "
                     << (present == 1 ? "is" : "are") << " in this chain";
  return state_.Add(reason, text);
}

// Each key once, in the order of the chain: what an entry would have to name.
int ExplanationLosses::NoEntryAtAll() {
  TextWriter text;
  Store(text << "no ACL entry in ") << " names a key of this chain:";
  for (size_t i = 0; i < evidence_.CountCerts(); ++i) {
    Principal* const issuer = evidence_.GetCert(i)->GetIssuer();
    bool first = false;
    VESK2_TRY(state_.principals.IsFirstOf(first, issuer, i));
    if (first) (text << " ").Fingerprint(issuer);
  }
  return state_.Add(About(Explanation::NoEntry, kNone), text);
}

// Said of a refusal for want of entries only, and not of a manifest that could not be read that
// far.
int ExplanationLosses::NoStore() {
  if (evidence_.GetEntries() != nullptr || evidence_.CountCerts() == 0) return 0;
  TextWriter text;
  Store(text << "no ACL entry can be loaded from ") << ": nothing is trusted";
  return state_.Add(About(Explanation::NoEntry, kNone), text);
}

// What the chain does grant, beside what was asked for. It is one more reduction, without a tag and
// a period, and is paid for as such.
int ExplanationLosses::Rest() {
  if (!state_.Afford(evidence_.Size())) return 0;
  Ref<SExpression> tag;
  Ref<SExpression> limits[2];
  const int code = evidence_.Grants(tag.Out(), limits[0].Out(), limits[1].Out());
  VESK2_REQUIRE(!LacksMemory(code), VESK2_ERR_MEM_ALLOC);
  TextWriter text;
  if (tag) {
    (text << "the chain grants ").Tag(tag.get());
    // The dates are read from text, and told as they are: they may be of another grant than the
    // tag.
    for (const bool last : {false, true}) {
      const Ref<SExpression>& limit = limits[last ? 1 : 0];
      auto* const stamp = limit ? dynamic_cast<ByteString*>(limit->Last()) : nullptr;
      if (stamp == nullptr || stamp->GetLength() == 0) continue;
      text << (last ? " until " : " from ");
      text.Escaped({reinterpret_cast<const char*>(stamp->GetData()), stamp->GetLength()});
    }
    (text << ", asked was ").Tag(state_.tag.get()) << " ";
    text.Period(evidence_.GetFirst(), evidence_.GetLast());
    return state_.Add(About(Explanation::NotCombined, kNone), text);
  }
  // Nothing is granted at all, and reasons for it were given.
  if (state_.count > 0) return 0;
  text << "the certificates and the ACL entries do not combine to what was asked, ";
  text.Tag(state_.tag.get());
  return state_.Add(About(Explanation::NotCombined, kNone), text);
}

// ---- What the reduction cannot read ----

// One such credential is enough to stop it. Each credential is given to the reduction alone, so
// that the one that stops it is named. That is a call for each: it is charged, and ends when the
// budget does.
int ExplanationLosses::Unreadable() {
  const auto tell = [this](Reason reason) {
    TextWriter text;
    (Name(text, reason) << ": ").Code(reason.code);
    return reason.code < 0 ? state_.Add(reason, text) : 0;
  };
  for (size_t i = 0; i < evidence_.CountCerts() && state_.Afford(); ++i) {
    Reason reason = About(Explanation::CannotBeRead, i);
    VESK2_TRY(TryReduction(reason.code, false, evidence_.GetCert(i)));
    VESK2_TRY(tell(reason));
  }
  // A reading that did not come to the entries has none to name.
  if (evidence_.GetEntries() == nullptr) return 0;
  for (auto it = evidence_.GetEntries()->Begin(); it && state_.Afford(); it.Next()) {
    auto* const entry = dynamic_cast<AclEntry*>(it.Value());
    if (entry == nullptr) continue;
    Reason reason = About(Explanation::CannotBeRead, entry);
    VESK2_TRY(TryReduction(reason.code, true, entry));
    VESK2_TRY(tell(reason));
  }
  // Each can be read, but not whom the question is about.
  if (state_.found > 0 || !evidence_.GetCert(0)->GetSubject()->IsThresholdSubject()) return 0;
  TextWriter text;
  CertName(text, 0) << " is for several keys together, about whom nothing can be asked";
  return state_.Add(About(Explanation::CannotBeRead, size_t{0}), text);
}

// The reduction's answer about one credential alone. About the first issuer, as any key will do:
// the question is whether it can be read.
int ExplanationLosses::TryReduction(int& code, bool isEntry, DExpression* credential) {
  Vesk2ContextStruct* const context = evidence_.GetContext();
  Ref<SExpression> acl;
  Ref<SExpression> sequence;
  VESK2_TRY(SExpression::Create(acl.Out(), "acl", context));
  VESK2_TRY(SExpression::Create(sequence.Out(), "sequence", context));
  VESK2_TRY(AppendShared(isEntry ? acl.get() : sequence.get(), credential));
  Ref<SExpression> tag;
  Ref<SExpression> notBefore;
  Ref<SExpression> notAfter;
  code = Verify::ReductB(context, acl.get(), sequence.get(), evidence_.GetCert(0)->GetIssuer(),
                         tag.Out(), notBefore.Out(), notAfter.Out());
  return LacksMemory(code) ? VESK2_ERR_MEM_ALLOC : 0;
}

}  // namespace ZvVesk2
