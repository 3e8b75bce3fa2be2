// SPDX-License-Identifier: Apache-2.0
// public_key.h: PublicKey, the principal that is an RSA or DSA key.
//
//   (public-key (rsa (e <e>) (n <n>)))
//   (public-key (dsa (p <p>) (g <g>) (q <q>) (y <y>)))      in this order, not p, q, g, y
//
// Numbers are big-endian bytes. The identity of a key is its canonical form: a number written with
// a leading zero is another principal. What the numbers are worth is found out when a signature is
// checked: a key is an identity first, and one odd key in a store must not keep the others from
// being read.
//
// A key that was imported or set does not change any more, so that several threads may verify with
// one and export it, while none counts references to it.
#ifndef VESK2_PUBLIC_KEY_H
#define VESK2_PUBLIC_KEY_H

#include <vesk2/subject.h>

namespace ZvVesk2 {

// PublicKey holds the list of a key and, made from the same numbers, the key object that the crypto
// layer works with. Keys have no store; their files end in ".pub". Name keys in entries by the key
// itself or by its SHA-256: a hash of SHA-1, also one padded with zeros to the length of SHA-256,
// names a key as well, and so does whatever else has that digest.
class VESK2_API PublicKey : public Principal {
 public:
  // An object without a key, for Import, SetRSA or SetDSA.
  explicit PublicKey(Vesk2ContextStruct* context);

 protected:
  ~PublicKey() override;

 public:
  // "" and ".pub": keys have no store.
  const char* DirectoryName() const override;
  const char* ExtensionName() const override;

  // Import reads the canonical form into an empty object, from a buffer or from the file `name`
  // (".pub" appended unless it is there), a path, which the object then keeps. What follows the key
  // is ignored; the command refuses it. After a failure the object is partly built: free it.
  //   VESK2_ERR_INVALID_PARAM  null, or an object in use
  //   VESK2_ERR_FILE_OPEN      the file cannot be opened or read, or the name is too long
  //   VESK2_ERR_READ_FILE      another process held it for Limits::kMaxHeldWait
  //   VESK2_ERR_PARSE_FILE, VESK2_ERR_MAX_BYTE_STRING
  //                            it has another form
  //   VESK2_ERR_MEM_ALLOC      memory or descriptors ran out
  [[nodiscard]] int Import(ZvBuffer* buffer) override;
  [[nodiscard]] int Import(const char* name);
  using Principal::Import;
  // The two halves of Import, from "rsa(" or "dsa(" to the algorithm list's last pair; its ")" is
  // left unread.
  [[nodiscard]] int ImportRSA(ZvBuffer* buffer);
  [[nodiscard]] int ImportDSA(ZvBuffer* buffer);

  // SetRSA and SetDSA adopt a key object of zvclm_PublicKeyDefine and build the list from it.
  // VESK2_ERR_INVALID_PARAM for null, and for an object that has a key already: it has no place for
  // another, which stays the caller's then. Otherwise the object owns the key, and is of no use
  // after a failure.
  //   VESK2_ERR_BIG_INT_BUFFER_SIZE  a number of it is missing
  //   VESK2_ERR_MEM_ALLOC            memory ran out
  //   ZVCLM_ERR_KEY_TYPE, ZVCLM_ERR_NO_MEM
  //                                  it is a key of the other kind; no memory in the crypto layer
  [[nodiscard]] int SetRSA(ZVCLMPublicKeyData* key);
  [[nodiscard]] int SetDSA(ZVCLMPublicKeyData* key);

  // Verify: see Principal. Algorithm names: "rsa-pss" and "rsa-1.5" for RSA, with sha1 or sha256;
  // "dsa-sha1" for DSA, always over SHA-1, whatever hash the signature names. A name that is a
  // prefix of a known one matches it, PSS first: "", "r", "rsa" and "rsa-" verify as PSS, "d" as
  // DSA. Compare Signature::GetAlgorithm with the full names if you must know.
  //
  // SHA-1 is accepted in RSA signatures: look at Signature::GetHash where it must not count, and do
  // not trust DSA keys for anything new. The command verifies the same and writes full names; its
  // RSA keys sign over SHA-256.
  //
  // VerifyRSA and VerifyDSA are the two halves. They are for a key of their kind only: one of the
  // other kind is VESK2_ERR_SIGNATURE.
  [[nodiscard]] int Verify(ByteString* algorithm, ByteString* signatureValue, Hash* hash,
                           SExpression* signedObject) override;
  [[nodiscard]] int VerifyRSA(ByteString* algorithm, ByteString* signatureValue, Hash* hash,
                              SExpression* signedObject);
  [[nodiscard]] int VerifyDSA(ByteString* algorithm, ByteString* signatureValue, Hash* hash,
                              SExpression* signedObject);
  // VerifyMobile works with DSA keys only; others give VESK2_ERR_NOT_IMPLEMENTED. `signature` must
  // hold 54 bytes: `signatureLength` is not looked at. `data` may be null when `dataLength` is 0.
  // Codes as in Verify, without VESK2_ERR_HASH_MISMATCH.
  [[nodiscard]] int VerifyMobile(ByteString* algorithm, unsigned char* signature,
                                 unsigned int signatureLength, unsigned char* data,
                                 unsigned int dataLength) override;
  // The same without the test of the key's kind: an RSA key answers VESK2_ERR_SIGNATURE.
  [[nodiscard]] int VerifyMobileDSA(ByteString* algorithm, unsigned char* signature,
                                    unsigned int signatureLength, unsigned char* data,
                                    unsigned int dataLength);
  // Always 0, `revoked` untouched.
  [[nodiscard]] int IsRevoked(bool& revoked) override;

  // SshExport makes the binary SSH key blob, X509Export the DER SubjectPublicKeyInfo, as a new
  // array of `length` bytes (free with Vesk2Free; the caller's also when the export itself fails).
  // What `out` held is overwritten. VESK2_ERR_MEM_ALLOC and the crypto layer's codes:
  // ZVCLM_ERR_NULL_PARAM for an object without a key, ZVCLM_ERR_NO_MEM.
  [[nodiscard]] int SshExport(unsigned char*& out, unsigned int& length);
  // The form that `openssl pkey -pubin -inform DER` reads.
  [[nodiscard]] int X509Export(unsigned char*& out, unsigned int& length);

  // 1 RSA, 0 DSA, -1 none; the algorithm's name, "rsa" or "dsa", static, or null; the key length in
  // bits, of n or p without leading zeros, 0 for none.
  int32_t GetType() const;
  // "rsa", "dsa", or null without a key.
  const char* GetAlgorithm() const;
  // Bits: what people call the size of a key.
  uint32_t GetLength() const;
  // The crypto key object, borrowed as long as the key lives; null until there is a key.
  ZVCLMPublicKeyData* GetKey() const;

 private:
  VESK2_LOCAL bool IsEmpty() const;
  template <typename Form>
  [[nodiscard]] VESK2_LOCAL int ImportNumbers(ZvBuffer* buffer);
  template <typename Form>
  [[nodiscard]] VESK2_LOCAL int SetNumbers(ZVCLMPublicKeyData* newKey);

  // Set when the key is read, and not touched afterwards: several threads may look at them.
  int32_t keyType = -1;
  ZVCLMPublicKeyData* key = nullptr;
  const char* algorithmName = nullptr;
  uint32_t keyLength = 0;
};

}  // namespace ZvVesk2

#endif  // VESK2_PUBLIC_KEY_H
