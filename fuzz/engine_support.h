// SPDX-License-Identifier: Apache-2.0
// An engine that parses canonical texts and answers for the length of one input.
#ifndef VESK2_FUZZ_ENGINE_SUPPORT_H
#define VESK2_FUZZ_ENGINE_SUPPORT_H

#include <deque>
#include <vector>

#include "fuzz/fuzz_support.h"
#include "src/engine/pool.h"
#include "src/engine/reduce.h"
#include "src/engine/tag.h"
#include "src/engine/tuple.h"
#include "src/engine/write.h"

namespace vesk2fuzz {

class EngineRun {
 public:
  EngineRun();
  EngineRun(const EngineRun&) = delete;
  // With `units` left of the work that a reduction may spend, so that inputs which only multiply
  // take no time from the others.
  explicit EngineRun(uint32_t units);
  // Every record must be back on its free list.
  ~EngineRun();

  // The list that a text begins with, null for none; it lives as long as the engine, as does the
  // text's copy. `consumed` receives the bytes that it takes.
  ZvVesk2::Engine::spki_elem* Parse(std::string_view text, int* code = nullptr,
                                    size_t* consumed = nullptr);
  // What a function of the engine handed out, released at the end.
  ZvVesk2::Engine::spki_elem* Keep(ZvVesk2::Engine::spki_elem* list);

  ZvVesk2::Engine::spki_engine* get() { return &state_; }
  // Whether the work was too much; what it answered then means nothing.
  bool Spent() const { return state_.budget.spent != 0; }

 private:
  ZvVesk2::Engine::spki_engine state_;
  std::deque<std::vector<unsigned char>> texts_;
  std::vector<ZvVesk2::Engine::spki_elem*> lists_;
};

std::string WrittenForm(const ZvVesk2::Engine::spki_elem* chain);

}  // namespace vesk2fuzz

#endif  // VESK2_FUZZ_ENGINE_SUPPORT_H
