// SPDX-License-Identifier: Apache-2.0
// Public keys and the other subjects. A key that was read can be written in the forms of other
// programs.
#include "fuzz/round_trip.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

static void UseKey(PublicKey& key) {
  unsigned char* out = nullptr;
  unsigned int length = 0;
  for (const bool ssh : {true, false}) {
    const int code = ssh ? key.SshExport(out, length) : key.X509Export(out, length);
    FUZZ_CHECK((code == 0) == (out != nullptr));
    Vesk2Free(out);
    out = nullptr;
  }
}

FUZZ_TARGET(key) {
  Ref<PublicKey> key;
  if (RoundTrip<PublicKey>(input, key)) UseKey(*key);
  RoundTrip<Hash>(input);
  Ref<ThresholdSubject> threshold;
  if (RoundTrip<ThresholdSubject>(input, threshold)) {
    Ref<SExpression> members;
    FUZZ_CHECK(threshold->GetSubjects(members.Out()) == 0 || !members);
  }
  Ref<Subject> subject;
  const int code = Subject::Import(subject.Out(), Wrap(input).get(), nullptr);
  FUZZ_CHECK((code == 0) == static_cast<bool>(subject));
  FUZZ_CHECK(code != 0 || key->First() != nullptr || threshold || subject->IsHash());
}
