// SPDX-License-Identifier: Apache-2.0
// hash.h: Hash, the principal (hash <algorithm> <digest>) that names a key or any object by its
// digest, and the computation of such digests.
//
//   sha1     20 bytes
//   sha256   32 bytes
//   rmd160   20 bytes; the reduction knows no key by it
//
// A key's hash is over its canonical form without display hints (DExpression::ComputeHash); the
// hash in a signature is over the signed object with them. A hash of SHA-1 names a key like any
// other: write SHA-256 where you choose.
#ifndef VESK2_HASH_H
#define VESK2_HASH_H

#include <vesk2/subject.h>

namespace ZvVesk2 {

// A Hash is either a computation (Init, any number of Update, Finalize) or a value (Set or Import).
// After Finalize, Set or Import the list is complete and can be exported, compared or inserted.
//
//   Ref<Hash> hash(new Hash(nullptr));
//   int code = hash->Init(ZVCLM_HASH_SHA256);
//   if (code == 0) code = hash->Update(certificate);       and more, one after the other
//   if (code == 0) code = hash->Finalize();
class VESK2_API Hash : public Principal {
 public:
  // An object without a digest, for Init, Set or Import.
  explicit Hash(Vesk2ContextStruct* context);

 protected:
  ~Hash() override;

 public:
  // Always true.
  bool IsHash() const override;
  // Import reads "(4:hash", the algorithm's name, the digest and ")" into an empty object. After a
  // failure the object is partly built: free it.
  //   VESK2_ERR_INVALID_PARAM  no buffer, or an object in use
  //   VESK2_ERR_HASH_ID        another name
  //   VESK2_ERR_INVALID_HASH   a digest of another length than the algorithm's
  //   VESK2_ERR_PARSE_FILE, VESK2_ERR_MAX_BYTE_STRING, VESK2_ERR_MEM_ALLOC
  //                            of the reader
  [[nodiscard]] int Import(ZvBuffer* buffer) override;
  using Principal::Import;
  // A hash can name a signer but not check a signature: always VESK2_ERR_NOT_IMPLEMENTED, for both.
  // A chain whose issuer is a hash therefore proves nothing.
  [[nodiscard]] int Verify(ByteString* algorithm, ByteString* signatureValue, Hash* hash,
                           SExpression* signedObject) override;
  [[nodiscard]] int VerifyMobile(ByteString* algorithm, unsigned char* signature,
                                 unsigned int signatureLength, unsigned char* data,
                                 unsigned int dataLength) override;
  // Always 0, `revoked` untouched.
  [[nodiscard]] int IsRevoked(bool& revoked) override;

  // Init starts a computation on an empty object. VESK2_ERR_HASH_ID for an unknown algorithm,
  // VESK2_ERR_INVALID_PARAM for an object in use, VESK2_ERR_MEM_ALLOC and the crypto layer's codes.
  [[nodiscard]] int Init(ZvclmHashID id);
  // Update feeds an expression's canonical bytes, hints included, or `length` raw bytes. Between
  // Init and Finalize only: ZVCLM_ERR_NULL_PARAM before, ZVCLM_ERR_FAILURE after.
  // VESK2_ERR_INVALID_PARAM for a null expression, VESK2_ERR_BUFFER_OVERFLOW for one nested too
  // deeply.
  [[nodiscard]] int Update(DExpression* expression);
  [[nodiscard]] int Update(const unsigned char* data, unsigned int length);
  // Finalize appends the digest to the list; GetValue stays null (only Import fills it), GetDigest
  // has it. VESK2_ERR_INVALID_PARAM before Init and the second time, VESK2_ERR_MEM_ALLOC, the
  // crypto layer's codes.
  [[nodiscard]] int Finalize();
  // Set builds a value from a known digest of `length` bytes. It adopts `data`, an array from
  // new[], whose length is not compared with the algorithm's, and gives it the hint BsBin.
  // VESK2_ERR_HASH_ID for an unknown algorithm, VESK2_ERR_INVALID_PARAM for null and for an object
  // in use, VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int Set(ZvclmHashID id, unsigned char* data, unsigned int length);

  // DumpFingerprint turns "(hash NAME BYTES)" of `length` bytes, as in Vesk2CertInfoStruct, into
  // "NAME HEX", terminated, in `out`, which must hold 2 * length + 8 bytes. A name outside the
  // three gives the name alone, as it was written; any other text (also null) "(null)". Returns
  // `out`.
  static char* DumpFingerprint(char* out, const unsigned char* text, unsigned int length);

  // HashFile writes the SHA-256 of a regular file to `digest` and 32 to *digestLength, which on
  // entry gives the room in bytes (0: not tested). `context` may be null; links are followed.
  //   VESK2_ERR_INVALID_PARAM    another null argument
  //   VESK2_ERR_BUFFER_OVERFLOW  room for fewer than 32 bytes; *digestLength is as it was
  //   VESK2_ERR_FILE_OPEN        it cannot be opened, or is no regular file
  //   VESK2_ERR_READ_FILE        a read error, the file changed meanwhile, or another process held
  //                              it for Limits::kMaxHeldWait
  //   VESK2_ERR_MEM_ALLOC and the crypto layer's
  //                              memory or descriptors ran out
  // *digestLength is 0, and `digest` as it was, after a failure (except of the room test).
  [[nodiscard]] static int HashFile(const char* path, unsigned char* digest,
                                    unsigned int* digestLength, Vesk2ContextStruct* context);
  // The same, telling `callbacks` (may be null; see Vesk2FileCallbacks) about it, on this thread.
  // VESK2_ERR_USER_INTERRUPT when they end it.
  [[nodiscard]] static int HashFile(const char* path, unsigned char* digest,
                                    unsigned int* digestLength, Vesk2ContextStruct* context,
                                    const Vesk2FileCallbacks* callbacks);

  // ZVCLM_HASH_NONE until Init, Set or Import.
  ZvclmHashID GetAlgorithm() const;
  // The digest of an imported hash, borrowed, else null.
  ByteString* GetValue() const;
  // The digest of any complete hash, borrowed: the value, else the third element; null when there
  // is none.
  ByteString* GetDigest() const;

 private:
  uint32_t digestLength = 0;
  ZVCLMHashContextData* hashContext = nullptr;
  ZvclmHashID algorithm = ZVCLM_HASH_NONE;
  ByteString* value = nullptr;  // a counted reference
};

}  // namespace ZvVesk2

#endif  // VESK2_HASH_H
