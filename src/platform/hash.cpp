// SPDX-License-Identifier: Apache-2.0
// Hashes: a block in front of libcrypto, so that many small updates cost about as much as a few
// large ones. Which algorithm is meant is in a table; libcrypto is asked by name, once a
// process.
#include <openssl/evp.h>
#include <array>
#include <atomic>
#include <memory>
#include <new>

#include "src/platform/crypto.h"
#include "src/platform/openssl.h"

using namespace ZVsysutil;

namespace {

struct Algorithm {
  ZvclmHashID id;
  uint32_t length;
  const char* name;
};

constexpr Algorithm kAlgorithms[] = {
    {ZVCLM_HASH_SHA1, 20, "SHA1"},
    {ZVCLM_HASH_SHA256, 32, "SHA256"},
    {ZVCLM_HASH_RMD160, 20, "RIPEMD160"},
};

// By a wide id, as ids come as enumerators and as words of records.
const Algorithm* FindAlgorithm(int64_t id) {
  for (const Algorithm& algorithm : kAlgorithms) {
    if (algorithm.id == id) return &algorithm;
  }
  return nullptr;
}

// Starts libcrypto's state, again where there is one.
[[nodiscard]] int Begin(ZVCLMHashContextData* context) {
  if (context->digest == nullptr) context->digest = EVP_MD_CTX_new();
  const bool begun = context->digest != nullptr &&
                     EVP_DigestInit_ex2(context->digest, context->algorithm, nullptr) == 1;
  return begun ? 0 : ZVCLM_ERR_NO_MEM;
}

size_t Gathered(const ZVCLMHashContextData* context) {
  return static_cast<size_t>(context->next - context->block);
}

// Gives libcrypto the gathered bytes and empties the block. Emptied whether or not libcrypto took
// it: after a failure the digest is never finished.
[[nodiscard]] int Flush(ZVCLMHashContextData* context) {
  if (context->digest == nullptr) {
    if (const int code = Begin(context)) return code;
  }
  const size_t gathered = Gathered(context);
  context->next = context->block;
  const bool fed = EVP_DigestUpdate(context->digest, context->block, gathered) == 1;
  return fed ? 0 : ZVCLM_ERR_FAILURE;
}

bool Finished(const ZVCLMHashContextData* context) { return context->end == context->block; }

}  // namespace

namespace ZVsysutil {

uint32_t HashLength(int64_t id) {
  const Algorithm* algorithm = FindAlgorithm(id);
  return algorithm != nullptr ? algorithm->length : 0;
}

// An algorithm is fetched once a process: that takes as long as hashing a short text. It is given
// back when libcrypto ends, which is before its own memory goes.
namespace {

std::array<std::atomic<EVP_MD*>, std::size(kAlgorithms)> fetched;

void GiveBack() {
  for (std::atomic<EVP_MD*>& kept : fetched) EVP_MD_free(kept.exchange(nullptr));
}

}  // namespace

const EVP_MD* HashAlgorithm(int64_t id) {
  static std::atomic_flag ends;  // set when libcrypto will tell its end
  const Algorithm* const algorithm = FindAlgorithm(id);
  if (algorithm == nullptr) return nullptr;
  std::atomic<EVP_MD*>& kept = fetched[static_cast<size_t>(algorithm - kAlgorithms)];
  if (const EVP_MD* known = kept.load(std::memory_order_acquire)) return known;
  const ErrorMark mark;
  Evp<EVP_MD, EVP_MD_free> found(EVP_MD_fetch(nullptr, algorithm->name, nullptr));
  // Without the room for that word it stays until the process is gone.
  if (found != nullptr && !ends.test_and_set() && OPENSSL_atexit(GiveBack) != 1) ends.clear();
  EVP_MD* other = nullptr;
  if (found != nullptr && kept.compare_exchange_strong(other, found.get())) return found.release();
  return other;  // another thread's, null without memory
}

}  // namespace ZVsysutil

ZVCLMHashContextData::~ZVCLMHashContextData() { EVP_MD_CTX_free(digest); }

int zvclm_HashAlloc(ZVCLMHashContextData** context, ZvclmHashID id, uint32_t handle) {
  if (context == nullptr || *context != nullptr) return ZVCLM_ERR_NULL_PARAM;
  if (FindAlgorithm(id) == nullptr) return ZVCLM_ERR_UNKNOWN_HASH;
  std::unique_ptr<ZVCLMHashContextData> made(new (std::nothrow) ZVCLMHashContextData);
  if (made == nullptr) return ZVCLM_ERR_NO_MEM;
  if (const int code = zvclm_HashStart(made.get(), id, handle)) return code;
  *context = made.release();
  return 0;
}

int zvclm_HashStart(ZVCLMHashContextData* context, ZvclmHashID id, uint32_t /*handle*/) {
  if (context == nullptr) return ZVCLM_ERR_NULL_PARAM;
  if (FindAlgorithm(id) == nullptr) return ZVCLM_ERR_UNKNOWN_HASH;
  // libcrypto has every algorithm of the table, and never is another taken instead. One that it
  // does not come up with, or cannot start, is a lack of memory, though it may be called
  // unsupported.
  context->algorithm = HashAlgorithm(id);
  return context->algorithm != nullptr ? 0 : ZVCLM_ERR_NO_MEM;
}

// The context keeps its algorithm and its memory, which for small files cost more than the hashing.
int zvclm_HashRestart(ZVCLMHashContextData* context, uint32_t /*handle*/) {
  if (context == nullptr) return ZVCLM_ERR_NULL_PARAM;
  const ErrorMark mark;
  if (const int code = Begin(context)) return code;
  context->next = context->block;
  context->end = context->block + ZVCLMHashContextData::kBlock;
  return 0;
}

int zvclm_HashInfo(ZvclmHashID id, ZVCLMHashInfo* info) {
  if (info == nullptr) return ZVCLM_ERR_NULL_PARAM;
  if (info->size != sizeof(ZVCLMHashInfo)) return ZVCLM_ERR_KEY_TYPE;
  const uint32_t length = HashLength(id);
  if (length == 0) return ZVCLM_ERR_UNKNOWN_HASH;
  info->digestLength = length;
  return 0;
}

// Whole blocks go past ours; what is left waits for more.
int zvclm_HashUpdateSlow(ZVCLMHashContextData* context, const unsigned char* data, size_t length) {
  if (context == nullptr || (data == nullptr && length > 0)) return ZVCLM_ERR_NULL_PARAM;
  if (Finished(context)) return ZVCLM_ERR_FAILURE;
  const ErrorMark mark;
  const auto room = static_cast<size_t>(context->end - context->next);
  if (length > room) {
    // Fill the block up first, so that libcrypto always gets whole ones.
    std::memcpy(context->next, data, room);
    context->next += room;
    data += room;
    length -= room;
    if (const int code = Flush(context)) return code;
  }
  if (length >= ZVCLMHashContextData::kBlock) {
    return EVP_DigestUpdate(context->digest, data, length) == 1 ? 0 : ZVCLM_ERR_FAILURE;
  }
  if (length > 0) std::memcpy(context->next, data, length);
  context->next += length;
  return 0;
}

// Closed also after a failure: bytes that come later would be in no digest.
int zvclm_HashFinal(ZVCLMHashContextData* context, unsigned char* digest, uint32_t /*handle*/) {
  if (context == nullptr || digest == nullptr) return ZVCLM_ERR_NULL_PARAM;
  if (Finished(context)) return ZVCLM_ERR_FAILURE;
  const ErrorMark mark;
  context->end = context->block;  // no room: every later update takes the slow road and fails
  if (context->digest == nullptr) {
    const size_t gathered = Gathered(context);
    context->next = context->block;
    // Bytes at hand are hashed, unless there is no memory to do it in.
    const EVP_MD* const algorithm = context->algorithm;
    const int done = EVP_Digest(context->block, gathered, digest, nullptr, algorithm, nullptr);
    return done == 1 ? 0 : ZVCLM_ERR_NO_MEM;
  }
  if (const int code = Flush(context)) return code;
  return EVP_DigestFinal_ex(context->digest, digest, nullptr) == 1 ? 0 : ZVCLM_ERR_FAILURE;
}

void zvclm_HashFree(ZVCLMHashContextData* context, uint32_t /*handle*/) { delete context; }
