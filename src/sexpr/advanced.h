// SPDX-License-Identifier: Apache-2.0
// Steps shared by the readers of the advanced form. The text ends with a 0 byte, which no step
// passes: it is no white space and ends every token. So the readers need no length beside `pos`,
// and the text before it is shorter than Limits::kMaxExport wherever the whole of it is read.
#ifndef VESK2_SRC_SEXPR_ADVANCED_H
#define VESK2_SRC_SEXPR_ADVANCED_H

#include "src/frame/check.h"
#include "src/sexpr/chars.h"

namespace ZvVesk2 {

inline void SkipSpace(const char* text, unsigned& pos) {
  while (IsSpace(text[pos])) ++pos;
}

// Compares the byte at `pos` wherever that is, unlike the memory readers' ExpectByte. '\0' may be
// wanted, to ask for the end of the text; `pos` is then behind it and must not be read from again.
[[nodiscard]] inline int ExpectChar(char wanted, const char* text, unsigned& pos) {
  VESK2_REQUIRE(text[pos] == wanted, VESK2_ERR_UNEXPECTED_CHAR);
  ++pos;
  return 0;
}

}  // namespace ZvVesk2

#endif  // VESK2_SRC_SEXPR_ADVANCED_H
