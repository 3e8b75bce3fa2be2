// SPDX-License-Identifier: Apache-2.0
// The reduction: keys are registered, credentials become tuples one after the other, and what the
// ACL has come to grant is written out.
#include "src/engine/reduce.h"

#include "src/engine/chain.h"
#include "src/engine/fields.h"
#include "src/engine/reduction.h"
#include "src/engine/tag.h"
#include "src/engine/validity.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

// The heads of what is read from one of the two lists, and of what nests more of it. Each list has
// its own: an (entry ...) in a sequence, which anyone may write, would be a trust root.
struct Kind {
  int32_t container;
  int32_t credential;
};
constexpr Kind kAcl = {SPKI_KW_ACL, SPKI_KW_ENTRY};
constexpr Kind kSequence = {SPKI_KW_SEQUENCE, SPKI_KW_CERT};

// Gives the tuple the tag that the credential grants of what is requested; false for nothing, and
// when the budget is spent. A credential that grants none of it is then out of the way before it is
// combined with anything.
bool ApplyRequest(spki_reduction* run, spki_tuple* tuple) {
  spki_elem* requested = run->requested_tag;
  if (tuple->tag != nullptr && requested != nullptr) {
    requested = spki_intersect_chain(run->engine, tuple->tag, requested);
    spki_elem_assign(run->engine, &tuple->tag, requested);
    return tuple->tag != nullptr;
  }
  // A definition of a name grants nothing by itself.
  if (tuple->tag == nullptr && tuple->issuer_name == nullptr) {
    spki_elem_assign(run->engine, &tuple->tag, requested);
  }
  return true;
}

// An error in a credential stops the whole reduction: not to be readable is something else than to
// say nothing.
[[nodiscard]] spki_status spki_credential_to_tuple(spki_reduction* run,
                                                   const spki_elem* credential) {
  spki_engine* engine = run->engine;
  VESK2_REQUIRE(credential != nullptr, SPKI_ERR_NULL_PARAM);
  const spki_tuple_owner tuple = Own(engine, spki_tuple_new(engine));
  VESK2_REQUIRE(tuple != nullptr, SPKI_ERR_NO_MEM);
  const bool acl = HeadKeyword(credential) == SPKI_KW_ENTRY;
  VESK2_TRY(spki_tuple_fields(engine, tuple.get(), credential, acl));

  // A credential that has nothing to say to this request is passed over without error.
  if (run->fifth != nullptr) {
    const spki_status status = spki_validity_narrow(engine, tuple.get(), run->fifth);
    if (status == SPKI_ERR_DATE_INTERSECTION) return 0;
    VESK2_TRY(status);
  }
  if (!ApplyRequest(run, tuple.get())) return engine->budget.spent;

  VESK2_REQUIRE(acl || tuple->issuer != nullptr, SPKI_ERR_NEED_ISSUER);
  VESK2_REQUIRE(tuple->issuer_name == nullptr || tuple->tag == nullptr,
                SPKI_ERR_ISSUER_NAME_AND_AUTH);
  return spki_tuple_insert(run, tuple.get());
}

[[nodiscard]] spki_status spki_walk_credentials(spki_reduction* run, const spki_elem* chain,
                                                const Kind& kind) {
  for (const spki_elem* elem = chain; elem != nullptr; elem = elem->next) {
    const spki_elem* list = ListOf(elem);
    const int32_t keyword = HeadKeyword(list);
    if (keyword == kind.container) VESK2_TRY(spki_walk_credentials(run, list, kind));
    if (keyword == kind.credential) VESK2_TRY(spki_credential_to_tuple(run, list));
  }
  return 0;
}

// An engine may be used for several reductions; each starts with empty tables. What they held was
// released at the end of the one before.
void ForgetTables(spki_engine* engine) {
  for (spki_table* table :
       {&engine->principals, &engine->name_definitions, &engine->name_users, &engine->filed}) {
    *table = {};
  }
  engine->newest = nullptr;
  engine->keys_by_sha1 = false;
  engine->acl_tuples = nullptr;
}

// A list that stands in another as its first element is meant itself.
void Take(spki_engine* engine, spki_elem** slot, spki_elem* list) {
  spki_elem_assign(engine, slot, ListOf(list) != nullptr ? ListOf(list) : list);
}

}  // namespace

spki_reduction::~spki_reduction() {
  spki_work_clear(this);
  spki_thresholds_clear(this);
  spki_entries_clear(engine, &engine->acl_tuples);
  for (spki_table* table : {&engine->name_definitions, &engine->name_users, &engine->filed}) {
    spki_table_clear(engine, table);
  }
  spki_principals_clear(engine);
  for (spki_elem* list : {acl, sequence, third, requested_tag, fifth}) {
    spki_elem_release(engine, list);
  }
}

spki_status spki_reduce(spki_engine* engine, spki_elem* acl, spki_elem* sequence, spki_elem* third,
                        spki_elem* requestedTag, spki_elem* fifth, spki_elem** result) {
  VESK2_REQUIRE(engine != nullptr && result != nullptr, SPKI_ERR_NULL_PARAM);
  *result = nullptr;
  ForgetTables(engine);
  VESK2_REQUIRE(acl != nullptr, SPKI_ERR_NO_ACL);
  spki_reduction run(engine);
  Take(engine, &run.acl, acl);
  Take(engine, &run.sequence, sequence);
  Take(engine, &run.third, third);
  Take(engine, &run.requested_tag, requestedTag);
  Take(engine, &run.fifth, fifth);

  // All keys come first, so that a hash in any credential finds the key that it names.
  VESK2_TRY(spki_register_keys(engine, run.third));
  VESK2_TRY(spki_register_keys(engine, run.acl));
  VESK2_TRY(spki_register_keys(engine, run.sequence));
  VESK2_TRY(spki_walk_credentials(&run, run.acl, kAcl));
  VESK2_TRY(spki_walk_credentials(&run, run.sequence, kSequence));
  VESK2_TRY(engine->budget.spent);
  return spki_emit_entries(engine, result);
}

}  // namespace ZvVesk2::Engine
