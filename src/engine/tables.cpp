// SPDX-License-Identifier: Apache-2.0
// Lists of tuples and tables by digest.
#include "src/engine/tables.h"

#include <bit>
#include <cstring>

#include "src/engine/budget.h"
#include "src/engine/tuple.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

// Bit 0 stands in front of every digest: the first node of a table has one branch only.
unsigned Bit(const Digest& digest, unsigned number) {
  if (number == 0) return 0;
  return digest[(number - 1) / 8] >> (7 - (number - 1) % 8) & 1;
}

// The number of the first bit in which two different digests differ.
unsigned FirstDifference(const Digest& a, const Digest& b) {
  size_t i = 0;
  while (a[i] == b[i]) ++i;
  const auto difference = static_cast<unsigned char>(a[i] ^ b[i]);
  return static_cast<unsigned>(8 * i) + static_cast<unsigned>(std::countl_zero(difference)) + 1;
}

// Goes down to where `digest` is, or would be below `bit`: *end is the node that the way leads to,
// and the result the one that it leads from. A branch to a node with no greater bit leads back up,
// and ends the way. Null when the budget is spent.
spki_node* Descend(spki_engine* engine, spki_node* from, const Digest& digest, unsigned bit,
                   spki_node** end) {
  spki_node* node = from;
  *end = node->below[Bit(digest, node->bit)];
  while ((*end)->bit > node->bit && (*end)->bit < bit) {
    if (spki_charge_step(engine) != 0) return nullptr;
    node = *end;
    *end = node->below[Bit(digest, node->bit)];
  }
  return node;
}

// Greater than any bit: only a branch that leads up ends the way.
constexpr unsigned kToTheEnd = 8 * kSpkiDigestSize + 1;

spki_node* NewNode(spki_engine* engine, spki_table* table, const Digest& digest) {
  auto* node = static_cast<spki_node*>(spki_allocate(engine, sizeof(spki_node)));
  if (node == nullptr) return nullptr;
  *node = {};
  std::memcpy(node->digest, digest, sizeof node->digest);
  node->older = table->newest;
  table->newest = node;
  return node;
}

// Hangs a new node into the way of its digest, where its bit has its place among the growing ones.
// `nearest` is what the search for the digest ended at: no other shares more of its first bits, so
// the first in which the two differ is the node's. One of its branches is itself, the other what
// stood there. Nothing else in the table moves.
[[nodiscard]] spki_status Hang(spki_engine* engine, spki_table* table, spki_node* node,
                               const spki_node* nearest) {
  node->bit = FirstDifference(node->digest, nearest->digest);
  spki_node* end = nullptr;
  spki_node* above = Descend(engine, table->first, node->digest, node->bit, &end);
  VESK2_REQUIRE(above != nullptr, engine->budget.spent);
  const unsigned side = Bit(node->digest, node->bit);
  node->below[side] = node;
  node->below[1 - side] = end;
  above->below[Bit(node->digest, above->bit)] = node;
  return 0;
}

}  // namespace

spki_entry* spki_entry_push(spki_engine* engine, spki_entry** list) {
  auto* entry = static_cast<spki_entry*>(spki_allocate(engine, sizeof(spki_entry)));
  if (entry == nullptr) return nullptr;
  *entry = {*list, nullptr};
  *list = entry;
  return entry;
}

void spki_entries_clear(spki_engine* engine, spki_entry** list) {
  while (spki_entry* entry = *list) {
    *list = entry->next;
    spki_tuple_release(engine, entry->tuple);
    spki_free(engine, entry);
  }
}

spki_status spki_table_find(spki_engine* engine, const spki_table& table, const Digest& digest,
                            spki_node** slot) {
  *slot = nullptr;
  if (table.first == nullptr) return 0;
  spki_node* end = nullptr;
  VESK2_REQUIRE(Descend(engine, table.first, digest, kToTheEnd, &end) != nullptr,
                engine->budget.spent);
  if (std::memcmp(end->digest, digest, sizeof end->digest) == 0) *slot = end;
  return 0;
}

spki_status spki_table_enter(spki_engine* engine, spki_table* table, const Digest& digest,
                             spki_node** slot, bool* made) {
  *slot = nullptr;
  *made = false;
  spki_node* nearest = nullptr;
  if (table->first != nullptr) {
    VESK2_REQUIRE(Descend(engine, table->first, digest, kToTheEnd, &nearest) != nullptr,
                  engine->budget.spent);
    if (std::memcmp(nearest->digest, digest, sizeof nearest->digest) == 0) {
      *slot = nearest;
      return 0;
    }
  }
  spki_node* node = NewNode(engine, table, digest);
  VESK2_REQUIRE(node != nullptr, SPKI_ERR_NO_MEM);
  if (nearest == nullptr) {
    node->below[0] = node;
    table->first = node;
  } else {
    VESK2_TRY(Hang(engine, table, node, nearest));
  }
  *slot = node;
  *made = true;
  return 0;
}

void spki_table_clear(spki_engine* engine, spki_table* table) {
  while (spki_node* node = table->newest) {
    table->newest = node->older;
    spki_entries_clear(engine, &node->tuples);
    spki_free(engine, node);
  }
  table->first = nullptr;
}

}  // namespace ZvVesk2::Engine
