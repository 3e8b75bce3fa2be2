// SPDX-License-Identifier: Apache-2.0
// See text_writer.h. Everything that a stranger wrote goes through Escaped: a name in an
// explanation must not move the cursor, forge a line, or turn the direction of what follows.
#include "src/trust/text_writer.h"

#include <algorithm>
#include <charconv>

#include <vesk2/context.h>
#include <vesk2/hash.h>
#include <vesk2/ref.h>

#include "src/frame/check.h"
#include "src/platform/text.h"

namespace ZvVesk2 {
namespace {

// A missing word has no bytes.
std::string_view BytesOf(const ByteString* word) {
  if (word == nullptr) return {};
  return {reinterpret_cast<const char*>(word->GetData()), word->GetLength()};
}

// The length of the UTF-8 sequence at the start of `text` and its code point; 0 for none. Overlong
// forms, surrogates and what lies past U+10FFFF are none.
size_t DecodeUtf8(std::string_view text, char32_t& point) {
  const auto lead = static_cast<unsigned char>(text[0]);
  const size_t length = lead < 0x80 ? 1 : lead < 0xc2 ? 0 : lead < 0xe0 ? 2 : lead < 0xf0 ? 3 : 4;
  if (length == 0 || lead > 0xf4 || text.size() < length) return 0;
  point = length == 1 ? lead : lead & (0x7fU >> length);
  for (size_t i = 1; i < length; ++i) {
    const auto next = static_cast<unsigned char>(text[i]);
    if ((next & 0xc0U) != 0x80) return 0;
    point = (point << 6) | (next & 0x3fU);
  }
  constexpr char32_t kLeast[] = {0, 0, 0x80, 0x800, 0x10000};
  const bool surrogate = point >= 0xd800 && point < 0xe000;
  return point < kLeast[length] || point > 0x10ffff || surrogate ? 0 : length;
}

// What a terminal does something with instead of showing it. Letters of every language stay
// readable.
bool IsUnsafe(char32_t point) {
  constexpr struct {
    char32_t first, last;
  } kUnsafe[] = {
      {0x00, 0x1f},     {0x7f, 0x9f},      // control characters
      {0x200e, 0x200f}, {0x2028, 0x202e},  // line breaks, marks that turn the direction of text
      {0x2066, 0x2069},
  };
  for (const auto& range : kUnsafe) {
    if (point >= range.first && point <= range.last) return true;
  }
  return false;
}

// Two stamps that are the same text are one moment.
bool IsMoment(const TimeStamp* notBefore, const TimeStamp* notAfter) {
  return notBefore != nullptr && notAfter != nullptr && !notBefore->IsBefore(notAfter) &&
         !notBefore->IsAfter(notAfter);
}

}  // namespace

// After a failure nothing is written any more: half a sentence must not be taken for a whole one.
bool TextWriter::Reserve(size_t more) {
  if (code_ != 0) return false;
  if (more < capacity_ - length_) return true;  // the terminator has its place
  const size_t larger = std::max(length_ + more + 1, capacity_ * 2);
  std::unique_ptr<char[]> moved(TryNewArray<char>(larger));
  if (!moved) {
    code_ = VESK2_ERR_MEM_ALLOC;
    return false;
  }
  std::copy_n(text_.get(), length_, moved.get());
  text_ = std::move(moved);
  capacity_ = larger;
  return true;
}

TextWriter& TextWriter::operator<<(std::string_view text) {
  if (!Reserve(text.size())) return *this;
  std::copy(text.begin(), text.end(), text_.get() + length_);
  length_ += text.size();
  return *this;
}

TextWriter& TextWriter::operator<<(size_t number) {
  char digits[24];
  const auto end = std::to_chars(digits, digits + sizeof digits, number).ptr;
  return *this << std::string_view(digits, static_cast<size_t>(end - digits));
}

void TextWriter::Hex(const unsigned char* bytes, size_t length) {
  constexpr char kDigits[] = "0123456789abcdef";
  if (!Reserve(2 * length)) return;
  for (size_t i = 0; i < length; ++i) {
    text_[length_++] = kDigits[bytes[i] >> 4];
    text_[length_++] = kDigits[bytes[i] & 15];
  }
}

// What is no UTF-8 is told byte by byte, and decoding goes on behind that byte, so that nothing
// hides in a broken sequence. A backslash is doubled: an escape can then not be forged by writing
// one.
TextWriter& TextWriter::Escaped(std::string_view bytes) {
  while (!bytes.empty()) {
    char32_t point = 0;
    size_t length = DecodeUtf8(bytes, point);
    const bool plain = length != 0 && !IsUnsafe(point);
    // One byte on, and try again from there.
    if (length == 0) length = 1;
    for (const char byte : bytes.substr(0, length)) {
      const auto value = static_cast<unsigned char>(byte);
      if (!plain) (*this << "\\x").Hex(&value, 1);
      if (plain) *this << (byte == '\\' ? "\\\\" : std::string_view(&byte, 1));
    }
    bytes.remove_prefix(length);
  }
  return *this;
}

// Without hints: the identity of a key must not change with how it is shown.
TextWriter& TextWriter::Fingerprint(DExpression* expression) {
  unsigned char* digest = nullptr;
  unsigned int length = 0;
  // NOLINTNEXTLINE(clang-analyzer-core.CallAndMessage): callers have a value to tell of
  const int code = expression->ComputeHash(digest, length, ZVCLM_HASH_SHA256, true);
  const std::unique_ptr<unsigned char[]> owner(digest);
  if (code_ == 0) code_ = InOwnWords(code);
  *this << "sha256:";
  Hex(digest, length);
  return *this;
}

// A hash is told as it says itself, which is not the fingerprint of the hash.
TextWriter& TextWriter::Of(Subject* subject) {
  if (const auto* hash = dynamic_cast<Hash*>(subject)) {
    *this << (hash->GetAlgorithm() == ZVCLM_HASH_SHA256 ? "sha256:"
              : hash->GetAlgorithm() == ZVCLM_HASH_SHA1 ? "sha1:"
                                                        : "rmd160:");
    if (const ByteString* digest = hash->GetDigest()) Hex(digest->GetData(), digest->GetLength());
    return *this;
  }
  auto* const threshold = dynamic_cast<ThresholdSubject*>(subject);
  if (threshold == nullptr) return Fingerprint(subject);
  *this << size_t{threshold->GetK()} << " of";
  Ref<SExpression> members;
  const int code = threshold->GetSubjects(members.Out());
  if (code_ == 0) code_ = code;
  if (code_ != 0) return *this;
  for (auto it = members->Begin(); it; it.Next()) (*this << " ").Fingerprint(it.Value());
  return *this;
}

// The root as it is set now: an explanation is told in the process that verified.
std::unique_ptr<char[]> TextWriter::StorePath() {
  std::unique_ptr<char[]> path(
      ZVsysutil::zv_join_path(VeskConf::GetGlobalDirectory(), AclEntry::DirectoryName(true)));
  if (!path && code_ == 0) code_ = VESK2_ERR_MEM_ALLOC;
  return path;
}

TextWriter& TextWriter::AclStore() {
  const std::unique_ptr<char[]> path = StorePath();
  return path ? Escaped(path.get()) : *this;
}

// The bare name for the store's own, as administrators know it; a path for all others, so that a
// file of that name elsewhere is not taken for it.
TextWriter& TextWriter::Of(const AclEntry* entry) {
  const std::string_view path = entry->GetFileName() != nullptr ? entry->GetFileName() : "";
  const std::unique_ptr<char[]> store = StorePath();
  const std::string_view directory = store ? store.get() : "";
  const bool inStore = path.size() > directory.size() && path.starts_with(directory) &&
                       path[directory.size()] == '/' && path.rfind('/') == directory.size();
  return Escaped(inStore ? path.substr(directory.size() + 1) : path);
}

// All bytes of the text, not those up to the first 0: two tags must not read the same because one
// goes on behind it.
TextWriter& TextWriter::List(SExpression* list, std::string_view keyword) {
  if (code_ != 0) return *this;
  const unsigned int size = list->AdvancedLength();
  if (size > Limits::kMaxExport) code_ = VESK2_ERR_BUFFER_OVERFLOW;
  const std::unique_ptr<unsigned char[]> bytes(
      code_ == 0 ? TryNewArray<unsigned char>(size_t{size} + 1) : nullptr);
  unsigned int length = 0;
  if (code_ == 0)
    // The text of an empty list wants one byte more than its length says.
    code_ = bytes ? list->ExportAdvanced(bytes.get(), length, size + 1) : VESK2_ERR_MEM_ALLOC;
  if (code_ != 0) return *this;
  std::string_view text(reinterpret_cast<const char*>(bytes.get()), length);
  if (!keyword.empty() && text.size() > keyword.size() + 2 && text[0] == '(' &&
      text.substr(1).starts_with(keyword) && text[keyword.size() + 1] == ' ') {
    text = text.substr(keyword.size() + 2, text.size() - keyword.size() - 3);
  }
  return Escaped(text);
}

// No tag grants everything, and is told so: an empty text would read as nothing.
TextWriter& TextWriter::Tag(SExpression* tag) {
  return tag != nullptr ? List(tag, "tag") : *this << "everything";
}

TextWriter& TextWriter::Of(const TimeStamp* stamp) { return Escaped(BytesOf(stamp)); }

TextWriter& TextWriter::Period(const TimeStamp* notBefore, const TimeStamp* notAfter) {
  if (notBefore == nullptr && notAfter == nullptr) return *this << "always";
  if (IsMoment(notBefore, notAfter)) return (*this << "at ").Of(notBefore);
  if (notBefore != nullptr) (*this << "from ").Of(notBefore);
  if (notBefore != nullptr && notAfter != nullptr) *this << " ";
  return notAfter != nullptr ? (*this << "until ").Of(notAfter) : *this;
}

// Words for people, and the name for whoever looks it up.
TextWriter& TextWriter::Code(int code) {
  const std::string_view words = V2CodeWords(code);
  const char* const name = V2CodeName(code);
  if (!words.empty()) *this << words << " (";
  if (name != nullptr) *this << name;
  if (name == nullptr)
    *this << "code " << (code < 0 ? "-" : "") << static_cast<size_t>(code < 0 ? -code : code);
  return words.empty() ? *this : *this << ")";
}

// The first failure of all that was written. The writer is empty afterwards, and may be used again
// when it did not fail.
int TextWriter::Take(std::unique_ptr<char[]>& out) {
  static_cast<void>(Reserve(0));
  VESK2_TRY(code_);
  text_[length_] = 0;
  out = std::move(text_);
  length_ = capacity_ = 0;
  return 0;
}

}  // namespace ZvVesk2
