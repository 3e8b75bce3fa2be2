// SPDX-License-Identifier: Apache-2.0
// Typed objects read from text, and what must hold of damaged text.
#ifndef VESK2_TESTS_SUPPORT_TEST_READ_H
#define VESK2_TESTS_SUPPORT_TEST_READ_H

#include <gtest/gtest.h>

#include "tests/support/test_object.h"

namespace vesk2test {

// Reads an object with its Import, which must answer `code`.
template <typename T>
ZvVesk2::Ref<T> Read(const std::string& text, int code = 0) {
  ZvVesk2::Ref<T> object(new T(nullptr));
  EXPECT_EQ(object->Import(Wrap(text).get()), code) << text;
  return object;
}

// What can be read is written as it was, and nothing is read twice into one object.
template <typename T>
void ExpectRead(const std::string& text, int code = 0, size_t unread = 0) {
  const BufferPtr buffer = Wrap(text);
  const ZvVesk2::Ref<T> object(new T(nullptr));
  EXPECT_EQ(object->Import(buffer.get()), code) << text;
  if (code != 0) return;
  EXPECT_EQ(Canonical(object), text);
  EXPECT_EQ(buffer->Remaining(), unread) << text;
  EXPECT_EQ(object->Import(Wrap(text).get()), VESK2_ERR_INVALID_PARAM);
}

// Hands out every truncation of `text` and every change of one bit in it.
template <typename Check>
void ForEachDamage(const std::string& text, const Check& check) {
  for (size_t length = 0; length < text.size(); ++length) check(text.substr(0, length));
  for (size_t bit = 0; bit < 8 * text.size(); ++bit) {
    std::string flipped = text;
    flipped[bit / 8] = static_cast<char>(flipped[bit / 8] ^ (1 << bit % 8));
    check(flipped);
  }
}

// Truncated text is refused; changed text is refused too, or is another object that reads back as
// itself.
template <typename T>
void ExpectDamageIsSeen(const std::string& text) {
  Read<T>(text);
  ForEachDamage(text, [&text](const std::string& damaged) {
    const ZvVesk2::Ref<T> object(new T(nullptr));
    if (object->Import(Wrap(damaged).get()) != 0) return;
    EXPECT_EQ(damaged.size(), text.size());
    const ZvVesk2::Ref<T> again = Read<T>(Canonical(object));
    EXPECT_EQ(Canonical(again), Canonical(object));
    EXPECT_TRUE(again->IsEqual(object.get()));
  });
}

}  // namespace vesk2test

#endif  // VESK2_TESTS_SUPPORT_TEST_READ_H
