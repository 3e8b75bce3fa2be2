// SPDX-License-Identifier: Apache-2.0
// The advanced form of a byte string: a bare run of bytes without white space or parentheses. What
// is written is the bytes as they are, so it need not read back. There is no quoting and no hint:
// the form is for people, and whoever shows it escapes it first (Wording::Escape).
#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include <algorithm>
#include <charconv>
#include <climits>
#include <cstring>

#include "src/frame/check.h"
#include "src/sexpr/advanced.h"

namespace ZvVesk2 {
namespace {

// A token may be empty: at a parenthesis it ends before it began. That is how "()" and "((a) b)"
// come to have an empty string in first place.
bool EndsToken(char c) { return c == '\0' || c == '(' || c == ')' || IsSpace(c); }

}  // namespace

int ByteString::ParseAdvanced(DExpression*& out, const char* text, unsigned int& pos,
                              Vesk2ContextStruct* context) {
  VESK2_REQUIRE(out == nullptr && text != nullptr, VESK2_ERR_INVALID_PARAM);
  SkipSpace(text, pos);
  size_t size = 0;
  while (!EndsToken(text[pos + size])) ++size;
  // The form at a position takes text of any length; what `pos` cannot count is refused.
  VESK2_REQUIRE(size <= UINT_MAX - pos, VESK2_ERR_INVALID_S_EXPRESSION);

  Ref<ByteString> token(TryNew<ByteString>(context));
  VESK2_REQUIRE(token, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(token->Reserve(static_cast<unsigned>(size)));
  std::memcpy(token->data, text + pos, size);
  pos += static_cast<unsigned>(size);
  out = token.Release();
  return 0;
}

unsigned int ByteString::AdvancedLength() { return length + 1; }

// The bound is strict: a byte beyond the terminator must be there, as a list around the string has
// one for its ")". A string by itself needs AdvancedLength() + 1 bytes.
int ByteString::ExportAdvanced(unsigned char* buf, unsigned int& pos, unsigned int size) {
  VESK2_REQUIRE(buf != nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(uint64_t{pos} + length + 1 < size, VESK2_ERR_BUFFER_OVERFLOW);
  if (length != 0) std::memcpy(buf + pos, data, length);
  pos += length;
  buf[pos] = '\0';
  return 0;
}

// Bytes that may be anything are left out rather than guessed at. UTF-8 goes out unchecked: it is
// the callback that has to escape what a terminal would obey.
int ByteString::PrintAdvanced(int (*write)(const char* text, unsigned int length, void* user),
                              void* user, int /*depth*/) {
  if (write == nullptr) return 0;
  const char* text = data != nullptr ? reinterpret_cast<const char*>(data) : "";
  switch (type) {
    case BsNone:
      if (std::all_of(data, data + length, IsPrintable)) write(text, length, user);
      break;
    case BsUtf8:
      write(text, length, user);
      break;
    case BsNum:
      // A count is one byte (the k and n of a k-of-n), and only the first is printed. A string of
      // digits that has this hint shows its first digit's code, not its number.
      if (length != 0) {
        char number[32];
        // NOLINTNEXTLINE(clang-analyzer-core.NullDereference): what has a length has bytes
        const char* end = std::to_chars(number, number + sizeof number, unsigned{data[0]}).ptr;
        write(number, static_cast<unsigned>(end - number), user);
      }
      break;
    case BsBin:
    default:
      break;
  }
  return 0;
}

}  // namespace ZvVesk2
