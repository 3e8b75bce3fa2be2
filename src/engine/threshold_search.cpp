// SPDX-License-Identifier: Apache-2.0
// The choice of k members. Positions are taken in increasing order and every choice is cut off as
// soon as its tags or periods have nothing in common; what is left may still be exponential, so it
// is bounded, and a search that is too long is an error of its own.
//
// A depth-first search with one Choice for each member chosen so far. `sum` of each is what it and
// all before it grant in common; a choice extends the last sum, and going back drops it. Every
// choice has the arriving tuple in it: those without were searched when their last tuple arrived.
// The first k that agree end the search, whatever others would grant.
#include <algorithm>
#include <utility>

#include "src/engine/budget.h"
#include "src/engine/threshold.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

// The choice of one more position.
struct Choice {
  uint32_t next;            // the candidate behind the one chosen
  const spki_entry* entry;  // the member tuple chosen; null before the first
  spki_tuple* sum;          // what this and the choices before it have in common
};

class Search {
 public:
  Search(spki_engine* engine, const spki_threshold* threshold, const spki_tuple* arriving)
      : engine_(engine), threshold_(threshold), arriving_(arriving), k_(threshold->k) {}
  Search(const Search&) = delete;
  Search& operator=(const Search&) = delete;
  ~Search();

  // Finds the candidates: for each position with a tuple to the subject, the first of them.
  [[nodiscard]] spki_status Prepare();
  // *made is the sum of the first complete choice; null when there is none.
  [[nodiscard]] spki_status Run(spki_tuple** made);

 private:
  const spki_entry* Fitting(const spki_entry* entry);
  // At depth d the member d + 1 of k is chosen.
  void Start(uint32_t depth);
  bool Move(uint32_t depth);
  [[nodiscard]] spki_status Join(uint32_t depth, bool* agree);
  void Drop(uint32_t depth);

  spki_engine* engine_;
  const spki_threshold* threshold_;
  const spki_tuple* arriving_;
  uint32_t k_;
  const spki_entry** candidates_ = nullptr;
  uint32_t count_ = 0;
  uint32_t own_ = 0;  // the arriving tuple among the candidates
  Choice* choices_ = nullptr;
};

Search::~Search() {
  for (uint32_t i = 0; choices_ != nullptr && i < k_; ++i) Drop(i);
  spki_free(engine_, choices_);
  spki_free(engine_, candidates_);
}

// The first tuple from `entry` on that may be chosen: to the subject, and of the arriving tuple's
// position that one alone (choices without it were searched before). Null also when the budget is
// spent.
const spki_entry* Search::Fitting(const spki_entry* entry) {
  for (; entry != nullptr; entry = entry->next) {
    if (spki_charge_step(engine_, SPKI_ERR_THRESHOLD) != 0) return nullptr;
    const spki_tuple* tuple = entry->tuple;
    const bool own = tuple->member == arriving_->member;
    if (own ? tuple == arriving_ : tuple->subject == arriving_->subject) return entry;
  }
  return nullptr;
}

spki_status Search::Prepare() {
  // Each position is looked at, whether or not anything is there.
  VESK2_TRY(spki_charge_units(engine_, threshold_->n, SPKI_ERR_THRESHOLD));
  // NOLINTNEXTLINE(bugprone-sizeof-expression): an array of pointers
  const size_t size = threshold_->n * sizeof(spki_entry*);
  candidates_ = static_cast<const spki_entry**>(spki_allocate(engine_, size));
  VESK2_REQUIRE(candidates_ != nullptr, SPKI_ERR_NO_MEM);
  for (uint32_t position = 1; position <= threshold_->n; ++position) {
    const spki_entry* entry = Fitting(threshold_->chains[position]);
    if (entry == nullptr) continue;
    if (entry->tuple == arriving_) own_ = count_;
    candidates_[count_++] = entry;
  }
  VESK2_TRY(engine_->budget.spent);
  if (count_ < k_) return 0;
  choices_ = static_cast<Choice*>(spki_allocate(engine_, k_ * sizeof(Choice)));
  VESK2_REQUIRE(choices_ != nullptr, SPKI_ERR_NO_MEM);
  std::fill_n(choices_, k_, Choice{});
  return 0;
}

// The last choice must be the arriving tuple when none before it is.
void Search::Start(uint32_t depth) {
  const uint32_t next = depth == 0 ? 0 : choices_[depth - 1].next;
  choices_[depth].next = depth + 1 == k_ ? std::max(next, own_) : next;
  choices_[depth].entry = nullptr;
}

// Moves a choice to the next tuple that may stand there: first the others of its position, then the
// following positions, but past the arriving tuple's only once that is chosen. False at the end.
bool Search::Move(uint32_t depth) {
  Choice& choice = choices_[depth];
  if (choice.entry != nullptr) choice.entry = Fitting(choice.entry->next);
  if (choice.entry != nullptr) return true;
  const bool taken = depth > 0 && choices_[depth - 1].next > own_;
  // One candidate must remain for each further choice.
  const uint32_t last = std::min(taken ? count_ : own_ + 1, count_ - (k_ - 1 - depth));
  if (choice.next >= last) return false;
  choice.entry = candidates_[choice.next++];
  return true;
}

// Makes the sum of a choice. It may be delegated on only where all members allow it.
spki_status Search::Join(uint32_t depth, bool* agree) {
  Choice& choice = choices_[depth];
  VESK2_TRY(spki_charge_combination(engine_, SPKI_ERR_THRESHOLD));
  choice.sum = spki_tuple_copy(engine_, choice.entry->tuple);
  VESK2_REQUIRE(choice.sum != nullptr, SPKI_ERR_NO_MEM);
  const spki_tuple* before = depth == 0 ? choice.sum : choices_[depth - 1].sum;
  choice.sum->propagate = choice.sum->propagate && before->propagate;
  choice.sum->reaches = choice.sum->reaches && before->reaches;
  *agree = spki_tuple_narrow(engine_, choice.sum, before);
  return engine_->budget.spent;
}

void Search::Drop(uint32_t depth) {
  spki_tuple_release(engine_, choices_[depth].sum);
  choices_[depth].sum = nullptr;
}

spki_status Search::Run(spki_tuple** made) {
  if (count_ < k_) return 0;
  uint32_t depth = 0;
  Start(depth);
  while (true) {
    Drop(depth);
    if (!Move(depth)) {
      VESK2_TRY(engine_->budget.spent);
      if (depth == 0) return 0;
      --depth;
      continue;
    }
    bool agree = false;
    VESK2_TRY(Join(depth, &agree));
    if (!agree) continue;
    if (depth + 1 == k_) break;
    Start(++depth);
  }
  *made = std::exchange(choices_[depth].sum, nullptr);
  return 0;
}

}  // namespace

spki_status spki_threshold_search(spki_engine* engine, const spki_threshold* threshold,
                                  const spki_tuple* arriving, spki_tuple** made) {
  Search search(engine, threshold, arriving);
  VESK2_TRY(search.Prepare());
  VESK2_TRY(search.Run(made));
  if (*made == nullptr) return 0;
  (*made)->member = threshold->member;
  (*made)->threshold = threshold->enclosing;
  (*made)->issuer = threshold->issuer;
  // Which members it came by makes no difference.
  spki_elem_assign(engine, &(*made)->subject_list, nullptr);
  return 0;
}

}  // namespace ZvVesk2::Engine
