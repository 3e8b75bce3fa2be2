// SPDX-License-Identifier: Apache-2.0
// The canonical form of a chain, given out in pieces. Principals are identified by its digest and
// results leave the engine in it, so there is one writer for both.
#ifndef VESK2_SRC_ENGINE_WRITE_H
#define VESK2_SRC_ENGINE_WRITE_H

#include "src/engine/digest.h"
#include "src/engine/model.h"

namespace ZvVesk2::Engine {

// Takes one piece, which is borrowed for the call; empty pieces are never given. The first failure
// ends the walk: a sink that has had enough answers with one.
struct spki_sink {
  [[nodiscard]] virtual spki_status Put(const void* data, size_t length) = 0;

 protected:
  ~spki_sink() = default;
};

// Feeds the pieces to a digest.
struct spki_digest_sink final : spki_sink {
  spki_digest digest;

  [[nodiscard]] spki_status Put(const void* data, size_t length) override {
    return spki_digest_update(&digest, data, length);
  }
};

// The list that `chain` is the head of, parentheses included. Code of the sink. What is written is
// not bounded here: shared parts come as often as they stand.
[[nodiscard]] spki_status spki_write_pieces(const spki_elem* chain, spki_sink* sink);
// One byte string with its display hint, as it stands in a list.
[[nodiscard]] spki_status spki_write_atom(const spki_atom* atom, spki_sink* sink);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_WRITE_H
