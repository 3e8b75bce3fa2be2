// SPDX-License-Identifier: Apache-2.0
// Hashes: a block in front of libcrypto, so that many small updates cost about as much as a few
// large ones. Which algorithm is meant is in a table; libcrypto is asked by name, once for each
// hash that is started.
#include <openssl/evp.h>
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

// Gives libcrypto the gathered bytes and empties the block. Emptied whether or not libcrypto took
// it: after a failure the digest is never finished.
bool Flush(ZVCLMHashContextData* context) {
  const auto gathered = static_cast<size_t>(context->next - context->block);
  context->next = context->block;
  return EVP_DigestUpdate(context->digest, context->block, gathered) == 1;
}

bool Finished(const ZVCLMHashContextData* context) { return context->end == context->block; }

}  // namespace

namespace ZVsysutil {

const char* HashName(int64_t id) {
  const Algorithm* algorithm = FindAlgorithm(id);
  return algorithm != nullptr ? algorithm->name : nullptr;
}

uint32_t HashLength(int64_t id) {
  const Algorithm* algorithm = FindAlgorithm(id);
  return algorithm != nullptr ? algorithm->length : 0;
}

}  // namespace ZVsysutil

int zvclm_HashAlloc(ZVCLMHashContextData** context, ZvclmHashID id, uint32_t /*handle*/) {
  if (context == nullptr || *context != nullptr) return ZVCLM_ERR_NULL_PARAM;
  const ErrorMark mark;
  const char* name = HashName(id);
  if (name == nullptr) return ZVCLM_ERR_UNKNOWN_HASH;
  // libcrypto has every algorithm of the table, and never is another taken instead. One that it
  // does not come up with, or cannot start, is a lack of memory, though it may be called
  // unsupported.
  const Evp<EVP_MD, EVP_MD_free> algorithm(EVP_MD_fetch(nullptr, name, nullptr));
  Evp<EVP_MD_CTX, EVP_MD_CTX_free> digest(EVP_MD_CTX_new());
  std::unique_ptr<ZVCLMHashContextData> made(new (std::nothrow) ZVCLMHashContextData);
  if (algorithm == nullptr || digest == nullptr || made == nullptr) return ZVCLM_ERR_NO_MEM;
  if (EVP_DigestInit_ex2(digest.get(), algorithm.get(), nullptr) != 1) return ZVCLM_ERR_NO_MEM;
  made->digest = digest.release();
  *context = made.release();
  return 0;
}

// The context keeps its algorithm and its memory, which for small files cost more than the hashing.
int zvclm_HashRestart(ZVCLMHashContextData* context, uint32_t /*handle*/) {
  if (context == nullptr) return ZVCLM_ERR_NULL_PARAM;
  const ErrorMark mark;
  if (EVP_DigestInit_ex2(context->digest, nullptr, nullptr) != 1) return ZVCLM_ERR_NO_MEM;
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
    if (!Flush(context)) return ZVCLM_ERR_FAILURE;
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
  const bool flushed = Flush(context);
  context->end = context->block;  // no room: every later update takes the slow road and fails
  const bool done = flushed && EVP_DigestFinal_ex(context->digest, digest, nullptr) == 1;
  return done ? 0 : ZVCLM_ERR_FAILURE;
}

void zvclm_HashFree(ZVCLMHashContextData* context, uint32_t /*handle*/) {
  if (context == nullptr) return;
  EVP_MD_CTX_free(context->digest);
  delete context;
}
