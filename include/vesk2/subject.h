// SPDX-License-Identifier: Apache-2.0
// subject.h: who authority is granted to. A Subject is a principal or a k-of-n threshold; a
// Principal (a key, or the hash of one) can also sign.
#ifndef VESK2_SUBJECT_H
#define VESK2_SUBJECT_H

#include <vesk2/expression.h>

namespace ZvVesk2 {

class Hash;

// Every subject has storage type StoragePath.
class VESK2_API Subject : public SExpression {
 public:
  explicit Subject(Vesk2ContextStruct* context);

 protected:
  ~Subject() override;

 public:
  // Import reads the canonical form into an empty object (VESK2_ERR_INVALID_PARAM for another one).
  [[nodiscard]] virtual int Import(ZvBuffer* buffer) = 0;
  virtual bool IsThresholdSubject() const;

  // Import reads any subject and picks the class by the next two characters: "(1" a key, "(4" a
  // hash, "(6" a k-of-n; anything else is VESK2_ERR_PRINCIPAL. Names are never read from text.
  [[nodiscard]] static int Import(Subject*& subject, ZvBuffer* buffer, Vesk2ContextStruct* context);
};

class VESK2_API Principal : public Subject {
 public:
  explicit Principal(Vesk2ContextStruct* context);

 protected:
  ~Principal() override;

 public:
  // Verify checks a signature over `signedObject`, whose digest must be `hash`.
  //   VESK2_ERR_INVALID_PARAM, VESK2_ERR_SIGNATURE_ID (unknown algorithm), VESK2_ERR_HASH_MISMATCH
  //   (the object is not what was signed), VESK2_ERR_SIGNATURE, VESK2_ERR_NOT_IMPLEMENTED (not a
  //   key), the crypto layer's: ZVCLM_ERR_NO_MEM.
  [[nodiscard]] virtual int Verify(ByteString* algorithm, ByteString* signatureValue, Hash* hash,
                                   SExpression* signedObject) = 0;
  // VerifyMobile checks a raw 54-byte block of the mobile format (14-byte header, r, s) over
  // `data`. `signatureLength` is not consulted: the caller guarantees the 54 bytes.
  [[nodiscard]] virtual int VerifyMobile(ByteString* algorithm, unsigned char* signature,
                                         unsigned int signatureLength, unsigned char* data,
                                         unsigned int dataLength) = 0;
  // Always 0, and `revoked` is left alone: revocation is decided by the CRL store.
  [[nodiscard]] virtual int IsRevoked(bool& revoked) = 0;

  using Subject::Import;
  // Import reads a key or a hash; anything else is VESK2_ERR_PRINCIPAL.
  [[nodiscard]] static int Import(Principal*& principal, ZvBuffer* buffer,
                                  Vesk2ContextStruct* context);
};

// Name is the list (name <text>).
class VESK2_API Name : public Subject {
 public:
  explicit Name(Vesk2ContextStruct* context);

 protected:
  ~Name() override;

 public:
  // Always VESK2_ERR_NOT_IMPLEMENTED: names are never read from text.
  [[nodiscard]] int Import(ZvBuffer* buffer) override;
  using Subject::Import;
  // Set names an empty object. Errors are ByteString::Set's and Insert's.
  [[nodiscard]] int Set(const char* text);

  const ByteString* GetName() const;

 private:
  ByteString* name = nullptr;  // owned; the list holds another copy
};

// ThresholdSubject is (k-of-n <k> <n> <key>...): any k of the n keys together. k and n are one raw
// byte each, so at most 255; no relation between them is required here. The reduction refuses k = 0
// and k > n, and one such object in a store stops every reduction.
class VESK2_API ThresholdSubject : public Subject {
 public:
  explicit ThresholdSubject(Vesk2ContextStruct* context);

 protected:
  ~ThresholdSubject() override;

 public:
  // Import reads exactly n members, which must be public keys. k and n come out as Set writes them,
  // whatever hint their text had: a signature over counts without the hint "[num]" does not verify.
  [[nodiscard]] int Import(ZvBuffer* buffer) override;
  bool IsThresholdSubject() const override;
  using Subject::Import;

  // Set writes the head of an empty object: the low bytes of k and n go into the list, with the
  // hint BsNum, the full values into the fields. Insert the members afterwards.
  [[nodiscard]] int Set(unsigned int k, unsigned int n);
  bool HasMember(Principal* principal);
  // GetSubjects makes a new list that shares the members; the caller frees it.
  [[nodiscard]] int GetSubjects(SExpression*& members);

  unsigned int GetK() const;
  unsigned int GetN() const;

 private:
  unsigned int k = 0;
  unsigned int n = 0;
};

}  // namespace ZvVesk2

#endif  // VESK2_SUBJECT_H
