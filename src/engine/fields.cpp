// SPDX-License-Identifier: Apache-2.0
// Credentials:
//
//   (entry <field>...)     a grant of the ACL itself, without an issuer
//   (cert <field>...)
//
//   field = (issuer <key>) / (issuer (name <key> N))
//         / (subject <key>) / (subject (name [<key>] N N...)) / (subject (k-of-n k n S...))
//         / (propagate) / (tag ...) / (not-before d) / (not-after d)
//         / (valid [(not-before d)] [(not-after d)])
//   key   = (public-key ...) / (hash algorithm value)
//
// in any order, except that a subject name without a key comes behind the issuer; other fields say
// nothing here. A field is a list, and bare words between them are passed over.
#include "src/engine/fields.h"

#include "src/engine/chain.h"
#include "src/engine/validity.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

bool IsKey(const spki_elem* list) {
  const int32_t keyword = HeadKeyword(list);
  return keyword == SPKI_KW_HASH || keyword == SPKI_KW_PUBLIC_KEY;
}

// Two of one kind are refused, here as for tags, issuers and subjects: whichever a reader took, the
// issuer may have meant the other.
[[nodiscard]] spki_status ReadPropagate(spki_engine* /*engine*/, spki_tuple* tuple,
                                        spki_elem* /*list*/) {
  VESK2_REQUIRE(!tuple->propagate, SPKI_ERR_TOO_MANY_PROPAGATE);
  tuple->propagate = true;
  return 0;
}

// The whole (tag ...) list, its head included: tags are compared and written out so.
[[nodiscard]] spki_status ReadTag(spki_engine* engine, spki_tuple* tuple, spki_elem* list) {
  VESK2_REQUIRE(tuple->tag == nullptr, SPKI_ERR_TOO_MANY_TAGS);
  spki_elem_assign(engine, &tuple->tag, list);
  return 0;
}

// Of two dates of one kind the later one in the text counts: there are stored credentials with two.
[[nodiscard]] spki_status ReadDate(spki_engine* engine, spki_tuple* tuple, spki_elem* list) {
  spki_atom* date = nullptr;
  VESK2_TRY(spki_validity_date(list, &date));
  const bool before = HeadKeyword(list) == SPKI_KW_NOT_BEFORE;
  spki_atom_assign(engine, before ? &tuple->not_before : &tuple->not_after, date);
  return 0;
}

[[nodiscard]] spki_status ReadValid(spki_engine* engine, spki_tuple* tuple, spki_elem* list) {
  for (const spki_elem* elem = list->next; elem != nullptr; elem = elem->next) {
    spki_elem* date = ListOf(elem);
    const int32_t keyword = HeadKeyword(date);
    if (keyword != SPKI_KW_NOT_BEFORE && keyword != SPKI_KW_NOT_AFTER) continue;
    VESK2_TRY(ReadDate(engine, tuple, date));
  }
  return 0;
}

// An entry of the ACL that named an issuer would be granted on somebody else's word.
[[nodiscard]] spki_status ReadIssuer(spki_engine* engine, spki_tuple* tuple, spki_elem* list) {
  VESK2_REQUIRE(tuple->member != kSpkiAclEntry, SPKI_ERR_ACL_HAS_ISSUER);
  VESK2_REQUIRE(tuple->issuer == nullptr, SPKI_ERR_TOO_MANY_ISSUERS);
  spki_elem* key = ListOf(list->next);
  if (HeadKeyword(key) == SPKI_KW_NAME) {
    const spki_elem* owner = key->next;
    const spki_elem* name = owner == nullptr ? nullptr : owner->next;
    VESK2_REQUIRE(StringOf(name) != nullptr && name->next == nullptr, SPKI_ERR_ISSUER_SYNTAX);
    spki_atom_assign(engine, &tuple->issuer_name, StringOf(name));
    key = ListOf(owner);
  }
  VESK2_REQUIRE(IsKey(key), SPKI_ERR_ISSUER_SYNTAX);
  return spki_resolve_principal(engine, key, &tuple->issuer);
}

// The names from `name` on: K's N1's N2. Definitions can feed themselves, so the number of names
// that are still to be resolved is bounded.
[[nodiscard]] spki_status ReadNames(spki_engine* engine, spki_tuple* tuple, const spki_elem* name) {
  VESK2_REQUIRE(StringOf(name) != nullptr, SPKI_ERR_SUBJECT_SYNTAX);
  uint32_t count = 0;
  for (const spki_elem* rest = name->next; rest != nullptr; rest = rest->next) {
    VESK2_REQUIRE(++count <= Limits::kMaxNameRest, SPKI_ERR_BAD_NAME_SYNTAX);
  }
  spki_atom_assign(engine, &tuple->subject_name, StringOf(name));
  spki_elem_assign(engine, &tuple->name_rest, name->next);
  return 0;
}

[[nodiscard]] spki_status ReadNameSubject(spki_engine* engine, spki_tuple* tuple,
                                          const spki_elem* list) {
  const spki_elem* first = list->next;
  if (spki_elem* key = ListOf(first)) {
    VESK2_TRY(spki_resolve_principal(engine, key, &tuple->subject));
    return ReadNames(engine, tuple, first->next);
  }
  VESK2_REQUIRE(tuple->issuer != nullptr, SPKI_ERR_SUBJECT_SYNTAX);
  tuple->subject = tuple->issuer;
  return ReadNames(engine, tuple, first);
}

[[nodiscard]] spki_status ReadSubject(spki_engine* engine, spki_tuple* tuple, spki_elem* list) {
  VESK2_REQUIRE(tuple->subject_list == nullptr, SPKI_ERR_TOO_MANY_SUBJECTS);
  spki_elem_assign(engine, &tuple->subject_list, list);
  return spki_tuple_subject(engine, tuple, ListOf(list->next));
}

struct Field {
  int32_t keyword;
  spki_status (*read)(spki_engine* engine, spki_tuple* tuple, spki_elem* list);
};
constexpr Field kFields[] = {
    {SPKI_KW_PROPAGATE, ReadPropagate}, {SPKI_KW_ISSUER, ReadIssuer},
    {SPKI_KW_NOT_BEFORE, ReadDate},     {SPKI_KW_NOT_AFTER, ReadDate},
    {SPKI_KW_VALID, ReadValid},         {SPKI_KW_TAG, ReadTag},
    {SPKI_KW_SUBJECT, ReadSubject},
};

[[nodiscard]] spki_status ReadField(spki_engine* engine, spki_tuple* tuple, spki_elem* list) {
  for (const Field& field : kFields) {
    if (HeadKeyword(list) == field.keyword) return field.read(engine, tuple, list);
  }
  return 0;
}

}  // namespace

spki_status spki_tuple_fields(spki_engine* engine, spki_tuple* tuple, const spki_elem* credential,
                              bool acl) {
  tuple->member = acl ? kSpkiAclEntry : kSpkiCertificate;
  for (const spki_elem* elem = credential; elem != nullptr; elem = elem->next) {
    if (spki_elem* list = ListOf(elem)) VESK2_TRY(ReadField(engine, tuple, list));
  }
  return 0;
}

spki_status spki_tuple_subject(spki_engine* engine, spki_tuple* tuple, spki_elem* list) {
  if (IsKey(list)) return spki_resolve_principal(engine, list, &tuple->subject);
  switch (HeadKeyword(list)) {
    case SPKI_KW_K_OF_N:
      return 0;  // src/engine/threshold.cpp reads it once the tuple is whole
    case SPKI_KW_NAME:
      return ReadNameSubject(engine, tuple, list);
    default:
      return SPKI_ERR_SUBJECT_SYNTAX;
  }
}

}  // namespace ZvVesk2::Engine
