// SPDX-License-Identifier: Apache-2.0
// Signatures: read, written, and verified over an object that nobody signed.
#include "fuzz/round_trip.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

FUZZ_TARGET(signature) {
  Ref<Signature> signature;
  if (!RoundTrip<Signature>(input, signature)) return;
  FUZZ_CHECK(signature->GetHash() != nullptr && signature->GetPrincipal() != nullptr);
  FUZZ_CHECK(signature->GetAlgorithm() != nullptr && signature->GetValue() != nullptr);
  Ref<SExpression> object;
  FUZZ_CHECK(SExpression::Create(object.Out(), "nobody", nullptr) == 0);
  FUZZ_CHECK(signature->Verify(object.get()) != 0);
}
