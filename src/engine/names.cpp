// Names: (issuer (name K N)) defines what N means below K, (subject (name K N N2...)) uses it.
// Definitions and uses wait for each other under the digest of K and N, whichever comes first.
#include <cstring>

#include "src/engine/budget.h"
#include "src/engine/chain.h"
#include "src/engine/reduction.h"
#include "src/engine/validity.h"
#include "src/engine/value.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

using Digest = unsigned char[kSpkiDigestSize];

// The next tuple under the cursor's name.
const spki_tuple* NextOfName(spki_reduction* run, spki_work* work) {
  spki_bucket_entry* entry = work->cursor;
  if (entry == nullptr) return nullptr;
  work->cursor = spki_entry_find(run->engine, entry->next, entry->digest);
  return entry->tuple;
}

// The use with its first name replaced by what the definition says; none when they are never valid
// together.
spki_status Resolve(spki_engine* engine, const spki_tuple* use, const spki_tuple* definition,
                    spki_tuple** made) {
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
  return 0;
}

spki_status ResolveUses(spki_reduction* run, spki_work* work, spki_tuple** made) {
  while (const spki_tuple* use = NextOfName(run, work)) {
    VESK2_TRY(Resolve(run->engine, use, work->tuple, made));
    if (*made != nullptr) return 0;
  }
  work->step = nullptr;
  return 0;
}

spki_status ResolveDefinitions(spki_reduction* run, spki_work* work, spki_tuple** made) {
  while (const spki_tuple* definition = NextOfName(run, work)) {
    VESK2_TRY(Resolve(run->engine, work->tuple, definition, made));
    if (*made != nullptr) return 0;
  }
  work->step = nullptr;
  return 0;
}

// Whether the subject has this name already. The first definition counts, whatever the others'
// dates are.
spki_status IsDefined(spki_engine* engine, const Digest& digest, const spki_principal* subject,
                      bool* defined) {
  spki_bucket_entry* entry = engine->name_definitions[digest[0]];
  *defined = false;
  while ((entry = spki_entry_find(engine, entry, digest)) != nullptr && !*defined) {
    *defined = entry->tuple->subject == subject;
    entry = entry->next;
  }
  return engine->budget.spent;
}

}  // namespace

spki_status spki_name_define(spki_reduction* run, spki_work* work) {
  spki_engine* engine = run->engine;
  spki_tuple* tuple = work->tuple;
  work->step = nullptr;
  // A name for any k of n subjects is none that a single one of them has.
  if (tuple->member > 0) return 0;
  Digest digest;
  VESK2_TRY(spki_name_value(engine, tuple->issuer, tuple->issuer_name, digest));
  bool defined = false;
  VESK2_TRY(IsDefined(engine, digest, tuple->subject, &defined));
  if (defined) return 0;
  spki_bucket_entry** bucket = &engine->name_definitions[digest[0]];
  VESK2_TRY(spki_tuple_push(engine, bucket, tuple));
  std::memcpy((*bucket)->digest, digest, sizeof digest);
  work->cursor = spki_entry_find(engine, engine->name_users[digest[0]], digest);
  work->step = ResolveUses;
  return 0;
}

spki_status spki_name_use(spki_reduction* run, spki_work* work) {
  spki_engine* engine = run->engine;
  spki_tuple* tuple = work->tuple;
  work->step = nullptr;
  Digest digest;
  VESK2_TRY(spki_name_value(engine, tuple->subject, tuple->subject_name, digest));
  spki_bucket_entry** bucket = &engine->name_users[digest[0]];
  bool filed = false;
  VESK2_TRY(spki_tuple_file(engine, bucket, tuple, &filed));
  if (!filed) return 0;
  std::memcpy((*bucket)->digest, digest, sizeof digest);
  work->cursor = spki_entry_find(engine, engine->name_definitions[digest[0]], digest);
  work->step = ResolveDefinitions;
  return 0;
}

}  // namespace ZvVesk2::Engine
