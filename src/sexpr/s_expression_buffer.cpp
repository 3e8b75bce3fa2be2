// SPDX-License-Identifier: Apache-2.0
// Lists read from a buffer or a file:
//
//   "(" { <byte string, hint allowed> | <list> } ")"
//
// without white space. Empty lists and lists in first place are fine here.
#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include "src/frame/check.h"
#include "src/frame/handles.h"

namespace ZvVesk2 {
namespace {

[[nodiscard]] int ReadList(Ref<SExpression>& out, ZvBuffer* buffer, Vesk2ContextStruct* context,
                           unsigned level);

[[nodiscard]] int ReadString(Ref<DExpression>& out, ZvBuffer* buffer, Vesk2ContextStruct* context) {
  Ref<ByteString> string(TryNew<ByteString>(context));
  VESK2_REQUIRE(string, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(string->Import(buffer));
  out.Reset(string.Release());
  return 0;
}

[[nodiscard]] int ReadElement(Ref<DExpression>& out, ZvBuffer* buffer, Vesk2ContextStruct* context,
                              unsigned level) {
  if (buffer->Peek() != '(') return ReadString(out, buffer, context);
  Ref<SExpression> list;
  VESK2_TRY(ReadList(list, buffer, context, level));
  out.Reset(list.Release());
  return 0;
}

// Reads a list of nesting `level`.
[[nodiscard]] int ReadList(Ref<SExpression>& out, ZvBuffer* buffer, Vesk2ContextStruct* context,
                           unsigned level) {
  VESK2_REQUIRE(level <= Limits::kMaxDepth, VESK2_ERR_PARSE_FILE);
  VESK2_TRY(buffer->Expect("("));
  Ref<SExpression> list(TryNew<SExpression>(context));
  VESK2_REQUIRE(list, VESK2_ERR_MEM_ALLOC);
  for (int c = buffer->Peek(); c >= 0 && c != ')'; c = buffer->Peek()) {
    Ref<DExpression> element;
    VESK2_TRY(ReadElement(element, buffer, context, level + 1));
    VESK2_TRY(list->Insert(element.get()));
    (void)element.Release();
  }
  VESK2_TRY(buffer->Expect(")"));
  out.Reset(list.Release());
  return 0;
}

}  // namespace

int SExpression::Import(SExpression*& out, ZvBuffer* buffer, Vesk2ContextStruct* context) {
  VESK2_REQUIRE(out == nullptr && buffer != nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<SExpression> list;
  VESK2_TRY(ReadList(list, buffer, context, 1));
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
