// Proving a manifest's chain against the stores of this machine.
#include "src/manifest/manifest_authority.h"

#include <utility>

#include <vesk2/acl_entry.h>
#include <vesk2/crl.h>
#include <vesk2/verify.h>

#include "src/frame/check.h"
#include "src/objects/build.h"
#include "src/sexpr/same.h"
#include "src/trust/revocation_lists.h"

namespace ZvVesk2 {
namespace {

// The second certificate of a chain, counted from 0: the signer's own.
constexpr unsigned kIssuersPlace = 1;

// A clone that may pass its grant on, whatever the certificate says: the signer certificate, which
// only names the content, is not a delegation.
int ClonePropagating(Cert& cert, Ref<Cert>& clone) {
  clone.Reset(TryNew<Cert>(cert.GetContext()));
  VESK2_REQUIRE(clone, VESK2_ERR_MEM_ALLOC);
  const bool own = cert.GetPropagate();
  cert.SetPropagate(true);
  const int code = clone->Clone(&cert);
  cert.SetPropagate(own);
  return code;
}

}  // namespace

int ManifestAuthority::SetPeriod(long notBefore, long notAfter, TimeStamp* signingTime) {
  VESK2_TRY(SExpression::Create(validity_.Out(), "valid", context_));
  notBefore_ = Ref<TimeStamp>::Share(signingTime);
  notAfter_ = Ref<TimeStamp>::Share(signingTime);
  if (notBefore == 0 && notAfter == 0) {
    return Append(validity_.get(), Ref<TimeStamp>::Share(signingTime));
  }
  if (notBefore != 0) VESK2_TRY(AddTime("not-before", notBefore, notBefore_));
  if (notAfter != 0) VESK2_TRY(AddTime("not-after", notAfter, notAfter_));
  return 0;
}

int ManifestAuthority::AddTime(const char* name, long seconds, Ref<TimeStamp>& revocationTime) {
  revocationTime.Reset(TryNew<TimeStamp>(context_));
  VESK2_REQUIRE(revocationTime, VESK2_ERR_MEM_ALLOC);
  const int code = revocationTime->Set(seconds);
  VESK2_REQUIRE(code != -1, VESK2_ERR_TIME_STAMP);  // a year that has no text
  VESK2_TRY(code);
  Ref<SExpression> pair;
  VESK2_TRY(SExpression::Create(pair.Out(), name, context_));
  VESK2_TRY(Append(pair.get(), Ref<TimeStamp>::Share(revocationTime.get())));
  return Append(validity_.get(), std::move(pair));
}

int ManifestAuthority::LoadRoots(const char* extraAclDirectory) {
  return AclEntry::Import(acls_.Out(), context_, extraAclDirectory);
}

int ManifestAuthority::MarkRevoked(SExpression* carried, bool updateStore) {
  Ref<SExpression> lists;
  VESK2_TRY(CrlSequence::ImportStore(lists.Out(), acls_.get(), context_));
  for (auto it = carried->Begin(); it; it.Next()) {
    VESK2_TRY(Append(lists.get(), Ref<DExpression>::Share(it.Value())));
  }
  // The status that this leaves decides; a certificate about which nothing is known is dropped like
  // a revoked one.
  RevocationLists revocations(acls_.get(), lists.get());
  VESK2_TRY(revocations.MarkAll(certificates_, notBefore_.get()));
  // What cannot be stored changes no answer.
  if (updateStore) static_cast<void>(revocations.Store(carried));
  return 0;
}

int ManifestAuthority::BuildChain(Ref<SExpression>& chain) {
  VESK2_TRY(SExpression::Create(chain.Out(), "sequence", context_));
  unsigned place = 0;
  for (auto it = certificates_->Begin(); it; it.Next()) {
    auto* const cert = dynamic_cast<Cert*>(it.Value());
    if (cert == nullptr || cert->GetRevocationStatus() != Cert::NotRevoked) continue;
    if (place++ != kIssuersPlace) {
      VESK2_TRY(Append(chain.get(), Ref<Cert>::Share(cert)));
      continue;
    }
    bool follows = false;
    VESK2_TRY(CompareValues(follows, cert->GetSubject(), signer_->GetIssuer()));
    VESK2_REQUIRE(follows, VESK2_ERR_SIGNING_CERT_ORDER);
    Ref<Cert> clone;
    VESK2_TRY(ClonePropagating(*cert, clone));
    VESK2_TRY(Append(chain.get(), std::move(clone)));
  }
  return place > kIssuersPlace ? 0 : VESK2_ERR_SIGNING_CERT_ORDER;
}

int ManifestAuthority::Prove(SExpression* tag) {
  // Without its signer the chain would be another one, about nothing that was signed.
  const int32_t status = signer_->GetRevocationStatus();
  VESK2_REQUIRE(status != Cert::Undetermined, VESK2_ERR_CRL_NOT_FOUND);
  VESK2_REQUIRE(status == Cert::NotRevoked, VESK2_ERR_CERT_REVOKED);
  Ref<SExpression> chain;
  VESK2_TRY(BuildChain(chain));
  return Verify::ReductA(context_, acls_.get(), chain.get(), signer_->GetSubject(), tag,
                         validity_.get());
}

}  // namespace ZvVesk2
