// Tuples: made, counted, listed, compared and combined.
#include "src/engine/tuple.h"

#include <cstring>

#include "src/engine/budget.h"
#include "src/engine/tag.h"
#include "src/engine/validity.h"
#include "src/engine/value.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

// Most tuples differ in what is no text; values are made for the others only.
spki_status Compare(spki_engine* engine, spki_tuple* a, spki_tuple* b, bool* equal) {
  *equal = a->reaches == b->reaches && a->propagate == b->propagate && a->member == b->member &&
           a->issuer == b->issuer && a->subject == b->subject && a->threshold == b->threshold;
  if (!*equal) return 0;
  VESK2_TRY(spki_tuple_value(engine, a));
  VESK2_TRY(spki_tuple_value(engine, b));
  *equal = std::memcmp(a->value, b->value, sizeof a->value) == 0;
  return 0;
}

}  // namespace

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

spki_status spki_tuple_push(spki_engine* engine, spki_bucket_entry** list, spki_tuple* tuple) {
  spki_bucket_entry* entry = spki_entry_push(engine, list);
  VESK2_REQUIRE(entry != nullptr, SPKI_ERR_NO_MEM);
  entry->tuple = tuple;
  ++tuple->refcount;
  return 0;
}

spki_status spki_tuple_file(spki_engine* engine, spki_bucket_entry** list, spki_tuple* tuple,
                            bool* filed) {
  *filed = false;
  VESK2_TRY(spki_tuple_charge(engine, tuple));
  for (const spki_bucket_entry* entry = *list; entry != nullptr; entry = entry->next) {
    VESK2_TRY(spki_charge_step(engine));
    bool equal = false;
    VESK2_TRY(Compare(engine, entry->tuple, tuple, &equal));
    if (equal) return 0;
  }
  VESK2_TRY(spki_tuple_push(engine, list, tuple));
  *filed = true;
  return 0;
}

bool spki_tuple_narrow(spki_engine* engine, spki_tuple* tuple, const spki_tuple* first) {
  spki_elem_assign(engine, &tuple->tag, spki_intersect_chain(engine, first->tag, tuple->tag));
  return tuple->tag != nullptr && spki_validity_meet(engine, tuple, first);
}

// The result is what `second` grants, under the issuer of `first`.
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
