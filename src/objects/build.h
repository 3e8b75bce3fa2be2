// SPDX-License-Identifier: Apache-2.0
// What every reader and builder of a typed object does: read a part into a new value, and hand it
// to a list. References travel as Ref, so that a part that was not appended is freed on every path.
// A reader is a row of these calls in the order of its grammar, each of which returns on failure:
// there is no cleaning up to forget. What was read up to a failure stays in the object, whose owner
// frees it.
#ifndef VESK2_SRC_OBJECTS_BUILD_H
#define VESK2_SRC_OBJECTS_BUILD_H

#include <utility>

#include <vesk2/expression.h>
#include <vesk2/ref.h>
#include <vesk2/time_stamp.h>

#include "src/frame/check.h"
#include "src/frame/handles.h"
#include "src/sexpr/value_blocks.h"

namespace ZvVesk2 {

// ImportNew makes a T and reads it from the buffer with T::Import. `out` is untouched on failure.
template <typename T>
[[nodiscard]] int ImportNew(Ref<T>& out, ZvBuffer* buffer, Vesk2ContextStruct* context) {
  Ref<T> made(TryNew<T>(context));
  VESK2_REQUIRE(made, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(made->Import(buffer));
  out = std::move(made);
  return 0;
}

// Append gives the list the reference to `value`; on failure the value is freed. The second form
// then points `field` at it, borrowed: a field is only ever set to what the list holds.
template <typename T>
[[nodiscard]] int Append(SExpression* list, Ref<T> value) {
  VESK2_TRY(list->Insert(value.get()));
  (void)value.Release();
  return 0;
}
template <typename T>
[[nodiscard]] int Append(SExpression* list, Ref<T> value, T*& field) {
  T* const borrowed = value.get();
  VESK2_TRY(Append(list, std::move(value)));
  field = borrowed;
  return 0;
}

// AppendHead appends the new list (name) and points `head` at it, borrowed, for more elements. The
// list is in its parent before it is filled, so that nothing has to be handed over afterwards.
[[nodiscard]] inline int AppendHead(SExpression* list, const char* name, SExpression*& head) {
  Ref<SExpression> made;
  VESK2_TRY(SExpression::Create(made.Out(), name, list->GetContext()));
  return Append(list, std::move(made), head);
}

// The same, cut from a reader's blocks.
[[nodiscard]] inline int AppendHead(ValueBlocks& blocks, SExpression* list, const char* name,
                                    SExpression*& head) {
  Ref<SExpression> made(blocks.NewList());
  VESK2_REQUIRE(made, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(blocks.Insert(*made, name));
  return Append(list, std::move(made), head);
}

// AppendPair appends (name value); the second form points `field` at the value, borrowed.
template <typename T>
[[nodiscard]] int AppendPair(SExpression* list, const char* name, Ref<T> value) {
  SExpression* pair = nullptr;
  VESK2_TRY(AppendHead(list, name, pair));
  return Append(pair, std::move(value));
}
template <typename T>
[[nodiscard]] int AppendPair(SExpression* list, const char* name, Ref<T> value, T*& field) {
  SExpression* pair = nullptr;
  VESK2_TRY(AppendHead(list, name, pair));
  return Append(pair, std::move(value), field);
}

// AppendBounds appends (not-before <stamp>) and (not-after <stamp>) to a list (valid), each unless
// it is null, and points the fields at them. Certificates, entries and questions write their
// periods with it, in the one order that readers take.
[[nodiscard]] inline int AppendBounds(SExpression* valid, Ref<TimeStamp> begin, Ref<TimeStamp> end,
                                      TimeStamp*& beginField, TimeStamp*& endField) {
  if (begin) VESK2_TRY(AppendPair(valid, "not-before", std::move(begin), beginField));
  if (end) VESK2_TRY(AppendPair(valid, "not-after", std::move(end), endField));
  return 0;
}

}  // namespace ZvVesk2

#endif  // VESK2_SRC_OBJECTS_BUILD_H
