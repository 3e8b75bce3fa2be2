// SPDX-License-Identifier: Apache-2.0
// The canonical form of a byte string:
//
//   <length in decimal> ":" <bytes>                 in memory and in lengths
//   ["[bin]" | "[utf-8]" | "[num]"] <the same>      in files and in digests that count hints
#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include <charconv>
#include <cstring>
#include <string_view>

#include "src/frame/check.h"
#include "src/platform/crypto.h"
#include "src/platform/file.h"
#include "src/sexpr/chars.h"

namespace ZvVesk2 {
namespace {

struct Hint {
  ByteString::BsType type;
  std::string_view text;
};
constexpr Hint kHints[] = {
    {ByteString::BsBin, "[bin]"}, {ByteString::BsUtf8, "[utf-8]"}, {ByteString::BsNum, "[num]"}};

std::string_view HintText(ByteString::BsType type) {
  for (const Hint& hint : kHints) {
    if (hint.type == type) return hint.text;
  }
  return {};
}

// "<length>:"
class Prefix {
 public:
  explicit Prefix(unsigned length) {
    char* end = std::to_chars(text_, text_ + sizeof text_, length).ptr;
    *end++ = ':';
    size_ = static_cast<unsigned>(end - text_);
  }
  std::string_view Text() const { return {text_, size_}; }
  unsigned Size() const { return size_; }

 private:
  char text_[12];
  unsigned size_;
};

bool Fits(unsigned pos, unsigned wanted, unsigned size) {
  return pos <= size && wanted <= size - pos;
}

[[nodiscard]] int Feed(ZVCLMHashContextData* hash, std::string_view text, uint32_t handle) {
  return zvclm_HashUpdate(hash, reinterpret_cast<const unsigned char*>(text.data()), text.size(),
                          handle);
}

// Reads "[text]". A hint that is not closed, not known or too long is no hint.
[[nodiscard]] int ReadHint(ZvBuffer* buffer, ByteString::BsType& type) {
  VESK2_TRY(buffer->Expect("["));
  char text[Limits::kMaxHint + 2] = "[";
  size_t size = 1;
  for (int c = buffer->Next(); c != ']'; c = buffer->Next()) {
    VESK2_REQUIRE(c >= 0 && size <= Limits::kMaxHint, VESK2_ERR_PARSE_FILE);
    text[size++] = static_cast<char>(c);
  }
  text[size++] = ']';
  for (const Hint& hint : kHints) {
    if (hint.text != std::string_view(text, size)) continue;
    type = hint.type;
    return 0;
  }
  return VESK2_ERR_PARSE_FILE;
}

// Reads "<digits>:". Leading zeros are accepted, and so are no digits at all, for 0.
[[nodiscard]] int ReadLength(ZvBuffer* buffer, unsigned& length) {
  length = 0;
  unsigned digits = 0;
  while (IsDigit(buffer->Peek())) {
    VESK2_REQUIRE(digits++ < Limits::kMaxLengthDigits, VESK2_ERR_MAX_BYTE_STRING);
    length = length * 10 + static_cast<unsigned>(buffer->Next() - '0');
  }
  VESK2_REQUIRE(length <= Limits::kMaxByteString, VESK2_ERR_MAX_BYTE_STRING);
  return buffer->Expect(":");
}

}  // namespace

int ByteString::Import(ZvBuffer* buffer) {
  VESK2_REQUIRE(buffer != nullptr, VESK2_ERR_PARAM_NULL);
  const auto read = [&]() -> int {
    type = BsNone;
    if (buffer->Peek() == '[') VESK2_TRY(ReadHint(buffer, type));
    unsigned size = 0;
    VESK2_TRY(ReadLength(buffer, size));
    VESK2_TRY(Reserve(size));
    VESK2_REQUIRE(buffer->Read(data, size) == size, VESK2_ERR_PARSE_FILE);
    return 0;
  };
  const int code = read();
  if (code) Clear();
  return code;
}

// A byte string in memory is accepted with any byte for its ":" except at position 0, where Expect
// compares it.
int ByteString::ParseCanonical(DExpression*& out, unsigned char* buf, unsigned int size,
                               unsigned int& pos, Vesk2ContextStruct* context) {
  VESK2_REQUIRE(out == nullptr && buf != nullptr && size != 0, VESK2_ERR_INVALID_PARAM);
  while (pos < size && IsSpace(buf[pos])) ++pos;
  uint64_t length = 0;
  for (; pos < size && IsDigit(buf[pos]); ++pos) {
    if (length < size) length = length * 10 + (buf[pos] - unsigned{'0'});  // beyond, it cannot fit
  }
  VESK2_TRY(Expect(":", buf, size, pos));
  VESK2_REQUIRE(length <= size - pos, VESK2_ERR_BUFFER_OVERFLOW);

  const auto count = static_cast<unsigned>(length);
  Ref<ByteString> string(TryNew<ByteString>(context));
  VESK2_REQUIRE(string, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(string->Reserve(count));
  std::memcpy(string->data, buf + pos, count);
  pos += count;
  out = string.Release();
  return 0;
}

unsigned int ByteString::CanonicalLength() { return Prefix(length).Size() + length; }

int ByteString::Export(unsigned char* buf, unsigned int& pos, unsigned int size) {
  VESK2_REQUIRE(buf != nullptr, VESK2_ERR_INVALID_PARAM);
  const Prefix prefix(length);
  VESK2_REQUIRE(Fits(pos, prefix.Size(), size), VESK2_ERR_BUFFER_OVERFLOW);
  std::memcpy(buf + pos, prefix.Text().data(), prefix.Size());
  pos += prefix.Size();
  VESK2_REQUIRE(Fits(pos, length, size), VESK2_ERR_BUFFER_OVERFLOW);
  if (length != 0) std::memcpy(buf + pos, data, length);
  pos += length;
  return 0;
}

int ByteString::PrintCanonical(FILE* stream) {
  VESK2_REQUIRE(stream != nullptr, VESK2_ERR_PARAM_NULL);
  const Prefix prefix(length);
  const std::string_view bytes(reinterpret_cast<const char*>(data), length);
  for (const std::string_view part : {HintText(type), prefix.Text(), bytes}) {
    if (part.empty()) continue;
    VESK2_REQUIRE(ZVsysutil::zv_write(stream, part.data(), part.size()) == part.size(),
                  VESK2_ERR_WRITE_FILE);
  }
  return 0;
}

int ByteString::UpdateHash(ZVCLMHashContextData* hash, bool ignoreHints) {
  const uint32_t handle = CryptoHandle();
  const std::string_view hint = ignoreHints ? std::string_view() : HintText(type);
  if (!hint.empty()) VESK2_TRY(Feed(hash, hint, handle));
  VESK2_TRY(Feed(hash, Prefix(length).Text(), handle));
  if (length == 0) return 0;
  return zvclm_HashUpdate(hash, data, length, handle);
}

}  // namespace ZvVesk2
