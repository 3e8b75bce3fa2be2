// SPDX-License-Identifier: Apache-2.0
// The engine's own expression model: reference-counted nodes parsed from canonical bytes, keywords
// known by number, and the pools that nodes are taken from and returned to.
//
// The engine never sees the object model. What crosses into it are canonical bytes
// (src/engine/interface), and atoms point into those bytes: a buffer outlives every node made
// from it.
//
// Counting: a new record has one reference. Storing a record into a slot (spki_*_assign) takes a
// reference on it and releases what the slot held. A released record goes back to its free list,
// zeroed.
#ifndef VESK2_SRC_ENGINE_MODEL_H
#define VESK2_SRC_ENGINE_MODEL_H

#include <vesk2.h>
#include <vesk2/limits.h>

#include <cstddef>
#include <cstdint>

namespace ZvVesk2::Engine {

using spki_status = int;

// The allocator that a caller hands to spki_engine_start. The pool keeps its address, so it has to
// outlive the engine. `allocate` returns memory that is aligned for any record, or null.
struct spki_allocator {
  void* (*allocate)(size_t size, void* user);
  void (*release)(void* memory, void* user);
  void* user;
};

// One byte string. Its bytes lie in the input, which has no 0 behind them; only what the engine
// made up itself (the end of a prefix) belongs to the atom.
struct spki_atom {
  spki_atom* link;    // next in the free list while released
  uint32_t refcount;  // saturating: a count that reaches the top stays there
  bool owns;          // hint and data belong to the atom
  int32_t keyword;    // keyword id; -1 with a display hint or for any other word
  uint32_t hint_length;
  const unsigned char* hint;
  uint32_t length;
  const unsigned char* data;
};

// The first element of a list is of one of the first two kinds, every later one of the last two. A
// head that is a keyword keeps no atom, and is written back as its keyword's row.
enum spki_elem_kind : int32_t {
  SPKI_ELEM_KEYWORD = 1,  // a head that is a keyword
  SPKI_ELEM_HEAD = 2,     // a head that is not
  SPKI_ELEM_STRING = 3,   // a later byte string
  SPKI_ELEM_LIST = 4,     // a nested list
};

// One element of a list; a list is the chain of its elements and known by its head. Derived tags
// share tails and nested lists with the tags that they come from, so a chain is not changed any
// more once it is stored where others can find it. (3:tag(7:install3:app)) is
//
//   KEYWORD tag -> LIST
//                   |
//                  HEAD "install" -> STRING "app"
struct spki_elem {
  spki_elem* link;
  uint32_t refcount;
  spki_elem_kind kind;
  spki_elem* next;            // counted
  const unsigned char* text;  // on a head: the "(" in the input; null for lists made from templates
  uint32_t text_length;       // on a head: bytes up to just behind the ")"
  unsigned char* digest;      // of the chain from here on, once asked for; its own memory
  union {
    int32_t keyword;  // SPKI_ELEM_KEYWORD
    spki_atom* atom;  // SPKI_ELEM_HEAD, SPKI_ELEM_STRING; counted
    spki_elem* list;  // SPKI_ELEM_LIST; counted
  } value;
};

struct spki_tuple;  // src/engine/tuple.h
struct spki_principal;
struct spki_entry;  // src/engine/tables.h
struct spki_node;

// What is known by a digest; see src/engine/tables.h. Empty when it is zero-filled.
struct spki_table {
  spki_node* first;
  spki_node* newest;
};

// Work done so far by this engine; see src/engine/budget.h. When `spent` is set the operation that
// set it failed, and the reduction ends with `spent`.
struct spki_budget {
  uint32_t tuples;
  uint32_t combinations;
  uint32_t comparisons;  // units
  uint32_t live_records;
  spki_status spent;  // 0, SPKI_ERR_NO_MEM or SPKI_ERR_THRESHOLD
};

// What is left of the block that new records of one kind are cut from.
struct spki_slab {
  unsigned char* next;
  uint32_t left;
};

// The state of one call. Zero-filled before use, held in the caller's frame.
struct spki_engine {
  spki_table principals;        // by their digests
  spki_principal* newest;       // of them all
  bool keys_by_sha1;            // whether keys stand in the table by their SHA-1 too
  spki_table name_definitions;  // by the values of names
  spki_table name_users;
  spki_table filed;        // values of the tuples that are in a list, and of definitions
  spki_entry* acl_tuples;  // issued by the ACL itself, newest first
  spki_atom* free_atoms;
  spki_elem* free_elems;
  spki_slab atom_slab;
  spki_slab elem_slab;
  spki_tuple* free_tuples;
  void* pool;              // made by the memory callbacks at start
  uint32_t hash_provider;  // the context's crypto handle
  spki_budget budget;
};

// ---- Start and stop ----

// What spki_engine_start returns when the allocator yields nothing; the one positive failure.
inline constexpr spki_status kSpkiNoPool = 16386;

// Makes an empty engine with a pool of its own. 0, SPKI_ERR_NULL_PARAM, kSpkiNoPool, or
// SPKI_ERR_NO_MEM; after a failure there is nothing to stop.
[[nodiscard]] spki_status spki_engine_start(spki_engine* engine, const spki_allocator* allocator);
// Gives all of the pool's memory back to the same allocator, whatever still points at it, and
// leaves the engine empty. Export buffers are no part of the pool: spki_list_dispose comes first.
void spki_engine_stop(spki_engine* engine, const spki_allocator* allocator);

// Allocation from the engine's pool, zero-filled, counted against the budget of live records; null
// when there is none or the budget is spent, and then budget.spent is set: whoever goes on without
// the memory cannot have the reduction succeed.
void* spki_allocate(spki_engine* engine, size_t size);
// Gives back what spki_allocate gave, and its part of the budget. Null is allowed.
void spki_free(spki_engine* engine, void* memory);
// The same for a record that stays with the engine until it stops: parsing takes hundreds of them,
// so they are cut from larger blocks. One slab serves records of one size. They go to free lists,
// never to spki_free.
void* spki_allocate_record(spki_engine* engine, spki_slab* slab, size_t size);

// ---- Records ----

// Each has one reference, all else zero; null without memory.
spki_elem* spki_elem_new(spki_engine* engine);
spki_atom* spki_atom_new(spki_engine* engine);
// Takes one reference away; with the last, what the record refers to is released too, an element's
// `next` included. Null is allowed.
void spki_elem_release(spki_engine* engine, spki_elem* elem);
void spki_atom_release(spki_engine* engine, spki_atom* atom);
// Counted store; a null slot releases the record given. The new reference is taken before the old
// one is released, so a slot may be given what hangs from the very record that it holds.
void spki_elem_assign(spki_engine* engine, spki_elem** slot, spki_elem* elem);
void spki_atom_assign(spki_engine* engine, spki_atom** slot, spki_atom* atom);
// Frees the export buffer at the list's `text` (delete[]) and releases the list. For the outermost
// lists that the interface makes only.
void spki_list_dispose(spki_engine* engine, spki_elem* list);

// ---- Keywords ----

// Ids that the engine tests for.
enum spki_keyword : int32_t {
  SPKI_KW_STAR = 1,
  SPKI_KW_ACL = 3,
  SPKI_KW_ALPHA = 4,
  SPKI_KW_BINARY = 7,
  SPKI_KW_CERT = 11,
  SPKI_KW_DATE = 16,
  SPKI_KW_ENTRY = 36,
  SPKI_KW_G = 39,
  SPKI_KW_GE = 40,
  SPKI_KW_HASH = 42,
  SPKI_KW_ISSUER = 48,
  SPKI_KW_K_OF_N = 50,
  SPKI_KW_L = 53,
  SPKI_KW_LE = 54,
  SPKI_KW_NAME = 64,
  SPKI_KW_NOT_AFTER = 67,
  SPKI_KW_NOT_BEFORE = 68,
  SPKI_KW_NUMERIC = 70,
  SPKI_KW_PREFIX = 79,
  SPKI_KW_PROPAGATE = 82,
  SPKI_KW_PUBLIC_KEY = 86,
  SPKI_KW_RANGE = 89,
  SPKI_KW_SEQUENCE = 105,
  SPKI_KW_SET = 106,
  SPKI_KW_SHA1 = 108,
  SPKI_KW_SUBJECT = 117,
  SPKI_KW_TAG = 119,
  SPKI_KW_TIME = 121,
  SPKI_KW_SHA256 = 129,  // recognised, but without a row of its own
  SPKI_KW_VALID = 0x10003,
};

struct spki_keyword_entry {
  uint32_t length;
  char name[24];
};

// The id of a word, -1 for any other. A word that goes on behind a 0 byte is the one before it.
int32_t spki_keyword_id(const unsigned char* data, size_t length);
// Never null: "???" for an id without a row. So a list headed by "sha256" is written back with
// another head; the word is meant to stand behind "hash", where it keeps its own bytes.
const spki_keyword_entry* spki_keyword_row(int32_t id);

// ---- Comparison of byte strings ----
//
// What takes an engine is charged to it (src/engine/budget.h).

// 0 equal, 1 the first is less, 2 the first is greater, 3 a null argument.
enum spki_order : int {
  SPKI_ORDER_EQUAL = 0,
  SPKI_ORDER_LESS = 1,
  SPKI_ORDER_GREATER = 2,
  SPKI_ORDER_NONE = 3
};

// A 0 byte is the end of its string, and a string is less than one that it begins.
[[nodiscard]] int spki_cmp_cstr(const unsigned char* data, size_t length, const char* text);
[[nodiscard]] int spki_cmp_bytes(const unsigned char* a, size_t a_length, const unsigned char* b,
                                 size_t b_length);
// As numbers: leading `pad` bytes of the longer one do not count, any other byte there decides.
[[nodiscard]] int spki_cmp_padded(const unsigned char* a, size_t a_length, const unsigned char* b,
                                  size_t b_length, unsigned char pad);
// Same hint and equal by spki_cmp_bytes. Null equals null only. False when the budget is spent.
bool spki_atom_equal(spki_engine* engine, const spki_atom* a, const spki_atom* b);
// Whether the first comes behind the second by spki_cmp_bytes; hints do not count. Neither is null.
// False when the budget is spent.
bool spki_atom_later(spki_engine* engine, const spki_atom* a, const spki_atom* b);

// ---- Canonical text ----

// A cursor. `position` moves with what was read, and stands at the fault after a failure.
struct spki_input {
  const unsigned char* start;
  const unsigned char* position;
  const unsigned char* end;
};

// Reads a list at its "(". *slot gets the one reference, and is null after a failure. Strings are
// not copied: the input outlives the list. Nested at most Limits::kMaxDepth levels.
[[nodiscard]] spki_status spki_parse_list(spki_engine* engine, spki_elem** slot, spki_input* input);
// Reads "[4:hint]3:abc" or "3:abc" into a slot (counted store).
[[nodiscard]] spki_status spki_parse_atom(spki_engine* engine, spki_atom** slot, spki_input* input);
// Reads "3:". From 1 on, without leading zeros: each text has one encoding, so that equal digests
// mean equal lists.
[[nodiscard]] spki_status spki_parse_length(uint32_t* length, spki_input* input);

// Folds a crypto result into an engine code; every unlisted value is success, deliberately.
[[nodiscard]] spki_status spki_map_crypto_status(int status);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_MODEL_H
