// SPDX-License-Identifier: Apache-2.0
// The canonical form of a byte string:
//
//   <length in decimal> ":" <bytes>                 in memory and in lengths
//   ["[bin]" | "[utf-8]" | "[num]"] <the same>      in files and in digests that count hints
//
// 4:calc and [utf-8]4:calc are one string to every comparison, and two to a signature: what is
// signed is the form with hints, and a key is named by the digest of the form without.
#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include <cstring>
#include <initializer_list>
#include <string_view>

#include "src/frame/check.h"
#include "src/platform/crypto.h"
#include "src/platform/file.h"
#include "src/sexpr/atom_text.h"
#include "src/sexpr/read_atom.h"

namespace ZvVesk2 {
namespace {

// "<length>:"
class Prefix {
 public:
  explicit Prefix(unsigned length)
      : size_(static_cast<unsigned>(AtomText::WritePrefix(text_, length) - text_)) {}
  std::string_view Text() const { return {reinterpret_cast<const char*>(text_), size_}; }
  unsigned Size() const { return size_; }

 private:
  unsigned char text_[AtomText::kMaxPrefix];
  unsigned size_;
};

// Compares what is left with what is wanted: `pos + wanted` could wrap.
bool Fits(unsigned pos, unsigned wanted, unsigned size) {
  return pos <= size && wanted <= size - pos;
}

[[nodiscard]] int Feed(ZVCLMHashContextData* hash, std::string_view text, uint32_t handle) {
  return zvclm_HashUpdate(hash, reinterpret_cast<const unsigned char*>(text.data()), text.size(),
                          handle);
}

}  // namespace

// Collects the hint with its brackets, as the table of hints has it, up to Limits::kMaxHint bytes
// between them: the end of the input and a byte too many are the same error.
int ReadHint(ZvCursor& cursor, ByteString::BsType& type) {
  VESK2_REQUIRE(cursor.Accept('['), VESK2_ERR_PARSE_FILE);
  char text[Limits::kMaxHint + 2] = "[";
  size_t size = 1;
  for (int c = cursor.Next(); c != ']'; c = cursor.Next()) {
    VESK2_REQUIRE(c >= 0 && size <= Limits::kMaxHint, VESK2_ERR_PARSE_FILE);
    text[size++] = static_cast<char>(c);
  }
  text[size++] = ']';
  for (const ByteString::BsType known :
       {ByteString::BsBin, ByteString::BsUtf8, ByteString::BsNum}) {
    if (AtomText::Hint(known) != std::string_view(text, size)) continue;
    type = known;
    return 0;
  }
  return VESK2_ERR_PARSE_FILE;
}

// Reads over what the object held. Its array is reused where it fits, so the old bytes are gone
// before it is known whether the new ones are good: after a failure the string is empty.
int ByteString::Import(ZvBuffer* buffer) {
  VESK2_REQUIRE(buffer != nullptr, VESK2_ERR_PARAM_NULL);
  ZvCursor cursor(buffer);
  type = BsNone;
  const int code = ReadAtom(cursor, type, [this](const unsigned char* bytes, unsigned size) -> int {
    VESK2_TRY(Reserve(size));
    if (bytes != nullptr) std::memcpy(data, bytes, size);
    return 0;
  });
  if (code) Clear();
  return code;
}

int ByteString::ParseCanonical(DExpression*& out, unsigned char* buf, unsigned int size,
                               unsigned int& pos, Vesk2ContextStruct* context) {
  VESK2_REQUIRE(out == nullptr && buf != nullptr && size != 0, VESK2_ERR_INVALID_PARAM);
  unsigned count = 0;
  VESK2_TRY(ReadMemoryLength(count, buf, size, pos));
  Ref<ByteString> string(TryNew<ByteString>(context));
  VESK2_REQUIRE(string, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(string->Reserve(count));
  std::memcpy(string->data, buf + pos, count);
  pos += count;
  out = string.Release();
  return 0;
}

// Without the hint, as Export writes it. The length of a string near 4 GiB would wrap here; whoever
// sums over a list counts in 64 bits.
unsigned int ByteString::CanonicalLength() { return AtomText::PrefixSize(length) + length; }

// Where the prefix fits and the bytes do not, the prefix is written and `pos` is behind it.
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
  for (const std::string_view part : {AtomText::Hint(type), prefix.Text(), bytes}) {
    if (part.empty()) continue;
    VESK2_REQUIRE(ZVsysutil::zv_write(stream, part.data(), part.size()) == part.size(),
                  VESK2_ERR_WRITE_FILE);
  }
  return 0;
}

int ByteString::UpdateHash(ZVCLMHashContextData* hash, bool ignoreHints) {
  const uint32_t handle = CryptoHandle();
  const std::string_view hint = ignoreHints ? std::string_view() : AtomText::Hint(type);
  if (!hint.empty()) VESK2_TRY(Feed(hash, hint, handle));
  VESK2_TRY(Feed(hash, Prefix(length).Text(), handle));
  if (length == 0) return 0;
  return zvclm_HashUpdate(hash, data, length, handle);
}

}  // namespace ZvVesk2
