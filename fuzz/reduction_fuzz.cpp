// SPDX-License-Identifier: Apache-2.0
// The reduction, of a world that is made of the input, beside a plain fixpoint:
//   - one request at one moment is granted if and only if the fixpoint says so;
//   - a reduction for a wider tag and a period grants no request that the fixpoint refuses; and all
//     that it grants, where neither sets nor thresholds nor names of some time make it stricter.
#include "fuzz/engine_support.h"
#include "fuzz/oracle/grant_model.h"

#include <algorithm>

using namespace ZvVesk2::Engine;
using namespace vesk2fuzz;

namespace {

// A few worlds in a hundred need more; a reduction with all that it may spend takes as long as
// thousands of others.
constexpr uint32_t kUnits = 10'000;

std::string DateList(const char* head, int date) { return head + ("19:" + DateText(date)) + ")"; }

class Reduction {
 public:
  explicit Reduction(const World& world) : world_(world), engine_(kUnits) {}
  // The list of what is granted; null when the work was too much. Empty texts are left out.
  spki_elem* Run(const std::string& tag, const std::string& period);
  // Whether one of the entries covers a request at a moment.
  bool Covers(const spki_elem* granted, const TagTree& request, int date);
  std::string About() const { return AclText(world_) + "\n" + SequenceText(world_); }

 private:
  const World& world_;
  EngineRun engine_;
};

spki_elem* Reduction::Run(const std::string& tag, const std::string& period) {
  const std::string texts[] = {AclText(world_), SequenceText(world_), KeyText(world_.requester, 0),
                               tag, period};
  spki_elem* lists[5] = {};
  for (int i = 0; i < 5; ++i) {
    if (!texts[i].empty()) lists[i] = engine_.Parse(texts[i]);
    FUZZ_CHECK(texts[i].empty() || lists[i] != nullptr);
  }
  spki_elem* result = nullptr;
  const spki_status status =
      spki_reduce(engine_.get(), lists[0], lists[1], lists[2], lists[3], lists[4], &result);
  // What is asked about the answer is not paid from what the reduction left, or it would be denied.
  engine_.get()->budget.comparisons = 0;
  FUZZ_CHECK((status == 0) == (result != nullptr));
  const bool too_much = status == SPKI_ERR_NO_MEM || status == SPKI_ERR_THRESHOLD;
  FUZZ_CHECK_ABOUT(status == 0 || too_much, About());
  return engine_.Keep(result);
}

const spki_elem* Field(const spki_elem* list, std::string_view head) {
  for (; list != nullptr; list = list->next) {
    if (list->kind != SPKI_ELEM_LIST) continue;
    const std::string text = WrittenForm(list->value.list);
    if (text.starts_with(head)) return list->value.list;
  }
  return nullptr;
}

bool Reduction::Covers(const spki_elem* granted, const TagTree& request, int date) {
  spki_elem* const asked = engine_.Parse(Canonical(request));
  for (const spki_elem* item = granted->next; item != nullptr; item = item->next) {
    const spki_elem* const entry = item->value.list;
    const std::string text = WrittenForm(entry);
    FUZZ_CHECK(text.find("(7:subject" + KeyText(world_.requester, 0)) != text.npos);
    const spki_relation relation = spki_cmp_chain(engine_.get(), asked, Field(entry, "(3:tag"));
    if (relation != SPKI_REL_EQUAL && relation != SPKI_REL_NARROWER) continue;
    const spki_elem* const valid = Field(entry, "(5:valid");
    const spki_elem* const from = Field(valid, "(10:not-before");
    const spki_elem* const until = Field(valid, "(9:not-after");
    const std::string from_text = from == nullptr ? "" : WrittenForm(from);
    const std::string until_text = until == nullptr ? "" : WrittenForm(until);
    const bool begun = from == nullptr || from_text <= DateList("(10:not-before", date);
    const bool lasts = until == nullptr || until_text >= DateList("(9:not-after", date);
    if (begun && lasts) return true;
  }
  return false;
}

bool HasThreshold(const Grantee& grantee) { return grantee.k > 0; }

// Whether a wide reduction must find all that the fixpoint finds.
bool IsComplete(const World& world, const TagTree* tag) {
  std::vector<TagTree> tags = world.tags;
  if (tag != nullptr) tags.push_back(*tag);
  if (!IsExact(tags)) return false;
  return std::ranges::all_of(world.credentials, [&](const Credential& credential) {
    const bool defines = credential.issuer_name >= 0;
    const bool dated = credential.from >= 0 || credential.until >= 0;
    return !HasThreshold(credential.subject) && !(defines && dated) &&
           (defines || credential.tag >= 0 || tag != nullptr);
  });
}

void CheckGround(const World& world, const TagTree& request, int date) {
  Reduction reduction(world);
  const spki_elem* granted = reduction.Run(Canonical(request), DateList("(5:valid", date));
  if (granted == nullptr) return;
  FUZZ_CHECK_ABOUT((granted->next != nullptr) == IsGranted(world, request, date),
                   reduction.About() + "\n" + Canonical(request) + DateText(date));
}

void CheckWide(const World& world, Choices& choices) {
  TagTree tag;
  const bool asks = choices.Chance(2);
  if (asks) tag = MakeWholeTag(choices, 2);
  const bool from = choices.Chance(2);
  const int first = static_cast<int>(choices.Below(kDates));
  const std::string period = from ? "(5:valid" + DateList("(10:not-before", first) + ")" : "";
  Reduction reduction(world);
  const spki_elem* granted = reduction.Run(asks ? Canonical(tag) : "", period);
  if (granted == nullptr) return;
  for (int i = 0; i < 2; ++i) {
    const auto index = choices.Below(static_cast<unsigned>(world.tags.size()));
    const TagTree request = MakeRequest(choices, world.tags[index]);
    const int date = static_cast<int>(choices.Below(kDates));
    const bool covered = reduction.Covers(granted, request, date);
    const bool asked = (!asks || Allows(tag, request)) && !(from && date < first);
    const bool granted_now = asked && IsGranted(world, request, date);
    FUZZ_CHECK_ABOUT(
        covered ? granted_now : !granted_now || !IsComplete(world, asks ? &tag : nullptr),
        reduction.About() + "\n" + Canonical(request) + DateText(date));
  }
}

}  // namespace

FUZZ_TARGET(reduction) {
  Choices choices(input);
  const World world = MakeWorld(choices);
  const auto index = choices.Below(static_cast<unsigned>(world.tags.size()));
  const TagTree request = Lengthened(MakeRequest(choices, world.tags[index]));
  CheckGround(world, request, static_cast<int>(choices.Below(kDates)));
  CheckWide(world, choices);
}
