// What byte strings and lists have in common: counting, equality by digest, and the literal match
// of the memory readers.
#include <vesk2/expression.h>

#include <cstring>
#include <memory>

#include "src/frame/check.h"
#include "src/frame/handles.h"
#include "src/sexpr/same.h"

namespace ZvVesk2 {

DExpression::DExpression(Vesk2ContextStruct* owner) : context(owner) {}

DExpression::~DExpression() = default;

void DExpression::IncrementRefCount() { ++refCount; }

void DExpression::Free() {
  if (--refCount <= 0) delete this;
}

bool DExpression::IsEqual(DExpression* other) {
  bool equal = false;
  return CompareValues(equal, this, other) == 0 && equal;
}

int CompareValues(bool& equal, DExpression* a, DExpression* b) {
  equal = false;
  if (a == nullptr || b == nullptr) return 0;
  // Equal encodings are equally long; this spares most comparisons two digests.
  if (a->CanonicalLength() != b->CanonicalLength()) return 0;
  unsigned char* digests[2] = {};
  unsigned int lengths[2] = {};
  VESK2_TRY(a->ComputeHash(digests[0], lengths[0], ZVCLM_HASH_SHA256, true));
  const std::unique_ptr<unsigned char[]> first(digests[0]);
  VESK2_TRY(b->ComputeHash(digests[1], lengths[1], ZVCLM_HASH_SHA256, true));
  const std::unique_ptr<unsigned char[]> second(digests[1]);
  equal = lengths[0] == lengths[1] && std::memcmp(digests[0], digests[1], lengths[0]) == 0;
  return 0;
}

int DExpression::ComputeHash(unsigned char*& digest, unsigned int& digestLength, ZvclmHashID id,
                             bool ignoreHints) {
  VESK2_REQUIRE(digest == nullptr, VESK2_ERR_INVALID_PARAM);
  const uint32_t handle = CryptoHandle();
  ZVCLMHashContextData* started = nullptr;
  VESK2_TRY(zvclm_HashAlloc(&started, id, handle));
  const HashOwner hash(started, HashFree{handle});
  VESK2_TRY(UpdateHash(hash.get(), ignoreHints));

  ZVCLMHashInfo info = {};
  info.size = sizeof info;
  VESK2_TRY(zvclm_HashInfo(id, &info));
  std::unique_ptr<unsigned char[]> bytes(TryNewArray<unsigned char>(info.digestLength));
  VESK2_REQUIRE(bytes != nullptr, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(zvclm_HashFinal(hash.get(), bytes.get(), handle));
  digestLength = info.digestLength;
  digest = bytes.release();
  return 0;
}

int DExpression::Expect(const char* text, const unsigned char* buf, unsigned int size,
                        unsigned int& pos) {
  VESK2_REQUIRE(text != nullptr && buf != nullptr, VESK2_ERR_INVALID_PARAM);
  const size_t length = std::strlen(text);
  // The index starts at `pos`, not at 0: stored texts that only this rule accepts must stay
  // readable.
  for (size_t i = pos; i < length; ++i) {
    VESK2_REQUIRE(i < size && pos < size - i, VESK2_ERR_BUFFER_OVERFLOW);
    VESK2_REQUIRE(static_cast<unsigned char>(text[i]) == buf[pos + i], VESK2_ERR_UNEXPECTED_CHAR);
  }
  VESK2_REQUIRE(pos <= size && length <= size - pos, VESK2_ERR_BUFFER_OVERFLOW);
  pos += static_cast<unsigned int>(length);
  return 0;
}

}  // namespace ZvVesk2
