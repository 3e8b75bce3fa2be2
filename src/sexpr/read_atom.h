// SPDX-License-Identifier: Apache-2.0
// The readers of one byte string, in line for the readers of whole expressions.
#ifndef VESK2_SRC_SEXPR_READ_ATOM_H
#define VESK2_SRC_SEXPR_READ_ATOM_H

#include <string_view>

#include <vesk2/expression.h>

#include "src/frame/check.h"
#include "src/platform/cursor.h"
#include "src/sexpr/atom_text.h"
#include "src/sexpr/chars.h"

namespace ZvVesk2 {

using ZVsysutil::ZvCursor;

// Reads "[text]". A hint that is not closed, not known or too long is no hint.
[[nodiscard]] int ReadHint(ZvCursor& cursor, ByteString::BsType& type);

// Reads "<digits>:". Leading zeros are accepted, and so are no digits at all, for 0.
[[nodiscard]] inline int ReadLength(ZvCursor& cursor, unsigned& length) {
  length = 0;
  unsigned digits = 0;
  while (IsDigit(cursor.Peek())) {
    VESK2_REQUIRE(digits++ < Limits::kMaxLengthDigits, VESK2_ERR_MAX_BYTE_STRING);
    length = length * 10 + static_cast<unsigned>(cursor.Next() - '0');
  }
  VESK2_REQUIRE(length <= Limits::kMaxByteString, VESK2_ERR_MAX_BYTE_STRING);
  return cursor.Accept(':') ? 0 : VESK2_ERR_PARSE_FILE;
}

// Reads one byte string, with an optional hint, and has `keep(bytes, size)` keep its bytes. Text
// that ends too early is read to its end.
template <typename Keep>
[[nodiscard]] int ReadAtom(ZvCursor& cursor, ByteString::BsType& type, const Keep& keep) {
  if (cursor.Peek() == '[') VESK2_TRY(ReadHint(cursor, type));
  unsigned size = 0;
  VESK2_TRY(ReadLength(cursor, size));
  const bool whole = size <= cursor.Remaining();
  VESK2_TRY(keep(whole ? cursor.Data() : nullptr, size));
  cursor.Skip(whole ? size : cursor.Remaining());
  return whole ? 0 : VESK2_ERR_PARSE_FILE;
}

// DExpression::Expect of a single character.
[[nodiscard]] inline int ExpectByte(unsigned char wanted, const unsigned char* buf, unsigned size,
                                    unsigned& pos) {
  VESK2_REQUIRE(pos < size, VESK2_ERR_BUFFER_OVERFLOW);
  VESK2_REQUIRE(pos != 0 || buf[0] == wanted, VESK2_ERR_UNEXPECTED_CHAR);
  ++pos;
  return 0;
}

// Reads the length of a byte string in memory, whose bytes are then at `pos`. Any byte is accepted
// for its ":" except at position 0, where Expect compares it.
[[nodiscard]] inline int ReadMemoryLength(unsigned& length, const unsigned char* buf, unsigned size,
                                          unsigned& pos) {
  while (pos < size && IsSpace(buf[pos])) ++pos;
  uint64_t stated = 0;
  for (; pos < size && IsDigit(buf[pos]); ++pos) {
    if (stated < size) stated = stated * 10 + (buf[pos] - unsigned{'0'});  // beyond, it cannot fit
  }
  VESK2_TRY(ExpectByte(':', buf, size, pos));
  VESK2_REQUIRE(stated <= size - pos, VESK2_ERR_BUFFER_OVERFLOW);
  length = static_cast<unsigned>(stated);
  return 0;
}

}  // namespace ZvVesk2

#endif  // VESK2_SRC_SEXPR_READ_ATOM_H
