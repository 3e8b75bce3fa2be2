// SPDX-License-Identifier: Apache-2.0
// Insertion of tuples: the stack, and what happens to a tuple whose subject is a principal.
//
// A grant from I to S is combined with what I received (someone grants to I, I grants to S) once it
// reaches the requester, and with what S issued. Only grants that reach the requester are second in
// a combination, so every derived one leads to it: chains are built backwards from the requester,
// and what leads elsewhere is filed and passed over.
//
// A tuple is filed before it is combined, so of each pair the later one finds the earlier. Where
// both find each other, the second result equals the first and is not filed again; by that rule
// delegation in a circle ends, too.
#include "src/engine/budget.h"
#include "src/engine/reduction.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

[[nodiscard]] spki_status Begin(spki_reduction* run, spki_work* work, spki_tuple** made);

// Puts an insertion on top. It takes a reference, and counts against the budget of tuples: of all
// that are made, not of those that are kept.
[[nodiscard]] spki_status Push(spki_reduction* run, spki_tuple* tuple) {
  spki_engine* engine = run->engine;
  VESK2_TRY(spki_charge(engine, &spki_budget::tuples, 1, Limits::kMaxTuples));
  auto* work = static_cast<spki_work*>(spki_allocate(engine, sizeof(spki_work)));
  VESK2_REQUIRE(work != nullptr, SPKI_ERR_NO_MEM);
  *work = {};
  work->below = run->work;
  work->tuple = tuple;
  ++tuple->refcount;
  work->step = Begin;
  run->work = work;
  return 0;
}

void Pop(spki_reduction* run) {
  spki_work* work = run->work;
  run->work = work->below;
  spki_tuple_release(run->engine, work->tuple);
  spki_free(run->engine, work);
}

// One step of the insertion on top.
[[nodiscard]] spki_status Advance(spki_reduction* run) {
  VESK2_TRY(run->engine->budget.spent);
  if (run->work->step == nullptr) {
    Pop(run);
    return 0;
  }
  spki_tuple* made = nullptr;
  VESK2_TRY(run->work->step(run, run->work, &made));
  const spki_tuple_owner owner = Own(run->engine, made);
  return made == nullptr ? 0 : Push(run, made);
}

// This one first, with what its subject issued.
[[nodiscard]] spki_status Downward(spki_reduction* run, spki_work* work, spki_tuple** made) {
  while (const spki_tuple* second = spki_next_tuple(run, work)) {
    if (!second->reaches) continue;
    VESK2_TRY(spki_tuple_combine(run->engine, work->tuple, second, made));
    if (*made != nullptr) return 0;
  }
  work->step = nullptr;
  return 0;
}

// What the issuer received first, with this one.
[[nodiscard]] spki_status Upward(spki_reduction* run, spki_work* work, spki_tuple** made) {
  while (const spki_tuple* first = spki_next_tuple(run, work)) {
    if (!first->propagate) continue;
    VESK2_TRY(spki_tuple_combine(run->engine, first, work->tuple, made));
    if (*made != nullptr) return 0;
  }
  work->cursor = work->tuple->propagate ? work->tuple->subject->issued : nullptr;
  work->step = Downward;
  return 0;
}

// A member of a threshold never goes upward: it would grant on its own what k of them must.
[[nodiscard]] spki_status Receive(spki_reduction* run, spki_work* work, spki_tuple** /*made*/) {
  spki_tuple* tuple = work->tuple;
  VESK2_TRY(spki_tuple_push(run->engine, &tuple->subject->received, tuple));
  const bool upward = tuple->member <= 0 && tuple->issuer != nullptr && tuple->reaches;
  work->cursor = upward ? tuple->issuer->received : nullptr;
  work->step = Upward;
  return 0;
}

// Files a grant with its issuer. Where an equal one is filed this one ends: it would find nothing
// that the other does not.
[[nodiscard]] spki_status Issue(spki_reduction* run, spki_work* work) {
  spki_tuple* tuple = work->tuple;
  spki_entry** list = tuple->issuer == nullptr ? &run->engine->acl_tuples : &tuple->issuer->issued;
  bool filed = false;
  VESK2_TRY(spki_tuple_file(run->engine, list, tuple, &filed));
  work->step = filed ? Receive : nullptr;
  return 0;
}

[[nodiscard]] spki_status Begin(spki_reduction* run, spki_work* work, spki_tuple** made) {
  const spki_tuple* tuple = work->tuple;
  if (tuple->subject == nullptr) return spki_threshold_expand(run, work);
  if (tuple->subject_name != nullptr) return spki_name_use(run, work);
  if (tuple->issuer_name != nullptr) return spki_name_define(run, work);
  if (tuple->member > 0) return spki_threshold_collect(run, work, Receive, made);
  return Issue(run, work);
}

}  // namespace

const spki_tuple* spki_next_tuple(spki_reduction* run, spki_work* work) {
  const spki_entry* entry = work->cursor;
  if (entry == nullptr || spki_charge_step(run->engine) != 0) return nullptr;
  work->cursor = entry->next;
  return entry->tuple;
}

spki_status spki_tuple_insert(spki_reduction* run, spki_tuple* tuple) {
  if (run->third != nullptr && run->requester == nullptr) {
    VESK2_TRY(spki_resolve_principal(run->engine, run->third, &run->requester));
  }
  spki_mark_reach(run, tuple);
  VESK2_TRY(Push(run, tuple));
  while (run->work != nullptr) VESK2_TRY(Advance(run));
  return 0;
}

void spki_mark_reach(const spki_reduction* run, spki_tuple* tuple) {
  if (tuple->subject == nullptr || tuple->subject_name != nullptr) return;
  tuple->reaches = run->third == nullptr || tuple->subject == run->requester;
}

void spki_work_clear(spki_reduction* run) {
  while (run->work != nullptr) Pop(run);
}

}  // namespace ZvVesk2::Engine
