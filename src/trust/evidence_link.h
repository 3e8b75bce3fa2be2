// SPDX-License-Identifier: Apache-2.0
// One certificate of an Evidence, with what was found about it.
#ifndef VESK2_SRC_TRUST_EVIDENCE_LINK_H
#define VESK2_SRC_TRUST_EVIDENCE_LINK_H

#include <vesk2/crl.h>
#include <vesk2/evidence.h>

namespace ZvVesk2 {

// `status` is copied out of the certificate after each question: the certificate is shared with
// other evidence, whose questions overwrite the one in it.
struct Evidence::Link {
  Ref<Cert> cert;
  Ref<Signature> signature;
  Ref<SExpression> source;
  int signatureCode = 0;
  // Undetermined until the lists were asked.
  int32_t status = Cert::Undetermined;
  // See RevocationLists::Decision.
  Ref<CrlSequence> list;
  Ref<TimeStamp> since;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_TRUST_EVIDENCE_LINK_H
