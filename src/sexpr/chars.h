// SPDX-License-Identifier: Apache-2.0
// Character classes of the encodings. They are those of the C locale whatever locale the host has
// set: what a stored text means must not depend on it. They take any value: a plain char may be
// negative, and a cursor answers -1 at its end.
#ifndef VESK2_SRC_SEXPR_CHARS_H
#define VESK2_SRC_SEXPR_CHARS_H

namespace ZvVesk2 {

// The six of the C locale: blank, tab, line feed, vertical tab, form feed, carriage return.
constexpr bool IsSpace(int c) { return c == ' ' || (c >= '\t' && c <= '\r'); }
constexpr bool IsDigit(int c) { return c >= '0' && c <= '9'; }
// ASCII only: a byte of a longer UTF-8 sequence is not printable, so a string without a hint that
// holds one is not shown at all.
constexpr bool IsPrintable(int c) { return c >= 0x20 && c <= 0x7e; }

}  // namespace ZvVesk2

#endif  // VESK2_SRC_SEXPR_CHARS_H
