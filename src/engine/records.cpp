// SPDX-License-Identifier: Apache-2.0
// Atoms and elements: made, counted, stored, and returned to their free lists.
//
// A reduction makes and drops the same few thousand records over and over; the free lists keep that
// away from the allocator. A released record is zeroed before it goes there, so that a pointer that
// was kept too long finds nothing rather than another list's contents.
#include <cstring>

#include "src/engine/owned.h"

namespace ZvVesk2::Engine {
namespace {

constexpr uint32_t kSaturated = UINT32_MAX;

// A record from its free list, else from the pool; one reference, all else zero.
template <typename Record>
Record* Take(spki_engine* engine, Record** free_list, spki_slab* slab) {
  Record* record = *free_list;
  if (record != nullptr) {
    *free_list = record->link;
  } else {
    record = static_cast<Record*>(spki_allocate_record(engine, slab, sizeof(Record)));
    if (record == nullptr) return nullptr;
  }
  *record = {};
  record->refcount = 1;
  return record;
}

// The other way. The budget is not given back: the record stays with the engine.
template <typename Record>
void Return(Record* record, Record** free_list) {
  *record = {};
  record->link = *free_list;
  *free_list = record;
}

// A count that has reached the top no longer knows how many there are, and stays.
template <typename Record>
void Share(Record* record) {
  if (record != nullptr && record->refcount != kSaturated) ++record->refcount;
}

// Whether that was the last reference. A new chain may have a count of 0 already: intersections
// hand theirs out so, and the slot that takes it counts the first.
template <typename Record>
bool Drop(Record* record) {
  if (record->refcount == kSaturated) return false;
  if (record->refcount > 0) --record->refcount;
  return record->refcount == 0;
}

void ReleaseValue(spki_engine* engine, const spki_elem* elem) {
  switch (elem->kind) {
    case SPKI_ELEM_HEAD:
    case SPKI_ELEM_STRING:
      spki_atom_release(engine, elem->value.atom);
      break;
    case SPKI_ELEM_LIST:
      spki_elem_release(engine, elem->value.list);
      break;
    case SPKI_ELEM_KEYWORD:
      break;
  }
}

}  // namespace

spki_elem* spki_elem_new(spki_engine* engine) {
  return Take(engine, &engine->free_elems, &engine->elem_slab);
}
spki_atom* spki_atom_new(spki_engine* engine) {
  return Take(engine, &engine->free_atoms, &engine->atom_slab);
}

// Walks along the list and recurses into nested ones only, whose depth the parser bounds: a flat
// list may have millions of elements.
void spki_elem_release(spki_engine* engine, spki_elem* elem) {
  while (elem != nullptr && Drop(elem)) {
    spki_elem* next = elem->next;
    ReleaseValue(engine, elem);
    spki_free(engine, elem->digest);
    Return(elem, &engine->free_elems);
    elem = next;
  }
}

void spki_atom_release(spki_engine* engine, spki_atom* atom) {
  if (atom == nullptr || !Drop(atom)) return;
  if (atom->owns) {
    spki_free(engine, const_cast<unsigned char*>(atom->data));
    spki_free(engine, const_cast<unsigned char*>(atom->hint));
  }
  Return(atom, &engine->free_atoms);
}

void spki_elem_assign(spki_engine* engine, spki_elem** slot, spki_elem* elem) {
  if (slot == nullptr) return spki_elem_release(engine, elem);
  Share(elem);
  spki_elem_release(engine, *slot);
  *slot = elem;
}

void spki_atom_assign(spki_engine* engine, spki_atom** slot, spki_atom* atom) {
  if (slot == nullptr) return spki_atom_release(engine, atom);
  Share(atom);
  spki_atom_release(engine, *slot);
  *slot = atom;
}

void spki_list_dispose(spki_engine* engine, spki_elem* list) {
  if (list == nullptr) return;
  delete[] list->text;
  list->text = nullptr;
  spki_elem_release(engine, list);
}

}  // namespace ZvVesk2::Engine
