// SPDX-License-Identifier: Apache-2.0
// CertSequence: what a chain grants when the certificates that fail are left out of it.
#include <vesk2/acl_entry.h>
#include <vesk2/cert_sequence.h>
#include <vesk2/crl.h>
#include <vesk2/evidence.h>
#include <vesk2/verify.h>

#include "src/platform/wait.h"
#include "src/trust/chain.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {
namespace {

[[nodiscard]] int VerifyLink(const ChainLink& link) {
  VESK2_REQUIRE(link.cert != nullptr && link.signature != nullptr, VESK2_ERR_SIGNATURE);
  return link.signature->Verify(link.cert);
}

[[nodiscard]] int AskStores(Evidence& evidence, Vesk2ContextStruct* ctx) {
  const ZVsysutil::ZvCall call;
  Ref<SExpression> acls;
  VESK2_TRY(AclEntry::Import(acls.Out(), ctx, nullptr));
  Ref<SExpression> lists;
  VESK2_TRY(CrlSequence::ImportStore(lists.Out(), acls.get(), ctx));
  evidence.SetEntries(acls.get());
  evidence.SetLists(lists.get(), nullptr);
  return evidence.MarkRevoked();
}

// Replaces the lists by what is not revoked of them. Both are as they were after a failure.
[[nodiscard]] int DropRevoked(Ref<SExpression>& certs, Ref<SExpression>& extras, Evidence& evidence,
                              Vesk2ContextStruct* ctx) {
  for (auto it = certs->Begin(); it; it.Next()) {
    auto* const cert = dynamic_cast<Cert*>(it.Value());
    if (cert != nullptr) VESK2_TRY(evidence.AddCert(cert, nullptr, 0));
  }
  VESK2_TRY(AskStores(evidence, ctx));

  Ref<SExpression> keptCerts(TryNew<SExpression>(ctx));
  Ref<SExpression> keptExtras(TryNew<SExpression>(ctx));
  VESK2_REQUIRE(keptCerts && keptExtras, VESK2_ERR_MEM_ALLOC);
  auto extra = extras->Begin();
  for (auto it = certs->Begin(); it && extra; it.Next(), extra.Next()) {
    auto* const cert = dynamic_cast<Cert*>(it.Value());
    if (cert == nullptr) continue;
    // Callers are told what a chain would grant: one whose list is missing is kept.
    const int32_t status = cert->GetRevocationStatus();
    if (status == Cert::RevokedByCrl || status == Cert::KeyRevoked) continue;
    VESK2_TRY(AppendShared(keptCerts.get(), cert));
    VESK2_TRY(AppendShared(keptExtras.get(), extra.Value()));
  }
  certs = std::move(keptCerts);
  extras = std::move(keptExtras);
  return 0;
}

}  // namespace

int CertSequence::Verify2(SExpression*& tag, SExpression*& notBefore, SExpression*& notAfter) {
  Evidence evidence(GetContext());
  return Verify2(tag, notBefore, notAfter, evidence);
}

int CertSequence::Verify2(SExpression*& tag, SExpression*& notBefore, SExpression*& notAfter,
                          Evidence& evidence) {
  evidence.Clear(Evidence::Chain);
  VESK2_REQUIRE(tag == nullptr && notBefore == nullptr && notAfter == nullptr,
                VESK2_ERR_INVALID_PARAM);
  const ZVsysutil::ZvCall call;
  Ref<SExpression> certs(TryNew<SExpression>(GetContext()));
  Ref<SExpression> extras(TryNew<SExpression>(GetContext()));
  VESK2_REQUIRE(certs && extras, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(VerifySignatures2(certs.get(), extras.get()));
  VESK2_TRY(DropRevoked(certs, extras, evidence, GetContext()));
  return VerifyChain2(certs.get(), tag, notBefore, notAfter);
}

int CertSequence::VerifySignatures2(SExpression* goodCerts, SExpression* goodExtras) {
  VESK2_REQUIRE(goodCerts != nullptr && goodExtras != nullptr, VESK2_ERR_PARAM_NULL);
  auto at = FirstItem(this);
  VESK2_REQUIRE(at, VESK2_ERR_INVALID_SEQUENCE);
  while (at) {
    ChainLink link;
    VESK2_TRY(ReadLink(link, at));
    const int code = VerifyLink(link);
    VESK2_REQUIRE(!LacksMemory(code), VESK2_ERR_MEM_ALLOC);
    // After a failure the extra item is taken for the next certificate: what follows is counted
    // from there, and a sequence that ends in the middle of a triple is refused.
    if (code != 0) continue;
    VESK2_TRY(AppendShared(goodCerts, link.cert));
    VESK2_TRY(AppendShared(goodExtras, link.extra));
    at.Next();
  }
  return 0;
}

int CertSequence::VerifyRevocations2(SExpression*& goodCerts, SExpression*& goodExtras) {
  VESK2_REQUIRE(goodCerts != nullptr && goodExtras != nullptr, VESK2_ERR_PARAM_NULL);
  Ref<SExpression> certs = Ref<SExpression>::Share(goodCerts);
  Ref<SExpression> extras = Ref<SExpression>::Share(goodExtras);
  Evidence evidence(GetContext());
  VESK2_TRY(DropRevoked(certs, extras, evidence, GetContext()));
  const Ref<SExpression> oldCerts(std::exchange(goodCerts, certs.Release()));
  const Ref<SExpression> oldExtras(std::exchange(goodExtras, extras.Release()));
  return 0;
}

int CertSequence::VerifyChain2(SExpression* goodCerts, SExpression*& tag, SExpression*& notBefore,
                               SExpression*& notAfter) {
  VESK2_REQUIRE(goodCerts != nullptr, VESK2_ERR_PARAM_NULL);
  Ref<SExpression> acls;
  VESK2_TRY(LoadRoots(acls, GetContext()));
  auto* const leaf = dynamic_cast<Cert*>(goodCerts->First());
  VESK2_REQUIRE(leaf != nullptr, VESK2_ERR_INVALID_SEQUENCE);
  Ref<SExpression> chain;
  VESK2_TRY(SExpression::Create(chain.Out(), "sequence", GetContext()));
  for (auto it = goodCerts->Begin(); it; it.Next()) {
    auto* const cert = dynamic_cast<Cert*>(it.Value());
    VESK2_REQUIRE(cert != nullptr, VESK2_ERR_INVALID_SEQUENCE);
    VESK2_TRY(AppendIrrevocable(chain.get(), *cert));
  }
  return Verify::ReductB(GetContext(), acls.get(), chain.get(), leaf->GetSubject(), tag, notBefore,
                         notAfter);
}

}  // namespace ZvVesk2
