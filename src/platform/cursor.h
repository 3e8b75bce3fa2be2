// SPDX-License-Identifier: Apache-2.0
// ZvCursor: the read position of a ZvBuffer, held by value, so that a loop over single bytes keeps
// it in registers. Nothing else may use the buffer until the cursor is gone.
#ifndef VESK2_SRC_PLATFORM_CURSOR_H
#define VESK2_SRC_PLATFORM_CURSOR_H

#include <cstddef>
#include <cstring>

#include <vesk2/platform.h>

namespace ZVsysutil {

class ZvCursor {
 public:
  explicit ZvCursor(ZvBuffer* buffer)
      : buffer_(buffer), at_(buffer->Data()), end_(at_ + buffer->Remaining()) {}
  ~ZvCursor() { buffer_->Skip(buffer_->Remaining() - Remaining()); }
  ZvCursor(const ZvCursor&) = delete;
  ZvCursor& operator=(const ZvCursor&) = delete;

  size_t Remaining() const { return static_cast<size_t>(end_ - at_); }
  // As those of ZvBuffer.
  [[nodiscard]] int Peek() const { return at_ != end_ ? *at_ : -1; }
  [[nodiscard]] int Next() { return at_ != end_ ? *at_++ : -1; }
  [[nodiscard]] bool Accept(unsigned char wanted) {
    if (Peek() != wanted) return false;
    ++at_;
    return true;
  }
  // The next Remaining() bytes, and passing over some of them, which must be there.
  const unsigned char* Data() const { return at_; }
  void Skip(size_t length) { at_ += length; }

 private:
  ZvBuffer* buffer_;
  const unsigned char* at_;
  const unsigned char* end_;
};

}  // namespace ZVsysutil

#endif  // VESK2_SRC_PLATFORM_CURSOR_H
