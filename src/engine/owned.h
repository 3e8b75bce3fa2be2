// SPDX-License-Identifier: Apache-2.0
// References to engine records that are held for a scope, so that no error path releases by hand.
// `release()` hands the reference on: to a slot that was empty, or to the caller. A slot that holds
// something takes its reference by spki_*_assign instead, and the owner releases its own.
#ifndef VESK2_SRC_ENGINE_OWNED_H
#define VESK2_SRC_ENGINE_OWNED_H

#include "src/engine/model.h"

#include <memory>

namespace ZvVesk2::Engine {

struct spki_releaser {
  spki_engine* engine;
  void operator()(spki_elem* elem) const { spki_elem_release(engine, elem); }
  void operator()(spki_atom* atom) const { spki_atom_release(engine, atom); }
};

using spki_elem_owner = std::unique_ptr<spki_elem, spki_releaser>;
using spki_atom_owner = std::unique_ptr<spki_atom, spki_releaser>;

// Each adopts the one reference that the record was returned with.
inline spki_elem_owner Own(spki_engine* engine, spki_elem* elem) { return {elem, {engine}}; }
inline spki_atom_owner Own(spki_engine* engine, spki_atom* atom) { return {atom, {engine}}; }

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_OWNED_H
