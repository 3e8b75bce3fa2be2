// SPDX-License-Identifier: Apache-2.0
// pointer_array.h: PointerArray<T>, a growable array of owned pointers with a cursor.
#ifndef VESK2_POINTER_ARRAY_H
#define VESK2_POINTER_ARRAY_H

#include <vesk2.h>

#include <cstdint>

namespace ZvVesk2 {

// Instantiated in the library for BodyObject and char.
template <typename T>
class VESK2_API PointerArray {
 public:
  PointerArray();
  // With ownsArrays, clear frees every element as an array. (char elements always are.)
  explicit PointerArray(bool elementsAreArrays);
  ~PointerArray();
  PointerArray(const PointerArray&) = delete;
  PointerArray& operator=(const PointerArray&) = delete;

  // push appends, and takes over the element. 1, or 0 without memory.
  [[nodiscard]] int push(T* element);
  // get(0): the element at the cursor. Negative: that element, then the cursor moves on. Positive:
  // the cursor moves on, then its element. Null at and past the end.
  T* get(int mode);
  T* begin();
  T* next();
  void reset();
  // at gives an element by its place and leaves the cursor alone; null past the end.
  T* at(uint32_t index) const;
  // sort orders the pointers; the comparator gets pointers to two elements of type T*.
  void sort(int (*compare)(const void*, const void*));
  // clear frees every element and the array.
  void clear();

  uint32_t GetCount() const;
  // GetCapacity grows by steps of 32 with the count; the memory beneath grows by doubling.
  uint32_t GetCapacity() const;
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
