// Order of byte strings, and equality of atoms.
//
// The order sees a 0 byte as the end: a string with an embedded 0 equals its beginning. Stored
// grants are judged by it, so whoever issues a tag keeps 0 bytes out of it.
#include <algorithm>

#include "src/engine/model.h"

namespace ZvVesk2::Engine {
namespace {

bool SameHint(const spki_atom* a, const spki_atom* b) {
  return a->hint_length == b->hint_length && std::equal(a->hint, a->hint + a->hint_length, b->hint);
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

int spki_cmp_bytes(const unsigned char* a, size_t a_length, const unsigned char* b,
                   size_t b_length) {
  if (a == nullptr || b == nullptr) return SPKI_ORDER_NONE;
  for (size_t i = 0;; ++i) {
    const unsigned char left = i < a_length ? a[i] : 0;
    const unsigned char right = i < b_length ? b[i] : 0;
    if (left != right) return left < right ? SPKI_ORDER_LESS : SPKI_ORDER_GREATER;
    if (left == 0) return SPKI_ORDER_EQUAL;
  }
}

int spki_cmp_padded(const unsigned char* a, size_t a_length, const unsigned char* b,
                    size_t b_length, unsigned char pad) {
  if (a == nullptr || b == nullptr) return SPKI_ORDER_NONE;
  for (; a_length > b_length; ++a, --a_length) {
    if (*a != pad) return SPKI_ORDER_GREATER;
  }
  for (; b_length > a_length; ++b, --b_length) {
    if (*b != pad) return SPKI_ORDER_LESS;
  }
  return spki_cmp_bytes(a, a_length, b, b_length);
}

bool spki_atom_equal(const spki_atom* a, const spki_atom* b) {
  if (a == nullptr || b == nullptr) return a == b;
  return SameHint(a, b) &&
         spki_cmp_bytes(a->data, a->length, b->data, b->length) == SPKI_ORDER_EQUAL;
}

}  // namespace ZvVesk2::Engine
