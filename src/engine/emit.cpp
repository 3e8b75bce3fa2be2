// SPDX-License-Identifier: Apache-2.0
// The result: one entry for each grant of the ACL that reaches the requester, newest first.
//
//   (acl (entry (subject <key>) [(propagate)] (tag ...)
//               [(valid [(not-before d)] [(not-after d)])])...)
//
// <key> is the (public-key ...) list, or the (hash ...) of a key that no list held. The order is
// part of the answer: of several grants, callers decide by the first.
#include "src/engine/reduction.h"
#include "src/engine/tag.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

constexpr char kEntry[] =
    "(5:entry(7:subject(10:public-key))(9:propagate)(3:tag)"
    "(5:valid(10:not-before2:nb)(9:not-after2:na)))";

// Fills the template's parts by their places: keys and tags may hold any text, "nb" included.
void FillEntry(spki_engine* engine, spki_elem* entry, const spki_tuple* tuple) {
  spki_elem* subject = entry->next;
  spki_elem* tag = subject->next->next;
  spki_elem* valid = tag->next->value.list;
  spki_elem* not_before = valid->next;
  spki_elem* not_after = not_before->next;

  spki_elem_assign(engine, &subject->value.list->next->value.list, tuple->subject->key);
  spki_elem_assign(engine, &tag->value.list, tuple->tag);
  spki_atom_assign(engine, &not_before->value.list->next->value.atom, tuple->not_before);
  spki_atom_assign(engine, &not_after->value.list->next->value.atom, tuple->not_after);

  // From the back, so that nothing is cut off that is still to be linked.
  if (tuple->not_after == nullptr) spki_elem_assign(engine, &not_before->next, nullptr);
  if (tuple->not_before == nullptr) spki_elem_assign(engine, &valid->next, not_before->next);
  if (valid->next == nullptr) spki_elem_assign(engine, &tag->next, nullptr);
  if (!tuple->propagate) spki_elem_assign(engine, &subject->next, tag);
}

// Appends the entry of a tuple behind *last, which moves on to it.
[[nodiscard]] spki_status EmitEntry(spki_engine* engine, const spki_tuple* tuple,
                                    spki_elem** last) {
  spki_elem* list = nullptr;
  VESK2_TRY(spki_parse_template(engine, &list, kEntry));
  const spki_elem_owner entry = Own(engine, list);
  FillEntry(engine, list, tuple);
  spki_elem* elem = spki_elem_new(engine);
  VESK2_REQUIRE(elem != nullptr, SPKI_ERR_NO_MEM);
  elem->kind = SPKI_ELEM_LIST;
  spki_elem_assign(engine, &elem->value.list, list);
  (*last)->next = elem;
  *last = elem;
  return 0;
}

}  // namespace

spki_status spki_emit_entries(spki_engine* engine, spki_elem** result) {
  spki_elem* list = nullptr;
  VESK2_TRY(spki_parse_template(engine, &list, "(3:acl)"));
  spki_elem_owner acl = Own(engine, list);
  spki_elem* last = list;
  for (const spki_entry* entry = engine->acl_tuples; entry != nullptr; entry = entry->next) {
    const spki_tuple* tuple = entry->tuple;
    // Without a tag the template's own would stand, which is the widest of all.
    if (!tuple->reaches || tuple->tag == nullptr) continue;
    VESK2_TRY(EmitEntry(engine, tuple, &last));
  }
  *result = acl.release();
  return 0;
}

}  // namespace ZvVesk2::Engine
