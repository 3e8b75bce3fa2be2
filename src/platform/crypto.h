// SPDX-License-Identifier: Apache-2.0
// Hashes, keys and signature checks over libcrypto's EVP interfaces: the functions of the crypto
// layer that callers of the library do not need. The others are in vesk2/platform.h.
//
// Results are the ZVCLM_* codes only: the engine's mapping reads any other value as success.
#ifndef VESK2_SRC_PLATFORM_CRYPTO_H
#define VESK2_SRC_PLATFORM_CRYPTO_H

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <span>

#include <vesk2/platform.h>

namespace ZVsysutil {

using ZvBytes = std::span<const unsigned char>;

// The number without zeros before it.
inline ZvBytes WithoutZeros(ZvBytes number) {
  while (!number.empty() && number.front() == 0) number = number.subspan(1);
  return number;
}
// The bits of a number that has no zeros before it.
inline size_t CountBits(ZvBytes number) {
  return number.empty() ? 0
                        : 8 * (number.size() - 1) +
                              static_cast<size_t>(std::bit_width(unsigned{number.front()}));
}

}  // namespace ZVsysutil

struct evp_md_st;
struct evp_md_ctx_st;

// A running hash. Small updates are gathered in `block`, inline, so that libcrypto sees whole
// blocks, and what fits into one is hashed in one call. A loop of them goes through a
// ZVCLMHashFeed. (Opaque to callers of the library.) `end` is `block` when the hash is finished:
// there is no room then, and the quick road is closed without a test of its own.
struct ZVCLMHashContextData {
  static constexpr size_t kBlock = 16384;

  ZVCLMHashContextData() = default;
  ~ZVCLMHashContextData();
  ZVCLMHashContextData(const ZVCLMHashContextData&) = delete;
  ZVCLMHashContextData& operator=(const ZVCLMHashContextData&) = delete;

  unsigned char* next = block;  // where the next byte goes
  unsigned char* end = block + kBlock;
  const evp_md_st* algorithm = nullptr;
  evp_md_ctx_st* digest = nullptr;  // libcrypto's state, once a block was full
  unsigned char block[kBlock];
};

// Eight words; the caller sets `size` to 32 before the call. Word 6 is the digest's length in
// bytes.
struct ZVCLMHashInfo {
  uint32_t size;
  uint32_t reserved[5];
  uint32_t digestLength;
  uint32_t reserved7;
};

// Signature schemes and export formats.
enum : int { ZVCLM_SCHEME_DSA = 1, ZVCLM_SCHEME_RSA_PKCS1 = 2, ZVCLM_SCHEME_RSA_PSS = 4 };
enum : int { ZVCLM_FORMAT_X509 = 0, ZVCLM_FORMAT_SSH = 3 };

// Parameters of a signature check, as words; word 3 of the RSA record is the hash algorithm.
struct ZVCLMRSAParameters {
  uint32_t words[10];
};
struct ZVCLMDSAParameters {
  uint32_t words[5];
};

extern "C" {

// zvclm_HashAlloc starts a hash in *context, which must be null. 0, ZVCLM_ERR_NULL_PARAM,
// ZVCLM_ERR_UNKNOWN_HASH for an id that is none of ZvclmHashID's, or ZVCLM_ERR_NO_MEM.
[[nodiscard]] int zvclm_HashAlloc(ZVCLMHashContextData** context, ZvclmHashID id, uint32_t handle);
// zvclm_HashStart is the same for a fresh context of the caller's, which may stand in a frame.
[[nodiscard]] int zvclm_HashStart(ZVCLMHashContextData* context, ZvclmHashID id, uint32_t handle);
// zvclm_HashRestart forgets what a context was fed and starts it again. 0, ZVCLM_ERR_NULL_PARAM or
// ZVCLM_ERR_NO_MEM.
[[nodiscard]] int zvclm_HashRestart(ZVCLMHashContextData* context, uint32_t handle);
// zvclm_HashInfo tells the length of an algorithm's digests. 0, ZVCLM_ERR_NULL_PARAM,
// ZVCLM_ERR_KEY_TYPE for a record of another size, or ZVCLM_ERR_UNKNOWN_HASH.
[[nodiscard]] int zvclm_HashInfo(ZvclmHashID id, ZVCLMHashInfo* info);
// Writes the digest; the context can then only be started again or freed. As zvclm_HashUpdate.
[[nodiscard]] int zvclm_HashFinal(ZVCLMHashContextData* context, unsigned char* digest,
                                  uint32_t handle);
// Frees a context, finished or not; null is allowed.
void zvclm_HashFree(ZVCLMHashContextData* context, uint32_t handle);
// What zvclm_HashUpdate does when the block has no room: it is given to libcrypto.
[[nodiscard]] int zvclm_HashUpdateSlow(ZVCLMHashContextData* context, const unsigned char* data,
                                       size_t length);

// zvclm_PublicKeyExport writes the key as DER SubjectPublicKeyInfo (format 0) or as a binary SSH
// key blob (format 3) into *length bytes at `out`, and sets *length. With a null `out` it only sets
// *length and returns ZVCLM_ERR_BUFFER_TOO_SMALL. *length is left alone on any other failure.
[[nodiscard]] int zvclm_PublicKeyExport(const ZVCLMPublicKeyData* key, int format,
                                        uint32_t parameters, unsigned char* out, uint32_t* length,
                                        uint32_t handle);

// zvclm_PublicKeyVerifySignature checks `signature` over `digest`. *valid is 0 from the start and 1
// only for a good signature; a malformed one, or a key outside the limits, is 0 with *valid 0.
// Returns other codes only for null arguments and lack of memory. `parameters` is the record of the
// scheme. A DSA signature is over a SHA-1 digest: r and s, in two equal halves of q's length.
[[nodiscard]] int zvclm_PublicKeyVerifySignature(const ZVCLMPublicKeyData* key, int scheme,
                                                 const void* parameters,
                                                 const unsigned char* digest, uint32_t digestLength,
                                                 const unsigned char* signature,
                                                 uint32_t signatureLength, int* valid,
                                                 uint32_t handle);

}  // extern "C"

// zvclm_PublicKeyOfNumbers makes a key without a record: of the numbers, big-endian, in the order
// of the record of its type. They are copied. 0, or ZVCLM_ERR_NO_MEM.
[[nodiscard]] int zvclm_PublicKeyOfNumbers(ZVCLMPublicKeyData** key, int type,
                                           std::span<const ZVsysutil::ZvBytes> numbers);

// zvclm_HashUpdate feeds `length` bytes. 0, ZVCLM_ERR_NULL_PARAM, ZVCLM_ERR_NO_MEM or
// ZVCLM_ERR_FAILURE.
[[nodiscard]] inline int zvclm_HashUpdate(ZVCLMHashContextData* context, const unsigned char* data,
                                          size_t length, uint32_t /*handle*/) {
  if (context != nullptr && data != nullptr &&
      static_cast<size_t>(context->end - context->next) >= length) [[likely]] {
    std::memcpy(context->next, data, length);
    context->next += length;
    return 0;
  }
  return zvclm_HashUpdateSlow(context, data, length);
}

// The place where a running hash takes its next byte, held by value: a loop of 4-byte updates keeps
// it in registers, which the processor's store unit could not keep up with otherwise. Nothing else
// may use the context until the feed is gone.
class ZVCLMHashFeed {
 public:
  explicit ZVCLMHashFeed(ZVCLMHashContextData* context)
      : context_(context), next_(context->next), end_(context->end) {}
  ~ZVCLMHashFeed() { context_->next = next_; }
  ZVCLMHashFeed(const ZVCLMHashFeed&) = delete;
  ZVCLMHashFeed& operator=(const ZVCLMHashFeed&) = delete;

  // The room that is at hand, and filling it up.
  unsigned char* Next() { return next_; }
  size_t Room() const { return static_cast<size_t>(end_ - next_); }
  void Filled(size_t length) { next_ += length; }

  [[nodiscard]] int Update(const unsigned char* data, size_t length) {
    constexpr size_t kWord = 4;
    if (length == kWord && static_cast<size_t>(end_ - next_) >= kWord) [[likely]] {
      std::memcpy(next_, data, kWord);
      next_ += kWord;
      return 0;
    }
    context_->next = next_;
    const int code = zvclm_HashUpdateSlow(context_, data, length);
    next_ = context_->next;
    end_ = context_->end;
    return code;
  }

 private:
  ZVCLMHashContextData* context_;
  unsigned char* next_;
  unsigned char* end_;
};

[[nodiscard]] inline int zvclm_HashUpdate(ZVCLMHashFeed& feed, const unsigned char* data,
                                          size_t length, uint32_t /*handle*/) {
  return feed.Update(data, length);
}

#endif  // VESK2_SRC_PLATFORM_CRYPTO_H
