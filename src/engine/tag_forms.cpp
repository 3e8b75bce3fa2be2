// SPDX-License-Identifier: Apache-2.0
// The star forms, seen from outside and inside, and the elements that results are made of.
#include "src/engine/tag_forms.h"

#include <algorithm>

#include "src/engine/budget.h"
#include "src/engine/chain.h"

namespace ZvVesk2::Engine {
namespace {

spki_elem_owner NewElem(spki_engine* engine, spki_elem_kind kind) {
  spki_elem_owner elem = Own(engine, spki_elem_new(engine));
  if (elem != nullptr) elem->kind = kind;
  return elem;
}

}  // namespace

const spki_elem* spki_form_head(const spki_elem* elem) {
  if (elem == nullptr) return nullptr;
  if (elem->kind == SPKI_ELEM_LIST) return elem->value.list;
  return elem->kind == SPKI_ELEM_KEYWORD ? elem : nullptr;
}

const spki_elem* spki_form_arguments(const spki_elem* form) {
  return spki_form_head(form)->next->next;
}

// A star form that is none of the four is an ordinary list or head and no error: such tags exist,
// and are compared word by word.
spki_tag_class spki_classify(const spki_elem* elem) {
  if (elem == nullptr) return SPKI_TAG_NONE;
  const auto plain = static_cast<spki_tag_class>(elem->kind);
  const spki_elem* head = spki_form_head(elem);
  if (HeadKeyword(head) != SPKI_KW_STAR) return plain;
  if (head->next == nullptr) return SPKI_TAG_ALL;
  if (head->next->kind != SPKI_ELEM_STRING) return plain;
  switch (head->next->value.atom->keyword) {
    case SPKI_KW_SET:
      return SPKI_TAG_SET;
    case SPKI_KW_PREFIX:
      return SPKI_TAG_PREFIX;
    case SPKI_KW_RANGE:
      return SPKI_TAG_RANGE;
    default:
      return plain;
  }
}

// A prefix with more or less behind it than one string has no members: it is not a plain list, so
// it is not compared word by word either.
const spki_elem* spki_prefix_string(const spki_elem* elem) {
  if (spki_classify(elem) != SPKI_TAG_PREFIX) return nullptr;
  const spki_elem* string = spki_form_arguments(elem);
  return StringOf(string) != nullptr && string->next == nullptr ? string : nullptr;
}

// Bytes are compared to the end, 0 bytes included, unlike in the orders of strings.
bool spki_has_prefix(spki_engine* engine, const spki_elem* string, const spki_elem* prefix) {
  const spki_atom* s = StringOf(string);
  const spki_atom* p = StringOf(spki_prefix_string(prefix));
  if (s == nullptr || p == nullptr || spki_charge_strings(engine, s, p) != 0) return false;
  return std::equal(s->hint, s->hint + s->hint_length, p->hint, p->hint + p->hint_length) &&
         s->length >= p->length && std::equal(p->data, p->data + p->length, s->data);
}

spki_bound spki_read_bound(const spki_elem* elem) {
  const spki_elem* head = ListOf(elem);
  if (HeadKeyword(head) == -1) return {};
  spki_atom* value = StringOf(head->next);
  if (value == nullptr) return {};
  return {head->value.keyword, value, head->next->next == nullptr};
}

spki_elem_owner spki_new_string(spki_engine* engine, spki_atom* atom) {
  spki_elem_owner elem = NewElem(engine, SPKI_ELEM_STRING);
  if (elem != nullptr) spki_atom_assign(engine, &elem->value.atom, atom);
  return elem;
}

spki_elem_owner spki_new_keyword(spki_engine* engine, int32_t keyword) {
  spki_elem_owner elem = NewElem(engine, SPKI_ELEM_KEYWORD);
  if (elem != nullptr) elem->value.keyword = keyword;
  return elem;
}

spki_elem_owner spki_new_list(spki_engine* engine, spki_elem* list) {
  spki_elem_owner elem = NewElem(engine, SPKI_ELEM_LIST);
  if (elem != nullptr) spki_elem_assign(engine, &elem->value.list, list);
  return elem;
}

spki_elem_owner spki_copy(spki_engine* engine, const spki_elem* elem) {
  switch (elem->kind) {
    case SPKI_ELEM_KEYWORD:
      return spki_new_keyword(engine, elem->value.keyword);
    case SPKI_ELEM_LIST:
      return spki_new_list(engine, elem->value.list);
    default: {
      spki_elem_owner copy = spki_new_string(engine, elem->value.atom);
      if (copy != nullptr) copy->kind = elem->kind;
      return copy;
    }
  }
}

}  // namespace ZvVesk2::Engine
