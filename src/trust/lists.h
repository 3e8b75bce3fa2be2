// SPDX-License-Identifier: Apache-2.0
// Steps that several files of this folder take, beside those of the objects.
#ifndef VESK2_SRC_TRUST_LISTS_H
#define VESK2_SRC_TRUST_LISTS_H

#include <memory>

#include <vesk2/time_stamp.h>

#include "src/objects/build.h"

namespace ZvVesk2 {

using TextPtr = std::unique_ptr<char[]>;

// AppendShared appends a borrowed value, of which the list takes a reference of its own.
[[nodiscard]] inline int AppendShared(SExpression* list, DExpression* borrowed) {
  return Append(list, Ref<DExpression>::Share(borrowed));
}

// MakeTag makes (tag e2 e3 ...) of the list (e1 e2 e3 ...), sharing the elements; without the last
// one when `dropLast`. Revocation elements carry tags in this form, under a keyword of their own.
[[nodiscard]] int MakeTag(Ref<SExpression>& out, SExpression* source, bool dropLast = false);

// EndsInRevoke tells whether the last element of `tag` (may be null) is a list (revoke ...): the
// tag then names a source of revocation lists.
bool EndsInRevoke(SExpression* tag);

// MakeStamp makes a stamp of a moment; VESK2_ERR_TIME_STAMP for a year that has no text. MakeNow
// makes one of the current time; the same code when the clock cannot be read.
[[nodiscard]] int MakeStamp(Ref<TimeStamp>& out, long seconds, Vesk2ContextStruct* ctx);
[[nodiscard]] int MakeNow(Ref<TimeStamp>& out, Vesk2ContextStruct* ctx);

}  // namespace ZvVesk2

#endif  // VESK2_SRC_TRUST_LISTS_H
