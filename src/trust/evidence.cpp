// SPDX-License-Identifier: Apache-2.0
// Evidence: what a verification read, and changes to it. Judging it: evidence_judge.cpp. All values
// are shared and none is changed, so that a copy costs an array and its counts: whoever asks "what
// if" copies, changes, and judges, without a file being read.
#include <vesk2/evidence.h>

#include <algorithm>
#include <utility>

#include "src/trust/evidence_link.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {

Evidence::Evidence(Vesk2ContextStruct* ctx) : context(ctx) {}
Evidence::~Evidence() = default;

// Everything but the context: no fact of another verification may stand beside those of this one.
void Evidence::Clear(Kind newKind) {
  kind = newKind;
  links.reset();
  count = capacity = 0;
  for (Ref<SExpression>* list : {&entries, &granting, &storedLists, &carriedLists, &assumed}) {
    list->Reset();
  }
  subject.Reset();
  for (Ref<TimeStamp>* stamp : {&signingTime, &first, &last, &revocationTime}) stamp->Reset();
  // 0 is "as it should be": what was not looked at is no reproach.
  SetContent(0, 0, 0);
  work = 0;
}

// Room first: after that nothing can fail, and what is half-copied cannot be seen.
int Evidence::Copy(const Evidence& other) {
  Clear(other.kind);
  VESK2_TRY(Reserve(other.count));
  for (; count < other.count; ++count) {
    const Link& each = other.links[count];
    links[count] = {Ref<Cert>::Share(each.cert.get()),
                    Ref<Signature>::Share(each.signature.get()),
                    Ref<SExpression>::Share(each.source.get()),
                    each.signatureCode,
                    each.status,
                    Ref<CrlSequence>::Share(each.list.get()),
                    Ref<TimeStamp>::Share(each.since.get())};
  }
  entries = Ref<SExpression>::Share(other.entries.get());
  granting = Ref<SExpression>::Share(other.granting.get());
  storedLists = Ref<SExpression>::Share(other.storedLists.get());
  carriedLists = Ref<SExpression>::Share(other.carriedLists.get());
  assumed = Ref<SExpression>::Share(other.assumed.get());
  subject = Ref<Subject>::Share(other.subject.get());
  signingTime = Ref<TimeStamp>::Share(other.signingTime.get());
  first = Ref<TimeStamp>::Share(other.first.get());
  last = Ref<TimeStamp>::Share(other.last.get());
  revocationTime = Ref<TimeStamp>::Share(other.revocationTime.get());
  SetContent(other.contentCode, other.listingCode, other.listingPosition);
  work = other.work;
  return 0;
}

// ---- What was read ----

Cert* Evidence::GetCert(size_t index) const { return links[index].cert.get(); }
Signature* Evidence::GetSignature(size_t index) const { return links[index].signature.get(); }
int Evidence::GetSignatureCode(size_t index) const { return links[index].signatureCode; }
int32_t Evidence::GetRevocationStatus(size_t index) const { return links[index].status; }
SExpression* Evidence::GetRevocationSource(size_t index) const { return links[index].source.get(); }
CrlSequence* Evidence::GetRevocationList(size_t index) const { return links[index].list.get(); }
TimeStamp* Evidence::GetRevokedSince(size_t index) const { return links[index].since.get(); }

// A manifest without a period is judged at the moment that its signer wrote.
TimeStamp* Evidence::GetFirst() const {
  return AskedAboutSigning() ? signingTime.get() : first.get();
}
TimeStamp* Evidence::GetLast() const {
  return AskedAboutSigning() ? signingTime.get() : last.get();
}

// The time of signing stands in for an open end of a manifest's period; a chain has none.
TimeStamp* Evidence::GetRevocationFirst() const {
  if (revocationTime) return revocationTime.get();
  return first ? first.get() : signingTime.get();
}
TimeStamp* Evidence::GetRevocationLast() const {
  if (revocationTime) return revocationTime.get();
  return last ? last.get() : signingTime.get();
}

// ---- Changes ----

// Grows by doubling: a manifest may have as many certificates as its file holds.
int Evidence::Reserve(size_t wanted) {
  if (wanted <= capacity) return 0;
  const size_t larger = std::max(wanted, capacity * 2);
  std::unique_ptr<Link[]> moved(TryNewArray<Link>(larger));
  VESK2_REQUIRE(moved, VESK2_ERR_MEM_ALLOC);
  std::move(links.get(), links.get() + count, moved.get());
  links = std::move(moved);
  capacity = larger;
  return 0;
}

// The source is made a tag here, once: it is compared and shown as one.
int Evidence::AddCert(Cert* cert, Signature* signature, int signatureCode) {
  VESK2_REQUIRE(cert != nullptr, VESK2_ERR_PARAM_NULL);
  VESK2_TRY(Reserve(count + 1));
  Link link;
  if (cert->GetRevocationElement() != nullptr) {
    VESK2_TRY(MakeTag(link.source, cert->GetRevocationElement()));
  }
  link.cert = Ref<Cert>::Share(cert);
  link.signature = Ref<Signature>::Share(signature);
  link.signatureCode = signatureCode;
  links[count++] = std::move(link);
  return 0;
}

// The subject is kept before its certificate goes: the question must not become one about somebody
// else, and a grant for that one a yes.
void Evidence::RemoveCerts() {
  if (!subject) subject = Ref<Subject>::Share(AskedSubject());
  links.reset();
  count = capacity = 0;
}

// The others move up, with what was found about them.
void Evidence::RemoveCert(size_t index) {
  if (!subject) subject = Ref<Subject>::Share(AskedSubject());
  std::move(links.get() + index + 1, links.get() + count, links.get() + index);
  links[--count] = Link();
}

void Evidence::SetEntries(SExpression* acl) { entries = Ref<SExpression>::Share(acl); }
void Evidence::SetGrantingEntries(SExpression* acl) { granting = Ref<SExpression>::Share(acl); }
// The statuses stay as they were until somebody asks again: MarkRevoked.
void Evidence::SetLists(SExpression* stored, SExpression* carried) {
  storedLists = Ref<SExpression>::Share(stored);
  carriedLists = Ref<SExpression>::Share(carried);
}

int Evidence::AssumeList(SExpression* source) {
  VESK2_REQUIRE(source != nullptr, VESK2_ERR_PARAM_NULL);
  return Assume(source);
}

// As an item without a date, which is how a list names what it revokes: ItemIndex reads it.
int Evidence::AssumeRevoked(Hash* digest) {
  VESK2_REQUIRE(digest != nullptr, VESK2_ERR_PARAM_NULL);
  Ref<SExpression> item;
  VESK2_TRY(SExpression::Create(item.Out(), "item", context));
  VESK2_TRY(AppendShared(item.get(), digest));
  return Assume(item.get());
}

// A new list each time, as a copy may hold the old one.
int Evidence::Assume(DExpression* item) {
  Ref<SExpression> more(TryNew<SExpression>(context));
  VESK2_REQUIRE(more, VESK2_ERR_MEM_ALLOC);
  if (assumed) {  // which a copy may share
    for (auto it = assumed->Begin(); it; it.Next()) VESK2_TRY(AppendShared(more.get(), it.Value()));
  }
  VESK2_TRY(AppendShared(more.get(), item));
  assumed = std::move(more);
  return 0;
}

void Evidence::SetSubject(Subject* newSubject) { subject = Ref<Subject>::Share(newSubject); }
void Evidence::SetSigningTime(TimeStamp* stamp) { signingTime = Ref<TimeStamp>::Share(stamp); }
void Evidence::SetPeriod(TimeStamp* newFirst, TimeStamp* newLast) {
  first = Ref<TimeStamp>::Share(newFirst);
  last = Ref<TimeStamp>::Share(newLast);
}
void Evidence::SetRevocationTime(TimeStamp* stamp) {
  revocationTime = Ref<TimeStamp>::Share(stamp);
}

void Evidence::SetContent(int code, int codeOfListing, size_t position) {
  contentCode = code;
  listingCode = codeOfListing;
  listingPosition = position;
}

Evidence::Kind Evidence::GetKind() const { return kind; }
Vesk2ContextStruct* Evidence::GetContext() const { return context; }
size_t Evidence::CountCerts() const { return count; }
SExpression* Evidence::GetEntries() const { return entries.get(); }
SExpression* Evidence::GetStoredLists() const { return storedLists.get(); }
SExpression* Evidence::GetCarriedLists() const { return carriedLists.get(); }
TimeStamp* Evidence::GetSigningTime() const { return signingTime.get(); }
int Evidence::GetContentCode() const { return contentCode; }
int Evidence::GetListingCode() const { return listingCode; }
size_t Evidence::GetListingPosition() const { return listingPosition; }
uint64_t Evidence::GetWork() const { return work; }
// Only with both ends open. One end alone is a period, as programs mean it.
bool Evidence::AskedAboutSigning() const { return kind == SignedManifest && !first && !last; }

}  // namespace ZvVesk2
