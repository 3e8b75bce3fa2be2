// SPDX-License-Identifier: Apache-2.0
// See chain.h.
#include "src/trust/chain.h"

#include <vesk2/acl_entry.h>
#include <vesk2/crl.h>

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

int AppendPropagating(SExpression* chain, const Cert& cert) {
  return AppendClone(chain, cert, true, cert.GetRevocationElement());
}

}  // namespace ZvVesk2
