// SPDX-License-Identifier: Apache-2.0
// platform.h: what a caller of the exported classes needs of the layer beneath them: the buffer
// that every Import reads from, and crypto key objects for PublicKey::SetRSA and SetDSA.
//
//   ZvBuffer* buffer = zv_buffer_wrap_file("calc.cert");
//   if (buffer != nullptr) {
//     code = CertSequence::Import(chain.Out(), buffer, nullptr);
//     if (code == 0 && buffer->Remaining() != 0) code = VESK2_ERR_PARSE_FILE;
//     zv_buffer_free(buffer);
//   }
//
// Ownership: what a function returns or stores through a pointer belongs to the caller, who
// releases it with the function named there. Nothing here is counted, and no object may be used by
// two threads at once, but that several may read one key.
#ifndef VESK2_PLATFORM_H
#define VESK2_PLATFORM_H

#include <vesk2.h>

#include <cstddef>
#include <cstdint>

namespace ZVsysutil {

// ZvBuffer is a reader over a block of bytes that it owns. It knows no white space and no escapes:
// it matches literals byte by byte. Nothing is consumed by a match that fails or by a look, so that
// after a failure the position tells the place. It never reads past its end, whatever it is asked.
class VESK2_API ZvBuffer {
 public:
  // Expect matches the 0-terminated `text` (required mode). Returns 0 with the text consumed, or
  // VESK2_ERR_PARSE_FILE.
  [[nodiscard]] int Expect(const char* text);
  // Accept matches `text` in the optional mode: consumed and true, or untouched and false. What is
  // optional is asked for once, at its place.
  [[nodiscard]] bool Accept(const char* text);
  // LooksAt matches `text` in the look-ahead mode: whether the next bytes are `text`, which are
  // never consumed.
  [[nodiscard]] bool LooksAt(const char* text) const;

  // Peek returns the next byte (0 to 255) without consuming it, Next consumes it. -1 at the end.
  [[nodiscard]] int Peek() const;
  // Next gives that byte and moves behind it.
  [[nodiscard]] int Next();

  // Read copies up to `length` bytes to `out` and returns how many there were. Fewer than asked for
  // means that the buffer has come to its end.
  size_t Read(void* out, size_t length);
  // Skip passes over up to `length` bytes and returns how many there were.
  size_t Skip(size_t length);

  // Remaining is the number of bytes not yet consumed, Position that of those consumed: after a
  // failed Import, the byte at which the text stopped making sense. Most Imports ignore what
  // follows their object: whoever minds tests that nothing remains.
  size_t Remaining() const;
  // Counted from the start of the block: of a file, the byte of the file.
  size_t Position() const;
  // The next Remaining() bytes, borrowed until the buffer is freed.
  const unsigned char* Data() const;

  ZvBuffer(const ZvBuffer&) = delete;
  ZvBuffer& operator=(const ZvBuffer&) = delete;

 private:
  friend VESK2_API ZvBuffer* zv_buffer_wrap(const void* data, size_t size);
  friend VESK2_API ZvBuffer* zv_buffer_wrap_file(const char* path);
  friend ZvBuffer* zv_buffer_adopt(unsigned char* data, size_t size);
  friend VESK2_API void zv_buffer_free(ZvBuffer* buffer);
  VESK2_LOCAL ZvBuffer(unsigned char* data, size_t size);
  VESK2_LOCAL ~ZvBuffer();

  unsigned char* data_;
  size_t size_;
  size_t position_ = 0;
};

// zv_buffer_wrap copies `size` bytes at `data` into a new buffer (`data` may be null when `size` is
// 0). Null when memory runs out, and for null with a size. Free with zv_buffer_free.
VESK2_API ZvBuffer* zv_buffer_wrap(const void* data, size_t size);

// zv_buffer_wrap_file reads a whole regular file into a new buffer; links are followed. Null on any
// failure: no such file, not a regular file, over Limits::kMaxFile bytes (256 MiB), a read error, a
// file that changed its size meanwhile, no memory, or held by another process for
// Limits::kMaxHeldWait. Do not take null for an absent file where that would be the milder answer:
// the Imports that take a path tell the causes apart. Free with zv_buffer_free.
VESK2_API ZvBuffer* zv_buffer_wrap_file(const char* path);

// zv_buffer_free releases a buffer and its bytes; null is allowed. What Data gave is gone with it.
VESK2_API void zv_buffer_free(ZvBuffer* buffer);

}  // namespace ZVsysutil

namespace ZvVesk2 {
using ZVsysutil::ZvBuffer;
}

// ---- Crypto keys -------------------------------------------------------------------------------

// Hash algorithms, as they are named in a Hash. Every other value is refused.
enum ZvclmHashID : int32_t {
  // What an object without an algorithm says; refused by every function.
  ZVCLM_HASH_NONE = -1,
  ZVCLM_HASH_SHA1 = 0,    // "sha1", 20 bytes
  ZVCLM_HASH_SHA256 = 2,  // "sha256", 32 bytes
  ZVCLM_HASH_RMD160 = 3,  // "rmd160", 20 bytes
};

// Results of the crypto functions, which no other table holds. 0 is success. The verifications turn
// ZVCLM_ERR_NO_MEM into VESK2_ERR_MEM_ALLOC.
enum ZvclmStatus : int {
  // An argument is null that must not be, an output is not null, or there is no key.
  ZVCLM_ERR_NULL_PARAM = 1001,
  // A hash algorithm that is none of ZvclmHashID's.
  ZVCLM_ERR_UNKNOWN_HASH = 1003,
  // Memory ran out, in libcrypto or here.
  ZVCLM_ERR_NO_MEM = 1007,
  // Key data that libcrypto will not take.
  ZVCLM_ERR_KEY = 1009,
  // A key type, key-data id or record size that does not fit.
  ZVCLM_ERR_KEY_TYPE = 1014,
  // An export format other than 0 and 3.
  ZVCLM_ERR_FORMAT = 1015,
  // Any other failure: a hash that was finished is fed, or libcrypto fails on the way.
  ZVCLM_ERR_FAILURE = 1017,
  // Less room than what is written needs.
  ZVCLM_ERR_BUFFER_TOO_SMALL = 1070,
};

// A key and a number, opaque. Neither changes once it is made.
struct ZVCLMPublicKeyData;
struct ZVCLMBigInt;

// Key types and key-data ids of zvclm_PublicKeyDefine and zvclm_PublicKeyGetData.
enum : int { ZVCLM_KEY_DSA = 0, ZVCLM_KEY_RSA = 1 };
enum : int { ZVCLM_DATA_DSA = 6, ZVCLM_DATA_RSA = 8 };

// An RSA key's numbers, which the record owns. `size` is the mark 20, not a sizeof; the Init
// function sets it, and a record without it is refused (ZVCLM_ERR_KEY_TYPE).
//
//   ZVCLMRSAKeyData record;
//   ZVCLMPublicKeyData* key = nullptr;
//   if (zvclm_RSAKeyStructInit(ZVCLM_DATA_RSA, &record) == 0 &&
//       zvclm_BigIntFromBuffer(&record.n, n, nLength) == 0 &&
//       zvclm_BigIntFromBuffer(&record.e, e, eLength) == 0 &&
//       zvclm_PublicKeyDefine(&key, ZVCLM_KEY_RSA, ZVCLM_DATA_RSA, &record, 0, 0) == 0) {
//     code = publicKey->SetRSA(key);        which adopts the key
//   }
//   wiped = zvclm_RSAKeyStructZeroize(ZVCLM_DATA_RSA, &record);
struct ZVCLMRSAKeyData {
  uint32_t size;
  // 0, and not looked at.
  uint32_t reserved;
  // Bits of n. Read from a key, and not looked at when one is made.
  uint32_t keyLength;
  // The modulus and the exponent: null at first, made by zvclm_BigIntFromBuffer.
  ZVCLMBigInt* n;
  ZVCLMBigInt* e;
};

// A DSA key's numbers, which the record owns. `size` is the mark 60 and `parameterSize` the mark
// 48; both are set by the Init function. What is reserved is 0.
struct ZVCLMDSSKeyData {
  uint32_t size;
  uint32_t reserved1;
  uint32_t parameterSize;
  uint32_t reserved3;
  uint32_t reserved4;
  // Bits of p, likewise.
  uint32_t keyLength;
  uint32_t reserved6;
  uint32_t reserved7;
  // The prime, the subprime, the generator and the key's own number, each made likewise.
  ZVCLMBigInt* p;
  ZVCLMBigInt* q;
  ZVCLMBigInt* g;
  uint32_t reserved11;
  uint32_t reserved12;
  uint32_t reserved13;
  ZVCLMBigInt* y;
};

extern "C" {

// zvclm_RSAKeyStructInit clears a record, without looking at what it held, and sets its marks; `id`
// is ZVCLM_DATA_RSA. The zeroize form frees and clears the record's numbers, and leaves the marks:
// the record can be filled again. zvclm_DSSKeyStructInit likewise, `id` ZVCLM_DATA_DSA and
// `parameterSize` 48.
//   0                     done
//   ZVCLM_ERR_NULL_PARAM  no record
//   ZVCLM_ERR_KEY_TYPE    another id or size, or a record without its marks
[[nodiscard]] VESK2_API int zvclm_RSAKeyStructInit(int id, ZVCLMRSAKeyData* record);
// Once after the last use of a record that was initialised, whatever was filled in.
[[nodiscard]] VESK2_API int zvclm_RSAKeyStructZeroize(int id, ZVCLMRSAKeyData* record);
[[nodiscard]] VESK2_API int zvclm_DSSKeyStructInit(int id, ZVCLMDSSKeyData* record,
                                                   uint32_t parameterSize);
[[nodiscard]] VESK2_API int zvclm_DSSKeyStructZeroize(int id, ZVCLMDSSKeyData* record);

// zvclm_BigIntFromBuffer makes *number from `length` bytes, unsigned and big-endian; leading zeros
// are ignored, no bytes are the number 0. *number must be null. The record's zeroize form frees it.
// Returns 0, ZVCLM_ERR_NULL_PARAM (also: *number is not null) or ZVCLM_ERR_NO_MEM.
[[nodiscard]] VESK2_API int zvclm_BigIntFromBuffer(ZVCLMBigInt** number, const unsigned char* data,
                                                   uint32_t length);
// zvclm_BigIntGetBufferSize returns the bytes that zvclm_BigIntToBuffer writes: 1 for 0; -1 for
// null.
[[nodiscard]] VESK2_API int zvclm_BigIntGetBufferSize(const ZVCLMBigInt* number);
// zvclm_BigIntToBuffer writes the number, big-endian without leading zeros (0 as one 0 byte), into
// *size bytes at `out` and sets *size to the bytes written. Returns 0, ZVCLM_ERR_NULL_PARAM or
// ZVCLM_ERR_BUFFER_TOO_SMALL, with *size as it was.
[[nodiscard]] VESK2_API int zvclm_BigIntToBuffer(const ZVCLMBigInt* number, unsigned char* out,
                                                 uint32_t* size);

// zvclm_PublicKeyDefine makes *key, of `type` ZVCLM_KEY_*, from a record of `id` ZVCLM_DATA_*. The
// numbers are copied and not judged: the record stays the caller's to zeroize, and a key that
// cannot verify anything is a key. `parameters` is 0, `handle` a context's cryptoHandle or 0;
// neither changes anything. *key must be null; free it with zvclm_PublicKeyFree, or give it to
// SetRSA or SetDSA.
//   0                     made
//   ZVCLM_ERR_NULL_PARAM  a null argument or number; *key is not null
//   ZVCLM_ERR_KEY_TYPE    a type and an id that do not go together, or a record without its marks
//   ZVCLM_ERR_NO_MEM      memory ran out
[[nodiscard]] VESK2_API int zvclm_PublicKeyDefine(ZVCLMPublicKeyData** key, int type, int id,
                                                  const void* record, uint32_t parameters,
                                                  uint32_t handle);
// zvclm_PublicKeyGetData fills an initialised record with copies of the key's numbers, in the place
// of those that it held, which are freed; the record's zeroize form frees them. `keyLength` becomes
// the bits of n or p. Returns as zvclm_PublicKeyDefine does; after a failure the record is as it
// was.
[[nodiscard]] VESK2_API int zvclm_PublicKeyGetData(const ZVCLMPublicKeyData* key, int id,
                                                   void* record, uint32_t handle);
// zvclm_PublicKeyFree frees a key; null is allowed. A key that SetRSA or SetDSA adopted is not the
// caller's to free.
VESK2_API void zvclm_PublicKeyFree(ZVCLMPublicKeyData* key, uint32_t handle);

}  // extern "C"

#endif  // VESK2_PLATFORM_H
