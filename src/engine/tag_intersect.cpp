// SPDX-License-Identifier: Apache-2.0
// Intersection of lists and elements.
//
// Where one of two tags lies within the other, it is the result as it stands, and nothing is made.
// Only where they overlap is a new chain made, element by element:
//
//   (tag (* set read write) /etc)  and  (tag read)   give   (tag read /etc)
//
// The first elements with something in common are new; the tail is shared with the list that has
// it.
#include "src/engine/chain.h"
#include "src/engine/tag_forms.h"

namespace ZvVesk2::Engine {
namespace {

bool HasStarHead(const spki_elem* list) { return HeadKeyword(ListOf(list)) == SPKI_KW_STAR; }

// The list that the relation of two lists names; null when it names none. With `overlap` set the
// lists have to be intersected element by element.
spki_elem* Narrower(spki_engine* engine, spki_elem* a, spki_elem* b, bool* overlap) {
  const spki_relation relation = spki_cmp_chain(engine, a, b);
  *overlap = relation == SPKI_REL_OVERLAP;
  if (relation == SPKI_REL_WIDER) return b;
  return relation == SPKI_REL_EQUAL || relation == SPKI_REL_NARROWER ? a : nullptr;
}

// One new element for each pair, until what is left of the two lists is one of them as it stands. A
// loop, since lists are as long as their writers like. Each round asks for the relation of the
// rests, so the cost is the square of the length of what overlaps; the budget pays for it.
spki_elem* IntersectElements(spki_engine* engine, spki_elem* a, spki_elem* b) {
  spki_elem_owner first = Own(engine, spki_intersect_elem(engine, a, b));
  spki_elem* last = first.get();
  while (last != nullptr && (a->next != nullptr || b->next != nullptr)) {
    a = a->next;
    b = b->next;
    bool overlap = false;
    spki_elem* rest = a == nullptr ? b : b == nullptr ? a : Narrower(engine, a, b, &overlap);
    if (!overlap) {
      if (rest == nullptr) return nullptr;
      spki_elem_assign(engine, &last->next, rest);
      break;
    }
    last->next = spki_intersect_elem(engine, a, b);
    last = last->next;
  }
  if (last == nullptr) return nullptr;
  first->refcount = 0;  // the caller's store is the first reference
  return first.release();
}

spki_elem* IntersectPlainLists(spki_engine* engine, spki_elem* a, spki_elem* b) {
  spki_elem_owner result = spki_new_list(engine, nullptr);
  if (result == nullptr) return nullptr;
  spki_elem* chain = spki_intersect_chain(engine, a->value.list, b->value.list);
  if (chain == nullptr) return nullptr;  // an empty list would allow more than either
  spki_elem_assign(engine, &result->value.list, chain);
  return result.release();
}

// Ranges, of which one may be a prefix (which then counts as the first input).
spki_elem* IntersectRanges(spki_engine* engine, const spki_elem* a, const spki_elem* b) {
  spki_range_bounds bounds;
  if (spki_classify(a) == SPKI_TAG_PREFIX) {
    spki_range_add_tag(engine, &bounds, b, 2);
    spki_range_add_prefix(engine, &bounds, a, 1);
  } else {
    spki_range_add_tag(engine, &bounds, a, 1);
    spki_range_add_tag(engine, &bounds, b, 2);
  }
  return spki_range_build(engine, &bounds);
}

spki_elem* IntersectPrefixes(spki_engine* engine, const spki_elem* a, const spki_elem* b) {
  if (spki_has_prefix(engine, spki_prefix_string(a), b)) return spki_copy(engine, a).release();
  if (spki_has_prefix(engine, spki_prefix_string(b), a)) return spki_copy(engine, b).release();
  return nullptr;
}

// Two lists of which at least one is headed by "*". A malformed form has something in common with
// "(*)" and with sets only, not even with itself: that grants less.
spki_elem* IntersectForms(spki_engine* engine, spki_elem* a, spki_elem* b) {
  const spki_tag_class a_class = spki_classify(a);
  const spki_tag_class b_class = spki_classify(b);
  if (a_class == SPKI_TAG_ALL) return spki_copy(engine, b).release();
  if (b_class == SPKI_TAG_ALL) return spki_copy(engine, a).release();
  if (a_class == SPKI_TAG_SET) return spki_intersect_set(engine, a, b);
  if (b_class == SPKI_TAG_SET) return spki_intersect_set(engine, b, a);
  if (a_class == SPKI_TAG_PREFIX && b_class == SPKI_TAG_PREFIX) {
    return IntersectPrefixes(engine, a, b);
  }
  if (a_class == SPKI_TAG_RANGE && b_class == SPKI_TAG_PREFIX) {
    return IntersectRanges(engine, b, a);
  }
  const bool first = a_class == SPKI_TAG_RANGE || a_class == SPKI_TAG_PREFIX;
  if (first && b_class == SPKI_TAG_RANGE) return IntersectRanges(engine, a, b);
  return nullptr;
}

}  // namespace

spki_elem* spki_intersect_chain(spki_engine* engine, spki_elem* a, spki_elem* b) {
  bool overlap = false;
  spki_elem* narrower = Narrower(engine, a, b, &overlap);
  return overlap ? IntersectElements(engine, a, b) : narrower;
}

spki_elem* spki_intersect_elem(spki_engine* engine, spki_elem* a, spki_elem* b) {
  if (a == nullptr || b == nullptr || engine->budget.spent != 0) return nullptr;
  if (a->kind == SPKI_ELEM_LIST && b->kind == SPKI_ELEM_LIST) {
    const bool plain = !HasStarHead(a) && !HasStarHead(b);
    return plain ? IntersectPlainLists(engine, a, b) : IntersectForms(engine, a, b);
  }
  switch (spki_cmp_elem(engine, a, b)) {
    case SPKI_REL_EQUAL:
    case SPKI_REL_NARROWER:
      return spki_copy(engine, a).release();
    case SPKI_REL_WIDER:
      return spki_copy(engine, b).release();
    default:
      return nullptr;
  }
}

}  // namespace ZvVesk2::Engine
