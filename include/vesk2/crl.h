// SPDX-License-Identifier: Apache-2.0
// crl.h: Crl, a revocation list, and CrlSequence, the form in which one travels and is stored: the
// list, a certificate whose subject is the list's hash, and the issuer's signature over that
// certificate.
//
//   (crl (version 1) (list1 (item <hash> <stamp>)...) (list2 (item <hash> <stamp>)...))
//   (sequence <crl> <certificate> <signature>)
//
// list1 names revoked certificates, from a date on; list2 revoked keys, whatever the date. A list
// without items counts as absent: a fresh list that revokes nothing yet needs one (dummy) item in
// list1, or every certificate that depends on it is undetermined.
//
// The store keeps one list for every revocation source, an ACL entry whose tag ends in
// (revoke ...), in "cert"/*.crl below the global root. Its file name is the text of the tag's body,
// with "/" written "%2F"; a text with a 0 byte names no file, and neither does one that is longer
// than 250 bytes when it is so written.
#ifndef VESK2_CRL_H
#define VESK2_CRL_H

#include <vesk2/cert.h>
#include <vesk2/signature.h>

namespace ZvVesk2 {

class Hash;

class VESK2_API Crl : public SExpression {
 public:
  explicit Crl(Vesk2ContextStruct* context);

 protected:
  ~Crl() override;

 public:
  // Import reads the canonical form into an empty object. After a failure it is partly built: free
  // it.
  [[nodiscard]] int Import(ZvBuffer* buffer);
  using SExpression::Import;
  // BuildSExpression rebuilds the list from the fields. VESK2_ERR_PARAM_NULL while they are empty.
  [[nodiscard]] int BuildSExpression();

  // Create makes a list that revokes nothing yet; `out` must be null. RevokeCertificate and
  // RevokeKey add (item <digest> <date>) to list1 and list2, sharing both: the digest of the
  // certificate as it stands in its file, of the key without display hints, by any algorithm of
  // Hash. A list that was verified counts as unverified again. VESK2_ERR_INVALID_PARAM,
  // VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] static int Create(Crl*& out, Vesk2ContextStruct* context);
  [[nodiscard]] int RevokeCertificate(Hash* digest, TimeStamp* from);
  [[nodiscard]] int RevokeKey(Hash* digest, TimeStamp* from);
  // RevokeAllOf adds the items of another list, shared.
  [[nodiscard]] int RevokeAllOf(const Crl* other);

  // The two lists, borrowed; each is headed by its keyword.
  SExpression* GetList1() const;
  SExpression* GetList2() const;
  // The tag of the certificate that vouched for this list; null until CrlSequence::VerifySelf
  // succeeded.
  SExpression* GetIssuerTag() const;

 private:
  friend class CrlSequence;
  VESK2_LOCAL void ForgetVoucher();
  SExpression* list1 = nullptr;
  SExpression* list2 = nullptr;
  SExpression* issuerTag = nullptr;
};

class VESK2_API CrlSequence : public SExpression {
 public:
  explicit CrlSequence(Vesk2ContextStruct* context);

 protected:
  ~CrlSequence() override;

 public:
  const char* DirectoryName() const override;
  const char* ExtensionName() const override;
  // "cert" (the certificates' directory) and ".crl"; the argument changes nothing.
  static const char* DirectoryName(bool);
  static const char* ExtensionName(bool);
  // See SExpression::CalcDir and CalcPath.
  static char* CalcDir(StorageType type);
  static char* CalcPath(const char* name, StorageType type);

  // ---- One sequence ----

  // Import reads a file, exactly the path given, or a buffer, into an empty object. The opening
  // "(8:sequence" and the final ")" may be missing. VESK2_ERR_FILE_NOT_FOUND for a file that cannot
  // be read. After a failure the object is partly built: free it.
  [[nodiscard]] int Import(const char* path);
  [[nodiscard]] int Import(ZvBuffer* buffer);
  using SExpression::Import;
  // Create puts a list, the certificate for its hash and that certificate's signature together, all
  // shared; nothing is checked. `out` must be null. VESK2_ERR_INVALID_PARAM, VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] static int Create(CrlSequence*& out, Crl* crl, Cert* cert, Signature* signature,
                                  Vesk2ContextStruct* context);
  // BuildSExpression rebuilds the list from the fields. VESK2_ERR_PARAM_NULL while they are empty.
  [[nodiscard]] int BuildSExpression();

  // VerifyValidity compares the certificate's period with the given one, when both times are given:
  // VESK2_ERR_NOT_AFTER when it starts after *notAfter, VESK2_ERR_NOT_BEFORE when it ends before
  // *notBefore. Always stores the certificate's times. VESK2_ERR_PARAM_NULL.
  [[nodiscard]] int VerifyValidity(long* notBefore, long* notAfter);

  // VerifySelf proves the list against ACL entries: the last entry with the certificate's tag must
  // have the certificate's issuer as its subject (VESK2_ERR_ACL_ENTRY_NOT_FOUND), the certificate's
  // subject must be the list's hash (VESK2_ERR_HASH_ID, VESK2_ERR_SIGNATURE) and the signature must
  // hold.
  [[nodiscard]] int VerifySelf(SExpression* aclEntries);
  // ForgetProof takes back what VerifySelf left: the list counts only when it is proved again.
  void ForgetProof();

  // ---- The store ----

  // ImportStore loads the stored list of every revocation source among `aclEntries` (null: the ACL
  // store) into a new list. A list that is missing or unreadable is absent from it, but not one for
  // which memory or descriptors ran out (VESK2_ERR_MEM_ALLOC), that another process holds
  // (VESK2_ERR_READ_FILE) or whose path is too long (VESK2_ERR_FILE_OPEN): with a list that counts
  // as absent goes what it revokes. VESK2_ERR_INVALID_PARAM (no elements), AclEntry::Import's.
  [[nodiscard]] static int ImportStore(SExpression*& store, SExpression* aclEntries,
                                       Vesk2ContextStruct* ctx);
  // StorePath makes the path of the file that keeps the list of a source, for the caller to free
  // with Vesk2Free; no directory is made. Null with success for a tag that names no file, and
  // without a store. `out` must be null: VESK2_ERR_INVALID_PARAM. VESK2_ERR_FILE_OPEN for one
  // that cannot be, VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] static int StorePath(char*& out, SExpression* tag);
  // UpdateStore writes this sequence to the store when it verifies and is newer than what is there.
  // The file is replaced whole or not at all, and a list that another process holds, or that could
  // not be read for lack of memory or descriptors, stays. 0 whether it was stored or not;
  // VESK2_ERR_INVALID_PARAM when the certificate's tag names no file.
  [[nodiscard]] int UpdateStore(SExpression* aclEntries);
  // ImportDir loads every "*.crl" file of a directory that can be read. VESK2_ERR_INVALID_PARAM,
  // VESK2_ERR_FILE_NOT_FOUND (no directory), VESK2_ERR_CRL_NOT_FOUND (no list),
  // VESK2_ERR_MEM_ALLOC, VESK2_ERR_READ_FILE (see ImportStore).
  [[nodiscard]] static int ImportDir(SExpression*& list, const char* dir, StorageType type,
                                     Vesk2ContextStruct* ctx);
  // ImportDirAndStore offers every list of a directory to the store. Errors of loading only.
  [[nodiscard]] static int ImportDirAndStore(const char* dir, Vesk2ContextStruct* ctx);
  // Find returns the stored list whose certificate has the tag. VESK2_ERR_PARAM_NOT_NULL,
  // VESK2_ERR_PARAM_NULL, VESK2_ERR_FIND_DIR, VESK2_ERR_MEM_ALLOC, VESK2_ERR_READ_FILE (see
  // ImportStore); VESK2_ERR_ACL_ENTRY_NOT_FOUND when none has, `out` then holding the last one
  // read, for the caller to free. An empty store gives 0 and null.
  [[nodiscard]] static int Find(CrlSequence*& out, SExpression* tag);

  // CheckStatusCritical asks list2 of every sequence in `store` (with the tag, when one is given)
  // about `object`, a key or a hash: VESK2_ERR_KEY_REVOKED, else 0. Only sequences that verify
  // against `aclEntries`, or did before, count. VESK2_ERR_PARAM_NULL without an object; other codes
  // when it cannot be hashed.
  [[nodiscard]] static int CheckStatusCritical(SExpression* aclEntries, SExpression* store,
                                               SExpression* tag, SExpression* object);
  // CheckStatusNonCritical asks list1 about `object`, a certificate, for a period (null: whenever).
  // VESK2_ERR_CERT_REVOKED when it was revoked at or before `notBefore`; VESK2_ERR_CRL_NOT_FOUND
  // when there is no list to ask; VESK2_ERR_NOT_AFTER when all of them ended before the period;
  // else 0. Other codes as above.
  [[nodiscard]] static int CheckStatusNonCritical(SExpression* aclEntries, SExpression* store,
                                                  SExpression* tag, SExpression* object,
                                                  TimeStamp* notBefore, TimeStamp* notAfter);

  // MarkRevoked asks about each certificate of `certs` what Cert::IsRevoked asks, and leaves the
  // answer in its status; whatever fails for one leaves it Undetermined. Each list is proved once,
  // however many certificates there are. VESK2_ERR_PARAM_NULL, VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] static int MarkRevoked(SExpression* certs, SExpression* aclEntries,
                                       SExpression* store, TimeStamp* notBefore,
                                       TimeStamp* notAfter);

  // The parts, borrowed; null until imported.
  Crl* GetCrl() const;
  Cert* GetCert() const;
  Signature* GetSignature() const;

 private:
  Crl* crl = nullptr;
  Cert* cert = nullptr;
  Signature* signature = nullptr;
  SExpression* reserved = nullptr;
};

}  // namespace ZvVesk2

#endif  // VESK2_CRL_H
