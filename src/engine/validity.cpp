// SPDX-License-Identifier: Apache-2.0
// Narrowing of periods:
//
//   constraint = (not-before d) / (not-after d) / (valid *(d / constraint))
#include "src/engine/validity.h"

#include "src/engine/budget.h"
#include "src/engine/chain.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

// Each takes the narrower of two bounds; a null date is none.
void Raise(spki_engine* engine, spki_tuple* tuple, spki_atom* date) {
  if (date == nullptr) return;
  if (tuple->not_before == nullptr || spki_atom_later(engine, date, tuple->not_before)) {
    spki_atom_assign(engine, &tuple->not_before, date);
  }
}

void Lower(spki_engine* engine, spki_tuple* tuple, spki_atom* date) {
  if (date == nullptr) return;
  if (tuple->not_after == nullptr || spki_atom_later(engine, tuple->not_after, date)) {
    spki_atom_assign(engine, &tuple->not_after, date);
  }
}

bool IsEmpty(spki_engine* engine, const spki_tuple* tuple) {
  return tuple->not_before != nullptr && tuple->not_after != nullptr &&
         spki_atom_later(engine, tuple->not_before, tuple->not_after);
}

[[nodiscard]] spki_status Apply(spki_engine* engine, spki_tuple* tuple,
                                const spki_elem* constraint);

// A bare date is an instant: it narrows from both sides, so a period that it is outside of ends up
// empty, and one that it lies in as that instant.
[[nodiscard]] spki_status ApplyParts(spki_engine* engine, spki_tuple* tuple,
                                     const spki_elem* part) {
  for (; part != nullptr; part = part->next) {
    VESK2_TRY(spki_charge_step(engine));
    if (const spki_elem* nested = ListOf(part)) VESK2_TRY(Apply(engine, tuple, nested));
    Raise(engine, tuple, StringOf(part));
    Lower(engine, tuple, StringOf(part));
  }
  return 0;
}

[[nodiscard]] spki_status Apply(spki_engine* engine, spki_tuple* tuple,
                                const spki_elem* constraint) {
  const int32_t keyword = HeadKeyword(constraint);
  if (keyword == SPKI_KW_VALID) return ApplyParts(engine, tuple, constraint->next);
  if (keyword != SPKI_KW_NOT_BEFORE && keyword != SPKI_KW_NOT_AFTER) return 0;
  spki_atom* date = nullptr;
  VESK2_TRY(spki_validity_date(constraint, &date));
  if (keyword == SPKI_KW_NOT_BEFORE) {
    Raise(engine, tuple, date);
  } else {
    Lower(engine, tuple, date);
  }
  return 0;
}

}  // namespace

// A comparison that was not paid for answers "not later", which must not pass for a period.
bool spki_validity_meet(spki_engine* engine, spki_tuple* tuple, const spki_tuple* other) {
  Raise(engine, tuple, other->not_before);
  Lower(engine, tuple, other->not_after);
  const bool empty = IsEmpty(engine, tuple);
  return !empty && engine->budget.spent == 0;
}

spki_status spki_validity_narrow(spki_engine* engine, spki_tuple* tuple,
                                 const spki_elem* constraint) {
  VESK2_TRY(Apply(engine, tuple, constraint));
  const bool empty = IsEmpty(engine, tuple);
  VESK2_TRY(engine->budget.spent);
  return empty ? SPKI_ERR_DATE_INTERSECTION : 0;
}

spki_status spki_validity_date(const spki_elem* list, spki_atom** date) {
  *date = StringOf(list->next);
  return *date != nullptr ? 0 : SPKI_ERR_BAD_SEXP;
}

}  // namespace ZvVesk2::Engine
