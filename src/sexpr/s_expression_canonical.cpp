// SPDX-License-Identifier: Apache-2.0
// Lists in canonical form, "(" elements ")", written, measured and hashed.
#include <vesk2/expression.h>

#include <climits>
#include <memory>

#include "src/frame/check.h"
#include "src/platform/crypto.h"
#include "src/platform/file.h"
#include "src/sexpr/walk.h"

namespace ZvVesk2 {
namespace {

using Step = Walk::Step;

char Parenthesis(Step step) { return step == Step::Open ? '(' : ')'; }

// Writes a list at `pos`. Each parenthesis needs `spare` further bytes of room for the outermost
// list, one for lists within.
[[nodiscard]] int WriteList(SExpression* list, unsigned char* buf, unsigned& pos, unsigned size,
                            unsigned spare) {
  Walk walk(list);
  for (Step step = walk.Next(); step != Step::End; step = walk.Next()) {
    VESK2_REQUIRE(step != Step::TooDeep, VESK2_ERR_BUFFER_OVERFLOW);
    if (step == Step::Atom) {
      // A string that does not fit is left out; only parentheses report a lack of room.
      (void)walk.Value()->Export(buf, pos, size);
      continue;
    }
    const unsigned needed = walk.Level() == 1 ? spare : 1;
    VESK2_REQUIRE(uint64_t{pos} + needed < size, VESK2_ERR_BUFFER_OVERFLOW);
    buf[pos++] = static_cast<unsigned char>(Parenthesis(step));
  }
  return 0;
}

}  // namespace

unsigned int SExpression::CanonicalLength() {
  uint64_t length = 0;
  Walk walk(this);
  for (Step step = walk.Next(); step != Step::End; step = walk.Next()) {
    if (step == Step::TooDeep) return UINT_MAX;
    length += step == Step::Atom ? walk.Value()->CanonicalLength() : 1;
  }
  return length < UINT_MAX ? static_cast<unsigned>(length) : UINT_MAX;
}

int SExpression::Export(unsigned char* buf, unsigned int& pos, unsigned int size) {
  VESK2_REQUIRE(buf != nullptr, VESK2_ERR_INVALID_PARAM);
  return WriteList(this, buf, pos, size, 1);
}

int SExpression::Export(unsigned char*& out, unsigned int& length) {
  VESK2_REQUIRE(out == nullptr, VESK2_ERR_INVALID_PARAM);
  length = CanonicalLength();
  VESK2_REQUIRE(length <= Limits::kMaxExport, VESK2_ERR_BUFFER_OVERFLOW);
  std::unique_ptr<unsigned char[]> bytes(TryNewArray<unsigned char>(length));
  VESK2_REQUIRE(bytes != nullptr, VESK2_ERR_MEM_ALLOC);
  unsigned int pos = 0;
  VESK2_TRY(WriteList(this, bytes.get(), pos, length, 0));
  out = bytes.release();
  return 0;
}

int SExpression::PrintCanonical(FILE* stream) {
  VESK2_REQUIRE(stream != nullptr, VESK2_ERR_INVALID_PARAM);
  Walk walk(this);
  for (Step step = walk.Next(); step != Step::End; step = walk.Next()) {
    VESK2_REQUIRE(step != Step::TooDeep, VESK2_ERR_BUFFER_OVERFLOW);
    if (step == Step::Atom) {
      VESK2_TRY(walk.Value()->PrintCanonical(stream));
      continue;
    }
    const char parenthesis = Parenthesis(step);
    VESK2_REQUIRE(ZVsysutil::zv_write(stream, &parenthesis, 1) == 1, VESK2_ERR_WRITE_FILE);
  }
  // Bytes that stay in the stream's buffer could still be lost without anybody being told.
  VESK2_REQUIRE(std::fflush(stream) == 0, VESK2_ERR_WRITE_FILE);
  return 0;
}

int SExpression::UpdateHash(ZVCLMHashContextData* hash, bool ignoreHints) {
  Walk walk(this);
  for (Step step = walk.Next(); step != Step::End; step = walk.Next()) {
    VESK2_REQUIRE(step != Step::TooDeep, VESK2_ERR_BUFFER_OVERFLOW);
    if (step == Step::Atom) {
      VESK2_TRY(walk.Value()->UpdateHash(hash, ignoreHints));
      continue;
    }
    const auto parenthesis = static_cast<unsigned char>(Parenthesis(step));
    VESK2_TRY(zvclm_HashUpdate(hash, &parenthesis, 1, walk.Value()->CryptoHandle()));
  }
  return 0;
}

}  // namespace ZvVesk2
