// SPDX-License-Identifier: Apache-2.0
// PointerArray: the growable arrays of a manifest body. Callers see a capacity that grows by a
// fixed step; memory that did would be copied once for every 32 files of a directory. The cursor is
// part of the array, as programs walk it so; whoever walks within a walk goes by at.
#include <vesk2/pointer_array.h>

#include <algorithm>
#include <type_traits>

#include <vesk2/manifest_body.h>

#include "src/frame/check.h"
#include "src/platform/text.h"

namespace ZvVesk2 {
namespace {

constexpr uint32_t kFirstSlots = 8;  // most directories are small

}  // namespace

template <typename T>
PointerArray<T>::PointerArray() = default;
template <typename T>
PointerArray<T>::PointerArray(bool elementsAreArrays) : ownsArrays(elementsAreArrays) {}
template <typename T>
PointerArray<T>::~PointerArray() {
  clear();
}

// The element is the caller's until there is room for it.
template <typename T>
int PointerArray<T>::push(T* element) {
  if (count == slots) {
    if (slots > UINT32_MAX / 2) return 0;
    const uint32_t more = slots > 0 ? 2 * slots : kFirstSlots;
    T** const grown = TryNewArray<T*>(more);
    if (grown == nullptr) return 0;
    std::copy_n(items, count, grown);
    delete[] items;
    items = grown;
    slots = more;
  }
  items[count++] = element;
  return 1;
}

// The three ways of one old function: look, take, go on. Past the end nothing moves.
template <typename T>
T* PointerArray<T>::get(int mode) {
  if (mode > 0) ++cursor;
  T* const element = at(cursor);
  if (mode < 0 && element != nullptr) ++cursor;
  return element;
}

template <typename T>
T* PointerArray<T>::begin() {
  reset();
  return next();
}

template <typename T>
T* PointerArray<T>::next() {
  return get(-1);
}

template <typename T>
void PointerArray<T>::reset() {
  cursor = 0;
}

template <typename T>
T* PointerArray<T>::at(uint32_t index) const {
  return index < count ? items[index] : nullptr;
}

template <typename T>
uint32_t PointerArray<T>::GetCount() const {
  return count;
}

// In steps of 32, whatever the memory beneath does.
template <typename T>
uint32_t PointerArray<T>::GetCapacity() const {
  return (count + 31) / 32 * 32;
}

template <typename T>
uint32_t PointerArray<T>::GetCursor() const {
  return cursor;
}

// Stable: a name that is listed twice keeps the order of its listings.
template <typename T>
void PointerArray<T>::sort(int (*compare)(const void*, const void*)) {
  if (count != 0) ZVsysutil::zv_sort(items, count, sizeof(T*), compare);
}

// Names are arrays whatever the flag says: delete of one would be wrong.
template <typename T>
void PointerArray<T>::clear() {
  for (uint32_t i = 0; i < count; ++i) {
    if (ownsArrays || std::is_same_v<T, char>) {
      delete[] items[i];
    } else {
      delete items[i];
    }
  }
  delete[] items;
  items = nullptr;
  count = slots = cursor = 0;
}

template class PointerArray<BodyObject>;
template class PointerArray<char>;

}  // namespace ZvVesk2
