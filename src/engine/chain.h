// SPDX-License-Identifier: Apache-2.0
// Reading chains: what stands at an element, null or -1 when it is something else. Null is allowed
// everywhere, so that a reader asks for a field of a field without a test between.
#ifndef VESK2_SRC_ENGINE_CHAIN_H
#define VESK2_SRC_ENGINE_CHAIN_H

#include "src/engine/model.h"

namespace ZvVesk2::Engine {

// The keyword that heads a list; -1 when none does.
inline int32_t HeadKeyword(const spki_elem* list) {
  return list != nullptr && list->kind == SPKI_ELEM_KEYWORD ? list->value.keyword : -1;
}
inline spki_elem* ListOf(const spki_elem* elem) {
  return elem != nullptr && elem->kind == SPKI_ELEM_LIST ? elem->value.list : nullptr;
}
inline spki_atom* StringOf(const spki_elem* elem) {
  return elem != nullptr && elem->kind == SPKI_ELEM_STRING ? elem->value.atom : nullptr;
}

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_CHAIN_H
