// SPDX-License-Identifier: Apache-2.0
// The readers of typed objects. An accepted object must print to a text that reads back to itself.
#include "fuzz/fuzz_support.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

template <typename T>
static void RoundTrip(const std::string& text) {
  Ref<T> read(new T(nullptr));
  if (read->Import(Wrap(text).get()) != 0) return;
  const std::string printed = Print(read.get());
  Ref<T> again(new T(nullptr));
  FUZZ_CHECK(again->Import(Wrap(printed).get()) == 0);
  FUZZ_CHECK(Print(again.get()) == printed);
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string text(reinterpret_cast<const char*>(data), size);
  RoundTrip<Hash>(text);
  RoundTrip<PublicKey>(text);
  RoundTrip<ThresholdSubject>(text);
  RoundTrip<Signature>(text);
  RoundTrip<Cert>(text);
  RoundTrip<AclEntry>(text);
  RoundTrip<Crl>(text);
  RoundTrip<CrlSequence>(text);
  Ref<CertSequence> sequence;
  if (CertSequence::Import(sequence.Out(), Wrap(text).get(), nullptr) != 0) FUZZ_CHECK(!sequence);
  return 0;
}
