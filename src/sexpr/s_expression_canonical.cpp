// SPDX-License-Identifier: Apache-2.0
// Lists in canonical form, "(" elements ")", written, measured and hashed.
//
// Four visitors of one walk (Walk::Through): Writer and Measure leave hints out, Printer puts them
// in, Feeder is told. One walk for all means that the length, the bytes and the digest of a list
// cannot disagree about its order. Derived strings are asked by their virtual functions.
#include <vesk2/expression.h>

#include <climits>
#include <memory>

#include "src/frame/check.h"
#include "src/platform/crypto.h"
#include "src/platform/file.h"
#include "src/sexpr/atom_text.h"
#include "src/sexpr/walk.h"

namespace ZvVesk2 {
namespace {

// Whose the bytes behind the written ones are. In an array of our own, which is filled to its end,
// a short string may be copied with what is behind it; a caller's bytes beyond `pos` must stay.
enum class Behind { kOurs, kTheCallers };

// The room that a byte string surely fits into with all that may stand before it, and that
// AtomText::Write may touch.
size_t SafeRoom(const ByteString& string) {
  return AtomText::kMaxHint + AtomText::kMaxPrefix + AtomText::Room(string);
}

// Writes a list at `pos`. Each parenthesis needs `spare` further bytes of room for the outermost
// list, one for lists within. In a caller's array that is one byte beyond the last ")", as programs
// have always had to give it. An array of exactly CanonicalLength() bytes has none to spare; there
// the lists within find theirs in the ")" that is still to come.
struct Writer {
  [[nodiscard]] int Parenthesis(char which, unsigned level) {
    const unsigned needed = level == 1 ? spare : 1;
    VESK2_REQUIRE(uint64_t{pos} + needed < size, VESK2_ERR_BUFFER_OVERFLOW);
    buf[pos++] = static_cast<unsigned char>(which);
    return 0;
  }
  [[nodiscard]] int Atom(DExpression& value) {
    if (behind == Behind::kOurs && AtomText::IsPlain(value)) {
      const auto& string = static_cast<const ByteString&>(value);
      if (SafeRoom(string) <= size - pos) {
        pos = static_cast<unsigned>(AtomText::Write(buf + pos, string, true) - buf);
        return 0;
      }
    }
    // A string that does not fit is left out; only parentheses report a lack of room.
    unsigned moved = pos;
    (void)value.Export(buf, moved, size);
    pos = moved;
    return 0;
  }

  unsigned char* buf;
  unsigned size;
  unsigned spare;
  Behind behind;
  unsigned pos;
};

// Counts in 64 bits: elements that are shared can sum to more than any array holds.
struct Measure {
  [[nodiscard]] int Parenthesis(char /*which*/, unsigned /*level*/) {
    ++length;
    return 0;
  }
  [[nodiscard]] int Atom(DExpression& value) {
    length += AtomText::IsPlain(value) ? AtomText::Size(static_cast<const ByteString&>(value))
                                       : value.CanonicalLength();
    return 0;
  }

  uint64_t length = 0;
};

// The form of files: hints are written, by the strings themselves.
struct Printer {
  [[nodiscard]] int Parenthesis(char which, unsigned /*level*/) {
    return ZVsysutil::zv_write(stream, &which, 1) == 1 ? 0 : VESK2_ERR_WRITE_FILE;
  }
  [[nodiscard]] int Atom(DExpression& value) { return value.PrintCanonical(stream); }

  FILE* stream;
};

// Texts go straight into the block of the running hash as long as there is room. `at` and `end` are
// the hash's own `next` and `end`, held here for the loop; they are handed back before the hash is
// called and read again after it. Write may scribble behind a short string's end: that is the
// block's free part.
struct Feeder {
  [[nodiscard]] int Parenthesis(char which, unsigned /*level*/) {
    const auto byte = static_cast<unsigned char>(which);
    if (at != end) {
      *at++ = byte;
      return 0;
    }
    hash->next = at;
    return Follow(zvclm_HashUpdate(hash, &byte, 1, 0));
  }
  [[nodiscard]] int Atom(DExpression& value) {
    if (AtomText::IsPlain(value)) {
      const auto& string = static_cast<const ByteString&>(value);
      if (SafeRoom(string) <= static_cast<size_t>(end - at)) {
        at = AtomText::Write(at, string, ignoreHints);
        return 0;
      }
    }
    hash->next = at;
    return Follow(value.UpdateHash(hash, ignoreHints));
  }
  // The hash moved on by itself.
  [[nodiscard]] int Follow(int code) {
    at = hash->next;
    end = hash->end;
    return code;
  }

  ZVCLMHashContextData* hash;
  bool ignoreHints;
  unsigned char* at;
  unsigned char* end;
};

}  // namespace

unsigned int SExpression::CanonicalLength() {
  Measure measure;
  const int code = Walk::Through(this, measure);
  return code == 0 && measure.length < UINT_MAX ? static_cast<unsigned>(measure.length) : UINT_MAX;
}

int SExpression::Export(unsigned char* buf, unsigned int& pos, unsigned int size) {
  VESK2_REQUIRE(buf != nullptr, VESK2_ERR_INVALID_PARAM);
  Writer writer{buf, size, 1, Behind::kTheCallers, pos};
  const int code = Walk::Through(this, writer);
  pos = writer.pos;
  return code;
}

int SExpression::Export(unsigned char*& out, unsigned int& length) {
  VESK2_REQUIRE(out == nullptr, VESK2_ERR_INVALID_PARAM);
  length = CanonicalLength();
  VESK2_REQUIRE(length <= Limits::kMaxExport, VESK2_ERR_BUFFER_OVERFLOW);
  std::unique_ptr<unsigned char[]> bytes(TryNewArray<unsigned char>(length));
  VESK2_REQUIRE(bytes != nullptr, VESK2_ERR_MEM_ALLOC);
  Writer writer{bytes.get(), length, 0, Behind::kOurs, 0};
  VESK2_TRY(Walk::Through(this, writer));
  out = bytes.release();
  return 0;
}

int SExpression::PrintCanonical(FILE* stream) {
  VESK2_REQUIRE(stream != nullptr, VESK2_ERR_INVALID_PARAM);
  Printer printer{stream};
  VESK2_TRY(Walk::Through(this, printer));
  // Bytes that stay in the stream's buffer could still be lost without anybody being told.
  VESK2_REQUIRE(std::fflush(stream) == 0, VESK2_ERR_WRITE_FILE);
  return 0;
}

// The hash gets its position back in any case: after a failure it holds what came before.
int SExpression::UpdateHash(ZVCLMHashContextData* hash, bool ignoreHints) {
  VESK2_REQUIRE(hash != nullptr, ZVCLM_ERR_NULL_PARAM);
  Feeder feeder{hash, ignoreHints, hash->next, hash->end};
  const int code = Walk::Through(this, feeder);
  hash->next = feeder.at;
  return code;
}

}  // namespace ZvVesk2
