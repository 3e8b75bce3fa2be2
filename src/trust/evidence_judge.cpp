// SPDX-License-Identifier: Apache-2.0
// Evidence: what the certificates, entries and lists that were read come to. These steps are the
// verification: CertSequence::Verify and the reader of manifests call them, and whoever judges a
// changed copy gets the same rules. A yes comes from Reduce alone.
#include <vesk2/evidence.h>

#include <utility>

#include <vesk2/crl.h>
#include <vesk2/verify.h>

#include "src/sexpr/same.h"
#include "src/trust/chain.h"
#include "src/trust/evidence_link.h"
#include "src/trust/lists.h"
#include "src/trust/revocation_lists.h"

namespace ZvVesk2 {
namespace {

// The second certificate of a manifest, counted from 0: the signer's own. It need not be allowed to
// pass its grant on: the signer certificate, which only names the content, is no delegation.
constexpr size_t kIssuersPlace = 1;

// Not to know is a refusal of its own, so that an operator hears that a list is missing and not
// that something is revoked.
[[nodiscard]] int CodeOfStatus(int32_t status) {
  VESK2_REQUIRE(status != Cert::Undetermined, VESK2_ERR_CRL_NOT_FOUND);
  return status == Cert::NotRevoked ? 0 : VESK2_ERR_CERT_REVOKED;
}

// A list remembers that it was proved, which may have been by other entries.
[[nodiscard]] int AppendUnproved(SExpression* to, SExpression* from) {
  if (from == nullptr) return 0;
  for (auto it = from->Begin(); it; it.Next()) {
    if (auto* const list = dynamic_cast<CrlSequence*>(it.Value())) list->ForgetProof();
    VESK2_TRY(AppendShared(to, it.Value()));
  }
  return 0;
}

// As a list would: the key first, and a certificate only if it names a source.
[[nodiscard]] int MarkSupposed(bool& revoked, int32_t& status, Cert& cert,
                               const ItemIndex& supposed) {
  const ItemIndex::Item* item = nullptr;
  VESK2_TRY(supposed.Find(item, cert.GetSubject()));
  revoked = item != nullptr;
  if (revoked) status = Cert::KeyRevoked;
  if (revoked || cert.GetRevocationElement() == nullptr) return 0;
  VESK2_TRY(supposed.Find(item, &cert));
  revoked = item != nullptr;
  if (revoked && status != Cert::KeyRevoked) status = Cert::RevokedByCrl;
  return 0;
}

}  // namespace

// A subject that was set stands, whatever certificates come and go: the question is about somebody.
Subject* Evidence::AskedSubject() const {
  if (subject) return subject.get();
  return count > 0 ? GetCert(0)->GetSubject() : nullptr;
}

// ---- Revocation ----

// The lists are put together anew for each question, and proved anew: a changed copy may have other
// entries. Each list is proved once, whatever the number of certificates.
int Evidence::MarkRevoked() {
  VESK2_REQUIRE(entries, VESK2_ERR_PARAM_NULL);
  Ref<SExpression> lists(TryNew<SExpression>(context));
  VESK2_REQUIRE(lists, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(AppendUnproved(lists.get(), storedLists.get()));
  VESK2_TRY(AppendUnproved(lists.get(), carriedLists.get()));
  RevocationLists revocations(entries.get(), lists.get());
  ItemIndex supposed;  // what AssumeRevoked was told of
  if (assumed) {
    VESK2_TRY(supposed.Reserve(assumed->Count()));
    supposed.Add(assumed.get(), nullptr);
    supposed.Sort();
  }
  for (size_t i = 0; i < count; ++i) {
    Link& link = links[i];
    RevocationLists::Decision decision;
    // The status decides; a certificate about which nothing is known is treated like a revoked one,
    // but never because there was no memory to ask.
    const int code = revocations.Mark(decision, link.cert.get(), GetRevocationFirst());
    VESK2_REQUIRE(!LacksMemory(code), VESK2_ERR_MEM_ALLOC);
    link.status = link.cert->GetRevocationStatus();
    // Told by the explanation, and by the moment that it ends, since then the answer does.
    link.list = Ref<CrlSequence>::Share(decision.list);
    link.since = Ref<TimeStamp>::Share(decision.since);
    bool revoked = false;
    VESK2_TRY(MarkSupposed(revoked, link.status, *link.cert, supposed));
    if (revoked) {  // by no list that there is
      link.list.Reset();
      link.since.Reset();
    }
    // An assumed list only ever fills a gap: what is revoked stays revoked.
    if (link.status != Cert::Undetermined) continue;
    bool listed = false;
    VESK2_TRY(Assumed(listed, link.source.get()));
    if (listed) link.status = Cert::NotRevoked;
  }
  return 0;
}

// Linear, over what this program's own caller assumed: a few.
int Evidence::Assumed(bool& found, SExpression* source) const {
  found = false;
  if (!assumed || source == nullptr) return 0;
  for (auto it = assumed->Begin(); it && !found; it.Next()) {
    VESK2_TRY(CompareValues(found, it.Value(), source));
  }
  return 0;
}

// A chain is what a requester chose to present, so one bad certificate refuses it. A manifest
// carries what its maker collected, and stands on what is left.
int Evidence::CheckRevoked() const {
  if (kind == Chain) {
    for (size_t i = 0; i < count; ++i) VESK2_TRY(CodeOfStatus(links[i].status));
    return 0;
  }
  // Without its signer the chain would be another one, about nothing that was signed. The others
  // are left out, and what is then the second must be the signer's own.
  VESK2_TRY(count > 0 ? CodeOfStatus(links[0].status) : VESK2_ERR_SIGNING_CERT_ORDER);
  // Whichever comes first of those that are left: a revoked one before it is as if it were not
  // there.
  size_t second = 1;
  while (second < count && links[second].status != Cert::NotRevoked) ++second;
  VESK2_REQUIRE(second < count, VESK2_ERR_SIGNING_CERT_ORDER);
  bool follows = false;
  VESK2_TRY(CompareValues(follows, GetCert(second)->GetSubject(), GetCert(0)->GetIssuer()));
  return follows ? 0 : VESK2_ERR_SIGNING_CERT_ORDER;
}

// ---- Reduction ----

// The order is kept, and the places are those after what is revoked has gone: the second place is
// the signer's own, whichever certificate has it.
int Evidence::BuildChain(Ref<SExpression>& out) const {
  Ref<SExpression> chain;
  VESK2_TRY(SExpression::Create(chain.Out(), "sequence", context));
  size_t place = 0;
  for (size_t i = 0; i < count; ++i) {
    if (kind == SignedManifest && links[i].status != Cert::NotRevoked) continue;
    VESK2_TRY(AppendLink(chain.get(), i, place++));
  }
  out = std::move(chain);
  return 0;
}

// The reduction reads a manifest's other certificates as they are, revocation element and all: it
// ignores what it does not know.
int Evidence::AppendLink(SExpression* chain, size_t index, size_t place) const {
  if (kind == Chain) return AppendIrrevocable(chain, *GetCert(index));
  if (place == kIssuersPlace) return AppendPropagating(chain, *GetCert(index));
  return AppendShared(chain, GetCert(index));
}

// (valid <stamp>) for the moment of signing, else (valid [(not-before <stamp>)] [(not-after
// <stamp>)]); null for a chain and no period. The bare stamp asks for one moment that must lie in
// every period.
int Evidence::MakePeriod(Ref<SExpression>& out) const {
  if (kind == Chain && !first && !last) return 0;
  Ref<SExpression> valid;
  VESK2_TRY(SExpression::Create(valid.Out(), "valid", context));
  if (AskedAboutSigning()) {
    VESK2_TRY(Append(valid.get(), Ref<TimeStamp>::Share(signingTime.get())));
  }
  TimeStamp* begin = nullptr;
  TimeStamp* end = nullptr;
  VESK2_TRY(AppendBounds(valid.get(), Ref<TimeStamp>::Share(first.get()),
                         Ref<TimeStamp>::Share(last.get()), begin, end));
  out = std::move(valid);
  return 0;
}

int Evidence::Reduce(SExpression* tag) {
  Ref<SExpression> chain;
  VESK2_TRY(BuildChain(chain));
  Ref<SExpression> period;
  VESK2_TRY(MakePeriod(period));
  // What it cost is told to who wants to ask again (Explanation).
  const uint64_t before = Verify::WorkDone();
  const int code = Verify::ReductA(context, granting ? granting.get() : entries.get(), chain.get(),
                                   AskedSubject(), tag, period.get());
  work = Verify::WorkDone() - before;
  return code;
}

// Revocation before the reduction, which knows nothing of it.
int Evidence::Prove(SExpression* tag) {
  VESK2_TRY(CheckRevoked());
  return Reduce(tag);
}

int Evidence::Grants(SExpression*& tag, SExpression*& notBefore, SExpression*& notAfter) const {
  VESK2_TRY(CheckForm());
  VESK2_TRY(CheckRevoked());
  Ref<SExpression> chain;
  VESK2_TRY(BuildChain(chain));
  return Verify::ReductB(context, granting ? granting.get() : entries.get(), chain.get(),
                         AskedSubject(), tag, notBefore, notAfter);
}

// What is refused before any store is asked.
int Evidence::CheckForm() const {
  if (kind == Chain) VESK2_REQUIRE(count > 0, VESK2_ERR_INVALID_SEQUENCE);
  if (kind == SignedManifest) {
    VESK2_REQUIRE(count > 1, VESK2_ERR_SIGNING_CERT_ORDER);
    VESK2_REQUIRE(GetCert(0)->GetSubject()->IsHash(), VESK2_ERR_NOT_OBJECT_CERT);
  }
  for (size_t i = 0; i < count; ++i) VESK2_TRY(links[i].signatureCode);
  return entries ? 0 : VESK2_ERR_ACL_ENTRY_NOT_FOUND;
}

// In the order of a verification, so that the first refusal is the one that it would give.
int Evidence::Judge(SExpression* tag) {
  VESK2_TRY(CheckForm());
  VESK2_TRY(MarkRevoked());
  return Prove(tag);
}

// By canonical lengths, which a judgement exports and parses; a rough measure, for budgets.
size_t Evidence::Size() const {
  size_t size = 0;
  for (size_t i = 0; i < count; ++i) size += GetCert(i)->CanonicalLength();
  for (SExpression* list : {entries.get(), storedLists.get(), carriedLists.get()}) {
    if (list != nullptr) size += list->CanonicalLength();
  }
  return size;
}

}  // namespace ZvVesk2
