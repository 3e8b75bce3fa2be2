// SPDX-License-Identifier: Apache-2.0
// The relation of two tags, element by element and list by list.
//
//   first \ second   string      list          prefix     range      set          (*)
//   string           =           -             in it      in it      in it        narrower
//   list             -           lists' own    -          -          in it        narrower
//   prefix           has it      -             prefixes   bounds     overlaps     narrower
//   range            in it       -             bounds     bounds     overlaps     narrower
//   set              in it       in it         overlaps   overlaps   overlaps     narrower
//
// A head equals a head of its own kind; strings, prefixes and ranges say nothing about heads.
#include "src/engine/tag.h"

#include "src/engine/budget.h"
#include "src/engine/set_index.h"
#include "src/engine/tag_forms.h"

namespace ZvVesk2::Engine {
namespace {

// What the second is to the first.
spki_relation Exchanged(spki_relation relation) {
  if (relation == SPKI_REL_NARROWER) return SPKI_REL_WIDER;
  return relation == SPKI_REL_WIDER ? SPKI_REL_NARROWER : relation;
}

spki_relation When(bool holds, spki_relation relation) {
  return holds ? relation : SPKI_REL_DISJOINT;
}

bool IsPlain(spki_tag_class tag_class) {
  return tag_class >= SPKI_TAG_KEYWORD_HEAD && tag_class <= SPKI_TAG_LIST;
}

// Whether the first lies within the second.
bool Within(spki_relation relation) {
  return relation == SPKI_REL_EQUAL || relation == SPKI_REL_NARROWER;
}

spki_relation StringTo(spki_engine* engine, const spki_elem* a, const spki_elem* b,
                       spki_tag_class b_class) {
  switch (b_class) {
    case SPKI_TAG_PREFIX:
      return When(spki_has_prefix(engine, a, b), SPKI_REL_NARROWER);
    case SPKI_TAG_RANGE:
      return When(spki_in_range(engine, a, b), SPKI_REL_NARROWER);
    case SPKI_TAG_STRING:
      return When(spki_atom_equal(engine, a->value.atom, b->value.atom), SPKI_REL_EQUAL);
    default:
      return SPKI_REL_DISJOINT;
  }
}

// Equal prefixes count as narrower, which is within as much as equal is: an intersection then takes
// the first.
spki_relation PrefixToPrefix(spki_engine* engine, const spki_elem* a, const spki_elem* b) {
  if (spki_has_prefix(engine, spki_prefix_string(a), b)) return SPKI_REL_NARROWER;
  return When(spki_has_prefix(engine, spki_prefix_string(b), a), SPKI_REL_WIDER);
}

spki_relation PrefixTo(spki_engine* engine, const spki_elem* a, const spki_elem* b,
                       spki_tag_class b_class) {
  switch (b_class) {
    case SPKI_TAG_PREFIX:
      return PrefixToPrefix(engine, a, b);
    case SPKI_TAG_RANGE:
      return spki_prefix_to_range(engine, a, b);
    case SPKI_TAG_STRING:
      return When(spki_has_prefix(engine, b, a), SPKI_REL_WIDER);
    default:
      return SPKI_REL_DISJOINT;
  }
}

spki_relation RangeTo(spki_engine* engine, const spki_elem* a, const spki_elem* b,
                      spki_tag_class b_class) {
  switch (b_class) {
    case SPKI_TAG_PREFIX:
      return Exchanged(spki_prefix_to_range(engine, b, a));
    case SPKI_TAG_RANGE:
      return spki_range_to_range(engine, a, b);
    case SPKI_TAG_STRING:
      return When(spki_in_range(engine, b, a), SPKI_REL_WIDER);
    default:
      return SPKI_REL_DISJOINT;
  }
}

spki_relation SetTo(spki_engine* engine, const spki_elem* a, const spki_elem* b,
                    spki_tag_class b_class) {
  if (IsPlain(b_class)) return When(spki_in_set(engine, b, a), SPKI_REL_WIDER);
  return spki_set_overlaps(engine, a, b);
}

// `a` against a set.
spki_relation ToSet(spki_engine* engine, const spki_elem* a, spki_tag_class a_class,
                    const spki_elem* b) {
  if (IsPlain(a_class)) return When(spki_in_set(engine, a, b), SPKI_REL_NARROWER);
  return Exchanged(spki_set_overlaps(engine, b, a));
}

// By the class of `a`; `b` is neither "(*)" nor a set.
spki_relation ByClass(spki_engine* engine, const spki_elem* a, spki_tag_class a_class,
                      const spki_elem* b, spki_tag_class b_class) {
  switch (a_class) {
    case SPKI_TAG_KEYWORD_HEAD:
      return When(b_class == SPKI_TAG_KEYWORD_HEAD && a->value.keyword == b->value.keyword,
                  SPKI_REL_EQUAL);
    case SPKI_TAG_HEAD:
      return When(b_class == SPKI_TAG_HEAD && spki_atom_equal(engine, a->value.atom, b->value.atom),
                  SPKI_REL_EQUAL);
    case SPKI_TAG_STRING:
      return StringTo(engine, a, b, b_class);
    case SPKI_TAG_LIST:
      if (b_class != SPKI_TAG_LIST) return SPKI_REL_DISJOINT;
      return spki_cmp_chain(engine, a->value.list, b->value.list);
    case SPKI_TAG_SET:
      return SetTo(engine, a, b, b_class);
    case SPKI_TAG_PREFIX:
      return PrefixTo(engine, a, b, b_class);
    case SPKI_TAG_RANGE:
      return RangeTo(engine, a, b, b_class);
    default:
      return SPKI_REL_DISJOINT;
  }
}

// What two lists are to each other when they were `so_far` up to an element that is `next`. Lists
// of which each is narrower in some place overlap.
spki_relation Combined(spki_relation so_far, spki_relation next) {
  if (next == SPKI_REL_EQUAL || so_far == next) return so_far;
  return so_far == SPKI_REL_EQUAL ? next : SPKI_REL_OVERLAP;
}

}  // namespace

bool spki_in_set(spki_engine* engine, const spki_elem* elem, const spki_elem* set) {
  const spki_tag_class set_class = spki_classify(set);
  if (set_class == SPKI_TAG_ALL) return true;
  if (set_class != SPKI_TAG_SET) return false;
  for (const spki_elem* m = spki_form_arguments(set); m != nullptr; m = m->next) {
    if (Within(spki_cmp_elem(engine, elem, m))) return true;
  }
  return false;
}

// A set never lies within another tag nor contains a star form whole: it overlaps or it does not.
spki_relation spki_set_overlaps(spki_engine* engine, const spki_elem* set, const spki_elem* other) {
  const spki_tag_class set_class = spki_classify(set);
  if (set_class == SPKI_TAG_ALL) return SPKI_REL_WIDER;
  if (set_class != SPKI_TAG_SET) return SPKI_REL_DISJOINT;
  SetIndex index(engine, other, set);
  for (const spki_elem* m = spki_form_arguments(set); m != nullptr; m = m->next) {
    if (Within(index.Relation(m))) return SPKI_REL_OVERLAP;
  }
  return SPKI_REL_DISJOINT;
}

spki_relation spki_cmp_elem(spki_engine* engine, const spki_elem* a, const spki_elem* b) {
  if (spki_charge_step(engine) != 0) return SPKI_REL_DISJOINT;
  if (a == b) return SPKI_REL_EQUAL;
  if (a == nullptr || b == nullptr) return SPKI_REL_DISJOINT;
  const spki_tag_class a_class = spki_classify(a);
  const spki_tag_class b_class = spki_classify(b);
  if (b_class == SPKI_TAG_ALL) {
    return a_class == SPKI_TAG_ALL ? SPKI_REL_EQUAL : SPKI_REL_NARROWER;
  }
  if (a_class == SPKI_TAG_ALL) return SPKI_REL_WIDER;
  if (b_class == SPKI_TAG_SET) return ToSet(engine, a, a_class, b);
  return ByClass(engine, a, a_class, b, b_class);
}

// The shorter list is the wider tag: what a list has beyond the other narrows it. The first pair
// with nothing in common ends the walk, and so does a tail that both lists share.
spki_relation spki_cmp_chain(spki_engine* engine, const spki_elem* a, const spki_elem* b) {
  if (engine->budget.spent != 0) return SPKI_REL_DISJOINT;
  spki_relation relation = SPKI_REL_EQUAL;
  for (; a != b; a = a->next, b = b->next) {
    if (a == nullptr) return Combined(relation, SPKI_REL_WIDER);
    if (b == nullptr) return Combined(relation, SPKI_REL_NARROWER);
    const spki_relation next = spki_cmp_elem(engine, a, b);
    if (next == SPKI_REL_DISJOINT) return SPKI_REL_DISJOINT;
    relation = Combined(relation, next);
  }
  return relation;
}

spki_elem* spki_elem_max(spki_engine* engine, spki_elem* a, spki_elem* b) {
  if (a == nullptr || b == nullptr) return a != nullptr ? a : b;
  return spki_cmp_elem(engine, a, b) == SPKI_REL_NARROWER ? b : a;
}

spki_elem* spki_elem_min(spki_engine* engine, spki_elem* a, spki_elem* b) {
  if (a == nullptr || b == nullptr) return a != nullptr ? a : b;
  return spki_cmp_elem(engine, a, b) == SPKI_REL_WIDER ? b : a;
}

}  // namespace ZvVesk2::Engine
