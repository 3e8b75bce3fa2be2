// SPDX-License-Identifier: Apache-2.0
// A reader of objects: what it accepts must be written as it was read, but for zeros before
// lengths, and what is written must read back to the same object.
#ifndef VESK2_FUZZ_ROUND_TRIP_H
#define VESK2_FUZZ_ROUND_TRIP_H

#include <type_traits>

#include "fuzz/fuzz_support.h"

namespace vesk2fuzz {

// The two texts that are not written as they were read: counts of a threshold are written in the
// one form that is signed, and an entry may end without its ")".
template <typename T>
bool IsWrittenForm(const std::string& printed, std::string_view consumed) {
  if (consumed.find("(6:k-of-n") != consumed.npos) return true;
  const std::string text = WithoutZeros(consumed);
  return printed == text || (std::is_same_v<T, ZvVesk2::AclEntry> && printed == text + ")");
}

// Whether it was read; `read` then holds it.
template <typename T>
bool RoundTrip(std::string_view input, Ref<T>& read) {
  const Buffer buffer = Wrap(input);
  read.Reset(new T(nullptr));
  if (read->Import(buffer.get()) != 0) return false;
  const std::string printed = Print(read.get());
  FUZZ_CHECK(IsWrittenForm<T>(printed, input.substr(0, buffer->Position())));
  Ref<T> again(new T(nullptr));
  FUZZ_CHECK(again->Import(Wrap(printed).get()) == 0);
  FUZZ_CHECK(again->IsEqual(read.get()));
  FUZZ_CHECK(Print(again.get()) == printed);
  return true;
}

template <typename T>
bool RoundTrip(std::string_view input) {
  Ref<T> read;
  return RoundTrip(input, read);
}

}  // namespace vesk2fuzz

#endif  // VESK2_FUZZ_ROUND_TRIP_H
