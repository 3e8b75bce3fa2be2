// SPDX-License-Identifier: Apache-2.0
// Names: (issuer (name K N)) defines what N means below K, (subject (name K N N2...)) uses it.
// Definitions and uses wait for each other under the digest of K and N, whichever comes first: each
// is filed in its table before it looks for the other kind, so every pair meets.
//
//   (issuer (name K sales)) (subject A)       K's "sales" is A
//   (subject (name K sales boss))             resolves to (subject (name A boss)), and waits there
#include "src/engine/budget.h"
#include "src/engine/chain.h"
#include "src/engine/reduction.h"
#include "src/engine/validity.h"
#include "src/engine/value.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

// The use with its first name replaced by what the definition says; none when they are never valid
// together. The grant stays the use's: a definition has no tag, and cannot widen one.
[[nodiscard]] spki_status Resolve(spki_engine* engine, const spki_tuple* use,
                                  const spki_tuple* definition, spki_tuple** made) {
  VESK2_TRY(spki_charge_combination(engine));
  spki_tuple_owner copy = Own(engine, spki_tuple_copy(engine, use));
  VESK2_REQUIRE(copy != nullptr, SPKI_ERR_NO_MEM);
  copy->subject = definition->subject;
  copy->reaches = definition->reaches;
  spki_atom* name = nullptr;
  if (use->name_rest != nullptr) {
    name = StringOf(use->name_rest);
    VESK2_REQUIRE(name != nullptr, SPKI_ERR_BAD_NAME_SYNTAX);
    spki_elem_assign(engine, &copy->name_rest, use->name_rest->next);
  }
  spki_atom_assign(engine, &copy->subject_name, name);
  if (spki_validity_meet(engine, copy.get(), definition)) *made = copy.release();
  return engine->budget.spent;
}

[[nodiscard]] spki_status ResolveUses(spki_reduction* run, spki_work* work, spki_tuple** made) {
  while (const spki_tuple* use = spki_next_tuple(run, work)) {
    VESK2_TRY(Resolve(run->engine, use, work->tuple, made));
    if (*made != nullptr) return 0;
  }
  work->step = nullptr;
  return 0;
}

[[nodiscard]] spki_status ResolveDefinitions(spki_reduction* run, spki_work* work,
                                             spki_tuple** made) {
  while (const spki_tuple* definition = spki_next_tuple(run, work)) {
    VESK2_TRY(Resolve(run->engine, work->tuple, definition, made));
    if (*made != nullptr) return 0;
  }
  work->step = nullptr;
  return 0;
}

// What is listed under a name in a table; null for nothing.
[[nodiscard]] spki_status ListedUnder(spki_engine* engine, const spki_table& table,
                                      const Digest& name, spki_entry** list) {
  spki_node* node = nullptr;
  VESK2_TRY(spki_table_find(engine, table, name, &node));
  *list = node == nullptr ? nullptr : node->tuples;
  return 0;
}

}  // namespace

spki_status spki_name_define(spki_reduction* run, spki_work* work) {
  spki_engine* engine = run->engine;
  spki_tuple* tuple = work->tuple;
  work->step = nullptr;
  // A definition whose subject is a k-of-n defines nothing: no single member has the name.
  if (tuple->member > 0) return 0;
  Digest name;
  VESK2_TRY(spki_name_value(engine, tuple->issuer, tuple->issuer_name, name));
  Digest definition;
  VESK2_TRY(spki_definition_value(engine, name, tuple->subject, definition));
  spki_node* node = nullptr;
  bool made = false;
  VESK2_TRY(spki_table_enter(engine, &engine->filed, definition, &node, &made));
  // The first definition of a name for a subject counts, whatever the others' dates are.
  if (!made) return 0;
  VESK2_TRY(spki_table_enter(engine, &engine->name_definitions, name, &node, &made));
  VESK2_TRY(spki_tuple_push(engine, &node->tuples, tuple));
  work->step = ResolveUses;
  return ListedUnder(engine, engine->name_users, name, &work->cursor);
}

spki_status spki_name_use(spki_reduction* run, spki_work* work) {
  spki_engine* engine = run->engine;
  spki_tuple* tuple = work->tuple;
  work->step = nullptr;
  Digest name;
  VESK2_TRY(spki_name_value(engine, tuple->subject, tuple->subject_name, name));
  spki_node* node = nullptr;
  bool made = false;
  VESK2_TRY(spki_table_enter(engine, &engine->name_users, name, &node, &made));
  bool filed = false;
  VESK2_TRY(spki_tuple_file(engine, &node->tuples, tuple, &filed));
  if (!filed) return 0;
  work->step = ResolveDefinitions;
  return ListedUnder(engine, engine->name_definitions, name, &work->cursor);
}

}  // namespace ZvVesk2::Engine
