// SPDX-License-Identifier: Apache-2.0
// AsciiText: the file-name form of an ASCII argument, for the time of one call. On Linux both forms
// are bytes, but callers of the A functions must not come to depend on that. A conversion that
// lacked memory must not become a null argument, which some functions take for "the store": every
// caller tests OutOfMemory.
#ifndef VESK2_SRC_FRAME_FLAT_ASCII_TEXT_H
#define VESK2_SRC_FRAME_FLAT_ASCII_TEXT_H

#include "src/platform/text.h"

namespace ZvVesk2 {

class AsciiText {
 public:
  explicit AsciiText(const char* text) : text_(text), copy_(ZVsysutil::zv_atof(text)) {}
  ~AsciiText() { ZVsysutil::zv_atof_free(text_, copy_); }
  AsciiText(const AsciiText&) = delete;
  AsciiText& operator=(const AsciiText&) = delete;

  // Null for a null argument, and without memory.
  const char* get() const { return copy_; }
  bool OutOfMemory() const { return text_ != nullptr && copy_ == nullptr; }

 private:
  const char* text_;
  char* copy_;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_FRAME_FLAT_ASCII_TEXT_H
