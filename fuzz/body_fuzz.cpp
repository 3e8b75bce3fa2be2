// SPDX-License-Identifier: Apache-2.0
// The manifest body: parsed, and compared with itself, every entry must come out valid.
#include "fuzz/fuzz_support.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

FUZZ_TARGET(body) {
  BodyDirectory root(nullptr);
  const int parsed = root.ParseBody(Wrap(input).get(), nullptr);
  Manifest manifest(nullptr);
  const int compared = manifest.Compare(Wrap(input).get(), Wrap(input).get());
  FUZZ_CHECK((parsed == 0) == (compared == 0));
  FUZZ_CHECK(manifest.GetInvalid() == nullptr && manifest.GetMissing() == nullptr &&
             manifest.GetExtra() == nullptr);
}
