// SPDX-License-Identifier: Apache-2.0
// The engine's parser: what it accepts is written as it was read, but for heads of "sha256", which
// has no row of its own, and of keywords with a 0 byte behind them.
#include "fuzz/engine_support.h"

using namespace ZvVesk2::Engine;
using namespace vesk2fuzz;

FUZZ_TARGET(engine) {
  EngineRun engine;
  int code = 0;
  size_t consumed = 0;
  spki_elem* const list = engine.Parse(input, &code, &consumed);
  if (list == nullptr) return;
  FUZZ_CHECK(list->text_length == consumed);
  const std::string written = WrittenForm(list);
  const std::string_view text = input.substr(0, consumed);
  const bool exact = text.find("(6:sha256") == text.npos && text.find('\0') == text.npos;
  FUZZ_CHECK(!exact || written == text);
  spki_elem* const again = engine.Parse(written);
  FUZZ_CHECK(again != nullptr && WrittenForm(again) == written);
  // Sets and points are equal to nothing.
  const spki_relation relation = spki_cmp_chain(engine.get(), list, again);
  FUZZ_CHECK(relation >= SPKI_REL_EQUAL && relation <= SPKI_REL_OVERLAP);
  FUZZ_CHECK(spki_cmp_chain(engine.get(), list, list) == SPKI_REL_EQUAL || engine.Spent());
  spki_elem* const both = spki_intersect_chain(engine.get(), list, again);
  spki_elem* kept = nullptr;
  spki_elem_assign(engine.get(), &kept, both);
  engine.Keep(kept);
}
