// SPDX-License-Identifier: Apache-2.0
// public_key.h: PublicKey, the principal that is an RSA or DSA key.
//
//   (public-key (rsa (e <e>) (n <n>)))
//   (public-key (dsa (p <p>) (g <g>) (q <q>) (y <y>)))      in this order, not p, q, g, y
//
// Numbers are big-endian bytes. The identity of a key is its canonical form: a number written with
// a leading zero is another principal. A key that was imported or set does not change any more, so
// that several threads may verify with one and export it, while none counts references to it.
#ifndef VESK2_PUBLIC_KEY_H
#define VESK2_PUBLIC_KEY_H

#include <vesk2/subject.h>

namespace ZvVesk2 {

class VESK2_API PublicKey : public Principal {
 public:
  explicit PublicKey(Vesk2ContextStruct* context);

 protected:
  ~PublicKey() override;

 public:
  const char* DirectoryName() const override;
  const char* ExtensionName() const override;

  // Import reads the canonical form, from a buffer or from the file `name` (".pub" appended unless
  // it is there). VESK2_ERR_INVALID_PARAM, VESK2_ERR_FILE_OPEN, VESK2_ERR_PARSE_FILE,
  // VESK2_ERR_MEM_ALLOC. After a failure the object is partly built: free it.
  [[nodiscard]] int Import(ZvBuffer* buffer) override;
  [[nodiscard]] int Import(const char* name);
  using Principal::Import;
  // The two halves of Import, from "rsa(" or "dsa(" to the algorithm list's last pair.
  [[nodiscard]] int ImportRSA(ZvBuffer* buffer);
  [[nodiscard]] int ImportDSA(ZvBuffer* buffer);

  // SetRSA and SetDSA adopt a key object and build the list from it. VESK2_ERR_INVALID_PARAM for
  // null, and for an object that has a key already: it has no place for another, which stays the
  // caller's then. VESK2_ERR_BIG_INT_BUFFER_SIZE, VESK2_ERR_MEM_ALLOC, the crypto layer's.
  [[nodiscard]] int SetRSA(ZVCLMPublicKeyData* key);
  [[nodiscard]] int SetDSA(ZVCLMPublicKeyData* key);

  // Verify: see Principal. Algorithm names: "rsa-pss" and "rsa-1.5" for RSA, with sha1 or sha256;
  // "dsa-sha1" for DSA, always over SHA-1. A name that is a prefix of a known one matches it, PSS
  // first.
  [[nodiscard]] int Verify(ByteString* algorithm, ByteString* signatureValue, Hash* hash,
                           SExpression* signedObject) override;
  [[nodiscard]] int VerifyRSA(ByteString* algorithm, ByteString* signatureValue, Hash* hash,
                              SExpression* signedObject);
  [[nodiscard]] int VerifyDSA(ByteString* algorithm, ByteString* signatureValue, Hash* hash,
                              SExpression* signedObject);
  // VerifyMobile works with DSA keys only; others give VESK2_ERR_NOT_IMPLEMENTED.
  [[nodiscard]] int VerifyMobile(ByteString* algorithm, unsigned char* signature,
                                 unsigned int signatureLength, unsigned char* data,
                                 unsigned int dataLength) override;
  [[nodiscard]] int VerifyMobileDSA(ByteString* algorithm, unsigned char* signature,
                                    unsigned int signatureLength, unsigned char* data,
                                    unsigned int dataLength);
  // Always 0, `revoked` untouched.
  [[nodiscard]] int IsRevoked(bool& revoked) override;

  // SshExport makes the binary SSH key blob, X509Export the DER SubjectPublicKeyInfo, as a new
  // array (free with Vesk2Free; the caller's also when the export itself fails).
  // VESK2_ERR_MEM_ALLOC and the crypto layer's codes.
  [[nodiscard]] int SshExport(unsigned char*& out, unsigned int& length);
  [[nodiscard]] int X509Export(unsigned char*& out, unsigned int& length);

  // 1 RSA, 0 DSA, -1 none; the algorithm's name, or null; the key length in bits.
  int32_t GetType() const;
  const char* GetAlgorithm() const;
  uint32_t GetLength() const;
  // The crypto key object, borrowed; null until there is a key.
  ZVCLMPublicKeyData* GetKey() const;

 private:
  VESK2_LOCAL bool IsEmpty() const;
  template <typename Form>
  [[nodiscard]] VESK2_LOCAL int ImportNumbers(ZvBuffer* buffer);
  template <typename Form>
  [[nodiscard]] VESK2_LOCAL int SetNumbers(ZVCLMPublicKeyData* newKey);

  int32_t keyType = -1;
  ZVCLMPublicKeyData* key = nullptr;
  const char* algorithmName = nullptr;
  uint32_t keyLength = 0;
};

}  // namespace ZvVesk2

#endif  // VESK2_PUBLIC_KEY_H
