// What a certificate asks of the trust store: whether it was revoked; and a trust root seen as a
// certificate.
#include <vesk2/cert.h>

#include <vesk2/acl_entry.h>
#include <vesk2/crl.h>

#include "src/platform/wait.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {

Cert::Cert(AclEntry* entry)
    : SExpression(entry->GetContext()),
      subject(entry->GetSubject()),
      propagate(entry->GetPropagate()),
      tag(entry->GetTag()),
      notBefore(entry->GetNotBefore()),
      notAfter(entry->GetNotAfter()),
      comment(entry->GetComment()) {}

int Cert::IsRevoked(bool& revoked, SExpression* acls, SExpression* crls, TimeStamp* from,
                    TimeStamp* to) {
  revoked = false;
  // Chain verification looks at the status alone: it speaks for the certificate only when both
  // questions were answered.
  revocationStatus = Undetermined;

  const int key = CrlSequence::CheckStatusCritical(acls, crls, nullptr, subject);
  if (key == VESK2_ERR_KEY_REVOKED) {
    revocationStatus = KeyRevoked;
    revoked = true;
    return 0;
  }
  VESK2_TRY(key);

  if (revocationElement != nullptr) {
    Ref<SExpression> source;
    VESK2_TRY(MakeTag(source, revocationElement));
    const int listed =
        CrlSequence::CheckStatusNonCritical(acls, crls, source.get(), this, from, to);
    if (listed == VESK2_ERR_CERT_REVOKED) {
      revocationStatus = RevokedByCrl;
      revoked = true;
      return 0;
    }
    VESK2_TRY(listed);
  }
  revocationStatus = NotRevoked;
  return 0;
}

int Cert::IsRevoked(bool& revoked) {
  revoked = false;
  revocationStatus = Undetermined;
  const ZVsysutil::ZvCall call;
  Ref<SExpression> acls;
  VESK2_TRY(AclEntry::Import(acls.Out(), GetContext(), nullptr));
  Ref<SExpression> crls;
  VESK2_TRY(CrlSequence::ImportStore(crls.Out(), acls.get(), GetContext()));
  Ref<TimeStamp> now;
  VESK2_TRY(MakeNow(now, GetContext()));
  return IsRevoked(revoked, acls.get(), crls.get(), now.get(), now.get());
}

}  // namespace ZvVesk2
