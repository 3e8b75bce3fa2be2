// SPDX-License-Identifier: Apache-2.0
// See lists.h. Small steps over the value model that several files here take; none decides
// anything.
#include "src/trust/lists.h"

#include "src/platform/clock.h"

namespace ZvVesk2 {

// The new list shares the elements and replaces the keyword: a revocation element and the tag of
// its source differ in that alone.
int MakeTag(Ref<SExpression>& out, SExpression* source, bool dropLast) {
  Ref<SExpression> tag;
  VESK2_TRY(SExpression::Create(tag.Out(), "tag", source->GetContext()));
  const unsigned int end = source->Count() - (dropLast && source->Count() > 0 ? 1 : 0);
  unsigned int index = 0;
  for (auto it = source->Begin(); it && index < end; it.Next(), ++index) {
    if (index > 0) VESK2_TRY(AppendShared(tag.get(), it.Value()));
  }
  out = std::move(tag);
  return 0;
}

// Only the last element counts: (tag (revoke ...) x) grants something that is called so.
bool EndsInRevoke(SExpression* tag) {
  auto* last = tag != nullptr ? dynamic_cast<SExpression*>(tag->Last()) : nullptr;
  auto* keyword = last != nullptr ? dynamic_cast<ByteString*>(last->First()) : nullptr;
  return keyword != nullptr && keyword->IsEqual("revoke");
}

// A moment that cannot be written could not be compared, and must not be left out: an open end
// would be a wider question.
int MakeStamp(Ref<TimeStamp>& out, long seconds, Vesk2ContextStruct* ctx) {
  Ref<TimeStamp> stamp(TryNew<TimeStamp>(ctx));
  VESK2_REQUIRE(stamp, VESK2_ERR_MEM_ALLOC);
  const int code = stamp->Set(seconds);
  // -1 is no code of the library.
  VESK2_REQUIRE(code != -1, VESK2_ERR_TIME_STAMP);
  VESK2_TRY(code);
  out = std::move(stamp);
  return 0;
}

int MakeNow(Ref<TimeStamp>& out, Vesk2ContextStruct* ctx) {
  const long now = ZVsysutil::zv_time(nullptr);
  VESK2_REQUIRE(now != ZVsysutil::kNoTime, VESK2_ERR_TIME_STAMP);
  return MakeStamp(out, now, ctx);
}

}  // namespace ZvVesk2
