// SPDX-License-Identifier: Apache-2.0
// Strings of large sets, found by their values.
//
// Each member of one set is compared with those of the other, and what is found with what was found
// before: work that grows with the square. Sets are large because they list strings, and strings
// are equal or not; so those of a large set stand in a table (src/engine/tables.h). What is no
// string may allow strings that it does not equal, and is still compared one by one. Answers and
// their order are those of the plain comparison; only less work is done, and paid, for them.
#ifndef VESK2_SRC_ENGINE_SET_INDEX_H
#define VESK2_SRC_ENGINE_SET_INDEX_H

#include "src/engine/tables.h"
#include "src/engine/tag.h"

namespace ZvVesk2::Engine {

// Up to so many, comparing is cheaper than hashing, or its work grows with one of the sets only.
inline constexpr uint32_t kPlainMembers = 128;

// A table of strings, of which two are one when spki_atom_equal says so.
class StringTable {
 public:
  explicit StringTable(spki_engine* engine) : engine_(engine) {}
  StringTable(const StringTable&) = delete;
  StringTable& operator=(const StringTable&) = delete;
  ~StringTable() { spki_table_clear(engine_, &table_); }

  // Whether the string is new, and from now on there. False also when the budget is spent.
  bool Enter(const spki_atom* string);
  // False also when the budget is spent.
  bool Has(const spki_atom* string);

 private:
  spki_engine* engine_;
  spki_table table_ = {};
};

// A tag that several members of a set are compared with.
class SetIndex {
 public:
  // Borrows `tag`, which may be any. It is taken apart when both it and the set `asking` are large,
  // and the first members were not enough: most sets that overlap begin alike.
  SetIndex(spki_engine* engine, const spki_elem* tag, const spki_elem* asking);
  SetIndex(const SetIndex&) = delete;
  SetIndex& operator=(const SetIndex&) = delete;
  ~SetIndex();

  // What spki_cmp_elem says of `elem` and the tag.
  spki_relation Relation(const spki_elem* elem);

 private:
  void Fill();

  spki_engine* engine_;
  const spki_elem* tag_;
  uint32_t until_filled_;  // questions that are answered by comparing
  StringTable strings_;
  const spki_elem** others_ = nullptr;  // the members that are no strings; null: not taken apart
  uint32_t other_count_ = 0;
};

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_SET_INDEX_H
