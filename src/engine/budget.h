// SPDX-License-Identifier: Apache-2.0
// What a reduction may spend, and the price of all that it does: this page is the cost model.
//
// Certificates that an attacker signs for keys of his own multiply tuples, names and tags without
// end, and a file has room for long strings and for many short ones. So whoever does work pays for
// it first, by all that it may touch, in units: one is about what it takes to compare two short
// strings, some ten nanoseconds.
//
//   work                                                    units
//   ------------------------------------------------------  --------------------------------------
//   a step: an element of a tag, a bound of a range, a      1
//   tuple of a list, a node of a table, a position of a
//   threshold
//   strings compared, tested or copied, with their hints    1 for 64 bytes of all operands together
//   bytes looked at one by one (the end of a prefix)        1 for 8
//   a hash                                                  64
//   a piece of text that is hashed                          1, and 1 for 8 bytes
//   memory, in units of its own (live_records)              1 for a node; 1 for 64 bytes of any
//                                                           other block
//   a tuple inserted, two tuples combined                   counted each by itself
//
// A string shorter than 64 bytes is paid with the step that leads to it. Functions that compare,
// test, copy or hash charge inside, so that no caller can forget to; with a spent budget they
// answer that nothing is equal and nothing allowed, and whoever makes something of such an answer
// asks for `spent` first. What is only read once for each byte of the input (parsing, the fields of
// a credential) is not charged: the input has its own limit.
#ifndef VESK2_SRC_ENGINE_BUDGET_H
#define VESK2_SRC_ENGINE_BUDGET_H

#include "src/engine/model.h"

namespace ZvVesk2::Engine {

inline constexpr size_t kBytesPerUnit = 64;
inline constexpr size_t kSingleBytesPerUnit = 8;
inline constexpr size_t kHashedBytesPerUnit = 8;
inline constexpr size_t kUnitsPerHash = 64;

// Adds `amount` to one of the budget's counters, which never exceed their limits. 0, or the code
// that the reduction must end with: `code` when this was too much, or whatever was spent before. A
// budget that is spent stays spent, so a caller that overlooks one failure is stopped by the next.
[[nodiscard]] inline spki_status spki_charge(spki_engine* engine, uint32_t spki_budget::*counter,
                                             size_t amount, uint32_t limit,
                                             spki_status code = SPKI_ERR_NO_MEM) {
  spki_budget& budget = engine->budget;
  if (budget.spent != 0) return budget.spent;
  if (amount > limit - budget.*counter) return budget.spent = code;
  budget.*counter += static_cast<uint32_t>(amount);
  return 0;
}
[[nodiscard]] inline spki_status spki_charge_units(spki_engine* engine, size_t units,
                                                   spki_status code = SPKI_ERR_NO_MEM) {
  return spki_charge(engine, &spki_budget::comparisons, units, Limits::kMaxComparisons, code);
}

// One step. Short strings that it leads to are paid with it.
[[nodiscard]] inline spki_status spki_charge_step(spki_engine* engine,
                                                  spki_status code = SPKI_ERR_NO_MEM) {
  return spki_charge_units(engine, 1, code);
}
// One string, or the two of one operation.
inline size_t spki_atom_bytes(const spki_atom* atom) {
  return size_t{atom->hint_length} + atom->length;
}
[[nodiscard]] inline spki_status spki_charge_strings(spki_engine* engine, const spki_atom* a) {
  return spki_charge_units(engine, spki_atom_bytes(a) / kBytesPerUnit);
}
[[nodiscard]] inline spki_status spki_charge_strings(spki_engine* engine, const spki_atom* a,
                                                     const spki_atom* b) {
  return spki_charge_units(engine, (spki_atom_bytes(a) + spki_atom_bytes(b)) / kBytesPerUnit);
}
// One piece of what is hashed.
[[nodiscard]] inline spki_status spki_charge_hashed(spki_engine* engine, size_t bytes) {
  return spki_charge_units(engine, 1 + bytes / kHashedBytesPerUnit);
}
// One attempt to combine two tuples.
[[nodiscard]] inline spki_status spki_charge_combination(spki_engine* engine,
                                                         spki_status code = SPKI_ERR_NO_MEM) {
  return spki_charge(engine, &spki_budget::combinations, 1, Limits::kMaxCombinations, code);
}

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_BUDGET_H
