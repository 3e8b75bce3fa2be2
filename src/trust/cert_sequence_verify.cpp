// CertSequence: whether a chain proves that a subject holds a tag. The first failure is the answer.
#include <vesk2/cert_sequence.h>
#include <vesk2/verify.h>

#include "src/platform/wait.h"
#include "src/trust/chain.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {

int CertSequence::Verify(Subject* subject, SExpression* tag, TimeStamp* notBefore,
                         TimeStamp* notAfter, const char* name, bool usePath,
                         Vesk2ContextStruct* ctx) {
  VESK2_REQUIRE(name != nullptr, VESK2_ERR_PARAM_NULL);
  const ZVsysutil::ZvCall call;
  Ref<CertSequence> sequence;
  VESK2_TRY(Import(sequence.Out(), name, usePath, ctx));
  return sequence->Verify(subject, tag, notBefore, notAfter);
}

int CertSequence::Verify(Subject* subject, SExpression* tag, TimeStamp* notBefore,
                         TimeStamp* notAfter) {
  const ZVsysutil::ZvCall call;
  VESK2_TRY(VerifySignatures());
  VESK2_TRY(VerifyRevocations(notBefore, notAfter));
  return VerifyChain(subject, tag, notBefore, notAfter);
}

int CertSequence::VerifySignatures() {
  auto at = FirstItem(this);
  VESK2_REQUIRE(at, VESK2_ERR_INVALID_SEQUENCE);
  while (at) {
    ChainLink link;
    VESK2_TRY(ReadWholeLink(link, at));
    VESK2_TRY(link.signature->Verify(link.cert));
  }
  return 0;
}

int CertSequence::VerifyRevocations(TimeStamp* notBefore, TimeStamp* notAfter) {
  const ZVsysutil::ZvCall call;
  auto at = FirstItem(this);
  VESK2_REQUIRE(at, VESK2_ERR_INVALID_SEQUENCE);
  Ref<SExpression> certs(TryNew<SExpression>(GetContext()));
  VESK2_REQUIRE(certs, VESK2_ERR_MEM_ALLOC);
  while (at) {
    ChainLink link;
    VESK2_TRY(ReadWholeLink(link, at));
    VESK2_TRY(AppendShared(certs.get(), link.cert));
  }

  Ref<SExpression> acls;
  VESK2_TRY(LoadRoots(acls, GetContext()));
  VESK2_TRY(MarkRevoked(certs.get(), acls.get(), notBefore, notAfter));
  for (auto it = certs->Begin(); it; it.Next()) {
    auto* const cert = dynamic_cast<Cert*>(it.Value());
    VESK2_REQUIRE(cert != nullptr, VESK2_ERR_INVALID_SEQUENCE);
    const int32_t status = cert->GetRevocationStatus();
    VESK2_REQUIRE(status != Cert::Undetermined, VESK2_ERR_CRL_NOT_FOUND);
    VESK2_REQUIRE(status == Cert::NotRevoked, VESK2_ERR_CERT_REVOKED);
  }
  return 0;
}

namespace {

// (valid [(not-before <stamp>)] [(not-after <stamp>)]) over the caller's stamps; null without any.
int MakeValidity(Ref<SExpression>& out, TimeStamp* notBefore, TimeStamp* notAfter,
                 Vesk2ContextStruct* ctx) {
  if (notBefore == nullptr && notAfter == nullptr) return 0;
  Ref<SExpression> valid;
  VESK2_TRY(SExpression::Create(valid.Out(), "valid", ctx));
  if (notBefore != nullptr) {
    VESK2_TRY(AppendPair(valid.get(), "not-before", Ref<TimeStamp>::Share(notBefore)));
  }
  if (notAfter != nullptr) {
    VESK2_TRY(AppendPair(valid.get(), "not-after", Ref<TimeStamp>::Share(notAfter)));
  }
  out = std::move(valid);
  return 0;
}

}  // namespace

int CertSequence::VerifyChain(Subject* subject, SExpression* tag, TimeStamp* notBefore,
                              TimeStamp* notAfter) {
  auto at = FirstItem(this);
  VESK2_REQUIRE(at, VESK2_ERR_INVALID_SEQUENCE);
  Ref<SExpression> chain;
  VESK2_TRY(SExpression::Create(chain.Out(), "sequence", GetContext()));
  while (at) {
    ChainLink link;
    VESK2_TRY(ReadWholeLink(link, at));
    if (subject == nullptr) subject = link.cert->GetSubject();
    VESK2_TRY(AppendCopy(chain.get(), link.cert));
  }

  Ref<SExpression> acls;
  VESK2_TRY(LoadRoots(acls, GetContext()));
  Ref<SExpression> validity;
  VESK2_TRY(MakeValidity(validity, notBefore, notAfter, GetContext()));
  return Verify::ReductA(GetContext(), acls.get(), chain.get(), subject, tag, validity.get());
}

}  // namespace ZvVesk2
