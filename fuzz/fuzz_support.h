// SPDX-License-Identifier: Apache-2.0
// What the fuzz targets share: how one is written, a check that stays on in every build, a buffer
// over the input, the written form of a value, and choices out of bytes.
//
//   FUZZ_TARGET(cert) { RoundTrip<Cert>(input); }
//
// is a libFuzzer program of its own, or with VESK2_REPLAY a row of the program that replays the
// corpora (replay.cpp).
#ifndef VESK2_FUZZ_SUPPORT_H
#define VESK2_FUZZ_SUPPORT_H

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <map>
#include <memory>
#include <string>
#include <string_view>

#include <vesk2.hpp>

#define FUZZ_CHECK(condition) FUZZ_CHECK_ABOUT(condition, std::string())
// With a text that says what it is about, which is only made when the check fails.
#define FUZZ_CHECK_ABOUT(condition, text)                                                      \
  do {                                                                                         \
    if (!(condition)) {                                                                        \
      std::fprintf(stderr, "%s:%d: %s\n%s\n", __FILE__, __LINE__, #condition, (text).c_str()); \
      std::abort();                                                                            \
    }                                                                                          \
  } while (false)

#ifdef VESK2_REPLAY
#define FUZZ_TARGET(name)                                      \
  static void Fuzz_##name(std::string_view input);             \
  [[maybe_unused]] static const bool kListed_##name =          \
      vesk2fuzz::Targets().emplace(#name, Fuzz_##name).second; \
  static void Fuzz_##name(std::string_view input)
#else
#define FUZZ_TARGET(name)                                                   \
  static void Fuzz_##name(std::string_view input);                          \
  extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) { \
    Fuzz_##name({reinterpret_cast<const char*>(data), size});               \
    return 0;                                                               \
  }                                                                         \
  static void Fuzz_##name(std::string_view input)
#endif

namespace vesk2fuzz {

using ZvVesk2::Ref;

// The targets of a program that replays them.
using Target = void (*)(std::string_view input);
inline std::map<std::string, Target>& Targets() {
  static std::map<std::string, Target> targets;
  return targets;
}

struct BufferFree {
  void operator()(ZvVesk2::ZvBuffer* buffer) const { ZVsysutil::zv_buffer_free(buffer); }
};
using Buffer = std::unique_ptr<ZvVesk2::ZvBuffer, BufferFree>;
inline Buffer Wrap(std::string_view text) {
  return Buffer(ZVsysutil::zv_buffer_wrap(text.data(), text.size()));
}

// What the library made with new[].
struct TextFree {
  void operator()(void* text) const { Vesk2Free(text); }
};
using Text = std::unique_ptr<char, TextFree>;
using Bytes = std::unique_ptr<unsigned char, TextFree>;

// The canonical form of bytes: "4:calc".
std::string Token(std::string_view bytes);
// The canonical form with hints.
std::string Print(ZvVesk2::DExpression* value);
// The canonical form without hints; empty for what cannot be written.
std::string ExportOf(ZvVesk2::SExpression* value);
// A text that the buffer reader took, without the zeros before its lengths: readers take them, and
// no digits for 0, but nobody writes them.
std::string WithoutZeros(std::string_view canonical);

// Reads as many choices as there are bytes; after the last it always takes the first way.
class Choices {
 public:
  explicit Choices(std::string_view bytes) : rest_(bytes) {}
  unsigned Below(unsigned limit) { return limit == 0 ? 0 : Byte() % limit; }
  bool Chance(unsigned one_of) { return Below(one_of) == one_of - 1; }
  bool Empty() const { return rest_.empty(); }
  // At most `limit` bytes as they are.
  std::string_view Take(size_t limit);

 private:
  unsigned Byte();
  std::string_view rest_;
};

}  // namespace vesk2fuzz

#endif  // VESK2_FUZZ_SUPPORT_H
