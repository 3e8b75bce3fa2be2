// SPDX-License-Identifier: Apache-2.0
// Certificates. A copy of one says the same, but that it has a version.
#include "fuzz/round_trip.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

FUZZ_TARGET(cert) {
  Ref<Cert> cert;
  if (!RoundTrip<Cert>(input, cert)) return;
  FUZZ_CHECK(cert->GetIssuer() != nullptr && cert->GetSubject() != nullptr);
  Ref<Cert> copy(new Cert(nullptr));
  FUZZ_CHECK(copy->Clone(cert.get()) == 0);
  FUZZ_CHECK(copy->GetPropagate() == cert->GetPropagate());
  FUZZ_CHECK(copy->IsEqual(cert.get()) || cert->GetVersion() == nullptr ||
             cert->GetNotBefore() == nullptr);
  RoundTrip<Cert>(Print(copy.get()));
}
