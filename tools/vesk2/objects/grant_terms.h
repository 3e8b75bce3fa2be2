// SPDX-License-Identifier: Apache-2.0
// grant_terms.h: what a certificate says, and what one that replaces it says differently.
#ifndef VESK2_TOOLS_GRANT_TERMS_H
#define VESK2_TOOLS_GRANT_TERMS_H

#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/objects/times.h"

#include <vesk2/cert.h>

namespace vesk2_command {

// What a certificate says, beside its issuer. Only the subject is required; without a tag it passes
// on all that the issuer was granted.
struct Grant {
  ZvVesk2::Subject* subject = nullptr;
  bool propagate = false;
  SExpression* tag = nullptr;
  Period period = {};
  ByteString* comment = nullptr;
  SExpression* revocation = nullptr;  // where lists tell whether the certificate is revoked
};

// What a certificate that replaces another says differently; what is not set stays as it was.
struct Renewal {
  Ref<SExpression> tag = {};
  bool propagate = false;  // lets the subject pass it on
  bool newPeriod = false;  // the whole period is replaced
  Period period = {};
  Ref<ByteString> comment = {};
};
Grant Renewed(const ZvVesk2::Cert& old, const Renewal& renewal);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_GRANT_TERMS_H
