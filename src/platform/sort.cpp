// SPDX-License-Identifier: Apache-2.0
// A stable sort: names that compare equal keep the order in which they were found, whatever the C
// library's own sort does with them. Results are told in this order, so that it must be the same on
// every machine. The sort takes memory of the size of what it sorts; without that it is slow and
// does the same.
#include <cstring>
#include <memory>
#include <new>

#include "src/platform/text.h"

namespace ZVsysutil {
namespace {

using Compare = int (*)(const void*, const void*);

// Elements of `size` bytes at `base`: the array is of a type that only the caller knows.
struct Elements {
  unsigned char* At(size_t index) const { return base + index * size; }
  unsigned char* base;
  size_t size;
};

// Merges the sorted runs [first, middle) and [middle, last) of `from` into `to`. Equal ones come
// from the left first: that is what makes it stable.
void Merge(Elements from, Elements to, size_t first, size_t middle, size_t last, Compare compare) {
  size_t left = first;
  size_t right = middle;
  for (size_t i = first; i < last; ++i) {
    const bool takeLeft =
        left < middle && (right == last || compare(from.At(left), from.At(right)) <= 0);
    std::memcpy(to.At(i), from.At(takeLeft ? left++ : right++), from.size);
  }
}

// Bottom-up merge sort, passing the elements to `spare` and back.
void MergeSort(Elements items, Elements spare, size_t count, Compare compare) {
  Elements from = items;
  Elements to = spare;
  for (size_t run = 1; run < count; run *= 2) {
    for (size_t first = 0; first < count; first += 2 * run) {
      const size_t middle = run < count - first ? first + run : count;
      const size_t last = run < count - middle ? middle + run : count;
      Merge(from, to, first, middle, last, compare);
    }
    std::swap(from, to);
  }
  if (from.base != items.base) std::memcpy(items.base, from.base, count * items.size);
}

// Slow, but needs no memory. Its cost is the square of the count: only where memory has run out,
// and there it still ends.
void InsertionSort(Elements items, size_t count, Compare compare) {
  for (size_t i = 1; i < count; ++i) {
    for (size_t j = i; j > 0 && compare(items.At(j - 1), items.At(j)) > 0; --j) {
      for (size_t byte = 0; byte < items.size; ++byte) {
        std::swap(items.At(j - 1)[byte], items.At(j)[byte]);
      }
    }
  }
}

}  // namespace

// Fewer than two are sorted.
void zv_sort(void* items, size_t count, size_t size, Compare compare) {
  if (items == nullptr || count < 2) return;
  const Elements elements{static_cast<unsigned char*>(items), size};
  const std::unique_ptr<unsigned char[]> spare(new (std::nothrow) unsigned char[count * size]);
  if (spare != nullptr) {
    MergeSort(elements, {spare.get(), size}, count, compare);
  } else {
    InsertionSort(elements, count, compare);
  }
}

}  // namespace ZVsysutil
