// SPDX-License-Identifier: Apache-2.0
#include "fuzz/engine_support.h"

using namespace ZvVesk2::Engine;

namespace vesk2fuzz {
namespace {

void* Allocate(size_t size, void* /*user*/) { return std::malloc(size); }
void Release(void* memory, void* /*user*/) { std::free(memory); }
constexpr spki_allocator kAllocator = {Allocate, Release, nullptr};

}  // namespace

EngineRun::EngineRun() { FUZZ_CHECK(spki_engine_start(&state_, &kAllocator) == 0); }

EngineRun::EngineRun(uint32_t units) : EngineRun() {
  state_.budget.comparisons = ZvVesk2::Limits::kMaxComparisons - units;
}

EngineRun::~EngineRun() {
  for (spki_elem* list : lists_) spki_elem_release(&state_, list);
  size_t free_records = 0;
  for (auto* a = state_.free_atoms; a != nullptr; a = a->link) ++free_records;
  for (auto* e = state_.free_elems; e != nullptr; e = e->link) ++free_records;
  for (auto* t = state_.free_tuples; t != nullptr; t = t->link) {
    free_records += spki_block_cost(sizeof(*t));
  }
  FUZZ_CHECK(free_records == state_.budget.live_records);
  spki_engine_stop(&state_, &kAllocator);
}

spki_elem* EngineRun::Parse(std::string_view text, int* code, size_t* consumed) {
  const auto& kept = texts_.emplace_back(text.begin(), text.end());
  spki_input input = {kept.data(), kept.data(), kept.data() + kept.size()};
  spki_elem* list = nullptr;
  const spki_status status = spki_parse_list(&state_, &list, &input);
  FUZZ_CHECK((status == 0) == (list != nullptr) && input.position <= input.end);
  if (code != nullptr) *code = status;
  if (consumed != nullptr) *consumed = static_cast<size_t>(input.position - input.start);
  return Keep(list);
}

spki_elem* EngineRun::Keep(spki_elem* list) {
  if (list != nullptr) lists_.push_back(list);
  return list;
}

std::string WrittenForm(const spki_elem* chain) {
  struct StringSink final : spki_sink {
    std::string text;
    spki_status Put(const void* data, size_t length) override {
      text.append(static_cast<const char*>(data), length);
      return 0;
    }
  } sink;
  FUZZ_CHECK(spki_write_pieces(chain, &sink) == 0);
  return sink.text;
}

}  // namespace vesk2fuzz
