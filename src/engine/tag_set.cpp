// SPDX-License-Identifier: Apache-2.0
// Intersection of a set with anything: what each member has in common with it.
//
//   (* set a b c) and (* set c b)   (* set c b): b is found first, c is put in front of it
//   (* set a b) and a               a: one member is no set
//   (* set (* prefix ab)) and abc   abc
//
// Members that are sets are taken apart, so a result is never a set of sets. The cost is the
// product of both sizes, and for each result a comparison with those before it, but for the strings
// of large sets (set_index.h): the budget pays for what is done, and Limits::kMaxSetMembers bounds
// the result.
#include <utility>

#include "src/engine/budget.h"
#include "src/engine/chain.h"
#include "src/engine/set_index.h"
#include "src/engine/tag_forms.h"

namespace ZvVesk2::Engine {
namespace {

// What one member and the other tag, which is `relation` to it, have in common; null for nothing,
// and without memory.
spki_elem_owner InCommon(spki_engine* engine, spki_elem* member, spki_relation relation,
                         spki_elem* other) {
  switch (relation) {
    case SPKI_REL_EQUAL:
    case SPKI_REL_NARROWER:
      return spki_copy(engine, member);
    case SPKI_REL_WIDER:
      return spki_copy(engine, other);
    case SPKI_REL_OVERLAP:
      return Own(engine, spki_intersect_elem(engine, member, other));
    default:
      return Own(engine, static_cast<spki_elem*>(nullptr));
  }
}

// The members found so far, the newest in front: granted sets have always come out in the reverse
// order of discovery.
class Members {
 public:
  explicit Members(spki_engine* engine)
      : engine_(engine), strings_(engine), first_(Own(engine, static_cast<spki_elem*>(nullptr))) {}

  // A set is taken apart, what is there already is dropped. False when there is no room or memory:
  // a set with a member too few is narrower, but no longer what both allow, so there is none then.
  bool Add(spki_elem_owner found) {
    if (found == nullptr) return engine_->budget.spent == 0;
    if (spki_classify(found.get()) == SPKI_TAG_SET) return AddMembersOf(found.get());
    if (IsPresent(found.get())) return engine_->budget.spent == 0;
    if (count_ == Limits::kMaxSetMembers) engine_->budget.spent = SPKI_ERR_NO_MEM;
    if (engine_->budget.spent != 0) return false;
    ++count_;
    found->next = first_.release();
    first_ = std::move(found);
    return true;
  }

  // No member is no tag, one is that member, several are a new set.
  spki_elem* Finish() {
    if (count_ <= 1) return first_.release();
    spki_elem* list = nullptr;
    if (spki_parse_template(engine_, &list, "(1:*3:set)") != 0) return nullptr;
    const spki_elem_owner set = Own(engine_, list);
    set->next->next = first_.release();
    return spki_new_list(engine_, set.get()).release();
  }

 private:
  // No string equals what is none: strings need be looked for among strings only.
  bool IsPresent(const spki_elem* found) {
    if (StringOf(found) != nullptr && count_ >= kPlainMembers) return !Enter(found);
    for (const spki_elem* present = first_.get(); present != nullptr; present = present->next) {
      if (spki_cmp_elem(engine_, found, present) == SPKI_REL_EQUAL) return true;
    }
    return false;
  }
  // Whether a string is new to the table, which is made of what is there when it is first needed.
  bool Enter(const spki_elem* found) {
    if (!tabled_) {
      for (const spki_elem* present = first_.get(); present != nullptr; present = present->next) {
        if (StringOf(present) != nullptr) strings_.Enter(StringOf(present));
      }
      tabled_ = true;
    }
    return strings_.Enter(StringOf(found));
  }
  bool AddMembersOf(const spki_elem* set) {
    for (const spki_elem* m = spki_form_arguments(set); m != nullptr; m = m->next) {
      if (spki_charge_step(engine_) != 0 || !Add(spki_copy(engine_, m))) return false;
    }
    return true;
  }

  spki_engine* engine_;
  StringTable strings_;
  bool tabled_ = false;
  spki_elem_owner first_;
  uint32_t count_ = 0;
};

}  // namespace

spki_elem* spki_intersect_set(spki_engine* engine, spki_elem* set, spki_elem* other) {
  if (spki_classify(set) != SPKI_TAG_SET) return nullptr;
  Members members(engine);
  SetIndex index(engine, other, set);
  const spki_elem* head = spki_form_head(set);
  for (spki_elem* m = head->next->next; m != nullptr; m = m->next) {
    if (!members.Add(InCommon(engine, m, index.Relation(m), other))) return nullptr;
  }
  return members.Finish();
}

}  // namespace ZvVesk2::Engine
