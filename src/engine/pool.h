// SPDX-License-Identifier: Apache-2.0
// Where the engine's memory comes from: one pool for each engine, made in a record that the
// caller's allocator gives. Destroying the pool frees whatever is still allocated from it, so no
// path through the engine can leak.
#ifndef VESK2_SRC_ENGINE_POOL_H
#define VESK2_SRC_ENGINE_POOL_H

#include "src/engine/model.h"

namespace ZvVesk2::Engine {

// Links of a ring of blocks. The pool's record is the ring's anchor: a ring needs no test for its
// ends, and any block can leave it in constant time.
struct spki_block {
  spki_block* next;
  spki_block* previous;
};

struct spki_pool {
  spki_block ring;
  const spki_allocator* allocator;
};
// The size that callers' allocators are asked for.
inline constexpr size_t kSpkiPoolRecord = 24;
static_assert(sizeof(spki_pool) == kSpkiPoolRecord);

// The memory callbacks, fixed at build time. `free` takes what `allocate` of the same pool gave,
// never null. `create` makes a pool in a record of kSpkiPoolRecord bytes; `destroy` frees all the
// blocks and leaves the record to whoever gave it.
struct spki_memory_ops {
  void* (*allocate)(size_t size, void* pool);  // zero-filled, or null
  void (*free)(void* memory, void* pool);
  spki_status (*create)(void* record, const spki_allocator* allocator, void** pool);
  void (*destroy)(void* pool);
};
extern const spki_memory_ops kSpkiMemoryOps;

// What a block of this size costs of the budget of live records: never 0, so that empty blocks have
// a price too.
size_t spki_block_cost(size_t size);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_POOL_H
