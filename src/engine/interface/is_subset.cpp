// SPDX-License-Identifier: Apache-2.0
// Whether one tag lies within another: whether intersecting the two leaves the first unchanged.
// Every failure reads as "no": the question is asked in order to grant. Equal objects need no
// engine, and are the one way for a set to lie within a set.
#include <vesk2/expression.h>

#include "src/engine/interface/interface.h"
#include "src/engine/tag.h"

namespace ZvVesk2 {
namespace {

// Holds the intersection as long as it is compared; the call's engine frees it.
bool Within(Engine::spki_engine* engine, Engine::spki_elem* tag, Engine::spki_elem* other) {
  Engine::spki_elem* common = nullptr;
  Engine::spki_elem_assign(engine, &common, Engine::spki_intersect_chain(engine, tag, other));
  const bool unchanged =
      common != nullptr && Engine::spki_cmp_chain(engine, common, tag) == Engine::SPKI_REL_EQUAL;
  Engine::spki_elem_release(engine, common);
  // Work that was broken off has shown nothing.
  return unchanged && engine->budget.spent == 0;
}

}  // namespace

bool SExpression::IsSubset(SExpression* other) {
  if (other == nullptr) return false;
  if (IsEqual(other)) return true;
  Engine::EngineCall call;
  Engine::spki_elem* tag = nullptr;
  Engine::spki_elem* wide = nullptr;
  if (call.Start(GetContext()) != 0) return false;
  // A list that cannot be read must not count as the empty one, within which everything lies.
  if (call.Import(this, &tag) != 0 || call.Import(other, &wide) != 0) return false;
  return Within(call.Engine(), tag, wide);
}

}  // namespace ZvVesk2
