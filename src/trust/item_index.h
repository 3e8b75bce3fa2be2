// SPDX-License-Identifier: Apache-2.0
// ItemIndex: the items of revocation lists, found by what they name. A list of many items is then
// asked about many objects without being walked for each.
#ifndef VESK2_SRC_TRUST_ITEM_INDEX_H
#define VESK2_SRC_TRUST_ITEM_INDEX_H

#include <memory>
#include <string_view>

#include <vesk2/hash.h>
#include <vesk2/time_stamp.h>

namespace ZvVesk2 {

class CrlSequence;

// Whether a stamp has the full form "####-##-##_##:##:##", so that comparing it means something.
bool IsStamp(const TimeStamp* stamp);

class ItemIndex {
 public:
  using Bytes = std::basic_string_view<unsigned char>;

  // What the items say of one object: the earliest date from which it is revoked; null: always,
  // since no date that could be compared is given. `list` is where that item stands.
  struct Item {
    ZvclmHashID algorithm;
    Bytes digest;
    TimeStamp* from;
    CrlSequence* list;
  };

  // Reserve makes room for `count` items, before the first is added. VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int Reserve(size_t count);
  // Add takes in the items (item HASH DATE), headed by their keyword, of a list, and borrows their
  // bytes. What is no item, or is of an unknown hash, names nothing.
  void Add(SExpression* items, CrlSequence* list);
  // Sort makes the items findable. None may be added afterwards.
  void Sort();

  // Find puts the question about an object: null unless an item names it. The object is hashed by
  // the algorithms that items use, with display hints (as its owner hashed it) and without (as the
  // reduction identifies it): adding hints to a key must not take it off the list. An object that
  // is itself a hash is also sought as it stands, since it names what the item names. The codes of
  // hashing.
  [[nodiscard]] int Find(const Item*& found, DExpression* object) const;

 private:
  const Item* Find(ZvclmHashID algorithm, Bytes digest) const;

  std::unique_ptr<Item[]> items_;
  // Items that were taken in; Reserve made room for no fewer.
  size_t count_ = 0;
  unsigned algorithms_ = 0;  // a bit for each that an item uses
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_TRUST_ITEM_INDEX_H
