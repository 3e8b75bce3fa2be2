// SPDX-License-Identifier: Apache-2.0
// cert.h: Cert, an authorization certificate: an issuer grants a subject what a tag describes.
//
//   (cert [(version 1)] (issuer <principal>) (subject <subject>) [(propagate)] [<tag>]
//         [(valid [(not-before <stamp>)] [(not-after <stamp>)])] [(comment <text>)]
//         [<revocation element>])
//
// in this order. The tag is any list whose keyword has three characters, the revocation element any
// whose text begins with "(1". Without (propagate) the subject may not pass the grant on.
#ifndef VESK2_CERT_H
#define VESK2_CERT_H

#include <vesk2/subject.h>
#include <vesk2/time_stamp.h>

#include <cstddef>

namespace ZvVesk2 {

class AclEntry;
class RevocationLists;

class VESK2_API Cert : public SExpression {
 public:
  // Revocation status, set by IsRevoked.
  enum RevocationStatus : int32_t {
    NotRevoked = 0,    // also: not determined yet
    RevokedByCrl = 1,  // the certificate is listed
    KeyRevoked = 2,    // its subject's key is listed
    Undetermined = 3,  // the check failed
  };

  explicit Cert(Vesk2ContextStruct* context);
  // No context. (A bare nullptr would not tell the other two constructors apart.)
  explicit Cert(std::nullptr_t);
  // A certificate view of a trust root: the fields borrow the entry's objects and no list is built.
  // The entry must outlive it.
  explicit Cert(AclEntry* entry);

 protected:
  ~Cert() override;

 public:
  // Import reads the canonical form into an empty object. Time stamps are read as byte strings, not
  // checked. After a failure the object is partly built: free it.
  [[nodiscard]] int Import(ZvBuffer* buffer);
  using SExpression::Import;

  // Set builds an empty object from parts, always with a version. Parts are shared: the certificate
  // takes its own references. Only `issuer` and `subject` are required (VESK2_ERR_INVALID_PARAM).
  [[nodiscard]] int Set(Principal* issuer, Subject* subject, bool propagate, SExpression* tag,
                        TimeStamp* notBefore, TimeStamp* notAfter, ByteString* comment,
                        SExpression* revocationElement);
  // Clone is Set with the parts of `other`.
  [[nodiscard]] int Clone(Cert* other);

  // IsRevoked asks the revocation lists `crls`, vouched for by `acls`, about the subject's key and,
  // when the certificate has a revocation element, about the certificate in the given period.
  // Result 0 with `revoked` set and the status 0, 1 or 2; any other result leaves status 3.
  [[nodiscard]] int IsRevoked(bool& revoked, SExpression* acls, SExpression* crls,
                              TimeStamp* notBefore, TimeStamp* notAfter);
  // The same against the installed stores at this moment.
  [[nodiscard]] int IsRevoked(bool& revoked);

  // The parts, borrowed; null when absent.
  SExpression* GetVersion() const;
  Principal* GetIssuer() const;
  Subject* GetSubject() const;
  bool GetPropagate() const;
  SExpression* GetTag() const;
  TimeStamp* GetNotBefore() const;
  TimeStamp* GetNotAfter() const;
  ByteString* GetComment() const;
  SExpression* GetRevocationElement() const;
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

  SExpression* version = nullptr;
  Principal* issuer = nullptr;
  Subject* subject = nullptr;
  bool propagate = false;
  SExpression* tag = nullptr;
  TimeStamp* notBefore = nullptr;
  TimeStamp* notAfter = nullptr;
  ByteString* comment = nullptr;
  SExpression* revocationElement = nullptr;
  int32_t revocationStatus = NotRevoked;
  [[maybe_unused]] int32_t reserved = 0;  // always 0
};

}  // namespace ZvVesk2

#endif  // VESK2_CERT_H
