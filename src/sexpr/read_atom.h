// SPDX-License-Identifier: Apache-2.0
// The readers of one byte string, in line for the readers of whole expressions.
//
// There are two, and they do not accept the same texts. The buffer's reader (ReadHint, ReadLength,
// ReadAtom) is for files: it knows hints, wants its ":" and bounds lengths by Limits. The memory
// reader (ExpectByte, ReadMemoryLength) skips white space, knows no hints, bounds a length by what
// is left of the input alone, and takes most separators unseen: programs hold texts that read in no
// other way. Within the library it reads only what the engine wrote.
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

// Reads "[text]". A hint that is not closed, not known or too long is VESK2_ERR_PARSE_FILE: a
// signature covers hints, so one that cannot be written back must not be dropped. `type` is set on
// success only.
[[nodiscard]] int ReadHint(ZvCursor& cursor, ByteString::BsType& type);

// Reads "<digits>:". Leading zeros are accepted, and so are no digits at all, for 0. The digits are
// counted as well, since leading zeros would have no end otherwise.
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
// that ends too early is read to its end, and `keep` is told with null bytes: a lack of memory
// then comes before the error in the text. `size` is Limits::kMaxByteString at most.
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

// DExpression::Expect of a single character: that compares text[i] with buf[pos + i] for i from
// `pos` on, so a text of one character is compared at position 0 only, and anywhere else the byte
// is consumed whatever it is. (3;abc) reads like (3:abc).
[[nodiscard]] inline int ExpectByte(unsigned char wanted, const unsigned char* buf, unsigned size,
                                    unsigned& pos) {
  VESK2_REQUIRE(pos < size, VESK2_ERR_BUFFER_OVERFLOW);
  VESK2_REQUIRE(pos != 0 || buf[0] == wanted, VESK2_ERR_UNEXPECTED_CHAR);
  ++pos;
  return 0;
}

// Reads the length of a byte string in memory, whose bytes are then at `pos`. Any byte is accepted
// for its ":" except at position 0, where Expect compares it. No digits are 0, any number of them
// is read: the value stops growing at `size`, which no string fits into, instead of wrapping to a
// small one. After success `length` bytes are there.
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
