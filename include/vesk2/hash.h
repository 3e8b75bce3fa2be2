// SPDX-License-Identifier: Apache-2.0
// hash.h: Hash, the principal (hash <algorithm> <digest>) that names a key or any object by its
// digest, and the computation of such digests. Algorithms: sha1, sha256, rmd160.
#ifndef VESK2_HASH_H
#define VESK2_HASH_H

#include <vesk2/subject.h>

namespace ZvVesk2 {

// A Hash is either a computation (Init, any number of Update, Finalize) or a value (Set or Import).
// After Finalize, Set or Import the list is complete and can be exported, compared or inserted.
class VESK2_API Hash : public Principal {
 public:
  explicit Hash(Vesk2ContextStruct* context);

 protected:
  ~Hash() override;

 public:
  bool IsHash() const override;
  // Import reads "(4:hash", the algorithm's name, the digest and ")". VESK2_ERR_HASH_ID for another
  // name, VESK2_ERR_INVALID_HASH for a digest of another length.
  [[nodiscard]] int Import(ZvBuffer* buffer) override;
  using Principal::Import;
  // A hash can name a signer but not check a signature: always VESK2_ERR_NOT_IMPLEMENTED.
  [[nodiscard]] int Verify(ByteString* algorithm, ByteString* signatureValue, Hash* hash,
                           SExpression* signedObject) override;
  [[nodiscard]] int VerifyMobile(ByteString* algorithm, unsigned char* signature,
                                 unsigned int signatureLength, unsigned char* data,
                                 unsigned int dataLength) override;
  // Always 0, `revoked` untouched.
  [[nodiscard]] int IsRevoked(bool& revoked) override;

  // Init starts a computation on an empty object. VESK2_ERR_HASH_ID for an unknown algorithm,
  // VESK2_ERR_INVALID_PARAM for an object in use, the crypto layer's codes.
  [[nodiscard]] int Init(ZvclmHashID id);
  // Update feeds an expression's canonical bytes, hints included, or raw bytes.
  [[nodiscard]] int Update(DExpression* expression);
  [[nodiscard]] int Update(const unsigned char* data, unsigned int length);
  // Finalize appends the digest to the list; GetValue stays null (only Import fills it).
  [[nodiscard]] int Finalize();
  // Set builds a value from a known digest. It adopts `data`, an array from new[], whose length is
  // not compared with the algorithm's. VESK2_ERR_HASH_ID for an unknown algorithm,
  // VESK2_ERR_INVALID_PARAM for null and for an object in use, VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int Set(ZvclmHashID id, unsigned char* data, unsigned int length);

  // DumpFingerprint turns "(hash NAME BYTES)" of `length` bytes into "NAME HEX", terminated, in
  // `out`, which must hold 2 * length + 8 bytes. A name outside the three gives the name alone; any
  // other text "(null)". Returns `out`.
  static char* DumpFingerprint(char* out, const unsigned char* text, unsigned int length);

  // HashFile writes the SHA-256 of a regular file to `digest` and 32 to *digestLength, which on
  // entry gives the room (0: not tested). VESK2_ERR_INVALID_PARAM, VESK2_ERR_BUFFER_OVERFLOW (room
  // under 32), VESK2_ERR_FILE_OPEN, VESK2_ERR_READ_FILE (a read error, the file changed
  // meanwhile, or another process held it for Limits::kMaxHeldWait), VESK2_ERR_MEM_ALLOC;
  // *digestLength is 0 after a failure (except of the room test).
  [[nodiscard]] static int HashFile(const char* path, unsigned char* digest,
                                    unsigned int* digestLength, Vesk2ContextStruct* context);
  // The same, telling `callbacks` (may be null) about it. VESK2_ERR_USER_INTERRUPT when they end
  // it.
  [[nodiscard]] static int HashFile(const char* path, unsigned char* digest,
                                    unsigned int* digestLength, Vesk2ContextStruct* context,
                                    const Vesk2FileCallbacks* callbacks);

  // ZVCLM_HASH_NONE until Init, Set or Import.
  ZvclmHashID GetAlgorithm() const;
  // The digest of an imported hash, else null.
  ByteString* GetValue() const;
  // The digest of any complete hash: the value, else the third element; null when there is none.
  ByteString* GetDigest() const;

 private:
  uint32_t digestLength = 0;
  ZVCLMHashContextData* hashContext = nullptr;
  ZvclmHashID algorithm = ZVCLM_HASH_NONE;
  ByteString* value = nullptr;  // a counted reference
};

}  // namespace ZvVesk2

#endif  // VESK2_HASH_H
