// SPDX-License-Identifier: Apache-2.0
// See item_index.h. Items and digests are borrowed from the lists, which outlive the index: a list
// of a million items costs an array and a sort.
#include "src/trust/item_index.h"

#include <algorithm>

#include "src/frame/check.h"

namespace ZvVesk2 {
namespace {

using Bytes = ItemIndex::Bytes;
using Item = ItemIndex::Item;

// Any of them may name an object in a list, whatever the issuer preferred.
constexpr ZvclmHashID kAlgorithms[] = {ZVCLM_HASH_SHA1, ZVCLM_HASH_SHA256, ZVCLM_HASH_RMD160};

bool IsKnown(ZvclmHashID id) {
  return std::find(std::begin(kAlgorithms), std::end(kAlgorithms), id) != std::end(kAlgorithms);
}

// Ids are small numbers (ZvclmHashID): each is a bit of one word.
unsigned Bit(ZvclmHashID id) { return 1U << static_cast<unsigned>(id); }

Bytes View(const ByteString* value) {
  return value != nullptr ? Bytes(value->GetData(), value->GetLength()) : Bytes();
}

// By what is named; of several items about one object the one that revokes earliest is first.
bool IsLess(const Item& a, const Item& b) {
  if (a.algorithm != b.algorithm) return a.algorithm < b.algorithm;
  if (a.digest != b.digest) return a.digest < b.digest;
  if (a.from == nullptr || b.from == nullptr) return a.from == nullptr && b.from != nullptr;
  return a.from->IsBefore(b.from);
}

// Equal digests of different algorithms name different things.
bool Names(const Item& item, ZvclmHashID algorithm, Bytes digest) {
  return item.algorithm == algorithm && item.digest == digest;
}

// The one that revokes earlier; an item without a date always did.
const Item* Earlier(const Item* a, const Item* b) {
  if (a == nullptr || b == nullptr) return a != nullptr ? a : b;
  if (a->from == nullptr || b->from == nullptr) return a->from == nullptr ? a : b;
  return b->from->IsBefore(a->from) ? b : a;
}

}  // namespace

// Digits are not judged: 31st of February sorts where it belongs.
bool IsStamp(const TimeStamp* stamp) {
  constexpr std::string_view kForm = "####-##-##_##:##:##";
  if (stamp->GetLength() != kForm.size()) return false;
  for (size_t i = 0; i < kForm.size(); ++i) {
    const auto c = static_cast<char>(stamp->GetData()[i]);
    if (kForm[i] == '#' ? c < '0' || c > '9' : c != kForm[i]) return false;
  }
  return true;
}

// Made once with the room that all lists together can need, counted by the caller.
int ItemIndex::Reserve(size_t count) {
  items_.reset(TryNewArray<Item>(count));
  VESK2_REQUIRE(items_ != nullptr, VESK2_ERR_MEM_ALLOC);
  return 0;
}

// Items that name nothing we could compare are passed over, as the rest of a signed list still
// counts.
void ItemIndex::Add(SExpression* items, CrlSequence* list) {
  for (auto it = items->Begin(); it; it.Next()) {
    auto* const item = dynamic_cast<SExpression*>(it.Value());
    if (item == nullptr) continue;
    auto at = item->Begin();
    if (at) at.Next();
    auto* const named = at ? dynamic_cast<Hash*>(at.Value()) : nullptr;
    // A list that was made by a program can hold anything.
    if (named == nullptr || !IsKnown(named->GetAlgorithm())) continue;
    const Bytes digest = View(named->GetDigest());
    if (digest.empty()) continue;
    auto* const date = dynamic_cast<TimeStamp*>(item->Last());
    const bool isDated = date != nullptr && IsStamp(date);
    items_[count_++] = {named->GetAlgorithm(), digest, isDated ? date : nullptr, list};
    // So that an object is hashed by no algorithm that nobody used.
    algorithms_ |= Bit(named->GetAlgorithm());
  }
}

void ItemIndex::Sort() { std::sort(items_.get(), items_.get() + count_, IsLess); }

// The first of several about one object is the earliest (IsLess).
const Item* ItemIndex::Find(ZvclmHashID algorithm, Bytes digest) const {
  const Item* const begin = items_.get();
  const Item* const end = begin + count_;
  const auto before = [](const Item& item, const Item& wanted) {
    if (item.algorithm != wanted.algorithm) return item.algorithm < wanted.algorithm;
    return item.digest < wanted.digest;
  };
  const Item wanted{algorithm, digest, nullptr, nullptr};
  const Item* const first = std::lower_bound(begin, end, wanted, before);
  return first != end && Names(*first, algorithm, digest) ? first : nullptr;
}

// Two digests for each algorithm that items use, at most six, whatever the lists hold.
int ItemIndex::Find(const Item*& found, DExpression* object) const {
  found = nullptr;
  for (const ZvclmHashID algorithm : kAlgorithms) {
    if ((algorithms_ & Bit(algorithm)) == 0) continue;
    for (const bool ignoreHints : {true, false}) {
      unsigned char* bytes = nullptr;
      unsigned int length = 0;
      VESK2_TRY(object->ComputeHash(bytes, length, algorithm, ignoreHints));
      const std::unique_ptr<unsigned char[]> owner(bytes);
      found = Earlier(found, Find(algorithm, Bytes(bytes, length)));
    }
  }
  // A subject that is a hash: the item names the key that it stands for.
  auto* const hash = dynamic_cast<Hash*>(object);
  if (hash != nullptr) {
    found = Earlier(found, Find(hash->GetAlgorithm(), View(hash->GetDigest())));
  }
  return 0;
}

}  // namespace ZvVesk2
