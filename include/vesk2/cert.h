// SPDX-License-Identifier: Apache-2.0
// cert.h: Cert, an authorization certificate: an issuer grants a subject what a tag describes.
//
//   (cert [(version 1)] (issuer <principal>) (subject <subject>) [(propagate)] [<tag>]
//         [(valid [(not-before <stamp>)] [(not-after <stamp>)])] [(comment <text>)]
//         [<revocation element>])
//
// in this order. The tag is any list whose keyword has three characters, the revocation element any
// whose text begins with "(1". Without (propagate) the subject may not pass the grant on. The
// revocation element names a source of lists: its elements behind the keyword are those of the
// source's tag.
//
// A certificate says nothing about itself: the Signature beside it does, and that it leads to an
// ACL entry is for CertSequence to prove. Before issuing or relying on one by hand, require that
// GetTag is a list headed by "tag": without a tag, or with another keyword of three letters, it
// grants whatever is asked.
#ifndef VESK2_CERT_H
#define VESK2_CERT_H

#include <vesk2/subject.h>
#include <vesk2/time_stamp.h>

#include <cstddef>

namespace ZvVesk2 {

class AclEntry;
class RevocationLists;

// Cert is read or built whole, and does not change then, but for the revocation status, which is
// left in it by whoever asked last. Two threads must therefore not ask about one certificate.
class VESK2_API Cert : public SExpression {
 public:
  // Revocation status, set by IsRevoked, CrlSequence::MarkRevoked and the verifications. It speaks
  // of the moment of asking. A new certificate is NotRevoked because nobody has asked yet.
  enum RevocationStatus : int32_t {
    NotRevoked = 0,    // also: not determined yet
    RevokedByCrl = 1,  // the certificate is listed
    KeyRevoked = 2,    // its subject's key is listed
    Undetermined = 3,  // the check failed
  };

  // An empty certificate, for Import or Set.
  explicit Cert(Vesk2ContextStruct* context);
  // No context. (A bare nullptr would not tell the other two constructors apart.)
  explicit Cert(std::nullptr_t);
  // A certificate view of a trust root: the fields borrow the entry's objects and no list is built,
  // so that it cannot be exported or hashed. The entry must not be null, and must outlive it.
  explicit Cert(AclEntry* entry);

 protected:
  ~Cert() override;

 public:
  // Import reads the canonical form into an empty object. Time stamps are read as byte strings, not
  // checked, and neither is the signature. A list of another keyword of three letters in the tag's
  // place is taken for the tag. After a failure the object is partly built: free it.
  //   VESK2_ERR_INVALID_PARAM  no buffer, or an object in use
  //   VESK2_ERR_PARSE_FILE, VESK2_ERR_MAX_BYTE_STRING
  //                            it has another form
  //   VESK2_ERR_PRINCIPAL, VESK2_ERR_HASH_ID, VESK2_ERR_INVALID_HASH
  //                            of the issuer or the subject
  //   VESK2_ERR_MEM_ALLOC      memory ran out
  [[nodiscard]] int Import(ZvBuffer* buffer);
  using SExpression::Import;

  // Set builds an empty object from parts, always with a version. Parts are shared: the certificate
  // takes its own references. Only `issuer` and `subject` are required, the others may be null;
  // without a `tag` it grants whatever is asked. The parts are not judged: what is built from
  // another tag than (tag ...), or a revocation element that does not begin "(1", does not read
  // back the same. VESK2_ERR_INVALID_PARAM (a required part, or an object in use),
  // VESK2_ERR_MEM_ALLOC; the object is of no use after a failure.
  [[nodiscard]] int Set(Principal* issuer, Subject* subject, bool propagate, SExpression* tag,
                        TimeStamp* notBefore, TimeStamp* notAfter, ByteString* comment,
                        SExpression* revocationElement);
  // Clone is Set with the parts of `other`, which it shares. The clone has a version even where
  // `other` has none, and then another digest: no signature of the one holds for the other.
  [[nodiscard]] int Clone(Cert* other);

  // IsRevoked asks the revocation lists `crls` (of CrlSequence), vouched for by `acls` (of
  // AclEntry), about the subject's key and, when the certificate has a revocation element, about
  // the certificate in the given period. The lists are borrowed, and either may be null, for none.
  // Result 0 with `revoked` set and the status 0, 1 or 2; any other result (the codes of
  // CrlSequence::CheckStatusCritical and CheckStatusNonCritical) leaves status 3, and `revoked`
  // false: look at the result first.
  //
  // Only the subject is looked up: not the key of the ACL entry that the chain ends at, not an
  // issuer that no certificate is for, not the members of a k-of-n. Take such a key back by
  // removing the entry. A certificate on a list counts from the item's date on: it is revoked when
  // that is not after `notBefore`, and always when that is null. `notAfter` has no effect. A
  // revoked key has no date: it is revoked always.
  [[nodiscard]] int IsRevoked(bool& revoked, SExpression* acls, SExpression* crls,
                              TimeStamp* notBefore, TimeStamp* notAfter);
  // The same against the installed stores at this moment. VESK2_ERR_FILE_NOT_FOUND without an ACL
  // entry, VESK2_ERR_MEM_ALLOC, VESK2_ERR_READ_FILE (another process held a file), and the codes
  // above.
  [[nodiscard]] int IsRevoked(bool& revoked);

  // The parts, borrowed; null when absent. The version is (version 1), which says nothing.
  SExpression* GetVersion() const;
  // Who grants. Null of a view of a trust root.
  Principal* GetIssuer() const;
  // To whom: a key, a hash, or a k-of-n.
  Subject* GetSubject() const;
  // Whether the subject may pass the grant on. For the second certificate of a manifest it makes no
  // difference.
  bool GetPropagate() const;
  // What is granted. Null, (tag) alone, and any list that is not headed by "tag" are the widest
  // grant.
  SExpression* GetTag() const;
  // The period; null where it is open. Of an imported certificate these are byte strings that
  // nobody checked, and compared as they are.
  TimeStamp* GetNotBefore() const;
  TimeStamp* GetNotAfter() const;
  // Text of the issuer, as it was written: see Wording::Escape.
  ByteString* GetComment() const;
  // What names the source of lists without which the certificate is undetermined. Without this
  // element no list can name the certificate, only its key.
  SExpression* GetRevocationElement() const;
  // A RevocationStatus, as the last question left it. Evidence keeps one for each certificate of
  // its own.
  int32_t GetRevocationStatus() const;

 private:
  friend class RevocationLists;  // which sets the status
  // The elements that Import reads and Set builds, in order.
  [[nodiscard]] VESK2_LOCAL int AppendVersion();
  [[nodiscard]] VESK2_LOCAL int AppendPropagate();
  [[nodiscard]] VESK2_LOCAL int ImportParties(ZvBuffer* buffer);
  [[nodiscard]] VESK2_LOCAL int ImportValidity(ZvBuffer* buffer);
  [[nodiscard]] VESK2_LOCAL int ImportElement(ZvBuffer* buffer, SExpression*& field);
  [[nodiscard]] VESK2_LOCAL int SetValidity(TimeStamp* newNotBefore, TimeStamp* newNotAfter);

  // Borrowed from the list, but in a view of a trust root from the entry.
  SExpression* version = nullptr;
  Principal* issuer = nullptr;
  Subject* subject = nullptr;
  bool propagate = false;
  SExpression* tag = nullptr;
  TimeStamp* notBefore = nullptr;
  TimeStamp* notAfter = nullptr;
  // What the list holds is what is written, hashed and compared; the fields are a view of it.
  ByteString* comment = nullptr;
  SExpression* revocationElement = nullptr;
  int32_t revocationStatus = NotRevoked;
  [[maybe_unused]] int32_t reserved = 0;  // always 0
};

}  // namespace ZvVesk2

#endif  // VESK2_CERT_H
