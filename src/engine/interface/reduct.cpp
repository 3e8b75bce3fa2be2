// SPDX-License-Identifier: Apache-2.0
// The two reductions over objects. The engine's result is
//
//   (acl (entry (subject <key>) [(propagate)] (tag ...) [(valid ...)])...)
//
// and "(3:acl)" when nothing was granted.
#include <vesk2/verify.h>

#include <cstring>
#include <memory>
#include <string_view>

#include <vesk2/ref.h>

#include "src/engine/interface/interface.h"
#include "src/engine/owned.h"
#include "src/engine/reduce.h"
#include "src/frame/check.h"
#include "src/objects/granted_tag.h"

namespace ZvVesk2::Verify {
namespace {

struct Arguments {
  SExpression* acl;
  SExpression* sequence;
  SExpression* third;
  SExpression* requestedTag;
  SExpression* fifth;
};

struct Granted {
  std::unique_ptr<unsigned char[]> bytes;
  unsigned int length = 0;
};

// Measured first: the result may share its parts and be longer than all that went in.
[[nodiscard]] int WriteResult(const Engine::spki_elem* result, Granted& granted) {
  const uint64_t length = Engine::spki_canonical_length(result);
  VESK2_REQUIRE(length <= Limits::kMaxResult, SPKI_ERR_NO_MEM);
  granted.bytes.reset(TryNewArray<unsigned char>(length));
  VESK2_REQUIRE(granted.bytes != nullptr, VESK2_ERR_MEM_ALLOC);
  unsigned char* cursor = granted.bytes.get();
  Engine::spki_write_chain(result, &cursor);
  granted.length = static_cast<unsigned int>(length);
  return 0;
}

// ReductA compares the first entry alone, and is not to fail for the size of others.
enum class Entries { All, First };

// The result still points into the imported bytes, so it is written while they are there.
[[nodiscard]] int Reduce(const Vesk2ContextStruct* ctx, const Arguments& arguments, Entries entries,
                         Granted& granted) {
  Engine::EngineCall call;
  Engine::spki_elem* acl = nullptr;
  Engine::spki_elem* sequence = nullptr;
  Engine::spki_elem* third = nullptr;
  Engine::spki_elem* requestedTag = nullptr;
  Engine::spki_elem* fifth = nullptr;
  VESK2_TRY(call.Start(ctx));
  VESK2_TRY(call.Import(arguments.acl, &acl));
  VESK2_TRY(call.Import(arguments.sequence, &sequence));
  VESK2_TRY(call.Import(arguments.third, &third));
  VESK2_TRY(call.Import(arguments.requestedTag, &requestedTag));
  VESK2_TRY(call.Import(arguments.fifth, &fifth));
  Engine::spki_elem* result = nullptr;
  VESK2_TRY(Engine::spki_reduce(call.Engine(), acl, sequence, third, requestedTag, fifth, &result));
  const Engine::spki_elem_owner owner = Engine::Own(call.Engine(), result);
  if (entries == Entries::First && result->next != nullptr) {
    Engine::spki_elem_assign(call.Engine(), &result->next->next, nullptr);
  }
  return WriteResult(result, granted);
}

bool IsEmpty(const Granted& granted) {
  const std::string_view text(reinterpret_cast<const char*>(granted.bytes.get()), granted.length);
  return text == "(3:acl)";
}

[[nodiscard]] int Find(const Granted& granted, const char* tag, Vesk2ContextStruct* ctx,
                       Ref<SExpression>& found) {
  return SExpression::FindSubExpression(found.Out(), granted.bytes.get(), granted.length, tag, ctx);
}

}  // namespace

int ReductA(Vesk2ContextStruct* ctx, SExpression* acl, SExpression* sequence, SExpression* third,
            SExpression* requestedTag, SExpression* fifth) {
  VESK2_REQUIRE(acl != nullptr && sequence != nullptr && third != nullptr, VESK2_ERR_INVALID_PARAM);
  // Without a request there would be nothing to hold the grant against.
  VESK2_REQUIRE(requestedTag != nullptr, VESK2_ERR_INVALID_PARAM);
  Granted granted;
  VESK2_TRY(Reduce(ctx, {acl, sequence, third, requestedTag, fifth}, Entries::First, granted));
  VESK2_REQUIRE(!IsEmpty(granted), VESK2_ERR_NOT_AUTHORIZED);
  // The first entry decides, whatever the others grant.
  Ref<SExpression> tag;
  VESK2_TRY(ReadGrantedTag(tag.Out(), granted.bytes.get(), granted.length, ctx));
  return requestedTag->IsSubset(tag.get()) ? 0 : VESK2_ERR_PACKAGE_NOT_GRANTED;
}

// The search takes the last of each, so of several grants the outputs may come from different ones;
// in "(3:acl)" it finds nothing, which is no error.
int ReductB(Vesk2ContextStruct* ctx, SExpression* acl, SExpression* sequence, SExpression* third,
            SExpression*& tag, SExpression*& notBefore, SExpression*& notAfter) {
  VESK2_REQUIRE(acl != nullptr && sequence != nullptr && third != nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(tag == nullptr && notBefore == nullptr && notAfter == nullptr,
                VESK2_ERR_PARAM_NOT_NULL);
  Granted granted;
  VESK2_TRY(Reduce(ctx, {acl, sequence, third, nullptr, nullptr}, Entries::All, granted));
  Ref<SExpression> found;
  Ref<SExpression> from;
  Ref<SExpression> to;
  VESK2_TRY(Find(granted, "tag", ctx, found));
  VESK2_TRY(Find(granted, "not-before", ctx, from));
  VESK2_TRY(Find(granted, "not-after", ctx, to));
  tag = found.Release();
  notBefore = from.Release();
  notAfter = to.Release();
  return 0;
}

}  // namespace ZvVesk2::Verify
