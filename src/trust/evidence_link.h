// SPDX-License-Identifier: Apache-2.0
// One certificate of an Evidence, with what was found about it.
#ifndef VESK2_SRC_TRUST_EVIDENCE_LINK_H
#define VESK2_SRC_TRUST_EVIDENCE_LINK_H

#include <vesk2/crl.h>
#include <vesk2/evidence.h>

namespace ZvVesk2 {

struct Evidence::Link {
  Ref<Cert> cert;
  Ref<Signature> signature;
  Ref<SExpression> source;
  int signatureCode = 0;
  int32_t status = Cert::Undetermined;  // until the lists were asked
  Ref<CrlSequence> list;                // see RevocationLists::Decision
  Ref<TimeStamp> since;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_TRUST_EVIDENCE_LINK_H
