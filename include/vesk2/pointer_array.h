// SPDX-License-Identifier: Apache-2.0
// pointer_array.h: PointerArray<T>, a growable array of owned pointers with a cursor. It is what a
// manifest's listing keeps its entries in; programs mostly read one.
//
//   for (BodyObject* file = files.begin(); file != nullptr; file = files.next()) Use(file);
//   for (uint32_t i = 0; i < files.GetCount(); ++i) Use(files.at(i));     leaves the cursor alone
#ifndef VESK2_POINTER_ARRAY_H
#define VESK2_POINTER_ARRAY_H

#include <vesk2.h>

#include <cstdint>

namespace ZvVesk2 {

// Instantiated in the library for BodyObject and char: there is no other. It may lie in a program's
// own memory. The array owns its elements; what it hands out is borrowed until clear or its end.
template <typename T>
class VESK2_API PointerArray {
 public:
  // An empty array, whose elements are freed one by one.
  PointerArray();
  // With elementsAreArrays, clear frees every element as an array. (char elements always are.)
  explicit PointerArray(bool elementsAreArrays);
  // Frees what clear frees.
  ~PointerArray();
  PointerArray(const PointerArray&) = delete;
  PointerArray& operator=(const PointerArray&) = delete;

  // push appends, and takes over the element: it is the array's after a 1. 1, or 0 without memory,
  // which is not a code of the library. Null may be pushed, and ends every walk.
  [[nodiscard]] int push(T* element);
  // get(0): the element at the cursor. Negative: that element, then the cursor moves on. Positive:
  // the cursor moves on, then its element. Null at and past the end.
  T* get(int mode);
  // begin puts the cursor at the start and returns the first element, next the one after the one
  // that was returned last, each null at the end; reset only puts the cursor at the start. Who
  // walks an array within a walk of the same array goes by at.
  T* begin();
  // next is get(-1): null at the end, as often as it is asked.
  T* next();
  // reset puts the cursor at the start, and returns nothing.
  void reset();
  // at gives an element by its place and leaves the cursor alone; null past the end.
  T* at(uint32_t index) const;
  // sort orders the pointers, stably; the comparator gets pointers to two elements of type T*, and
  // returns less than, equal to or more than 0. The cursor stays.
  void sort(int (*compare)(const void*, const void*));
  // clear frees every element and the array, and puts the cursor at the start.
  void clear();

  // The elements that there are.
  uint32_t GetCount() const;
  // GetCapacity grows by steps of 32 with the count; the memory beneath grows by doubling.
  uint32_t GetCapacity() const;
  // The place of the element that get(0) gives.
  uint32_t GetCursor() const;

 private:
  T** items = nullptr;
  uint32_t count = 0;
  uint32_t slots = 0;  // that `items` has
  uint32_t cursor = 0;
  bool ownsArrays = false;
};

}  // namespace ZvVesk2

#endif  // VESK2_POINTER_ARRAY_H
