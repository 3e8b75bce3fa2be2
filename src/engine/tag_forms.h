// SPDX-License-Identifier: Apache-2.0
// What the parts of the tag algebra share: looking into the star forms, and making elements.
//
//   (*)   (* set member...)   (* prefix string)   (* range ordering (operator value)...)
#ifndef VESK2_SRC_ENGINE_TAG_FORMS_H
#define VESK2_SRC_ENGINE_TAG_FORMS_H

#include "src/engine/owned.h"
#include "src/engine/tag.h"

namespace ZvVesk2::Engine {

// The head of the list that an element stands for: a nested list's head, or the element itself when
// it is a keyword head. Null for any other.
const spki_elem* spki_form_head(const spki_elem* elem);
// What follows the second word of a set, prefix or range; null when nothing does. Only for an
// element that spki_classify says to be one of these: it has two words.
const spki_elem* spki_form_arguments(const spki_elem* form);
// The string of (* prefix string); null unless the element is exactly that.
const spki_elem* spki_prefix_string(const spki_elem* elem);

// An (operator value) list with a keyword head and a string behind it. A bound that is not exact
// holds for no string, but counts where ranges are compared; see tag.h.
struct spki_bound {
  int32_t op = -1;
  spki_atom* value = nullptr;  // borrowed; null when the element is not a bound
  bool exact = false;          // nothing follows the value
};
spki_bound spki_read_bound(const spki_elem* elem);

// Whether a value may stand in a range of this ordering; false for an unknown ordering.
bool spki_valid_value(spki_engine* engine, const spki_atom* value, int32_t ordering);
bool spki_known_ordering(int32_t ordering);

// Releases what the bounds hold and leaves them fresh.
void spki_range_clear(spki_engine* engine, spki_range_bounds* bounds);

// The relation of a prefix (source 1) to a range (source 2).
spki_relation spki_prefix_to_range(spki_engine* engine, const spki_elem* prefix,
                                   const spki_elem* range);
// The relation of two ranges.
spki_relation spki_range_to_range(spki_engine* engine, const spki_elem* a, const spki_elem* b);

// New elements with one reference, which take references of their own; null without memory.
spki_elem_owner spki_new_string(spki_engine* engine, spki_atom* atom);
spki_elem_owner spki_new_keyword(spki_engine* engine, int32_t keyword);
spki_elem_owner spki_new_list(spki_engine* engine, spki_elem* list);
// A new element with the same value and nothing behind it: results are linked anew, while the
// originals stay in their lists.
spki_elem_owner spki_copy(spki_engine* engine, const spki_elem* elem);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_TAG_FORMS_H
