// SPDX-License-Identifier: Apache-2.0
// Lists read from a buffer or a file:
//
//   "(" { <byte string, hint allowed> | <list> } ")"
//
// without white space. Empty lists and lists in first place are fine here.
//
// This is the reader of files and of all that was signed. Of the three readers it is the strict
// one: it compares every byte, and keeps hints, which signatures cover. What follows the list stays
// in the buffer for the caller to judge.
#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include <utility>

#include "src/frame/check.h"
#include "src/frame/handles.h"
#include "src/sexpr/value_blocks.h"

namespace ZvVesk2 {
namespace {

// Holds the buffer's position until it is destroyed; after a failure the buffer stands where the
// text stopped making sense.
class BufferReader {
 public:
  BufferReader(ZvBuffer* buffer, Vesk2ContextStruct* context) : cursor_(buffer), values_(context) {}

  // Reads a list of nesting `level`. The end of the input is no ")", so it ends the loop and is an
  // error behind it. `out` is set on success only.
  [[nodiscard]] int ReadList(Ref<SExpression>& out, unsigned level) {
    VESK2_REQUIRE(level <= Limits::kMaxDepth, VESK2_ERR_PARSE_FILE);
    VESK2_REQUIRE(cursor_.Accept('('), VESK2_ERR_PARSE_FILE);
    Ref<SExpression> list(values_.NewList());
    VESK2_REQUIRE(list, VESK2_ERR_MEM_ALLOC);
    for (int c = cursor_.Peek(); c >= 0 && c != ')'; c = cursor_.Peek()) {
      VESK2_TRY(c == '(' ? AppendList(*list, level + 1) : AppendString(*list));
    }
    VESK2_REQUIRE(cursor_.Accept(')'), VESK2_ERR_PARSE_FILE);
    out = std::move(list);
    return 0;
  }

 private:
  [[nodiscard]] int AppendList(SExpression& to, unsigned level) {
    Ref<SExpression> list;
    VESK2_TRY(ReadList(list, level));
    return Append(to, std::move(list));
  }

  [[nodiscard]] int AppendString(SExpression& to) {
    Ref<ByteString> string(values_.NewString());
    VESK2_REQUIRE(string, VESK2_ERR_MEM_ALLOC);
    VESK2_TRY(values_.Read(*string, cursor_));
    return Append(to, std::move(string));
  }

  // Takes the reference over even where it fails: it is the reader's own.
  template <typename T>
  [[nodiscard]] int Append(SExpression& to, Ref<T> value) {
    VESK2_TRY(values_.Insert(to, value.get()));
    (void)value.Release();  // the list's now
    return 0;
  }

  ZvCursor cursor_;
  ValueBlocks values_;
};

}  // namespace

int SExpression::Import(SExpression*& out, ZvBuffer* buffer, Vesk2ContextStruct* context) {
  VESK2_REQUIRE(out == nullptr && buffer != nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<SExpression> list;
  VESK2_TRY(BufferReader(buffer, context).ReadList(list, 1));
  out = list.Release();
  return 0;
}

int SExpression::Import(SExpression*& out, const char* path, Vesk2ContextStruct* context) {
  VESK2_REQUIRE(out == nullptr, VESK2_ERR_PARAM_NOT_NULL);
  VESK2_REQUIRE(path != nullptr, VESK2_ERR_PARAM_NULL);
  BufferOwner buffer;
  VESK2_TRY(WrapFile(buffer, path, VESK2_ERR_FILE_OPEN));
  return Import(out, buffer.get(), context);
}

}  // namespace ZvVesk2
