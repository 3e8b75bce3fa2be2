// SPDX-License-Identifier: Apache-2.0
// ByteString, an atom: bytes with a display hint, and the rule by which its array is reused.
//
// `data` is null until there were any bytes, the object's own `shortBytes` for up to kShort of
// them, or an array from new[] that the object owns. `length` is what counts, not the array's size:
// an array that was kept for a shorter string is larger, and only its beginning is the string.
#include <vesk2/expression.h>

#include <cstring>
#include <memory>
#include <string_view>
#include <utility>

#include "src/frame/check.h"
#include "src/platform/text.h"

namespace ZvVesk2 {
namespace {

// An array may be this much larger than what it is reused for: an object that is read again mostly
// gets values of nearly the same length.
constexpr unsigned kReuseSlack = 8;

// Judges by the length that the string had, since the array's own size is not kept. So an array is
// never reused for a longer string, not even one that would fit.
bool IsReusable(const unsigned char* data, unsigned length, unsigned wanted) {
  return data != nullptr && length >= wanted && length - wanted < kReuseSlack;
}

}  // namespace

ByteString::ByteString(Vesk2ContextStruct* owner) : DExpression(owner) {}

ByteString::ByteString(unsigned char* adopted, unsigned int size, BsType hint,
                       Vesk2ContextStruct* owner)
    : DExpression(owner), type(hint), length(adopted != nullptr ? size : 0), data(adopted) {}

ByteString::~ByteString() { Clear(); }

int ByteString::Set(const unsigned char* bytes, unsigned int size, BsType hint) {
  VESK2_REQUIRE(bytes != nullptr && size != 0, VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(size <= Limits::kMaxByteString, VESK2_ERR_MAX_BYTE_STRING);
  // `bytes` may lie within the array that is replaced, so that one outlives the copy. Within
  // `shortBytes` they stay where they are, and may overlap with their new place.
  std::unique_ptr<unsigned char[]> replaced;
  if (data != shortBytes && !IsReusable(data, length, size)) {
    replaced.reset(std::exchange(data, nullptr));
  }
  VESK2_TRY(Reserve(size));
  std::memmove(data, bytes, size);
  type = hint;
  return 0;
}

int ByteString::Set(const char* text, BsType hint) {
  VESK2_REQUIRE(text != nullptr, VESK2_ERR_INVALID_PARAM);
  const size_t size = std::strlen(text);
  VESK2_REQUIRE(size <= Limits::kMaxByteString, VESK2_ERR_MAX_BYTE_STRING);
  return Set(reinterpret_cast<const unsigned char*>(text), static_cast<unsigned>(size), hint);
}

// After success `data` is not null, also for 0 bytes; the hint is as it was. After a failure the
// string is empty, never one with a length and no bytes.
int ByteString::Reserve(unsigned int size) {
  if (!IsReusable(data, length, size)) {
    Clear();
    data = size <= kShort ? shortBytes : TryNewArray<unsigned char>(size);
    VESK2_REQUIRE(data != nullptr, VESK2_ERR_MEM_ALLOC);
  }
  length = size;
  return 0;
}

void ByteString::Clear() {
  if (data != shortBytes) delete[] data;
  data = nullptr;
  length = 0;
}

// The test of keywords. A string with a 0 byte in it equals no text, since a text ends there.
bool ByteString::IsEqual(const char* text) const {
  if (text == nullptr) return false;
  const std::string_view wanted(text);
  return wanted.size() == length && (length == 0 || std::memcmp(wanted.data(), data, length) == 0);
}

// A string that never had bytes has null data, which the copy would take for a missing text.
char* ByteString::ToString() {
  return ZVsysutil::zv_atof_copy_n(data != nullptr ? static_cast<const void*>(data) : "", length);
}

bool ByteString::IsSExpression() const { return false; }
ByteString::BsType ByteString::GetType() const { return type; }
unsigned int ByteString::GetLength() const { return length; }
const unsigned char* ByteString::GetData() const { return data; }

}  // namespace ZvVesk2
