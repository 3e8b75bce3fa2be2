// SPDX-License-Identifier: Apache-2.0
// Ranges: whether a string lies in one, and how they relate to prefixes and to each other.
#include "src/engine/budget.h"
#include "src/engine/chain.h"
#include "src/engine/tag_forms.h"

namespace ZvVesk2::Engine {
namespace {

spki_relation RelationOf(spki_engine* engine, spki_range_bounds* bounds) {
  const spki_relation relation = spki_range_relation(engine, bounds);
  spki_range_clear(engine, bounds);
  return relation;
}

}  // namespace

// An order that could not be told (SPKI_ORDER_NONE) satisfies no operator.
bool spki_bound_holds(spki_engine* engine, const spki_atom* value, const spki_elem* bound,
                      int32_t ordering) {
  if (spki_charge_step(engine) != 0) return false;
  const spki_bound limit = spki_read_bound(bound);
  if (limit.value == nullptr || !limit.exact) return false;
  if (!spki_valid_value(engine, limit.value, ordering)) return false;
  const int order = spki_cmp_ordered(engine, value, limit.value, ordering);
  switch (limit.op) {
    case SPKI_KW_G:
      return order == SPKI_ORDER_GREATER;
    case SPKI_KW_GE:
      return order == SPKI_ORDER_GREATER || order == SPKI_ORDER_EQUAL;
    case SPKI_KW_L:
      return order == SPKI_ORDER_LESS;
    case SPKI_KW_LE:
      return order == SPKI_ORDER_LESS || order == SPKI_ORDER_EQUAL;
    default:
      return false;
  }
}

// A range without bounds holds every valid value of its ordering; one without an ordering none.
bool spki_in_range(spki_engine* engine, const spki_elem* string, const spki_elem* range) {
  const spki_atom* value = StringOf(string);
  if (value == nullptr) return false;
  const spki_tag_class range_class = spki_classify(range);
  if (range_class == SPKI_TAG_ALL) return true;
  if (range_class != SPKI_TAG_RANGE) return false;
  const spki_elem* order = spki_form_arguments(range);
  if (StringOf(order) == nullptr) return false;
  const int32_t ordering = order->value.atom->keyword;
  if (!spki_valid_value(engine, value, ordering)) return false;
  for (const spki_elem* bound = order->next; bound != nullptr; bound = bound->next) {
    if (!spki_bound_holds(engine, value, bound, ordering)) return false;
  }
  return true;
}

// The range comes first: of equal bounds the first stay. A prefix is a range of "alpha", so it is
// disjoint from those of all other orderings.
spki_relation spki_prefix_to_range(spki_engine* engine, const spki_elem* prefix,
                                   const spki_elem* range) {
  spki_range_bounds bounds;
  spki_range_add_tag(engine, &bounds, range, 2);
  spki_range_add_prefix(engine, &bounds, prefix, 1);
  return RelationOf(engine, &bounds);
}

spki_relation spki_range_to_range(spki_engine* engine, const spki_elem* a, const spki_elem* b) {
  spki_range_bounds bounds;
  spki_range_add_tag(engine, &bounds, a, 1);
  spki_range_add_tag(engine, &bounds, b, 2);
  return RelationOf(engine, &bounds);
}

}  // namespace ZvVesk2::Engine
