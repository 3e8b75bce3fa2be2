// SPDX-License-Identifier: Apache-2.0
// The canonical text of a byte string in memory, in line for the loops over whole expressions.
//
// Most strings are keywords and numbers of a few bytes, and what they cost is calls. So the loops
// ask IsPlain, and then write without a virtual call and with copies of a fixed size. That needs
// room: Write may touch kMaxHint + kMaxPrefix + Room(string) bytes, more than the text has, and the
// caller has tested that they are there and are its own.
#ifndef VESK2_SRC_SEXPR_ATOM_TEXT_H
#define VESK2_SRC_SEXPR_ATOM_TEXT_H

#include <charconv>
#include <cstring>
#include <string_view>
#include <typeinfo>

#include <vesk2/expression.h>

namespace ZvVesk2 {

class AtomText {
 public:
  // The most that stands in front of the bytes: "4294967295:".
  static constexpr unsigned kMaxPrefix = 11;

  // Whether the value, which is no list, is a ByteString itself. What derives from it may write
  // something else, and is asked by its virtual functions. Blocks hold nothing derived, so most
  // values are told apart without looking at their type.
  static bool IsPlain(const DExpression& value) {
    return value.place != 0 || &typeid(value) == &typeid(ByteString);
  }

  // The size of "<length>:". The loop stops at the largest power of ten in 32 bits, since the next
  // one would wrap.
  static unsigned PrefixSize(unsigned length) {
    unsigned size = 2;
    for (unsigned power = 10; length >= power; power *= 10) {
      ++size;
      if (power == 1'000'000'000) break;
    }
    return size;
  }
  static uint64_t Size(const ByteString& string) {
    return uint64_t{PrefixSize(string.length)} + string.length;
  }
  // Writes the prefix and returns its end. Lengths of one and two digits are nearly all there are.
  static unsigned char* WritePrefix(unsigned char* at, unsigned length) {
    if (length < 10) {
      *at++ = static_cast<unsigned char>('0' + length);
    } else if (length < 100) {
      *at++ = static_cast<unsigned char>('0' + length / 10);
      *at++ = static_cast<unsigned char>('0' + length % 10);
    } else {
      auto* const text = reinterpret_cast<char*>(at);
      at += std::to_chars(text, text + kMaxPrefix, length).ptr - text;
    }
    *at++ = ':';
    return at;
  }

  // The room that WriteBytes must find: a short string is copied with what is behind its length.
  static size_t Room(const ByteString& string) {
    return string.data == string.shortBytes ? ByteString::kShort : string.length;
  }
  // Writes the bytes, and returns their end. What is behind it within the room is anything, and is
  // overwritten by what comes next.
  static unsigned char* WriteBytes(unsigned char* at, const ByteString& string) {
    if (string.data == string.shortBytes) {
      std::memcpy(at, string.shortBytes, ByteString::kShort);
    } else if (string.length != 0) {
      std::memcpy(at, string.data, string.length);
    }
    return at + string.length;
  }

  // Writes the whole text and returns its end: "[bin]3:abc", without the hint when it is ignored.
  static unsigned char* Write(unsigned char* at, const ByteString& string, bool ignoreHints) {
    if (!ignoreHints && string.type != ByteString::BsNone) {
      const std::string_view hint = Hint(string.type);
      at += hint.copy(reinterpret_cast<char*>(at), hint.size());
    }
    return WriteBytes(WritePrefix(at, string.length), string);
  }

  // "[bin]" and the like; empty without a display hint.
  static std::string_view Hint(ByteString::BsType type) {
    switch (type) {
      case ByteString::BsBin:
        return "[bin]";
      case ByteString::BsUtf8:
        return "[utf-8]";
      case ByteString::BsNum:
        return "[num]";
      default:
        return {};
    }
  }
  static constexpr unsigned kMaxHint = 7;  // "[utf-8]"
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_SEXPR_ATOM_TEXT_H
