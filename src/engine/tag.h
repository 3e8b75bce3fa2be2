// SPDX-License-Identifier: Apache-2.0
// Tag algebra: how two authorization tags relate, and the tag that allows what both allow.
//
// "(*)" allows everything, (* set ...) what a member allows, (* prefix ...) and (* range ...)
// strings; a longer list is narrower than its own beginning.
//
//   (tag (install (app calc)))        within  (tag (install))      within  (tag)
//   (tag (read (* prefix /etc/ssh)))  within  (tag (read (* prefix /etc)))
//   (* range numeric (ge 5))          meets   (* range numeric (le 9)), in a range of both bounds
//
// Two sets never compare as equal or within one another, and an intersection lists the members of a
// set in reverse: that errs towards granting less. A bound of more than two items errs the other
// way: (* range numeric (le 5 x)) allows no string, but, as if the x were not there, the range
// (* range numeric (ge 1) (le 3)).
//
// Both operations walk two tags in step and pay for each element. With a spent budget relations are
// disjoint and intersections null, so that nothing is granted by work that was broken off; whoever
// takes "disjoint" for an answer asks for `spent`.
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

// The first four are the kinds of elements. A star form that is malformed is of one of these too.
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

// The tightest bounds of all that was added, and from which input (1 or 2) each of them came: that
// alone tells the relation of the two. What is invalid stays so. To be cleared in the end
// (spki_range_clear); spki_range_build does it.
struct spki_range_bounds {
  spki_atom* low = nullptr;  // counted
  int32_t low_op = 0;
  int32_t low_source = 0;     // 0, 1 or 2
  spki_atom* high = nullptr;  // counted
  int32_t high_op = 0;
  int32_t high_source = 0;  // 0, 1 or 2; 3 marks the record invalid
  int32_t ordering = -1;    // that of the first range or bound added; others do not mix with it
};

// Null is SPKI_TAG_NONE, which is disjoint from everything.
spki_tag_class spki_classify(const spki_elem* elem);

// The relation of the first to the second. Two elements, or two lists from the elements given on.
spki_relation spki_cmp_elem(spki_engine* engine, const spki_elem* a, const spki_elem* b);
spki_relation spki_cmp_chain(spki_engine* engine, const spki_elem* a, const spki_elem* b);

// Either one of its inputs as it is or a new chain with a reference count of 0: the caller takes
// its reference by storing it. Null when nothing is in common (or the budget is spent). A null
// chain stands for no tag, which narrows nothing; of two of them the result is null as well.
spki_elem* spki_intersect_chain(spki_engine* engine, spki_elem* a, spki_elem* b);
// New elements with one reference, or null.
spki_elem* spki_intersect_elem(spki_engine* engine, spki_elem* a, spki_elem* b);
spki_elem* spki_intersect_set(spki_engine* engine, spki_elem* set, spki_elem* other);

// Whether an element is equal to or narrower than some member of a set. Here and below, what is not
// the form that is asked for has no members, but "(*)" holds what a set or a range may hold.
bool spki_in_set(spki_engine* engine, const spki_elem* elem, const spki_elem* set);
// A set against a star form: wider when the set is "(*)", else an overlap or disjoint.
spki_relation spki_set_overlaps(spki_engine* engine, const spki_elem* set, const spki_elem* other);
// Whether a string begins with the prefix's; every string begins with itself.
bool spki_has_prefix(spki_engine* engine, const spki_elem* string, const spki_elem* prefix);
// Whether a string is valid for the range's ordering and every bound holds for it.
bool spki_in_range(spki_engine* engine, const spki_elem* string, const spki_elem* range);
// Whether a valid value lies on the right side of one (operator value). False for a malformed one.
bool spki_bound_holds(spki_engine* engine, const spki_atom* value, const spki_elem* bound,
                      int32_t ordering);

// Each narrows the bounds by one input, or makes them invalid: another ordering, a value that the
// ordering does not know, a form that is not what it should be, no memory.
void spki_range_add_bound(spki_engine* engine, spki_range_bounds* bounds, spki_atom* value,
                          int32_t op, int32_t ordering, int32_t source);
void spki_range_add_tag(spki_engine* engine, spki_range_bounds* bounds, const spki_elem* range,
                        int32_t source);
void spki_range_add_prefix(spki_engine* engine, spki_range_bounds* bounds, const spki_elem* prefix,
                           int32_t source);
// The relation of input 1 to input 2: narrower when all bounds came from 1, wider when all came
// from 2, equal without any, else an overlap; disjoint when nothing lies between the bounds, and
// when they are invalid.
spki_relation spki_range_relation(spki_engine* engine, const spki_range_bounds* bounds);
// A new (* range ...) element of these bounds, with one reference; null for nothing between them.
spki_elem* spki_range_build(spki_engine* engine, spki_range_bounds* bounds);

// spki_order of two values by an ordering; SPKI_ORDER_NONE when they cannot be compared: a null,
// different hints, an unknown ordering, a spent budget.
[[nodiscard]] int spki_cmp_ordered(spki_engine* engine, const spki_atom* a, const spki_atom* b,
                                   int32_t ordering);
// Whether a value has the syntax of its ordering. One with a hint has none.
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
