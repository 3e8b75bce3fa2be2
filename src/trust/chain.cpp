// SPDX-License-Identifier: Apache-2.0
// See chain.h. A sequence is a plain list that programs can insert anything into, so that every
// walk through one asks each item for its kind.
#include "src/trust/chain.h"

#include <vesk2/acl_entry.h>
#include <vesk2/crl.h>

#include "src/trust/lists.h"

namespace ZvVesk2 {

// The keyword is not looked at: readers matched it, and a program's own sequence is what the
// program says.
SExpression::Iterator FirstItem(const SExpression* sequence) {
  auto at = sequence->Begin();
  if (at) at.Next();
  return at;
}

// Left at the third item, and not behind it: where a signature fails, Verify2 takes that item for
// the next certificate, which callers have come to see.
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

// One code for all that a missing store can be called, as callers of a chain's verification know
// it.
int LoadRoots(Ref<SExpression>& acls, Vesk2ContextStruct* ctx) {
  const int code = AclEntry::Import(acls.Out(), ctx, nullptr);
  return code == 0 || IsNoAbsence(code) ? code : VESK2_ERR_ACL_ENTRY_NOT_FOUND;
}

namespace {

// The certificate itself is never changed, not even for a moment: others may hold it, and its
// signature is over what it says.
[[nodiscard]] int AppendClone(SExpression* chain, const Cert& cert, bool propagate,
                              SExpression* revocationElement) {
  Ref<Cert> clone(TryNew<Cert>(cert.GetContext()));
  VESK2_REQUIRE(clone, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(clone->Set(cert.GetIssuer(), cert.GetSubject(), propagate, cert.GetTag(),
                       cert.GetNotBefore(), cert.GetNotAfter(), cert.GetComment(),
                       revocationElement));
  return Append(chain, std::move(clone));
}

}  // namespace

int AppendIrrevocable(SExpression* chain, const Cert& cert) {
  return AppendClone(chain, cert, cert.GetPropagate(), nullptr);
}

// The certificate behind a manifest's signer: the signer certificate only names the content, which
// is no delegation, so its issuer needs no leave to delegate. A key that may not pass its grant on
// can therefore sign manifests.
int AppendPropagating(SExpression* chain, const Cert& cert) {
  return AppendClone(chain, cert, true, cert.GetRevocationElement());
}

}  // namespace ZvVesk2
