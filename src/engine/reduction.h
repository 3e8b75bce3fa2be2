// SPDX-License-Identifier: Apache-2.0
// One reduction under way, and the insertions that it consists of.
//
// Inserting a tuple may make others, which are inserted before it is done with: as in a recursion,
// but on a stack of our own, since hostile chains are longer than the thread's stack. The order is
// that of the recursion; what is emitted first depends on it.
#ifndef VESK2_SRC_ENGINE_REDUCTION_H
#define VESK2_SRC_ENGINE_REDUCTION_H

#include "src/engine/tuple.h"

namespace ZvVesk2::Engine {

struct spki_reduction;
struct spki_work;

// Goes on with an insertion. Sets *made to a tuple (one reference) that must be inserted first, or
// moves work->step on; a null step is the end of it. Between calls all that it knows is in `work`.
using spki_step = spki_status (*)(spki_reduction* run, spki_work* work, spki_tuple** made);

// One insertion, and how far it got.
struct spki_work {
  spki_work* below;
  spki_tuple* tuple;  // counted
  spki_step step;
  spki_entry* cursor;         // the next tuple to combine or resolve with
  spki_threshold* threshold;  // of a k-of-n subject: what its members belong to,
  const spki_elem* member;    // the next of them
  int32_t position;           // and the position of the last
};

// Its end releases all that it holds and empties the engine's tables. Principals and thresholds,
// which tuples point at without counting, live until then.
struct spki_reduction {
  spki_engine* engine;
  spki_elem* acl = nullptr;  // the five lists, counted
  spki_elem* sequence = nullptr;
  spki_elem* third = nullptr;
  spki_elem* requested_tag = nullptr;
  spki_elem* fifth = nullptr;
  spki_principal* requester = nullptr;   // of `third`, once resolved
  spki_threshold* thresholds = nullptr;  // all that were made
  spki_work* work = nullptr;  // the insertion under way, on top of those that wait for it

  explicit spki_reduction(spki_engine* owner) : engine(owner) {}
  spki_reduction(const spki_reduction&) = delete;
  spki_reduction& operator=(const spki_reduction&) = delete;
  ~spki_reduction();
};

// The next tuple at an insertion's cursor, which moves on; null at the end, and when the budget is
// spent, which whoever runs the steps asks for. Tuples that are added meanwhile stand in front of
// the cursor: they look for this one themselves.
const spki_tuple* spki_next_tuple(spki_reduction* run, spki_work* work);

// Inserts the tuple of a credential and all that follow from it. After a failure the end of the
// reduction releases the insertions that are left on the stack.
[[nodiscard]] spki_status spki_tuple_insert(spki_reduction* run, spki_tuple* tuple);
// Marks a tuple of a credential, or a member of its k-of-n, when its subject is the requester.
// Without a requester every such tuple is marked. One whose subject is still a name is not: the
// definition says whether it reaches.
void spki_mark_reach(const spki_reduction* run, spki_tuple* tuple);

// Beginnings of insertions, by what the tuple's subject is; each sets work->step.
// A k-of-n subject: one member tuple for each of its subjects.
[[nodiscard]] spki_status spki_threshold_expand(spki_reduction* run, spki_work* work);
// A member tuple that has got to a principal. Makes what the threshold then grants to it, and goes
// on with `next` unless the tuple was collected before.
[[nodiscard]] spki_status spki_threshold_collect(spki_reduction* run, spki_work* work,
                                                 spki_step next, spki_tuple** made);
// A definition of a name, (issuer (name K N)), and a subject that is one.
[[nodiscard]] spki_status spki_name_define(spki_reduction* run, spki_work* work);
[[nodiscard]] spki_status spki_name_use(spki_reduction* run, spki_work* work);

// Releases what an unfinished insertion, and what waits for it, holds; and every threshold.
void spki_work_clear(spki_reduction* run);
void spki_thresholds_clear(spki_reduction* run);
// Builds the list (acl (entry ...) ...) of what reaches the requester.
[[nodiscard]] spki_status spki_emit_entries(spki_engine* engine, spki_elem** result);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_REDUCTION_H
