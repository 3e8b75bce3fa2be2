// SPDX-License-Identifier: Apache-2.0
// Chains of certificates: the whole list, and pair by pair, which must find the same certificates.
#include "fuzz/round_trip.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

FUZZ_TARGET(sequence) {
  const Buffer buffer = Wrap(input);
  Ref<CertSequence> sequence;
  if (CertSequence::Import(sequence.Out(), buffer.get(), nullptr) != 0) {
    FUZZ_CHECK(!sequence);
    return;
  }
  const std::string printed = Print(sequence.get());
  FUZZ_CHECK(IsWrittenForm<CertSequence>(printed, input.substr(0, buffer->Position())));
  Ref<CertSequence> again;
  FUZZ_CHECK(CertSequence::Import(again.Out(), Wrap(printed).get(), nullptr) == 0);
  FUZZ_CHECK(again->IsEqual(sequence.get()) && Print(again.get()) == printed);
  FUZZ_CHECK((sequence->Count() - 1) % 3 == 0);
  // Nobody grants anything here.
  FUZZ_CHECK(sequence->Verify(nullptr, nullptr, nullptr, nullptr) != 0);
}
