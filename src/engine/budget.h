// What a reduction may spend. Certificates that an attacker signs for keys of his own multiply
// tuples, names and tags without end, so every loop that hostile credentials can lengthen pays for
// each step here.
#ifndef VESK2_SRC_ENGINE_BUDGET_H
#define VESK2_SRC_ENGINE_BUDGET_H

#include "src/engine/model.h"

namespace ZvVesk2::Engine {

// Adds `amount` to one of the budget's counters. 0, or the code that the reduction must end with:
// `code` when this was too much, or whatever was spent before.
[[nodiscard]] inline spki_status spki_charge(spki_engine* engine, uint32_t spki_budget::*counter,
                                             uint32_t amount, uint32_t limit,
                                             spki_status code = SPKI_ERR_NO_MEM) {
  spki_budget& budget = engine->budget;
  if (budget.spent != 0) return budget.spent;
  if (amount > limit - budget.*counter) return budget.spent = code;
  budget.*counter += amount;
  return 0;
}

// One step along a chain of a table.
[[nodiscard]] inline spki_status spki_charge_step(spki_engine* engine,
                                                  spki_status code = SPKI_ERR_NO_MEM) {
  return spki_charge(engine, &spki_budget::comparisons, 1, Limits::kMaxComparisons, code);
}
// One attempt to combine two tuples.
[[nodiscard]] inline spki_status spki_charge_combination(spki_engine* engine,
                                                         spki_status code = SPKI_ERR_NO_MEM) {
  return spki_charge(engine, &spki_budget::combinations, 1, Limits::kMaxCombinations, code);
}

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_BUDGET_H
