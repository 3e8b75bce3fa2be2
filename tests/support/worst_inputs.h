// SPDX-License-Identifier: Apache-2.0
// The worst inputs known: text that a stranger may write so that the reductions have as much to do,
// or to hold, as its length allows. The tests count the work of each; scripts/bench --worst takes
// the time.
#ifndef VESK2_TESTS_SUPPORT_WORST_INPUTS_H
#define VESK2_TESTS_SUPPORT_WORST_INPUTS_H

#include <cstddef>
#include <span>
#include <string>

namespace vesk2test {

// The lists of one call, in canonical text; what the call does not take is empty. For IsSubset
// `tag` is held against `acl`.
struct WorstLists {
  std::string acl = {}, sequence = {}, third = {}, tag = {};
};

enum class WorstCall { Subset, ReductA, ReductB };

struct WorstInput {
  const char* name;
  WorstCall call;
  // Some `bytes` in all.
  WorstLists (*make)(size_t bytes);
  unsigned units;  // thousands that kWorstBytes spend, of kWorstUnits
  // Nothing but a large installation: its work grows as its length does.
  bool large = false;
};

inline constexpr size_t kWorstBytes = 20'000;
inline constexpr unsigned kWorstUnits = 3'000'000;

std::span<const WorstInput> WorstInputs();

// Two tags of `bytes` in all which share "(install)" and take long to compare.
struct WorstTags {
  std::string first, second;
};
WorstTags TagsThatTakeLong(size_t bytes);

}  // namespace vesk2test

#endif  // VESK2_TESTS_SUPPORT_WORST_INPUTS_H
