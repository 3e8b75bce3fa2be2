// SPDX-License-Identifier: Apache-2.0
// Between text and the library's objects: buffers to import from, and what an object writes.
// Inline, since the programs that link the support files do not all link the classes.
#ifndef VESK2_TESTS_SUPPORT_TEST_OBJECT_H
#define VESK2_TESTS_SUPPORT_TEST_OBJECT_H

#include <cstdio>
#include <cstdlib>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>

#include <vesk2/expression.h>
#include <vesk2/ref.h>

namespace vesk2test {

struct BufferFree {
  void operator()(ZVsysutil::ZvBuffer* buffer) const { ZVsysutil::zv_buffer_free(buffer); }
};
using BufferPtr = std::unique_ptr<ZVsysutil::ZvBuffer, BufferFree>;

// A buffer over a copy of `text`.
inline BufferPtr Wrap(std::string_view text) {
  return BufferPtr(ZVsysutil::zv_buffer_wrap(text.data(), text.size()));
}

// The canonical text of an object, display hints included.
inline std::string Canonical(ZvVesk2::DExpression& object) {
  char* text = nullptr;
  size_t size = 0;
  FILE* const stream = open_memstream(&text, &size);
  if (stream == nullptr) throw std::runtime_error("no memory stream");
  const int code = object.PrintCanonical(stream);
  std::fclose(stream);
  std::string result(text, size);
  std::free(text);
  if (code != 0) throw std::runtime_error("PrintCanonical: " + std::to_string(code));
  return result;
}
template <typename T>
std::string Canonical(const ZvVesk2::Ref<T>& object) {
  return Canonical(*object);
}

// The bytes of a byte string; empty for null.
inline std::string Bytes(const ZvVesk2::ByteString* value) {
  if (value == nullptr || value->GetLength() == 0) return {};
  return {reinterpret_cast<const char*>(value->GetData()), value->GetLength()};
}

// A list parsed from canonical text, hints allowed; throws when it cannot be read.
inline ZvVesk2::Ref<ZvVesk2::SExpression> Parse(std::string_view text) {
  ZvVesk2::Ref<ZvVesk2::SExpression> list;
  const BufferPtr buffer = Wrap(text);
  if (const int code = ZvVesk2::SExpression::Import(list.Out(), buffer.get(), nullptr)) {
    throw std::runtime_error("Parse: " + std::to_string(code));
  }
  return list;
}

}  // namespace vesk2test

#endif  // VESK2_TESTS_SUPPORT_TEST_OBJECT_H
