// SPDX-License-Identifier: Apache-2.0
// Explanation: the question, what it may cost, and what was found. Reasons: explanation_losses.cpp;
// the way of a yes: explanation_path.cpp. An explanation is a service to whoever was refused, and
// asks many questions about what a stranger wrote. So all of it is counted, the reduction's work
// and the bytes that are exported and told, and when that is spent what was found so far is the
// answer. It never touches the verdict: it judges copies.
#include <vesk2/explanation.h>

#include <algorithm>
#include <iterator>

#include <vesk2/limits.h>
#include <vesk2/verify.h>

#include "src/platform/text.h"
#include "src/trust/explanation_state.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {
namespace {

constexpr const char* kWords[] = {
    "signature", "order", "content",   "revoked",  "key-revoked", "undetermined", "period",
    "tag",       "link",  "propagate", "no-entry", "threshold",   "combination",  "unreadable",
};
static_assert(std::size(kWords) == Explanation::CannotBeRead + 1);

// What an explanation may cost when the answer took next to nothing, and else the multiple of what
// that cost. Work is counted as Verify::WorkDone does. A fraction of a second, for chains that are
// answered in microseconds.
constexpr uint64_t kLeastWork = 20'000'000;
constexpr uint64_t kLeastBytes = uint64_t{48} << 20;
constexpr uint64_t kMultiple = 2;

// For an index that is none: a caller's mistake must not become a read past the array.
const Explanation::Reason kNoReason = {
    Explanation::SignatureFails, 0, Explanation::kNone, Explanation::kNone, nullptr, nullptr, ""};

}  // namespace

const char* Explanation::Word(Kind kind) {
  const auto place = static_cast<size_t>(kind);
  return place < std::size(kWords) ? kWords[place] : nullptr;
}

Explanation::Explanation(Vesk2ContextStruct* ctx) : context(ctx) {}
Explanation::~Explanation() = default;

int Explanation::SetNames(const char* newFile, const char* newDirectory) {
  file.reset(ZVsysutil::zv_strdup(newFile));
  extraDirectory.reset(ZVsysutil::zv_strdup(newDirectory));
  VESK2_REQUIRE((file || newFile == nullptr) && (extraDirectory || newDirectory == nullptr),
                VESK2_ERR_MEM_ALLOC);
  return 0;
}

// What was explained before goes first, and the new state is published last: a failure leaves
// nothing that could pass for the reasons of this answer.
int Explanation::Explain(const Evidence& evidence, int code, SExpression* tag,
                         SExpression* members) {
  state.reset();
  VESK2_REQUIRE(tag != nullptr, VESK2_ERR_PARAM_NULL);
  std::unique_ptr<ExplanationState> fresh(TryNew<ExplanationState>(context));
  VESK2_REQUIRE(fresh, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(fresh->evidence.Copy(evidence));
  // Indexed once, since each entry of the store is compared with each key of the chain otherwise.
  VESK2_TRY(fresh->principals.Load(fresh->evidence));
  VESK2_TRY(fresh->evidence.RelevantEntries(fresh->relevant.Out()));
  fresh->tag = Ref<SExpression>::Share(tag);
  fresh->members = Ref<SExpression>::Share(members);
  fresh->StartCounting();
  const auto view = [](const char* text) { return text != nullptr ? text : ""; };
  VESK2_TRY(
      code == 0
          ? ExplanationPath(*fresh).Find()
          : ExplanationLosses(*fresh, view(file.get()), view(extraDirectory.get())).Find(code));
  state = std::move(fresh);
  return 0;
}

// ---- What it may cost ----

// A multiple of what the answer cost: who made that expensive has paid for this as well.
void ExplanationState::StartCounting() {
  workLimit = Verify::WorkDone() + std::max(kLeastWork, kMultiple * evidence.GetWork());
  bytesLimit = std::max(kLeastBytes, kMultiple * uint64_t{evidence.Size()});
}

// Asked before the work. The first question past the limit ends it, so that it overshoots by one
// question, which has a budget of its own.
bool ExplanationState::Afford(uint64_t bytes) {
  bytesSpent += bytes;
  if (Verify::WorkDone() > workLimit || bytesSpent > bytesLimit) complete = false;
  return complete;
}

// That there was no memory for one question is the explanation's failure, and no "no".
int ExplanationState::ProveMembers(Evidence& changed) {
  const int code = EachMember([&](SExpression* member) { return changed.Prove(member); });
  constexpr int kNoEngine = 16386;  // it had no memory to begin with
  if (code == SPKI_ERR_NO_MEM || code == kNoEngine) complete = false;
  return LacksMemory(code) ? VESK2_ERR_MEM_ALLOC : code;
}

// ---- Reasons ----

// A text may quote what a stranger wrote at length, so it is paid for like any work.
int ExplanationState::Add(Reason reason, TextWriter& text) {
  ++found;
  if (count == Limits::kMaxReasons) complete = false;
  if (!Afford(text.length())) return 0;
  if (count == capacity) {
    const size_t larger = std::max<size_t>(8, capacity * 2);
    std::unique_ptr<Held[]> moved(TryNewArray<Held>(larger));
    VESK2_REQUIRE(moved, VESK2_ERR_MEM_ALLOC);
    std::move(reasons.get(), reasons.get() + count, moved.get());
    reasons = std::move(moved);
    capacity = larger;
  }
  Held& held = reasons[count];
  held.reason = reason;
  VESK2_TRY(text.Take(held.text));
  held.reason.text = held.text.get();
  ++count;
  return 0;
}

// What was found out not to be one, once a later place was looked at. `found` keeps counting: it
// tells whether anything was said at all.
void ExplanationState::DropReasons(size_t from) {
  while (count > from) reasons[--count] = Held();
}

bool Explanation::IsComplete() const { return state != nullptr && state->complete; }
size_t Explanation::CountReasons() const { return state != nullptr ? state->count : 0; }
const Explanation::Reason& Explanation::GetReason(size_t index) const {
  return index < CountReasons() ? state->reasons[index].reason : kNoReason;
}

// ---- The path ----

AclEntry* Explanation::GetEntry() const { return state != nullptr ? state->entry : nullptr; }
size_t Explanation::CountPath() const { return state != nullptr ? state->pathCount : 0; }
size_t Explanation::GetPathCert(size_t index) const {
  return index < CountPath() ? state->path[index] : kNone;
}
TimeStamp* Explanation::GetEnd() const { return state != nullptr ? state->end : nullptr; }
Explanation::End Explanation::GetEndKind() const {
  return state != nullptr ? state->endKind : NoEnd;
}
// NOLINTNEXTLINE(clang-analyzer-core.NullDereference): the state is there
size_t Explanation::GetEndCert() const { return state != nullptr ? state->endCert : kNone; }

}  // namespace ZvVesk2
