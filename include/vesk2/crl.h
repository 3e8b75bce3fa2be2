// SPDX-License-Identifier: Apache-2.0
// crl.h: Crl, a revocation list, and CrlSequence, the form in which one travels and is stored: the
// list, a certificate whose subject is the list's hash, and the issuer's signature over that
// certificate.
//
//   (crl (version 1) (list1 (item <hash> <stamp>)...) (list2 (item <hash> <stamp>)...))
//   (sequence <crl> <certificate> <signature>)
//
// list1 names revoked certificates, from a date on; list2 revoked keys, whatever the date: for a
// key that leaked revoke the key. A list without items counts as absent: a fresh list that revokes
// nothing yet needs one (dummy) item in list1, or every certificate that depends on it is
// undetermined.
//
// A list is believed when an ACL entry has the tag of its certificate and that certificate's issuer
// as its subject. A list that is missing, cannot be read or does not verify is passed over, and
// every key that it revokes goes free: watch the store, and have certificates name a source of
// revocation, without a current list of which they are refused. The command takes a stored list
// that cannot be read or does not verify for trouble; that one is missing, nobody notices but a
// certificate that names its source.
//
// The store keeps one list for every revocation source, an ACL entry whose tag ends in (revoke
// ...), in "cert"/*.crl below the global root. Its file name is the text of the tag's body, with
// "/" written "%2F"; a text with a 0 byte names no file, and neither does one that is longer than
// Limits::kMaxStoreName (250) bytes when it is so written.
#ifndef VESK2_CRL_H
#define VESK2_CRL_H

#include <vesk2/cert.h>
#include <vesk2/signature.h>

namespace ZvVesk2 {

class Hash;

// Crl is the list alone: what is revoked, without anybody who says so. A program makes one, has a
// certificate for its hash issued and signed by who holds the source's key, and puts the three
// together:
//
//   Ref<Crl> list;
//   int code = Crl::Create(list.Out(), nullptr);
//   if (code == 0) code = list->RevokeAllOf(previous);             nothing is let go
//   if (code == 0) code = list->RevokeKey(digestOfKey, now);
//   ...                                                            a Cert for the Hash of `list`
//   if (code == 0) code = CrlSequence::Create(out, list.get(), cert, signature, nullptr);
class VESK2_API Crl : public SExpression {
 public:
  // An empty object, for Import. A program that makes a list uses Create.
  explicit Crl(Vesk2ContextStruct* context);

 protected:
  ~Crl() override;

 public:
  // Import reads the canonical form into an empty object. Dates are read as byte strings, not
  // checked; an item whose date is no full stamp revokes always. After a failure it is partly
  // built: free it. VESK2_ERR_INVALID_PARAM (no buffer, or an object in use), VESK2_ERR_PARSE_FILE,
  // VESK2_ERR_MAX_BYTE_STRING, VESK2_ERR_HASH_ID, VESK2_ERR_INVALID_HASH, VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int Import(ZvBuffer* buffer);
  using SExpression::Import;
  // BuildSExpression rebuilds the list from the fields. VESK2_ERR_PARAM_NULL while they are empty,
  // VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int BuildSExpression();

  // Create makes a list that revokes nothing yet, for the caller to free; `out` must be null.
  // RevokeCertificate and RevokeKey add (item <digest> <date>) to list1 and list2, sharing both:
  // the digest of the certificate as it stands in its file, of the key without display hints, by
  // any algorithm of Hash, SHA-1 among them: write SHA-256. `from` is required for a key, too,
  // though a revoked key is revoked whatever the date. A list that was verified counts as
  // unverified again. VESK2_ERR_INVALID_PARAM (also: a digest that is not complete),
  // VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] static int Create(Crl*& out, Vesk2ContextStruct* context);
  [[nodiscard]] int RevokeCertificate(Hash* digest, TimeStamp* from);
  [[nodiscard]] int RevokeKey(Hash* digest, TimeStamp* from);
  // RevokeAllOf adds the items of another list, shared. VESK2_ERR_INVALID_PARAM for null, for the
  // list itself, and for one that was not made or read; VESK2_ERR_MEM_ALLOC may leave some added.
  [[nodiscard]] int RevokeAllOf(const Crl* other);

  // The two lists, borrowed; each is headed by its keyword. Null until there are any.
  SExpression* GetList1() const;
  SExpression* GetList2() const;
  // The tag of the certificate that vouched for this list, borrowed; null until
  // CrlSequence::VerifySelf succeeded, and after the list was changed.
  SExpression* GetIssuerTag() const;

 private:
  friend class CrlSequence;
  // Nobody vouches for a list that was changed.
  VESK2_LOCAL void ForgetVoucher();
  // Each holds a reference beside the list's own, so that the list can be built anew.
  SExpression* list1 = nullptr;
  SExpression* list2 = nullptr;
  SExpression* issuerTag = nullptr;
};

// CrlSequence is one list with its voucher, and the store of lists. That it was proved once is kept
// with it: the questions below then do not ask again, whatever entries they are given, until
// ForgetProof.
class VESK2_API CrlSequence : public SExpression {
 public:
  // An empty object, for Import. Of parts it is made by Create.
  explicit CrlSequence(Vesk2ContextStruct* context);

 protected:
  ~CrlSequence() override;

 public:
  const char* DirectoryName() const override;
  const char* ExtensionName() const override;
  // "cert" (the certificates' directory) and ".crl"; the argument changes nothing.
  static const char* DirectoryName(bool);
  static const char* ExtensionName(bool);
  // See SExpression::CalcDir and CalcPath. The store is that of StorageGlobal.
  static char* CalcDir(StorageType type);
  static char* CalcPath(const char* name, StorageType type);

  // ---- One sequence ----

  // Import reads a file, exactly the path given, or a buffer, into an empty object. The opening
  // "(8:sequence" and the final ")" may be missing: what is said is proved as ever, but do not
  // compare such files byte by byte. What follows is ignored; the command refuses bytes after the
  // end. After a failure the object is partly built: free it.
  //   VESK2_ERR_INVALID_PARAM            an object in use, or no buffer
  //   VESK2_ERR_FILE_NOT_FOUND           the file cannot be opened or read; no path
  //   VESK2_ERR_READ_FILE                another process held the file for Limits::kMaxHeldWait
  //   VESK2_ERR_PARSE_FILE and the like  of the readers of its parts
  //   VESK2_ERR_MEM_ALLOC                memory or descriptors ran out
  [[nodiscard]] int Import(const char* path);
  [[nodiscard]] int Import(ZvBuffer* buffer);
  using SExpression::Import;
  // Create puts a list, the certificate for its hash and that certificate's signature together, all
  // shared, for the caller to free; nothing is checked. `out` must be null.
  // VESK2_ERR_INVALID_PARAM, VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] static int Create(CrlSequence*& out, Crl* crl, Cert* cert, Signature* signature,
                                  Vesk2ContextStruct* context);
  // BuildSExpression rebuilds the list from the fields. VESK2_ERR_PARAM_NULL while they are empty,
  // VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int BuildSExpression();

  // VerifyValidity compares the certificate's period with the given one, in seconds, when both
  // times are given, not 0; else it tests nothing. *notBefore and *notAfter then receive the
  // certificate's times, 0 where it has none, whatever the answer. Pass the present time twice, in
  // variables. Nothing else is verified.
  //   VESK2_ERR_NOT_AFTER   it starts after *notAfter
  //   VESK2_ERR_NOT_BEFORE  it ends before *notBefore, or has no end
  //   VESK2_ERR_PARAM_NULL  a null pointer, or a sequence that was not read
  [[nodiscard]] int VerifyValidity(long* notBefore, long* notAfter);

  // VerifySelf proves the list against ACL entries (acl <entry>...): the last entry with the
  // certificate's tag must have the certificate's issuer as its subject, the certificate's subject
  // must be the list's hash and the signature must hold. GetIssuerTag tells afterwards that it did.
  //
  // Neither the period of the list's certificate nor the period and the propagate flag of the entry
  // count: an entry that has ended still vouches. Test with VerifyValidity at one moment too, and
  // remove entries that have ended. `vesk2 crl verify` tests the list's period, and not the
  // entry's.
  //   0                              it is true
  //   VESK2_ERR_INVALID_PARAM        no entries, or a sequence that was not read
  //   VESK2_ERR_ACL_ENTRY_NOT_FOUND  no entry has the tag, or the last one is another key's
  //   VESK2_ERR_HASH_ID              the certificate is for no hash, or one of an unknown algorithm
  //   VESK2_ERR_SIGNATURE            the hash is another list's, or the signature does not hold
  //   Signature::Verify's, VESK2_ERR_BUFFER_OVERFLOW
  //                                  of the signature; of what is nested too deeply
  //   VESK2_ERR_MEM_ALLOC and the crypto layer's
  //                                  memory ran out: nothing was proved
  [[nodiscard]] int VerifySelf(SExpression* aclEntries);
  // ForgetProof takes back what VerifySelf left: the list counts only when it is proved again.
  void ForgetProof();

  // ---- The store ----

  // ImportStore loads the stored list of every revocation source among `aclEntries` (null: the ACL
  // store) into a new list, for the caller to free. Nothing is verified yet. A list that is missing
  // or unreadable is absent from it, but not one for which memory or descriptors ran out, that
  // another process holds or whose path is too long: with a list that counts as absent goes what it
  // revokes.
  //   VESK2_ERR_INVALID_PARAM  `aclEntries` without any element
  //   VESK2_ERR_READ_FILE      another process held a file for Limits::kMaxHeldWait, in all
  //   VESK2_ERR_FILE_OPEN      the path of a list would be too long
  //   VESK2_ERR_MEM_ALLOC      memory or descriptors ran out
  //   AclEntry::Import's       when it loads the ACL store
  [[nodiscard]] static int ImportStore(SExpression*& store, SExpression* aclEntries,
                                       Vesk2ContextStruct* ctx);
  // StorePath makes the path of the file that keeps the list of a source, for the caller to free
  // with Vesk2Free; no directory is made. Null with success for a tag that names no file (a null
  // one included), and without a store. `out` must be null: VESK2_ERR_INVALID_PARAM.
  // VESK2_ERR_FILE_OPEN for one that cannot be, VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] static int StorePath(char*& out, SExpression* tag);
  // UpdateStore writes this sequence to the store when it verifies against `aclEntries` (or did
  // before) and takes the place of what is there. The file is replaced whole or not at all, and a
  // list that another process holds, or that could not be read for lack of memory or descriptors,
  // stays.
  //
  // The answer is 0 whether it was stored or not; VESK2_ERR_INVALID_PARAM when the certificate's
  // tag names no file, or the sequence was not read. Where none is stored, or the stored one cannot
  // be read, it is taken without a test of time. Otherwise it must have begun, and end no earlier
  // than the stored one: with an equal end an older list can be played back. A stored one that
  // begins in the future is replaced by any that has begun, even by one that has ended; one that
  // has begun and has no end never, and a list without an end replaces none that has begun. Read
  // back what is stored (Find), and compare what the two revoke before offering one. `vesk2 crl
  // import` does, and refuses a list that ends no later and revokes less.
  [[nodiscard]] int UpdateStore(SExpression* aclEntries);
  // ImportDir loads every "*.crl" file of a directory that can be read, in byte order of the names,
  // into a new list for the caller to free; `type` becomes the storage type of each. Nothing is
  // verified.
  //   VESK2_ERR_INVALID_PARAM   `list` is not null
  //   VESK2_ERR_FILE_NOT_FOUND  no directory
  //   VESK2_ERR_CRL_NOT_FOUND   no list in it that can be read
  //   VESK2_ERR_MEM_ALLOC, VESK2_ERR_READ_FILE
  //                             see ImportStore
  [[nodiscard]] static int ImportDir(SExpression*& list, const char* dir, StorageType type,
                                     Vesk2ContextStruct* ctx);
  // ImportDirAndStore offers every list of a directory to the store, each by UpdateStore, whose
  // answers do not show. Errors of loading the ACL store and the directory only.
  [[nodiscard]] static int ImportDirAndStore(const char* dir, Vesk2ContextStruct* ctx);
  // Find returns the stored list whose certificate has the tag (its elements behind the keyword
  // count, the keyword does not), for the caller to free. Nothing is verified.
  //   0                              found; or, with `out` null, an empty store
  //   VESK2_ERR_ACL_ENTRY_NOT_FOUND  none has it; `out` then holds the last one looked at, which
  //                                  may be partly read, for the caller to free
  //   VESK2_ERR_PARAM_NOT_NULL, VESK2_ERR_PARAM_NULL
  //                                  `out` is not null; no tag
  //   VESK2_ERR_FIND_DIR             no store
  //   VESK2_ERR_MEM_ALLOC, VESK2_ERR_READ_FILE
  //                                  see ImportStore
  [[nodiscard]] static int Find(CrlSequence*& out, SExpression* tag);

  // CheckStatusCritical asks list2 of every sequence in `store` (with the tag, when one is given)
  // about `object`, a key or a hash: VESK2_ERR_KEY_REVOKED, else 0. The store may be null, for no
  // list. Only sequences that verify against `aclEntries`, or did before, count: with a list that
  // does not, its revocations vanish, and the answer is 0. Dates and periods play no part.
  // VESK2_ERR_PARAM_NULL without an object; VESK2_ERR_MEM_ALLOC, and other codes when it cannot be
  // hashed.
  [[nodiscard]] static int CheckStatusCritical(SExpression* aclEntries, SExpression* store,
                                               SExpression* tag, SExpression* object);
  // CheckStatusNonCritical asks list1 about `object`, a certificate, for a period (null: whenever);
  // the rest as above. `notAfter` has no effect: a list that has not begun counts, too.
  //   0                        it is not revoked, and a list was there to tell
  //   VESK2_ERR_CERT_REVOKED   it was revoked at or before `notBefore`, or at any time when that is
  //                            null
  //   VESK2_ERR_CRL_NOT_FOUND  there is no list to ask: none of the source, none that verifies,
  //                            none with items and an end
  //   VESK2_ERR_NOT_AFTER      all of them ended before the period
  // An item with a later date does not count; with `notBefore` null every item does, and a list
  // that has ended still serves as proof that nothing else is revoked. Give the moment that is
  // meant.
  [[nodiscard]] static int CheckStatusNonCritical(SExpression* aclEntries, SExpression* store,
                                                  SExpression* tag, SExpression* object,
                                                  TimeStamp* notBefore, TimeStamp* notAfter);

  // MarkRevoked asks about each certificate of `certs` what Cert::IsRevoked asks, and leaves the
  // answer in its status; whatever fails for one leaves it Undetermined. Elements that are no
  // certificates are passed over. Each list is proved once, however many certificates there are. As
  // there, only subjects are looked up: no key of an entry, no issuer that no certificate is for,
  // no member of a k-of-n. VESK2_ERR_PARAM_NULL for null `certs`, VESK2_ERR_MEM_ALLOC.
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
