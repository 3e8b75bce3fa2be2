// SPDX-License-Identifier: Apache-2.0
// subject.h: who authority is granted to. A Subject is a principal or a k-of-n threshold; a
// Principal (a key, or the hash of one) can also sign.
//
//   (public-key ...)                 a key                       public_key.h
//   (hash sha256 <digest>)           the key with this digest    hash.h
//   (k-of-n <k> <n> <key>...)        any k of these keys together
//   (name <text>)                    built by programs, never read
//
// Reading one, whichever it is:
//
//   Ref<Subject> subject;
//   const int code = Subject::Import(subject.Out(), buffer, nullptr);
#ifndef VESK2_SUBJECT_H
#define VESK2_SUBJECT_H

#include <vesk2/expression.h>

namespace ZvVesk2 {

class Hash;

// Subject is whom a certificate or an ACL entry is for. Every subject has storage type StoragePath:
// a key's file is a path, and no store keeps any.
class VESK2_API Subject : public SExpression {
 public:
  // For the classes below: there is no mere subject.
  explicit Subject(Vesk2ContextStruct* context);

 protected:
  ~Subject() override;

 public:
  // Import reads the canonical form into an empty object (VESK2_ERR_INVALID_PARAM for another one,
  // and without a buffer). The codes are those of the class. After a failure the object is partly
  // built: free it.
  [[nodiscard]] virtual int Import(ZvBuffer* buffer) = 0;
  // Whether it is a ThresholdSubject, about which alone nothing can be asked: it signs nothing.
  virtual bool IsThresholdSubject() const;

  // Import reads any subject, for the caller to free, and picks the class by the next two
  // characters: "(1" a key, "(4" a hash, "(6" a k-of-n. Names are never read from text.
  //   VESK2_ERR_INVALID_PARAM  `subject` is not null, or no buffer
  //   VESK2_ERR_PRINCIPAL      it begins like none of the three
  //   and the codes of that class's Import
  //                            of what was chosen
  [[nodiscard]] static int Import(Subject*& subject, ZvBuffer* buffer, Vesk2ContextStruct* context);
};

// Principal is a subject that can issue and sign: a PublicKey, or a Hash that stands for one.
class VESK2_API Principal : public Subject {
 public:
  // For PublicKey and Hash: there is no mere principal.
  explicit Principal(Vesk2ContextStruct* context);

 protected:
  ~Principal() override;

 public:
  // Verify checks a signature over `signedObject`, whose digest must be `hash`. The digest is made
  // of the canonical form with display hints, as in a file. All arguments are borrowed, none may be
  // null. Several threads may verify with one principal at the same time, while none counts
  // references to it.
  //   0                             the signature holds
  //   VESK2_ERR_INVALID_PARAM       a null argument
  //   VESK2_ERR_SIGNATURE_ID        an unknown algorithm, or a hash that it does not go with
  //   VESK2_ERR_HASH_MISMATCH       the object is not what was signed
  //   VESK2_ERR_SIGNATURE           it does not hold; also for a key beyond the limits of limits.h
  //   VESK2_ERR_NOT_IMPLEMENTED     not a key
  //   VESK2_ERR_BUFFER_OVERFLOW     the object is nested too deeply
  //   ZVCLM_ERR_NO_MEM and its kin  the crypto layer ran out of memory: nothing was decided
  [[nodiscard]] virtual int Verify(ByteString* algorithm, ByteString* signatureValue, Hash* hash,
                                   SExpression* signedObject) = 0;
  // VerifyMobile checks a raw 54-byte block of the mobile format (14-byte header, r, s) over the
  // header and `dataLength` bytes at `data`. `signatureLength` is not consulted: the caller
  // guarantees the 54 bytes, which are read whatever it says. The command never calls it. Codes as
  // in Verify.
  [[nodiscard]] virtual int VerifyMobile(ByteString* algorithm, unsigned char* signature,
                                         unsigned int signatureLength, unsigned char* data,
                                         unsigned int dataLength) = 0;
  // Always 0, and `revoked` is left alone: revocation is decided by the CRL store
  // (Cert::IsRevoked).
  [[nodiscard]] virtual int IsRevoked(bool& revoked) = 0;

  using Subject::Import;
  // Import reads a key or a hash, for the caller to free; anything else is VESK2_ERR_PRINCIPAL.
  // Other codes as in Subject::Import.
  [[nodiscard]] static int Import(Principal*& principal, ZvBuffer* buffer,
                                  Vesk2ContextStruct* context);
};

// Name is the list (name <text>): a subject that only programs make. Its canonical form begins like
// a hash, which is what readers would take it for, so that none can come from outside.
class VESK2_API Name : public Subject {
 public:
  // A name without a text, for Set.
  explicit Name(Vesk2ContextStruct* context);

 protected:
  ~Name() override;

 public:
  // Always VESK2_ERR_NOT_IMPLEMENTED: names are never read from text.
  [[nodiscard]] int Import(ZvBuffer* buffer) override;
  using Subject::Import;
  // Set names an empty object (VESK2_ERR_INVALID_PARAM for another one). Errors are
  // ByteString::Set's and Insert's.
  [[nodiscard]] int Set(const char* text);

  // The text, borrowed; null until it was set.
  const ByteString* GetName() const;

 private:
  ByteString* name = nullptr;  // owned; the list holds another copy
};

// ThresholdSubject is (k-of-n <k> <n> <key>...): any k of the n keys together. k and n are one raw
// byte each, so at most 255; no relation between them is required here. The reduction refuses k = 0
// and k > n, and one such object in a store stops every reduction.
//
//   Ref<ThresholdSubject> two(new ThresholdSubject(nullptr));
//   int code = two->Set(2, 3);                           any two of three
//   for (PublicKey* key : keys) {
//     Ref<PublicKey> member = Ref<PublicKey>::Share(key);
//     if (code == 0) code = two->Insert(member.get());
//     if (code == 0) (void)member.Release();             the list's now
//   }
//
// A member whose key is revoked still counts towards k: only subjects of certificates are looked up
// in revocation lists, so a member is never asked about. Replace the entry by one without that key.
// The command does no better, but its advice never makes a threshold smaller.
class VESK2_API ThresholdSubject : public Subject {
 public:
  // One of nobody, for Import or Set.
  explicit ThresholdSubject(Vesk2ContextStruct* context);

 protected:
  ~ThresholdSubject() override;

 public:
  // Import reads exactly n members, which must be public keys, into an empty object. k and n come
  // out as Set writes them, whatever hint their text had: a signature over counts without the hint
  // "[num]" does not verify. VESK2_ERR_INVALID_PARAM, VESK2_ERR_PARSE_FILE (also: an empty count,
  // fewer or other members), the codes of PublicKey::Import.
  [[nodiscard]] int Import(ZvBuffer* buffer) override;
  // Always true.
  bool IsThresholdSubject() const override;
  using Subject::Import;

  // Set writes the head of an empty object (VESK2_ERR_INVALID_PARAM for another one): the low bytes
  // of k and n go into the list, with the hint BsNum, the full values into the fields. Insert the
  // members afterwards; nothing counts them.
  [[nodiscard]] int Set(unsigned int k, unsigned int n);
  // Whether a member equals the principal, hints aside. False for null. A hash is equal to no key,
  // also to the one that it is the digest of.
  bool HasMember(Principal* principal);
  // GetSubjects makes a new list that shares the members; the caller frees it.
  // VESK2_ERR_INVALID_PARAM unless `members` is null, VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int GetSubjects(SExpression*& members);

  // As they were set or read; 0 before that.
  unsigned int GetK() const;
  // The members that there should be; the list may hold another number when Set was not followed by
  // as many.
  unsigned int GetN() const;

 private:
  unsigned int k = 0;
  unsigned int n = 0;
};

}  // namespace ZvVesk2

#endif  // VESK2_SUBJECT_H
