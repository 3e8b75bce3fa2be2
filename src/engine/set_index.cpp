// SPDX-License-Identifier: Apache-2.0
// Strings of large sets: entered, and asked for.
#include "src/engine/set_index.h"

#include "src/engine/budget.h"
#include "src/engine/chain.h"
#include "src/engine/tag_forms.h"
#include "src/engine/value.h"

namespace ZvVesk2::Engine {
namespace {

constexpr uint32_t kFirstMembers = 8;

bool IsLargeSet(const spki_elem* tag) {
  if (spki_classify(tag) != SPKI_TAG_SET) return false;
  uint32_t count = 0;
  const spki_elem* m = spki_form_arguments(tag);
  for (; m != nullptr && count <= kPlainMembers; m = m->next) ++count;
  return count > kPlainMembers;
}

}  // namespace

bool StringTable::Enter(const spki_atom* string) {
  Digest value;
  spki_node* node = nullptr;
  bool made = false;
  if (spki_string_value(engine_, string, value) != 0 ||
      spki_table_enter(engine_, &table_, value, &node, &made) != 0) {
    return false;
  }
  return made;
}

bool StringTable::Has(const spki_atom* string) {
  Digest value;
  spki_node* node = nullptr;
  return spki_string_value(engine_, string, value) == 0 &&
         spki_table_find(engine_, table_, value, &node) == 0 && node != nullptr;
}

SetIndex::SetIndex(spki_engine* engine, const spki_elem* tag, const spki_elem* asking)
    : engine_(engine),
      tag_(tag),
      until_filled_(IsLargeSet(tag) && IsLargeSet(asking) ? kFirstMembers : UINT32_MAX),
      strings_(engine) {}

SetIndex::~SetIndex() { spki_free(engine_, others_); }

// When the budget ends it, what is asked from then on is refused.
void SetIndex::Fill() {
  size_t others = 1;
  for (const spki_elem* m = spki_form_arguments(tag_); m != nullptr; m = m->next) {
    if (spki_charge_step(engine_) != 0) return;
    others += StringOf(m) == nullptr ? 1 : 0;
  }
  // NOLINTNEXTLINE(bugprone-sizeof-expression): an array of pointers
  others_ = static_cast<const spki_elem**>(spki_allocate(engine_, others * sizeof(spki_elem*)));
  if (others_ == nullptr) return;
  for (const spki_elem* m = spki_form_arguments(tag_); m != nullptr; m = m->next) {
    if (StringOf(m) == nullptr) {
      others_[other_count_++] = m;
    } else {
      strings_.Enter(StringOf(m));
    }
  }
}

spki_relation SetIndex::Relation(const spki_elem* elem) {
  const spki_atom* string = StringOf(elem);
  if (until_filled_ == 0) {
    Fill();
    until_filled_ = UINT32_MAX;
  } else if (until_filled_ != UINT32_MAX) {
    --until_filled_;
  }
  if (others_ == nullptr || string == nullptr) return spki_cmp_elem(engine_, elem, tag_);
  if (strings_.Has(string)) return SPKI_REL_NARROWER;
  for (uint32_t i = 0; i < other_count_ && engine_->budget.spent == 0; ++i) {
    const spki_relation relation = spki_cmp_elem(engine_, elem, others_[i]);
    if (relation == SPKI_REL_EQUAL || relation == SPKI_REL_NARROWER) return SPKI_REL_NARROWER;
  }
  return SPKI_REL_DISJOINT;
}

}  // namespace ZvVesk2::Engine
