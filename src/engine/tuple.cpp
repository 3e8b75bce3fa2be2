// SPDX-License-Identifier: Apache-2.0
// Tuples: made, counted, filed and combined. Only what hangs from a tuple is counted there; its
// principals and its threshold belong to the reduction.
#include "src/engine/tuple.h"

#include "src/engine/budget.h"
#include "src/engine/tag.h"
#include "src/engine/validity.h"
#include "src/engine/value.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
spki_tuple* spki_tuple_new(spki_engine* engine) {
  spki_tuple* tuple = engine->free_tuples;
  if (tuple != nullptr) {
    engine->free_tuples = tuple->link;
  } else {
    tuple = static_cast<spki_tuple*>(spki_allocate(engine, sizeof(spki_tuple)));
    if (tuple == nullptr) return nullptr;
  }
  *tuple = {};
  tuple->refcount = 1;
  return tuple;
}

spki_tuple* spki_tuple_copy(spki_engine* engine, const spki_tuple* tuple) {
  spki_tuple* copy = spki_tuple_new(engine);
  if (copy == nullptr) return nullptr;
  copy->reaches = tuple->reaches;
  copy->propagate = tuple->propagate;
  copy->member = tuple->member;
  copy->issuer = tuple->issuer;
  copy->subject = tuple->subject;
  copy->threshold = tuple->threshold;
  spki_atom_assign(engine, &copy->issuer_name, tuple->issuer_name);
  spki_atom_assign(engine, &copy->subject_name, tuple->subject_name);
  spki_elem_assign(engine, &copy->name_rest, tuple->name_rest);
  spki_elem_assign(engine, &copy->subject_list, tuple->subject_list);
  spki_elem_assign(engine, &copy->tag, tuple->tag);
  spki_atom_assign(engine, &copy->not_before, tuple->not_before);
  spki_atom_assign(engine, &copy->not_after, tuple->not_after);
  return copy;
}

void spki_tuple_release(spki_engine* engine, spki_tuple* tuple) {
  if (tuple == nullptr || --tuple->refcount > 0) return;
  spki_atom_release(engine, tuple->issuer_name);
  spki_atom_release(engine, tuple->subject_name);
  spki_elem_release(engine, tuple->name_rest);
  spki_elem_release(engine, tuple->subject_list);
  spki_elem_release(engine, tuple->tag);
  spki_atom_release(engine, tuple->not_before);
  spki_atom_release(engine, tuple->not_after);
  *tuple = {};
  tuple->link = engine->free_tuples;
  engine->free_tuples = tuple;
}

spki_status spki_tuple_push(spki_engine* engine, spki_entry** list, spki_tuple* tuple) {
  spki_entry* entry = spki_entry_push(engine, list);
  VESK2_REQUIRE(entry != nullptr, SPKI_ERR_NO_MEM);
  entry->tuple = tuple;
  ++tuple->refcount;
  return 0;
}

spki_status spki_tuple_file(spki_engine* engine, spki_entry** list, spki_tuple* tuple,
                            bool* filed) {
  *filed = false;
  Digest value;
  VESK2_TRY(spki_tuple_value(engine, tuple, value));
  spki_node* node = nullptr;
  bool made = false;
  VESK2_TRY(spki_table_enter(engine, &engine->filed, value, &node, &made));
  if (!made) return 0;
  VESK2_TRY(spki_tuple_push(engine, list, tuple));
  *filed = true;
  return 0;
}

bool spki_tuple_narrow(spki_engine* engine, spki_tuple* tuple, const spki_tuple* first) {
  spki_elem_assign(engine, &tuple->tag, spki_intersect_chain(engine, first->tag, tuple->tag));
  return tuple->tag != nullptr && spki_validity_meet(engine, tuple, first);
}

// The result is what `second` grants, under the issuer of `first`: I -> S and S -> P give I -> P.
// Whether P may delegate, and whether it leads to the requester, is what `second` says; at which
// position of a k-of-n it counts, what `first` says.
spki_status spki_tuple_combine(spki_engine* engine, const spki_tuple* first,
                               const spki_tuple* second, spki_tuple** made) {
  VESK2_TRY(spki_charge_combination(engine));
  spki_tuple_owner copy = Own(engine, spki_tuple_copy(engine, second));
  VESK2_REQUIRE(copy != nullptr, SPKI_ERR_NO_MEM);
  copy->member = first->member;
  copy->threshold = first->threshold;
  copy->issuer = first->issuer;
  const bool left = spki_tuple_narrow(engine, copy.get(), first);
  VESK2_TRY(engine->budget.spent);
  if (left) *made = copy.release();
  return 0;
}

}  // namespace ZvVesk2::Engine
