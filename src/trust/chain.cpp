// See chain.h.
#include "src/trust/chain.h"

#include <algorithm>

#include <vesk2/acl_entry.h>
#include <vesk2/crl.h>

#include "src/sexpr/same.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {

SExpression::Iterator FirstItem(const SExpression* sequence) {
  auto at = sequence->Begin();
  if (at) at.Next();
  return at;
}

int ReadLink(ChainLink& link, SExpression::Iterator& at) {
  VESK2_REQUIRE(at, VESK2_ERR_INVALID_SEQUENCE);
  link.cert = dynamic_cast<Cert*>(at.Value());
  at.Next();
  VESK2_REQUIRE(at, VESK2_ERR_INVALID_SEQUENCE);
  link.signature = dynamic_cast<Signature*>(at.Value());
  at.Next();
  VESK2_REQUIRE(at, VESK2_ERR_INVALID_SEQUENCE);
  link.extra = at.Value();
  return 0;
}

int ReadWholeLink(ChainLink& link, SExpression::Iterator& at) {
  VESK2_TRY(ReadLink(link, at));
  VESK2_REQUIRE(link.cert != nullptr && link.signature != nullptr, VESK2_ERR_INVALID_SEQUENCE);
  at.Next();
  return 0;
}

int LoadRoots(Ref<SExpression>& acls, Vesk2ContextStruct* ctx) {
  const int code = AclEntry::Import(acls.Out(), ctx, nullptr);
  return code == 0 || IsNoAbsence(code) ? code : VESK2_ERR_ACL_ENTRY_NOT_FOUND;
}

namespace {

// Chains are as long as their writers like.
constexpr size_t kMaxUnvouched = 16;

// Whether one of the entries carries the tag.
int HasTag(bool& found, SExpression* entries, SExpression* tag) {
  found = false;
  for (auto it = entries->Begin(); it && !found; it.Next()) {
    auto* const entry = dynamic_cast<AclEntry*>(it.Value());
    if (entry != nullptr) VESK2_TRY(CompareValues(found, entry->GetTag(), tag));
  }
  return 0;
}

int AppendEntry(SExpression* entries, Cert* cert, SExpression* tag) {
  auto subject = Ref<Subject>::Share(cert->GetIssuer());
  auto source = Ref<SExpression>::Share(tag);
  Ref<AclEntry> entry;
  VESK2_TRY(AclEntry::Create(entry.Out(), subject.get(), false, source.get(), nullptr, nullptr, 0,
                             nullptr));
  static_cast<void>(subject.Release());
  static_cast<void>(source.Release());
  return Append(entries, std::move(entry));
}

}  // namespace

int AddUnvouched(Evidence& evidence, Vesk2ContextStruct* ctx) {
  SExpression* const stored = evidence.GetStoredLists();
  if (stored == nullptr) return 0;
  // The store loads what entries name; these stand for the certificates that do.
  Ref<SExpression> named;
  VESK2_TRY(SExpression::Create(named.Out(), "acl", ctx));
  for (size_t i = 0; i < std::min(evidence.CountCerts(), kMaxUnvouched); ++i) {
    SExpression* const source = evidence.GetRevocationSource(i);
    if (source == nullptr) continue;
    bool known = false;
    VESK2_TRY(HasTag(known, evidence.GetEntries(), source));
    if (!known) VESK2_TRY(HasTag(known, named.get(), source));
    if (!known) VESK2_TRY(AppendEntry(named.get(), evidence.GetCert(i), source));
  }
  if (named->Count() < 2) return 0;
  Ref<SExpression> lists;
  const int code = CrlSequence::ImportStore(lists.Out(), named.get(), ctx);
  VESK2_REQUIRE(!LacksMemory(code), code);
  if (code != 0) return 0;  // the answer does not rest on them
  for (auto it = lists->Begin(); it; it.Next()) VESK2_TRY(AppendShared(stored, it.Value()));
  return 0;
}

int AppendCopy(SExpression* chain, Cert* cert) {
  Ref<Cert> copy(TryNew<Cert>(cert->GetContext()));
  VESK2_REQUIRE(copy, VESK2_ERR_MEM_ALLOC);
  SExpression* const own = cert->GetRevocationElement();
  cert->SetRevocationElement(nullptr);
  const int code = copy->Clone(cert);
  cert->SetRevocationElement(own);
  VESK2_TRY(code);
  return Append(chain, std::move(copy));
}

}  // namespace ZvVesk2
