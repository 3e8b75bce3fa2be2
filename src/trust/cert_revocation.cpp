// SPDX-License-Identifier: Apache-2.0
// What a certificate asks of the trust store: whether it was revoked; and a trust root seen as a
// certificate. It is here, above the class, because a certificate knows nothing of stores: the
// arrows point down.
#include <vesk2/cert.h>

#include <vesk2/acl_entry.h>
#include <vesk2/crl.h>

#include "src/platform/wait.h"
#include "src/trust/lists.h"
#include "src/trust/revocation_lists.h"

namespace ZvVesk2 {

// Nothing is counted: the entry outlives its view, which is made for the time of one question. No
// list is built, so that nobody can write a certificate that nobody issued.
Cert::Cert(AclEntry* entry)
    : SExpression(entry->GetContext()),
      subject(entry->GetSubject()),
      propagate(entry->GetPropagate()),
      tag(entry->GetTag()),
      notBefore(entry->GetNotBefore()),
      notAfter(entry->GetNotAfter()),
      comment(entry->GetComment()) {}

// The key is asked first: a revoked key ends it, whatever its certificates say, and needs no list
// of the certificate's own source. Only the subject's key is asked. The issuer is the subject of
// the next certificate, or is named by an entry, which is taken back by removing it; members of a
// k-of-n are asked by nobody, as the question is about the group's digest.
int RevocationLists::Mark(Decision& decision, Cert* cert, const TimeStamp* notBefore) {
  // Chain verification looks at the status alone: it speaks for the certificate only when both
  // questions were answered.
  cert->revocationStatus = Cert::Undetermined;

  const int key = AskCritical(decision, nullptr, cert->GetSubject());
  if (key == VESK2_ERR_KEY_REVOKED) {
    cert->revocationStatus = Cert::KeyRevoked;
    return 0;
  }
  // An answer that failed leaves the certificate undetermined.
  VESK2_TRY(key);

  // A certificate that names no source cannot be revoked itself, and one that does is lost without
  // a list of it: its issuer wanted it so.
  if (cert->GetRevocationElement() != nullptr) {
    Ref<SExpression> source;
    VESK2_TRY(MakeTag(source, cert->GetRevocationElement()));
    const int listed = AskNonCritical(decision, source.get(), cert, notBefore);
    if (listed == VESK2_ERR_CERT_REVOKED) {
      cert->revocationStatus = Cert::RevokedByCrl;
      return 0;
    }
    VESK2_TRY(listed);
  }
  cert->revocationStatus = Cert::NotRevoked;
  return 0;
}

// The end of the period plays no part: what is revoked at its start stays revoked, and what is
// revoked within it was good when it began.
int Cert::IsRevoked(bool& revoked, SExpression* acls, SExpression* crls, TimeStamp* from,
                    TimeStamp*) {
  revoked = false;
  RevocationLists::Decision decision;
  VESK2_TRY(RevocationLists(acls, crls).Mark(decision, this, from));
  revoked = revocationStatus != NotRevoked;
  return 0;
}

int Cert::IsRevoked(bool& revoked) {
  revoked = false;
  // Who looks at the status after a failure on the way must not see an older answer.
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
