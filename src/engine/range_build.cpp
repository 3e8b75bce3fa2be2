// SPDX-License-Identifier: Apache-2.0
// A new (* range ordering (operator value)...) from the bounds that are left: the lower one first,
// each only where there is one. It is built link by link behind the words that all ranges begin
// with, so that after a failure one owner releases whatever there is.
#include "src/engine/tag_forms.h"

namespace ZvVesk2::Engine {
namespace {

// (operator value), or null without memory.
spki_elem_owner NewBound(spki_engine* engine, int32_t op, spki_atom* value) {
  const spki_elem_owner head = spki_new_keyword(engine, op);
  spki_elem_owner string = spki_new_string(engine, value);
  if (head == nullptr || string == nullptr) return Own(engine, static_cast<spki_elem*>(nullptr));
  head->next = string.release();
  return spki_new_list(engine, head.get());
}

// The word is printed from the table of keywords, which outlives every atom. All five orderings
// have rows.
spki_elem_owner NewOrdering(spki_engine* engine, int32_t ordering) {
  const spki_atom_owner atom = Own(engine, spki_atom_new(engine));
  if (atom == nullptr) return Own(engine, static_cast<spki_elem*>(nullptr));
  const spki_keyword_entry* row = spki_keyword_row(ordering);
  atom->keyword = ordering;
  atom->length = row->length;
  atom->data = reinterpret_cast<const unsigned char*>(row->name);
  return spki_new_string(engine, atom.get());
}

// Moves an element behind *last; false when it could not be made.
bool Append(spki_elem** last, spki_elem_owner elem) {
  if (elem == nullptr) return false;
  (*last)->next = elem.release();
  *last = (*last)->next;
  return true;
}

spki_elem* BuildRange(spki_engine* engine, const spki_range_bounds* bounds) {
  spki_elem* list = nullptr;
  if (spki_parse_template(engine, &list, "(1:*5:range)") != 0) return nullptr;
  const spki_elem_owner range = Own(engine, list);
  spki_elem* last = range->next;
  if (!Append(&last, NewOrdering(engine, bounds->ordering))) return nullptr;
  if (bounds->low != nullptr && !Append(&last, NewBound(engine, bounds->low_op, bounds->low))) {
    return nullptr;
  }
  if (bounds->high != nullptr && !Append(&last, NewBound(engine, bounds->high_op, bounds->high))) {
    return nullptr;
  }
  return spki_new_list(engine, range.get()).release();
}

}  // namespace

spki_elem* spki_range_build(spki_engine* engine, spki_range_bounds* bounds) {
  const bool empty = spki_range_relation(engine, bounds) == SPKI_REL_DISJOINT;
  spki_elem* range = empty ? nullptr : BuildRange(engine, bounds);
  spki_range_clear(engine, bounds);
  return range;
}

}  // namespace ZvVesk2::Engine
