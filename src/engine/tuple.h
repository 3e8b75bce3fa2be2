// SPDX-License-Identifier: Apache-2.0
// 5-tuples: what one credential, or a chain of them, grants. (issuer, subject, propagate, tag,
// validity), with the names and thresholds that are still in between.
#ifndef VESK2_SRC_ENGINE_TUPLE_H
#define VESK2_SRC_ENGINE_TUPLE_H

#include "src/engine/owned.h"
#include "src/engine/principal.h"

namespace ZvVesk2::Engine {

struct spki_threshold;  // src/engine/threshold.h

// What stands in `member` of a tuple that belongs to no k-of-n subject.
inline constexpr int32_t kSpkiAclEntry = -1;
inline constexpr int32_t kSpkiCertificate = 0;

// Counts cannot wrap: the budget allows far fewer entries than they hold.
struct spki_tuple {
  spki_tuple* link;
  uint32_t refcount;
  bool reaches;               // the subject is, or leads to, the requester
  bool propagate;             // the subject may delegate
  int32_t member;             // kSpkiAclEntry, kSpkiCertificate or a position from 1
  spki_principal* issuer;     // null for an ACL entry
  spki_atom* issuer_name;     // N of (issuer (name K N))
  spki_principal* subject;    // null for a k-of-n subject
  spki_atom* subject_name;    // the first name still to resolve below the subject
  spki_elem* name_rest;       // the names behind it
  spki_threshold* threshold;  // that a member belongs to; borrowed
  spki_elem* subject_list;    // the (subject ...) list, or the member of a k-of-n
  spki_elem* tag;             // the whole (tag ...) list
  spki_atom* not_before;
  spki_atom* not_after;
};

// One reference, all else zero; null without memory.
spki_tuple* spki_tuple_new(spki_engine* engine);
spki_tuple* spki_tuple_copy(spki_engine* engine, const spki_tuple* tuple);
void spki_tuple_release(spki_engine* engine, spki_tuple* tuple);

struct spki_tuple_releaser {
  spki_engine* engine;
  void operator()(spki_tuple* tuple) const { spki_tuple_release(engine, tuple); }
};
using spki_tuple_owner = std::unique_ptr<spki_tuple, spki_tuple_releaser>;
inline spki_tuple_owner Own(spki_engine* engine, spki_tuple* tuple) { return {tuple, {engine}}; }

// Puts a tuple in front of a list, which takes a reference of its own.
[[nodiscard]] spki_status spki_tuple_push(spki_engine* engine, spki_entry** list,
                                          spki_tuple* tuple);
// The same unless an equal tuple was filed before; `*filed` tells. Equal tuples belong in one list.
[[nodiscard]] spki_status spki_tuple_file(spki_engine* engine, spki_entry** list, spki_tuple* tuple,
                                          bool* filed);

// Narrows a tuple to what `first` allows as well. Whether anything is left: a tag in common (two
// absent ones are none) and a period. Nothing is when the budget is spent. After false the tuple is
// only to be released.
bool spki_tuple_narrow(spki_engine* engine, spki_tuple* tuple, const spki_tuple* first);
// What `first`, whose subject issued `second`, grants to the subject of `second`, in *made; null
// when that is nothing.
[[nodiscard]] spki_status spki_tuple_combine(spki_engine* engine, const spki_tuple* first,
                                             const spki_tuple* second, spki_tuple** made);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_TUPLE_H
