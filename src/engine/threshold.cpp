// SPDX-License-Identifier: Apache-2.0
// Expansion and collection of k-of-n subjects:
//
//   (k-of-n k n S1 ... Sn), k and n big-endian numbers of 1 to 3 bytes, 0 < k <= n
//
// Each subject becomes a member tuple, which is delegated on like any grant, but is worth nothing
// until k positions have got to the same principal. A subject listed twice has two positions.
#include "src/engine/threshold.h"

#include <algorithm>

#include "src/engine/budget.h"
#include "src/engine/chain.h"
#include "src/engine/fields.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

// A count of `elem`; 0 for anything that is none. Bytes, not digits: "2" would be fifty.
uint32_t ReadCount(const spki_elem* elem) {
  const spki_atom* atom = StringOf(elem);
  if (atom == nullptr || atom->hint_length > 0 || atom->length > 3) return 0;
  uint32_t count = 0;
  for (uint32_t i = 0; i < atom->length; ++i) count = count << 8 | atom->data[i];
  return count;
}

// The number of lists from `elem` on; 0 when there is something else among them.
uint32_t CountLists(const spki_elem* elem) {
  uint32_t count = 0;
  for (; elem != nullptr; elem = elem->next) {
    if (ListOf(elem) == nullptr) return 0;
    ++count;
  }
  return count;
}

// The (k-of-n ...) list of a (subject ...) list, or the list itself when it is a member of another.
const spki_elem* ThresholdList(const spki_elem* subject) {
  return HeadKeyword(subject) == SPKI_KW_SUBJECT ? ListOf(subject->next) : subject;
}

[[nodiscard]] spki_status NewThreshold(spki_reduction* run, const spki_tuple* carrier, uint32_t k,
                                       uint32_t n, spki_threshold** slot) {
  spki_engine* engine = run->engine;
  auto* threshold = static_cast<spki_threshold*>(spki_allocate(engine, sizeof(spki_threshold)));
  VESK2_REQUIRE(threshold != nullptr, SPKI_ERR_NO_MEM);
  *threshold = {run->thresholds,    k,      n, carrier->member, carrier->issuer,
                carrier->threshold, nullptr};
  run->thresholds = threshold;
  // NOLINTNEXTLINE(bugprone-sizeof-expression): an array of pointers
  const size_t size = (size_t{n} + 1) * sizeof(spki_entry*);
  threshold->chains = static_cast<spki_entry**>(spki_allocate(engine, size));
  VESK2_REQUIRE(threshold->chains != nullptr, SPKI_ERR_NO_MEM);
  std::fill_n(threshold->chains, size_t{n} + 1, nullptr);
  *slot = threshold;
  return 0;
}

// The tuple of the next subject: the carrier's grant, at one more position.
[[nodiscard]] spki_status NextMember(spki_reduction* run, spki_work* work, spki_tuple** made) {
  if (work->member == nullptr) {
    work->step = nullptr;
    return 0;
  }
  spki_engine* engine = run->engine;
  spki_elem* list = ListOf(work->member);
  work->member = work->member->next;
  spki_tuple_owner copy = Own(engine, spki_tuple_copy(engine, work->tuple));
  VESK2_REQUIRE(copy != nullptr, SPKI_ERR_NO_MEM);
  copy->member = ++work->position;
  copy->threshold = work->threshold;
  spki_elem_assign(engine, &copy->subject_list, list);
  VESK2_TRY(spki_tuple_subject(engine, copy.get(), list));
  spki_mark_reach(run, copy.get());
  *made = copy.release();
  return 0;
}

}  // namespace

spki_status spki_threshold_expand(spki_reduction* run, spki_work* work) {
  const spki_elem* list = ThresholdList(work->tuple->subject_list);
  VESK2_REQUIRE(list != nullptr, SPKI_ERR_SUBJECT_SYNTAX);
  const spki_elem* k = list->next;
  const spki_elem* n = k == nullptr ? nullptr : k->next;
  VESK2_REQUIRE(n != nullptr, SPKI_ERR_KOFN_SYNTAX);
  const uint32_t wanted = ReadCount(k);
  const uint32_t count = ReadCount(n);
  VESK2_REQUIRE(wanted > 0 && wanted <= count, SPKI_ERR_KOFN_SYNTAX);
  // Before memory is taken for what the number only claims.
  VESK2_REQUIRE(CountLists(n->next) == count, SPKI_ERR_KOFN_SYNTAX);
  VESK2_TRY(spki_charge_units(run->engine, count));
  VESK2_TRY(NewThreshold(run, work->tuple, wanted, count, &work->threshold));
  work->member = n->next;
  work->step = NextMember;
  return 0;
}

// A tuple that was collected before has been searched with, too: the insertion ends. That is what
// ends delegation in a circle among members.
spki_status spki_threshold_collect(spki_reduction* run, spki_work* work, spki_step next,
                                   spki_tuple** made) {
  spki_tuple* tuple = work->tuple;
  spki_threshold* threshold = tuple->threshold;
  VESK2_REQUIRE(threshold != nullptr, SPKI_ERR_THRESHOLD);
  const auto position = static_cast<uint32_t>(tuple->member);
  VESK2_REQUIRE(position >= 1 && position <= threshold->n, SPKI_ERR_THRESHOLD);
  bool filed = false;
  VESK2_TRY(spki_tuple_file(run->engine, &threshold->chains[position], tuple, &filed));
  work->step = filed ? next : nullptr;
  return filed ? spki_threshold_search(run->engine, threshold, tuple, made) : 0;
}

void spki_thresholds_clear(spki_reduction* run) {
  while (spki_threshold* threshold = run->thresholds) {
    run->thresholds = threshold->next;
    for (uint32_t i = 0; threshold->chains != nullptr && i <= threshold->n; ++i) {
      spki_entries_clear(run->engine, &threshold->chains[i]);
    }
    spki_free(run->engine, threshold->chains);
    spki_free(run->engine, threshold);
  }
}

}  // namespace ZvVesk2::Engine
