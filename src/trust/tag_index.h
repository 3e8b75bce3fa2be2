// SPDX-License-Identifier: Apache-2.0
// TagIndex: values found by the tag that they are about, each tag hashed once. Comparing every tag
// with every other would cost the product of two numbers, either of which a stranger can choose. A
// digest costs as much as writing the tag once, and lists and entries are looked up by it alone:
// two tags with one SHA-256 would be one tag, which nobody can make.
#ifndef VESK2_SRC_TRUST_TAG_INDEX_H
#define VESK2_SRC_TRUST_TAG_INDEX_H

#include <algorithm>
#include <array>
#include <cstring>
#include <memory>
#include <span>

#include <vesk2/expression.h>

#include "src/frame/check.h"

namespace ZvVesk2 {

// What tells tags apart: two are equal when their canonical texts have the same digest.
using TagDigest = std::array<unsigned char, 32>;

// DigestTag hashes a tag. A null one, and one nested too deeply, equals nothing: `hashed` is false.
// The codes of hashing.
[[nodiscard]] inline int DigestTag(bool& hashed, TagDigest& digest, SExpression* tag) {
  hashed = false;
  if (tag == nullptr) return 0;
  unsigned char* bytes = nullptr;
  unsigned int length = 0;
  const int code = tag->ComputeHash(bytes, length, ZVCLM_HASH_SHA256, true);
  if (code == VESK2_ERR_BUFFER_OVERFLOW) return 0;
  VESK2_TRY(code);
  const std::unique_ptr<unsigned char[]> owner(bytes);
  VESK2_REQUIRE(length == digest.size(), VESK2_ERR_HASH_ID);
  std::copy_n(bytes, length, digest.begin());
  hashed = true;
  return 0;
}

template <typename T>
class TagIndex {
 public:
  // `order` keeps the run of one tag in the order of adding: sorting alone would not.
  struct Entry {
    TagDigest digest;
    size_t order;
    T value;
  };

  // Reserve makes room for `count` values, before the first is added. VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int Reserve(size_t count) {
    entries_.reset(TryNewArray<Entry>(count));
    VESK2_REQUIRE(entries_ != nullptr, VESK2_ERR_MEM_ALLOC);
    return 0;
  }
  // Add takes in a value; one whose tag equals nothing is left out. The codes of hashing.
  [[nodiscard]] int Add(SExpression* tag, const T& value) {
    Entry& entry = entries_[count_];
    bool hashed = false;
    VESK2_TRY(DigestTag(hashed, entry.digest, tag));
    if (!hashed) return 0;
    // What was added later comes later in its run: the last entry of a tag decides about its lists.
    entry.order = count_++;
    entry.value = value;
    return 0;
  }
  // Sort makes the values findable. None may be added afterwards.
  void Sort() {
    std::sort(entries_.get(), entries_.get() + count_, [](const Entry& a, const Entry& b) {
      return a.digest != b.digest ? a.digest < b.digest : a.order < b.order;
    });
  }
  // Find is the run of values with the tag, in the order in which they were added.
  std::span<Entry> Find(const TagDigest& digest) {
    struct Less {
      bool operator()(const Entry& entry, const TagDigest& wanted) const {
        return entry.digest < wanted;
      }
      bool operator()(const TagDigest& wanted, const Entry& entry) const {
        return wanted < entry.digest;
      }
    };
    const auto [first, last] =
        std::equal_range(entries_.get(), entries_.get() + count_, digest, Less());
    return {first, last};
  }
  // All the values, in the order of Sort.
  std::span<Entry> All() { return {entries_.get(), count_}; }

 private:
  std::unique_ptr<Entry[]> entries_;
  size_t count_ = 0;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_TRUST_TAG_INDEX_H
