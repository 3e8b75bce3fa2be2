// SPDX-License-Identifier: Apache-2.0
// The only door between the object model and the reduction engine. What goes in is an object's
// canonical bytes, without display hints; what comes out are canonical bytes again. So two keys
// that differ in hints are one principal, and neither side holds a pointer into the other.
#ifndef VESK2_SRC_ENGINE_INTERFACE_INTERFACE_H
#define VESK2_SRC_ENGINE_INTERFACE_INTERFACE_H

#include <memory>

#include <vesk2/expression.h>

#include "src/engine/model.h"

namespace ZvVesk2::Engine {

// Starts an engine on the library's own allocator, with the context's crypto handle (0 without a
// context).
[[nodiscard]] spki_status spki_call_start(spki_engine* engine, const Vesk2ContextStruct* ctx);
// Stops it.
void spki_call_stop(spki_engine* engine);
// Exports an object and parses it. The list in the slot owns the exported bytes: end it with
// spki_list_dispose. Codes of SExpression::Export and of the engine.
[[nodiscard]] int spki_import_sexpr(spki_engine* engine, SExpression* expression, spki_elem** slot);

// The bytes of a chain's canonical form; more than Limits::kMaxResult for one that is too long,
// which is not measured to its end.
uint64_t spki_canonical_length(const spki_elem* chain);
// Writes the canonical form, of that length, and moves the cursor behind it.
void spki_write_chain(const spki_elem* chain, unsigned char** cursor);

// An engine for one call. Its end disposes of the imported lists and stops the engine. Nothing that
// the engine made may be used behind it: results are written to bytes before.
class EngineCall {
 public:
  EngineCall() = default;
  EngineCall(const EngineCall&) = delete;
  EngineCall& operator=(const EngineCall&) = delete;
  ~EngineCall();

  // Before all else, once. Codes of spki_engine_start; after a failure the call is only to end.
  [[nodiscard]] int Start(const Vesk2ContextStruct* ctx);
  // Imports an object; a null one is the null list. At most kLists of them.
  [[nodiscard]] int Import(SExpression* expression, spki_elem** list);
  spki_engine* Engine() { return &engine_; }

 private:
  static constexpr size_t kLists = 5;
  spki_engine engine_ = {};
  spki_elem* lists_[kLists] = {};
  size_t count_ = 0;
  bool started_ = false;
};

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_INTERFACE_INTERFACE_H
