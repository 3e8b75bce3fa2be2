// SPDX-License-Identifier: Apache-2.0
// grant_terms.cpp: renewing what a certificate says.
#include "tools/vesk2/objects/grant_terms.h"

namespace vesk2_command {

Grant Renewed(const ZvVesk2::Cert& old, const Renewal& renewal) {
  Grant grant{old.GetSubject(), old.GetPropagate() || renewal.propagate};
  grant.tag = renewal.tag ? renewal.tag.get() : old.GetTag();
  const bool fresh = renewal.newPeriod;
  grant.period.notBefore =
      Ref<TimeStamp>::Share(fresh ? renewal.period.notBefore.get() : old.GetNotBefore());
  grant.period.notAfter =
      Ref<TimeStamp>::Share(fresh ? renewal.period.notAfter.get() : old.GetNotAfter());
  grant.comment = renewal.comment ? renewal.comment.get() : old.GetComment();
  grant.revocation = old.GetRevocationElement();
  return grant;
}

}  // namespace vesk2_command
