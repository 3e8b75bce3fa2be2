// SPDX-License-Identifier: Apache-2.0
// Revocation lists, alone and with what vouches for them. Built anew from its fields a list says
// the same.
#include "fuzz/round_trip.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

FUZZ_TARGET(crl) {
  Ref<Crl> list;
  if (RoundTrip<Crl>(input, list)) {
    const std::string printed = Print(list.get());
    FUZZ_CHECK(list->BuildSExpression() == 0 && Print(list.get()) == printed);
    FUZZ_CHECK(list->GetIssuerTag() == nullptr);
  }
  Ref<CrlSequence> sequence(new CrlSequence(nullptr));
  const Buffer buffer = Wrap(input);
  if (sequence->Import(buffer.get()) != 0) return;
  const std::string printed = Print(sequence.get());
  Ref<CrlSequence> again(new CrlSequence(nullptr));
  FUZZ_CHECK(again->Import(Wrap(printed).get()) == 0 && Print(again.get()) == printed);
  FUZZ_CHECK(sequence->BuildSExpression() == 0 && Print(sequence.get()) == printed);
  long from = 0;
  long until = 0;
  FUZZ_CHECK(sequence->VerifyValidity(&from, &until) == 0);
}
