// SPDX-License-Identifier: Apache-2.0
// The reduction of any lists, well formed or not: entries, certificates, a requester, a tag and a
// period, one after the other in the input. Whatever they hold there is an answer, and what is
// granted can be read.
#include "fuzz/engine_support.h"

using namespace ZvVesk2::Engine;
using namespace vesk2fuzz;

FUZZ_TARGET(credentials) {
  EngineRun engine;
  spki_elem* lists[5] = {};
  for (spki_elem*& list : lists) {
    size_t consumed = 0;
    int code = 0;
    list = engine.Parse(input, &code, &consumed);
    if (list == nullptr) break;
    input.remove_prefix(consumed);
  }
  if (lists[2] == nullptr) return;
  spki_elem* result = nullptr;
  const spki_status status =
      spki_reduce(engine.get(), lists[0], lists[1], lists[2], lists[3], lists[4], &result);
  engine.Keep(result);
  FUZZ_CHECK((status == 0) == (result != nullptr) && status <= 0);
  if (result == nullptr) return;
  FUZZ_CHECK(engine.Parse(WrittenForm(result)) != nullptr);
}
