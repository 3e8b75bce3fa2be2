// SPDX-License-Identifier: Apache-2.0
// ZvBuffer: the one bounded cursor that every reader of canonical text is built on. Nothing else
// moves a read position. It compares `remaining < wanted`, never `position + wanted > end`, which
// could wrap.
#include <algorithm>
#include <cstring>
#include <memory>
#include <new>
#include <string_view>

#include <vesk2/limits.h>
#include <vesk2/platform.h>

#include "src/platform/file.h"

namespace ZVsysutil {

ZvBuffer::ZvBuffer(unsigned char* data, size_t size) : data_(data), size_(size) {}

ZvBuffer::~ZvBuffer() { delete[] data_; }

// The base of all matching: nothing is consumed here, so that a look can never be one too many.
bool ZvBuffer::LooksAt(const char* text) const {
  const std::string_view wanted = text;
  return Remaining() >= wanted.size() && std::memcmp(Data(), wanted.data(), wanted.size()) == 0;
}

bool ZvBuffer::Accept(const char* text) {
  if (!LooksAt(text)) return false;
  position_ += std::strlen(text);
  return true;
}

int ZvBuffer::Expect(const char* text) { return Accept(text) ? 0 : VESK2_ERR_PARSE_FILE; }

int ZvBuffer::Peek() const { return Remaining() > 0 ? data_[position_] : -1; }
int ZvBuffer::Next() { return Remaining() > 0 ? data_[position_++] : -1; }

// As many as there are: who needs them all compares.
size_t ZvBuffer::Read(void* out, size_t length) {
  const unsigned char* const from = Data();
  const size_t count = Skip(length);
  if (count > 0) std::memcpy(out, from, count);
  return count;
}

size_t ZvBuffer::Skip(size_t length) {
  const size_t count = std::min(length, Remaining());
  position_ += count;
  return count;
}

// A copy, since the caller's bytes may go or change while they are parsed.
ZvBuffer* zv_buffer_wrap(const void* data, size_t size) {
  if (data == nullptr && size > 0) return nullptr;
  auto* const copy = new (std::nothrow) unsigned char[size];
  if (copy != nullptr && size > 0) std::memcpy(copy, data, size);
  return zv_buffer_adopt(copy, size);
}

// Takes the bytes on every path, so that its callers have nothing to free.
ZvBuffer* zv_buffer_adopt(unsigned char* data, size_t size) {
  std::unique_ptr<unsigned char[]> bytes(data);
  if (bytes == nullptr) return nullptr;
  ZvBuffer* buffer = new (std::nothrow) ZvBuffer(bytes.get(), size);
  if (buffer != nullptr) bytes.release();
  return buffer;
}

// The bytes are read, not mapped: a file that shrinks under a map kills the process that reads it.
int zv_buffer_read_file(ZvBuffer** out, const ZvPlace& place) {
  *out = nullptr;
  size_t size = 0;
  std::unique_ptr<unsigned char[]> bytes;
  if (const int code = zv_read_whole(bytes, &size, place, ZvVesk2::Limits::kMaxFile)) return code;
  *out = zv_buffer_adopt(bytes.release(), size);
  return *out != nullptr ? 0 : VESK2_ERR_MEM_ALLOC;
}

ZvBuffer* zv_buffer_wrap_file(const char* path) {
  ZvBuffer* buffer = nullptr;
  return zv_buffer_read_file(&buffer, {kZvNoDirectory, path}) == 0 ? buffer : nullptr;
}

void zv_buffer_free(ZvBuffer* buffer) { delete buffer; }

size_t ZvBuffer::Remaining() const { return size_ - position_; }
size_t ZvBuffer::Position() const { return position_; }
const unsigned char* ZvBuffer::Data() const { return data_ + position_; }

}  // namespace ZVsysutil
