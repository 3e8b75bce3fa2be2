// SPDX-License-Identifier: Apache-2.0
// Where tuples and principals are found again: lists of tuples, and tables by digest.
#ifndef VESK2_SRC_ENGINE_TABLES_H
#define VESK2_SRC_ENGINE_TABLES_H

#include "src/engine/digest.h"
#include "src/engine/model.h"

namespace ZvVesk2::Engine {

using Digest = unsigned char[kSpkiDigestSize];

// One link of a list of tuples. Lists grow at the front, so that whoever walks one may go on while
// others add to it; nothing leaves a list before the reduction ends.
struct spki_entry {
  spki_entry* next;
  spki_tuple* tuple;  // counted
};

// A new entry at the front of a list; null without memory.
spki_entry* spki_entry_push(spki_engine* engine, spki_entry** list);
// Releases a list and the tuples in it.
void spki_entries_clear(spki_engine* engine, spki_entry** list);

// One digest of a table, and what is known by it. A table is a tree over the bits of its digests:
// `bit` is the first in which two below it differ, counted from 1, and grows on the way down; a
// branch that leads back up ends at the only digest that may be the one looked for. Strangers
// choose digests, and no choice of theirs makes a way longer than 256 nodes.
//
// With the digests 00.., 01.. and 1.. (in bits), entered in this order:
//
//   00.. (bit 0) -> 1.. (bit 1): 0 -> 01.. (bit 2): 0 -> back to 00..
//                                                   1 -> itself
//                                1 -> itself
//
// A way down tests single bits and compares one whole digest at its end.
struct spki_node {
  spki_node* below[2];
  spki_node* older;  // the node made before this one
  unsigned bit;
  Digest digest;
  spki_principal* principal;
  spki_entry* tuples;  // newest first
};

// *slot is the node of a digest, borrowed from the table; null when there is none, and when the
// budget is spent, which is the code then.
[[nodiscard]] spki_status spki_table_find(spki_engine* engine, const spki_table& table,
                                          const Digest& digest, spki_node** slot);
// The same, made when there is none; `*made` tells. A new node knows nothing but its digest.
[[nodiscard]] spki_status spki_table_enter(spki_engine* engine, spki_table* table,
                                           const Digest& digest, spki_node** slot, bool* made);
// Releases the nodes and the lists of tuples in them.
void spki_table_clear(spki_engine* engine, spki_table* table);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_TABLES_H
