// SPDX-License-Identifier: Apache-2.0
// signature.h: Signature, (signature <hash> <principal> (<algorithm> <value>)): what was signed, by
// whom, and the signature itself.
#ifndef VESK2_SIGNATURE_H
#define VESK2_SIGNATURE_H

#include <vesk2/hash.h>
#include <vesk2/ref.h>

namespace ZvVesk2 {

class Cert;

class VESK2_API Signature : public SExpression {
 public:
  explicit Signature(Vesk2ContextStruct* context);

 protected:
  ~Signature() override;

 public:
  // Import reads the canonical form into an empty object. After a failure the object is partly
  // built.
  [[nodiscard]] int Import(ZvBuffer* buffer);
  using SExpression::Import;

  // Create makes a signature from its parts. It takes over the references to `hash` and
  // `principal`, and copies `value` (1 to 8192 bytes). `signature` must be null and nothing else
  // null or empty (VESK2_ERR_INVALID_PARAM). After a later failure the half-built object is in
  // `signature`, for the caller to free; it has references of its own.
  [[nodiscard]] static int Create(Signature*& signature, Hash* hash, Principal* principal,
                                  const char* algorithm, unsigned char* value, unsigned int length,
                                  Vesk2ContextStruct* context);
  using SExpression::Create;

  // Verify checks the signature over `object` with the signing principal: see Principal::Verify.
  // For a certificate the issuer must be the signer (VESK2_ERR_SIGNATURE). VESK2_ERR_PARAM_NULL for
  // null. A lack of memory is VESK2_ERR_MEM_ALLOC, the crypto layer's too.
  [[nodiscard]] int Verify(Cert* cert);
  [[nodiscard]] int Verify(SExpression* object);

  // The parts, borrowed from the list; null until imported or created.
  Hash* GetHash() const;
  Principal* GetPrincipal() const;
  ByteString* GetAlgorithm() const;
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
