// SPDX-License-Identifier: Apache-2.0
// Tag algebra: how two authorization tags relate, and the tag that allows what both allow.
//
// "(*)" allows everything, (* set ...) what a member allows, (* prefix ...) and (* range ...)
// strings; a longer list is narrower than its own beginning. Two sets never compare as equal or
// within one another: that errs towards granting less. A bound of more than two items does not:
// (* range numeric (le 5 x)) allows no string, but, as if the x were not there, the range
// (* range numeric (ge 1) (le 3)).
#ifndef VESK2_SRC_ENGINE_TAG_H
#define VESK2_SRC_ENGINE_TAG_H

#include "src/engine/model.h"

namespace ZvVesk2::Engine {

enum spki_relation : int {
  SPKI_REL_EQUAL = 0,
  SPKI_REL_NARROWER = 1,  // the first lies within the second
  SPKI_REL_WIDER = 2,     // the second lies within the first
  SPKI_REL_DISJOINT = 3,  // nothing in common; also: malformed, not comparable
  SPKI_REL_OVERLAP = 4,   // the intersection is a new tag
};

enum spki_tag_class : int {
  SPKI_TAG_KEYWORD_HEAD = 1,
  SPKI_TAG_HEAD = 2,
  SPKI_TAG_STRING = 3,
  SPKI_TAG_LIST = 4,
  SPKI_TAG_NONE = 10,
  SPKI_TAG_ALL = 11,
  SPKI_TAG_SET = 12,
  SPKI_TAG_PREFIX = 13,
  SPKI_TAG_RANGE = 14,
};

struct spki_range_bounds {
  spki_atom* low = nullptr;  // counted
  int32_t low_op = 0;
  int32_t low_source = 0;     // 0, 1 or 2
  spki_atom* high = nullptr;  // counted
  int32_t high_op = 0;
  int32_t high_source = 0;  // 0, 1 or 2; 3 marks the record invalid
  int32_t ordering = -1;    // that of the first range or bound added; others do not mix with it
};

spki_tag_class spki_classify(const spki_elem* elem);

spki_relation spki_cmp_elem(spki_engine* engine, const spki_elem* a, const spki_elem* b);
spki_relation spki_cmp_chain(spki_engine* engine, const spki_elem* a, const spki_elem* b);

// Either one of its inputs as it is or a new chain with a reference count of 0: the caller takes
// its reference by storing it. Null when nothing is in common (or the budget is spent).
spki_elem* spki_intersect_chain(spki_engine* engine, spki_elem* a, spki_elem* b);
// New elements with one reference, or null.
spki_elem* spki_intersect_elem(spki_engine* engine, spki_elem* a, spki_elem* b);
spki_elem* spki_intersect_set(spki_engine* engine, spki_elem* set, spki_elem* other);

bool spki_in_set(spki_engine* engine, const spki_elem* elem, const spki_elem* set);
spki_relation spki_set_overlaps(spki_engine* engine, const spki_elem* set, const spki_elem* other);
bool spki_has_prefix(spki_engine* engine, const spki_elem* string, const spki_elem* prefix);
bool spki_in_range(spki_engine* engine, const spki_elem* string, const spki_elem* range);
bool spki_bound_holds(spki_engine* engine, const spki_atom* value, const spki_elem* bound,
                      int32_t ordering);

void spki_range_add_bound(spki_engine* engine, spki_range_bounds* bounds, spki_atom* value,
                          int32_t op, int32_t ordering, int32_t source);
void spki_range_add_tag(spki_engine* engine, spki_range_bounds* bounds, const spki_elem* range,
                        int32_t source);
void spki_range_add_prefix(spki_engine* engine, spki_range_bounds* bounds, const spki_elem* prefix,
                           int32_t source);
spki_relation spki_range_relation(spki_engine* engine, const spki_range_bounds* bounds);
spki_elem* spki_range_build(spki_engine* engine, spki_range_bounds* bounds);

[[nodiscard]] int spki_cmp_ordered(spki_engine* engine, const spki_atom* a, const spki_atom* b,
                                   int32_t ordering);
bool spki_valid_date(const spki_atom* value);
bool spki_valid_time(const spki_atom* value);
bool spki_valid_numeric(const spki_atom* value);
bool spki_is_leap_year(int year);

// The greater and the lesser of two elements by spki_cmp_elem; a null side yields the other.
spki_elem* spki_elem_max(spki_engine* engine, spki_elem* a, spki_elem* b);
spki_elem* spki_elem_min(spki_engine* engine, spki_elem* a, spki_elem* b);

// Parses a fixed canonical text into a slot; the list's heads carry no `text`.
[[nodiscard]] spki_status spki_parse_template(spki_engine* engine, spki_elem** slot,
                                              const char* text);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_TAG_H
