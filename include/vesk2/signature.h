// SPDX-License-Identifier: Apache-2.0
// signature.h: Signature, what was signed, by whom, and the signature itself.
//
//   (signature <hash> <principal> (<algorithm> <value>))
//
// <hash> is the digest of the signed object as it stands in its file, display hints included;
// <value> is the signature over that digest, made with the key of <principal>. For the names of
// algorithms see PublicKey::Verify. The library makes no signatures: it holds no private key.
#ifndef VESK2_SIGNATURE_H
#define VESK2_SIGNATURE_H

#include <vesk2/hash.h>
#include <vesk2/ref.h>

namespace ZvVesk2 {

class Cert;

// Signature is read or made whole, and does not change then.
class VESK2_API Signature : public SExpression {
 public:
  explicit Signature(Vesk2ContextStruct* context);

 protected:
  ~Signature() override;

 public:
  // Import reads the canonical form into an empty object. After a failure the object is partly
  // built: free it. Whether the signature holds is not asked.
  //   VESK2_ERR_INVALID_PARAM  no buffer, or an object in use
  //   VESK2_ERR_PARSE_FILE, VESK2_ERR_MAX_BYTE_STRING
  //                            it has another form
  //   VESK2_ERR_HASH_ID, VESK2_ERR_INVALID_HASH, VESK2_ERR_PRINCIPAL
  //                            of its parts
  //   VESK2_ERR_MEM_ALLOC      memory ran out
  [[nodiscard]] int Import(ZvBuffer* buffer);
  using SExpression::Import;

  // Create makes a signature from its parts: the digest of what was signed, the signer, the name of
  // the algorithm and `length` bytes (1 to 8192) of signature, which are copied. It takes over the
  // references to `hash` and `principal`. Nothing is checked. After a failure behind the first test
  // the half-built object is in `signature`, for the caller to free; it has references of its own.
  //   VESK2_ERR_INVALID_PARAM    `signature` is not null, or something else is null or empty
  //   VESK2_ERR_MAX_BYTE_STRING  a name or a value of over Limits::kMaxByteString bytes
  //   VESK2_ERR_MEM_ALLOC        memory ran out
  [[nodiscard]] static int Create(Signature*& signature, Hash* hash, Principal* principal,
                                  const char* algorithm, unsigned char* value, unsigned int length,
                                  Vesk2ContextStruct* context);
  using SExpression::Create;

  // Verify checks the signature over `object` with the signing principal: see Principal::Verify for
  // the codes. For a certificate the issuer must be the signer (VESK2_ERR_SIGNATURE), by the
  // canonical form: a hash of the key is another principal. Nothing is asked about authority: any
  // key made by anyone passes. VESK2_ERR_PARAM_NULL for null, VESK2_ERR_SIGNATURE for an empty
  // signature. A lack of memory is VESK2_ERR_MEM_ALLOC, the crypto layer's too.
  [[nodiscard]] int Verify(Cert* cert);
  [[nodiscard]] int Verify(SExpression* object);

  // The parts, borrowed from the list; null until imported or created. The digest of what was
  // signed: look at its algorithm where SHA-1 must not count.
  Hash* GetHash() const;
  // Who signed. A hash names a signer and cannot check the signature.
  Principal* GetPrincipal() const;
  // The algorithm as it was written, which may be less than a full name: see PublicKey::Verify.
  ByteString* GetAlgorithm() const;
  // The signature itself.
  ByteString* GetValue() const;

 private:
  [[nodiscard]] VESK2_LOCAL int AppendValue(Ref<ByteString> newAlgorithm, Ref<ByteString> newValue);

  Hash* hash = nullptr;
  Principal* principal = nullptr;
  ByteString* algorithm = nullptr;
  ByteString* value = nullptr;
};

}  // namespace ZvVesk2

#endif  // VESK2_SIGNATURE_H
