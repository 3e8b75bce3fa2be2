// SPDX-License-Identifier: Apache-2.0
// The pool: blocks of the caller's allocator on a ring, and the state's start and stop.
//
//   anchor <-> newest <-> ... <-> oldest <-> anchor        (spki_pool::ring is the anchor)
//
// Every block has a header in front of it with its links and its cost, so destroying the pool needs
// to know nothing about what the blocks hold.
#include "src/engine/pool.h"

#include <cstring>
#include <new>

namespace ZvVesk2::Engine {
namespace {

// What a block costs of the budget of live records: as many as there is room for in its bytes, so
// that the budget bounds bytes.
constexpr size_t kRecordBytes = 64;
// Records of one block of a slab.
constexpr uint32_t kSlabRecords = 64;

// In front of each block's memory. The cost is kept for spki_free.
struct Header {
  spki_block link;
  size_t cost;
};

// Zero-filled, so that a record that was not finished can be released like any other.
void* Allocate(size_t size, void* pool) {
  auto* self = static_cast<spki_pool*>(pool);
  if (size > SIZE_MAX - sizeof(Header)) return nullptr;
  const spki_allocator* allocator = self->allocator;
  void* memory = allocator->allocate(sizeof(Header) + size, allocator->user);
  if (memory == nullptr) return nullptr;
  std::memset(memory, 0, sizeof(Header) + size);
  auto* header = new (memory) Header{{self->ring.next, &self->ring}, spki_block_cost(size)};
  self->ring.next->previous = &header->link;
  self->ring.next = &header->link;
  return header + 1;
}

void Free(void* memory, void* pool) {
  Header* header = static_cast<Header*>(memory) - 1;
  header->link.previous->next = header->link.next;
  header->link.next->previous = header->link.previous;
  const spki_allocator* allocator = static_cast<spki_pool*>(pool)->allocator;
  allocator->release(header, allocator->user);
}

[[nodiscard]] spki_status Create(void* record, const spki_allocator* allocator, void** pool) {
  // Callers' allocators are their own; a record that a pool cannot live in is refused.
  if (reinterpret_cast<uintptr_t>(record) % alignof(spki_pool) != 0) return SPKI_ERR_NO_MEM;
  auto* self = new (record) spki_pool{{nullptr, nullptr}, allocator};
  self->ring = {&self->ring, &self->ring};
  *pool = self;
  return 0;
}

void Destroy(void* pool) {
  auto* self = static_cast<spki_pool*>(pool);
  while (self->ring.next != &self->ring) {
    Free(reinterpret_cast<Header*>(self->ring.next) + 1, pool);
  }
}

// Whether the slab has a record left, if need be after a new block. The block itself costs nothing:
// each record is paid for when it is cut.
bool Fill(spki_engine* engine, spki_slab* slab, size_t size) {
  if (slab->left > 0) return true;
  slab->next =
      static_cast<unsigned char*>(kSpkiMemoryOps.allocate(kSlabRecords * size, engine->pool));
  if (slab->next != nullptr) slab->left = kSlabRecords;
  return slab->left > 0;
}

// Whoever asked may have to answer without the memory; the failure must not be forgotten, or a
// grant could be reported that was only half worked out.
void* Charged(spki_engine* engine, void* memory, size_t cost) {
  if (memory == nullptr) {
    engine->budget.spent = SPKI_ERR_NO_MEM;
  } else {
    engine->budget.live_records += static_cast<uint32_t>(cost);
  }
  return memory;
}

}  // namespace

const spki_memory_ops kSpkiMemoryOps = {Allocate, Free, Create, Destroy};

size_t spki_block_cost(size_t size) { return 1 + (sizeof(Header) + size) / kRecordBytes; }

spki_status spki_engine_start(spki_engine* engine, const spki_allocator* allocator) {
  if (engine == nullptr || allocator == nullptr) return SPKI_ERR_NULL_PARAM;
  *engine = {};
  void* record = allocator->allocate(kSpkiPoolRecord, allocator->user);
  if (record == nullptr) return kSpkiNoPool;
  const spki_status status = kSpkiMemoryOps.create(record, allocator, &engine->pool);
  if (status != 0) {
    allocator->release(record, allocator->user);
    engine->pool = nullptr;
  }
  return status;
}

void spki_engine_stop(spki_engine* engine, const spki_allocator* allocator) {
  if (engine == nullptr || allocator == nullptr) return;
  if (engine->pool != nullptr) {
    kSpkiMemoryOps.destroy(engine->pool);
    allocator->release(engine->pool, allocator->user);
  }
  *engine = {};
}

void* spki_allocate(spki_engine* engine, size_t size) {
  if (engine->budget.spent != 0) return nullptr;
  const size_t cost = spki_block_cost(size);
  void* memory = nullptr;
  if (cost <= Limits::kMaxRecords - engine->budget.live_records) {
    memory = kSpkiMemoryOps.allocate(size, engine->pool);
  }
  return Charged(engine, memory, cost);
}

void* spki_allocate_record(spki_engine* engine, spki_slab* slab, size_t size) {
  if (engine->budget.spent != 0) return nullptr;
  void* memory = nullptr;
  if (engine->budget.live_records < Limits::kMaxRecords && Fill(engine, slab, size)) {
    memory = slab->next;
    slab->next += size;
    --slab->left;
  }
  return Charged(engine, memory, 1);
}

void spki_free(spki_engine* engine, void* memory) {
  if (memory == nullptr) return;
  engine->budget.live_records -= static_cast<uint32_t>((static_cast<Header*>(memory) - 1)->cost);
  kSpkiMemoryOps.free(memory, engine->pool);
}

}  // namespace ZvVesk2::Engine
