// SPDX-License-Identifier: Apache-2.0
// What the fuzz targets share: a buffer over the input, the printed form of an expression, and a
// check that stays on in every build.
#ifndef VESK2_FUZZ_SUPPORT_H
#define VESK2_FUZZ_SUPPORT_H

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>
#include <vesk2.hpp>

namespace vesk2fuzz {

#define FUZZ_CHECK(condition)                                              \
  do {                                                                     \
    if (!(condition)) {                                                    \
      std::fprintf(stderr, "%s:%d: %s\n", __FILE__, __LINE__, #condition); \
      std::abort();                                                        \
    }                                                                      \
  } while (false)

struct BufferFree {
  void operator()(ZvVesk2::ZvBuffer* buffer) const { ZVsysutil::zv_buffer_free(buffer); }
};
using Buffer = std::unique_ptr<ZvVesk2::ZvBuffer, BufferFree>;

inline Buffer Wrap(const std::string& text) {
  return Buffer(ZVsysutil::zv_buffer_wrap(text.data(), text.size()));
}

// The canonical form with hints.
inline std::string Print(ZvVesk2::DExpression* value) {
  char* text = nullptr;
  size_t size = 0;
  FILE* stream = open_memstream(&text, &size);
  const int rc = value->PrintCanonical(stream);
  std::fclose(stream);
  std::string out(text, size);
  std::free(text);
  FUZZ_CHECK(rc == 0);
  return out;
}

}  // namespace vesk2fuzz

#endif  // VESK2_FUZZ_SUPPORT_H
