// SPDX-License-Identifier: Apache-2.0
// Order of byte strings, and equality of atoms.
//
// The order sees a 0 byte as the end: a string with an embedded 0 equals its beginning. Stored
// grants are judged by it, so whoever issues a tag keeps 0 bytes out of it. Bytes compare as
// unsigned, and a shorter string as if 0 bytes followed.
#include <algorithm>
#include <cstring>

#include "src/engine/budget.h"

namespace ZvVesk2::Engine {
namespace {

bool SameHint(const spki_atom* a, const spki_atom* b) {
  return a->hint_length == b->hint_length &&
         (a->hint_length == 0 || std::memcmp(a->hint, b->hint, a->hint_length) == 0);
}

[[nodiscard]] int OrderOf(int difference) {
  if (difference == 0) return SPKI_ORDER_EQUAL;
  return difference < 0 ? SPKI_ORDER_LESS : SPKI_ORDER_GREATER;
}

// Whether the bytes are all `pad`: the first is, and each is what stands in front of it.
bool IsPadding(const unsigned char* data, size_t length, unsigned char pad) {
  return length == 0 || (data[0] == pad && std::memcmp(data, data + 1, length - 1) == 0);
}

}  // namespace

int spki_cmp_cstr(const unsigned char* data, size_t length, const char* text) {
  if (static_cast<const void*>(data) == text) return SPKI_ORDER_EQUAL;
  if (data == nullptr || text == nullptr) return SPKI_ORDER_NONE;
  for (size_t i = 0;; ++i) {
    const unsigned char a = i < length ? data[i] : 0;
    const auto b = static_cast<unsigned char>(text[i]);
    if (a != b) return a < b ? SPKI_ORDER_LESS : SPKI_ORDER_GREATER;
    if (a == 0) return SPKI_ORDER_EQUAL;
  }
}

// Nothing but the first difference counts, and where `a` has a 0 byte both end or one is longer.
int spki_cmp_bytes(const unsigned char* a, size_t a_length, const unsigned char* b,
                   size_t b_length) {
  if (a == nullptr || b == nullptr) return SPKI_ORDER_NONE;
  size_t end = std::min(a_length, b_length);
  if (end > 0 && a[0] != b[0]) return OrderOf(a[0] - b[0]);  // as most strings are
  if (const void* zero = std::memchr(a, 0, end)) {
    end = static_cast<size_t>(static_cast<const unsigned char*>(zero) - a);
  }
  if (const int difference = std::memcmp(a, b, end)) return OrderOf(difference);
  return OrderOf((end < a_length ? a[end] : 0) - (end < b_length ? b[end] : 0));
}

// The longer string gives up what it has in front; where that is no padding, it is the greater.
int spki_cmp_padded(const unsigned char* a, size_t a_length, const unsigned char* b,
                    size_t b_length, unsigned char pad) {
  if (a == nullptr || b == nullptr) return SPKI_ORDER_NONE;
  const size_t a_more = a_length - std::min(a_length, b_length);
  const size_t b_more = b_length - std::min(a_length, b_length);
  if (!IsPadding(a, a_more, pad)) return SPKI_ORDER_GREATER;
  if (!IsPadding(b, b_more, pad)) return SPKI_ORDER_LESS;
  return spki_cmp_bytes(a + a_more, a_length - a_more, b + b_more, b_length - b_more);
}

bool spki_atom_equal(spki_engine* engine, const spki_atom* a, const spki_atom* b) {
  if (a == nullptr || b == nullptr) return a == b;
  if (spki_charge_strings(engine, a, b) != 0) return false;
  return SameHint(a, b) &&
         spki_cmp_bytes(a->data, a->length, b->data, b->length) == SPKI_ORDER_EQUAL;
}

bool spki_atom_later(spki_engine* engine, const spki_atom* a, const spki_atom* b) {
  if (spki_charge_strings(engine, a, b) != 0) return false;
  return spki_cmp_bytes(a->data, a->length, b->data, b->length) == SPKI_ORDER_GREATER;
}

}  // namespace ZvVesk2::Engine
