// SPDX-License-Identifier: Apache-2.0
// Start and end of an engine call, and the way of objects into the engine. Each call has an engine
// of its own in its frame: calls in different threads share nothing, and nothing survives one.
#include <new>

#include <vesk2/verify.h>

#include "src/engine/interface/interface.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

void* Allocate(size_t size, void* /*user*/) { return TryNewArray<unsigned char>(size); }
void Release(void* memory, void* /*user*/) { delete[] static_cast<unsigned char*>(memory); }
constexpr spki_allocator kAllocator = {Allocate, Release, nullptr};

}  // namespace

spki_status spki_call_start(spki_engine* engine, const Vesk2ContextStruct* ctx) {
  VESK2_TRY(spki_engine_start(engine, &kAllocator));
  engine->hash_provider = ctx != nullptr ? ctx->cryptoHandle : 0;
  return 0;
}

void spki_call_stop(spki_engine* engine) { spki_engine_stop(engine, &kAllocator); }

int spki_import_sexpr(spki_engine* engine, SExpression* expression, spki_elem** slot) {
  unsigned char* bytes = nullptr;
  unsigned int length = 0;
  VESK2_TRY(expression->Export(bytes, length));
  std::unique_ptr<unsigned char[]> buffer(bytes);
  spki_input input = {bytes, bytes, bytes + length};
  VESK2_TRY(spki_parse_list(engine, slot, &input));
  // The list knows its bytes by its head's text and frees them in the end.
  (void)buffer.release();
  return 0;
}

int EngineCall::Start(const Vesk2ContextStruct* ctx) {
  VESK2_TRY(spki_call_start(&engine_, ctx));
  started_ = true;
  return 0;
}

int EngineCall::Import(SExpression* expression, spki_elem** list) {
  *list = nullptr;
  if (expression == nullptr) return 0;
  VESK2_REQUIRE(count_ < kLists, VESK2_ERR_INVALID_PARAM);
  VESK2_TRY(spki_import_sexpr(&engine_, expression, &lists_[count_]));
  *list = lists_[count_++];
  return 0;
}

namespace {

// Of this thread, in all its calls. In the block that every thread has from its start: storage that
// is made on demand cannot be refused, so without memory the process would end.
__attribute__((tls_model("initial-exec"))) thread_local uint64_t workDone = 0;

// Trying to combine two tuples takes about as long as this many steps.
constexpr uint64_t kStepsPerCombination = 16;

}  // namespace

// The lists go first: they own export buffers, which are no part of the engine's pool. Work counts
// whatever the call answered.
EngineCall::~EngineCall() {
  workDone += engine_.budget.comparisons + kStepsPerCombination * engine_.budget.combinations;
  for (spki_elem* list : lists_) spki_list_dispose(&engine_, list);
  if (started_) spki_call_stop(&engine_);
}

}  // namespace ZvVesk2::Engine

uint64_t ZvVesk2::Verify::WorkDone() { return Engine::workDone; }
