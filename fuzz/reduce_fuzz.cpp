// SPDX-License-Identifier: Apache-2.0
// The reduction engine: an ACL, a sequence and a request, one after the other in the input.
// Whatever they hold, the answer comes in bounded time; a granted tag lies within itself and a tag
// is within "(*)".
#include "fuzz/fuzz_support.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const Buffer input = Wrap(std::string(reinterpret_cast<const char*>(data), size));
  Ref<SExpression> lists[4];
  for (Ref<SExpression>& list : lists) {
    if (SExpression::Import(list.Out(), input.get(), nullptr) != 0) return 0;
  }
  SExpression* tag = lists[3].get();
  (void)Verify::ReductA(nullptr, lists[0].get(), lists[1].get(), lists[2].get(), tag, nullptr);
  Ref<SExpression> granted;
  Ref<SExpression> from;
  Ref<SExpression> to;
  (void)Verify::ReductB(nullptr, lists[0].get(), lists[1].get(), lists[2].get(), granted.Out(),
                        from.Out(), to.Out());
  if (granted) FUZZ_CHECK(granted->IsSubset(granted.get()));
  (void)tag->IsSubset(lists[0].get());
  return 0;
}
