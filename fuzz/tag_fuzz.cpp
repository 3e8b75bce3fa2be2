// SPDX-License-Identifier: Apache-2.0
// The laws of the tag algebra, for tags and requests that are made of the input:
//   - a request lies within a tag if and only if the tag allows it;
//   - a tag that lies within another allows no more, disjoint ones allow nothing together;
//   - what an intersection allows, both allow; and, where no set or mix of orderings makes it
//     stricter, what both allow, it allows.
#include "fuzz/engine_support.h"
#include "fuzz/tag_model.h"

using namespace ZvVesk2::Engine;
using namespace vesk2fuzz;

namespace {

class Laws {
 public:
  explicit Laws(Choices& choices) : choices_(choices) {
    for (int i = 0; i < 3; ++i) {
      tags_[i] = MakeWholeTag(choices, 3);
      lists_[i] = engine_.Parse(Canonical(tags_[i]));
      FUZZ_CHECK(lists_[i] != nullptr);
    }
  }
  void Check();

 private:
  spki_elem* Both(spki_elem* a, spki_elem* b) {
    spki_elem* kept = nullptr;
    spki_elem_assign(engine_.get(), &kept, spki_intersect_chain(engine_.get(), a, b));
    return engine_.Keep(kept);
  }
  bool Within(spki_elem* a, spki_elem* b) {
    const spki_relation relation = spki_cmp_chain(engine_.get(), a, b);
    return relation == SPKI_REL_EQUAL || relation == SPKI_REL_NARROWER;
  }
  void CheckRequest(const TagTree& request);
  std::string About(const TagTree& request) const {
    std::string text = "asked " + Canonical(request);
    for (const TagTree& tag : tags_) text += "\n" + Canonical(tag);
    return text;
  }

  Choices& choices_;
  EngineRun engine_;
  TagTree tags_[3];
  spki_elem* lists_[3];
  spki_relation relation_ = SPKI_REL_DISJOINT;
  bool subset_ = false;
  spki_elem* both_ = nullptr;
  spki_elem* all_ = nullptr;
  bool exact_[2] = {};
};

void Laws::CheckRequest(const TagTree& request) {
  spki_elem* const asked = engine_.Parse(Canonical(request));
  bool allowed[3];
  for (int i = 0; i < 3; ++i) {
    allowed[i] = Allows(tags_[i], request);
    FUZZ_CHECK_ABOUT(Within(asked, lists_[i]) == allowed[i], About(request));
  }
  const bool by_both = both_ != nullptr && Within(asked, both_);
  const bool by_all = all_ != nullptr && Within(asked, all_);
  const bool each = allowed[0] && allowed[1];
  FUZZ_CHECK_ABOUT(by_both ? each : !(exact_[0] && each), About(request));
  FUZZ_CHECK_ABOUT(by_all ? each && allowed[2] : !(exact_[1] && each && allowed[2]),
                   About(request));
  if (relation_ == SPKI_REL_EQUAL) FUZZ_CHECK_ABOUT(allowed[0] == allowed[1], About(request));
  if (relation_ == SPKI_REL_NARROWER || subset_)
    FUZZ_CHECK_ABOUT(!allowed[0] || allowed[1], About(request));
  if (relation_ == SPKI_REL_WIDER) FUZZ_CHECK_ABOUT(!allowed[1] || allowed[0], About(request));
  if (relation_ == SPKI_REL_DISJOINT && exact_[0]) FUZZ_CHECK_ABOUT(!each, About(request));
}

void Laws::Check() {
  relation_ = spki_cmp_chain(engine_.get(), lists_[0], lists_[1]);
  both_ = Both(lists_[0], lists_[1]);
  all_ = both_ == nullptr ? nullptr : Both(both_, lists_[2]);
  subset_ = both_ != nullptr && spki_cmp_chain(engine_.get(), both_, lists_[0]) == SPKI_REL_EQUAL;
  exact_[0] = IsExact(std::span(tags_).first(2));
  exact_[1] = IsExact(tags_);
  for (int i = 0; i < 4; ++i) CheckRequest(MakeRequest(choices_, tags_[i % 3]));
  FUZZ_CHECK(!engine_.Spent());
}

}  // namespace

FUZZ_TARGET(tag) {
  Choices choices(input);
  Laws(choices).Check();
}
