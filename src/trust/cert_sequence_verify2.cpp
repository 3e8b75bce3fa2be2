// SPDX-License-Identifier: Apache-2.0
// CertSequence: what a chain grants when the certificates that fail are left out of it. It tells
// what could be granted, for tools that show it. It is lenient where a verdict must not be:
// undetermined certificates are kept, and no time is asked.
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

// Items of other kinds fail like a bad signature: the walk goes on behind them by the same rule.
[[nodiscard]] int VerifyLink(const ChainLink& link) {
  VESK2_REQUIRE(link.cert != nullptr && link.signature != nullptr, VESK2_ERR_SIGNATURE);
  return link.signature->Verify(link.cert);
}

// Both stores once, for all certificates together.
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

// Replaces the lists by what is not revoked of them. Both are as they were after a failure. The two
// lists run in step: the extra item of a certificate goes with it.
[[nodiscard]] int DropRevoked(Ref<SExpression>& certs, Ref<SExpression>& extras, Evidence& evidence,
                              Vesk2ContextStruct* ctx) {
  for (auto it = certs->Begin(); it; it.Next()) {
    auto* const cert = dynamic_cast<Cert*>(it.Value());
    if (cert != nullptr) VESK2_TRY(evidence.AddCert(cert, nullptr, 0));
  }
  VESK2_TRY(AskStores(evidence, ctx));

  Ref<SExpression> keptCerts(TryNew<SExpression>(ctx));
  Ref<SExpression> keptExtras(TryNew<SExpression>(ctx));
  // Both lists are made before either is filled.
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

// Unlike Verify, a bad signature costs its certificate only, and what is left may still be a chain.
int CertSequence::Verify2(SExpression*& tag, SExpression*& notBefore, SExpression*& notAfter,
                          Evidence& evidence) {
  // Emptied before anything is tested: evidence of an earlier question must not stand beside this
  // refusal.
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

// Lists that a caller hands in are added to, never emptied: programs gather several chains in one.
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

// The new lists are whole before the old ones go, so that a failure leaves the caller what it had.
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

// The question is about the subject of the first certificate that is left, which may be another
// than the chain began with: who decides by this must look whose grant it is.
int CertSequence::VerifyChain2(SExpression* goodCerts, SExpression*& tag, SExpression*& notBefore,
                               SExpression*& notAfter) {
  VESK2_REQUIRE(goodCerts != nullptr, VESK2_ERR_PARAM_NULL);
  Ref<SExpression> acls;
  // Loaded anew: the lists may have been made long before.
  VESK2_TRY(LoadRoots(acls, GetContext()));
  // Nobody is asked about when no certificate is left.
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
