// SPDX-License-Identifier: Apache-2.0
// The bounds that two ranges, or a range and a prefix, leave: the tightest of both, each with the
// input that it came from.
//
//   input 1             input 2              low       high      relation
//   (ge 5) (le 7)       (ge 1) (le 9)        5 of 1    7 of 1    narrower
//   (ge 1) (le 9)       (ge 5) (le 7)        5 of 2    7 of 2    wider
//   (ge 1) (le 7)       (ge 5) (le 9)        5 of 2    7 of 1    overlap
//   (ge 5) (le 5)       (ge 1)               5 of 1    5 of 1    overlap: a single point
//   (g 5) (le 5)        any                                      disjoint
//
// Equal ranges are narrower: the second has nothing to tighten. That a point overlaps with what it
// lies in keeps it from being found within anything but itself: that grants less, not more.
#include <algorithm>

#include "src/engine/budget.h"
#include "src/engine/chain.h"
#include "src/engine/tag_forms.h"

namespace ZvVesk2::Engine {
namespace {

constexpr int32_t kInvalid = 3;  // in high_source

void Invalidate(spki_engine* engine, spki_range_bounds* bounds) {
  spki_range_clear(engine, bounds);
  bounds->high_source = kInvalid;
}

// The first input to name an ordering decides it; ranges of different orderings share nothing.
void ClaimOrdering(spki_engine* engine, spki_range_bounds* bounds, int32_t ordering) {
  if (bounds->high_source == kInvalid) return;
  if (bounds->ordering == -1) bounds->ordering = ordering;
  if (bounds->ordering != ordering || !spki_known_ordering(ordering)) Invalidate(engine, bounds);
}

// One end of a range, and what makes it tighter.
struct End {
  spki_atom** value;
  int32_t* op;
  int32_t* source;
  spki_order tighter;  // the order of a new value that replaces the old one
  int32_t inclusive;
  int32_t exclusive;
};

// Takes the value when it is the first or tighter than the one that is there; of two equal ones the
// operator that leaves the value itself out. False when the values cannot be compared.
bool Tighten(spki_engine* engine, const End& end, spki_atom* value, int32_t op, int32_t ordering,
             int32_t source) {
  const int order =
      *end.value == nullptr ? end.tighter : spki_cmp_ordered(engine, value, *end.value, ordering);
  if (order == SPKI_ORDER_NONE) return false;
  if (order == end.tighter) {
    spki_atom_assign(engine, end.value, value);
    *end.op = op;
    *end.source = source;
  } else if (order == SPKI_ORDER_EQUAL && *end.op == end.inclusive && op == end.exclusive) {
    *end.op = op;
    *end.source = source;
  }
  return true;
}

// The value is valid before it is compared: the orders take their texts for well-formed.
bool AddBound(spki_engine* engine, spki_range_bounds* bounds, spki_atom* value, int32_t op,
              int32_t source) {
  if (spki_charge_step(engine) != 0) return false;
  if (!spki_valid_value(engine, value, bounds->ordering)) return false;
  switch (op) {
    case SPKI_KW_G:
    case SPKI_KW_GE:
      return Tighten(engine,
                     {&bounds->low, &bounds->low_op, &bounds->low_source, SPKI_ORDER_GREATER,
                      SPKI_KW_GE, SPKI_KW_G},
                     value, op, bounds->ordering, source);
    case SPKI_KW_L:
    case SPKI_KW_LE:
      return Tighten(engine,
                     {&bounds->high, &bounds->high_op, &bounds->high_source, SPKI_ORDER_LESS,
                      SPKI_KW_LE, SPKI_KW_L},
                     value, op, bounds->ordering, source);
    default:
      return false;
  }
}

const unsigned char* CopyBytes(spki_engine* engine, const unsigned char* data, size_t length) {
  auto* copy = static_cast<unsigned char*>(spki_allocate(engine, length));
  if (copy != nullptr) std::copy_n(data, length, copy);
  return copy;
}

// The first `length` bytes of a string with 1 added to the last of them, which is below 255; the
// hint stays, since values with another one do not compare. The bytes are the new atom's own. Null
// without memory.
spki_atom_owner Successor(spki_engine* engine, const spki_atom* string, uint32_t length) {
  if (spki_charge_strings(engine, string) != 0)
    return Own(engine, static_cast<spki_atom*>(nullptr));
  spki_atom_owner atom = Own(engine, spki_atom_new(engine));
  if (atom == nullptr) return atom;
  atom->owns = true;
  atom->keyword = -1;
  atom->hint_length = string->hint_length;
  if (string->hint_length > 0) atom->hint = CopyBytes(engine, string->hint, string->hint_length);
  auto* data = static_cast<unsigned char*>(spki_allocate(engine, length));
  atom->data = data;
  atom->length = length;
  if (data == nullptr || (string->hint_length > 0 && atom->hint == nullptr)) {
    return Own(engine, static_cast<spki_atom*>(nullptr));
  }
  std::copy_n(string->data, length, data);
  ++data[length - 1];
  return atom;
}

}  // namespace

void spki_range_clear(spki_engine* engine, spki_range_bounds* bounds) {
  spki_atom_release(engine, bounds->low);
  spki_atom_release(engine, bounds->high);
  *bounds = {};
}

void spki_range_add_bound(spki_engine* engine, spki_range_bounds* bounds, spki_atom* value,
                          int32_t op, int32_t ordering, int32_t source) {
  ClaimOrdering(engine, bounds, ordering);
  if (bounds->high_source == kInvalid) return;
  if (!AddBound(engine, bounds, value, op, source)) Invalidate(engine, bounds);
}

void spki_range_add_tag(spki_engine* engine, spki_range_bounds* bounds, const spki_elem* range,
                        int32_t source) {
  const bool is_range = spki_classify(range) == SPKI_TAG_RANGE;
  const spki_elem* order = is_range ? spki_form_arguments(range) : nullptr;
  if (StringOf(order) == nullptr) return Invalidate(engine, bounds);
  const int32_t ordering = order->value.atom->keyword;
  ClaimOrdering(engine, bounds, ordering);
  for (const spki_elem* elem = order->next; elem != nullptr; elem = elem->next) {
    const spki_bound bound = spki_read_bound(elem);
    if (bound.value == nullptr) return Invalidate(engine, bounds);
    spki_range_add_bound(engine, bounds, bound.value, bound.op, ordering, source);
    if (bounds->high_source == kInvalid) return;
  }
}

// A prefix is the range from its string up to, and without, the first string behind all that begin
// with it: "ab" is (ge ab) (l ac), and "a" with a 255 behind it ends before "b". Nothing is behind
// a prefix of 255s.
void spki_range_add_prefix(spki_engine* engine, spki_range_bounds* bounds, const spki_elem* prefix,
                           int32_t source) {
  const spki_elem* elem = spki_prefix_string(prefix);
  if (elem == nullptr) return Invalidate(engine, bounds);
  spki_atom* string = elem->value.atom;
  spki_range_add_bound(engine, bounds, string, SPKI_KW_GE, SPKI_KW_ALPHA, source);
  if (bounds->high_source == kInvalid) return;
  uint32_t length = string->length;
  if (spki_charge_units(engine, length / kSingleBytesPerUnit) != 0) {
    return Invalidate(engine, bounds);
  }
  while (length > 0 && string->data[length - 1] == 255) --length;
  if (length == 0) return;
  const spki_atom_owner successor = Successor(engine, string, length);
  if (successor == nullptr) return Invalidate(engine, bounds);
  spki_range_add_bound(engine, bounds, successor.get(), SPKI_KW_L, SPKI_KW_ALPHA, source);
}

spki_relation spki_range_relation(spki_engine* engine, const spki_range_bounds* bounds) {
  if (bounds->high_source == kInvalid) return SPKI_REL_DISJOINT;
  if (bounds->low != nullptr && bounds->high != nullptr) {
    const int order = spki_cmp_ordered(engine, bounds->low, bounds->high, bounds->ordering);
    if (order == SPKI_ORDER_EQUAL) {
      const bool point = bounds->low_op == SPKI_KW_GE && bounds->high_op == SPKI_KW_LE;
      return point ? SPKI_REL_OVERLAP : SPKI_REL_DISJOINT;
    }
    if (order != SPKI_ORDER_LESS) return SPKI_REL_DISJOINT;
  }
  // Sources 1 and 2 are the relations "the first is narrower" and "the second is"; 0 is "equal".
  if (bounds->low_source == 0) return static_cast<spki_relation>(bounds->high_source);
  if (bounds->high_source == 0 || bounds->high_source == bounds->low_source) {
    return static_cast<spki_relation>(bounds->low_source);
  }
  return SPKI_REL_OVERLAP;
}

}  // namespace ZvVesk2::Engine
