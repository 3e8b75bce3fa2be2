// ManifestAuthority: whether the certificates of a manifest, whose signatures hold, grant its tag
// to what the signer certificate names. The steps are taken in the order of declaration, because
// each reports its own failure before the next one looks at its input.
#ifndef VESK2_SRC_MANIFEST_MANIFEST_AUTHORITY_H
#define VESK2_SRC_MANIFEST_MANIFEST_AUTHORITY_H

#include <vesk2/cert.h>
#include <vesk2/ref.h>
#include <vesk2/time_stamp.h>

namespace ZvVesk2 {

class ManifestAuthority {
 public:
  // `certificates` is (sequence <signer> <certificate>...); both outlive this object.
  ManifestAuthority(Vesk2ContextStruct* context, SExpression* certificates, Cert* signer)
      : context_(context), certificates_(certificates), signer_(signer) {}

  // The period that the grant must cover; with both times 0 the moment of signing.
  [[nodiscard]] int SetPeriod(long notBefore, long notAfter, TimeStamp* signingTime);
  // Loads the trust roots of this machine and of `extraAclDirectory` (may be null).
  [[nodiscard]] int LoadRoots(const char* extraAclDirectory);
  // Marks revoked certificates by the stored lists and those that the manifest carries, and with
  // `updateStore` offers the carried ones to the store.
  [[nodiscard]] int MarkRevoked(SExpression* carried, bool updateStore);
  // Reduces the certificates that are left. VESK2_ERR_CERT_REVOKED or VESK2_ERR_CRL_NOT_FOUND when
  // the signer is not among them, VESK2_ERR_SIGNING_CERT_ORDER when the one after it is not its
  // issuer's, and what the reduction answers.
  [[nodiscard]] int Prove(SExpression* tag);

 private:
  int AddTime(const char* name, long seconds, Ref<TimeStamp>& revocationTime);
  int BuildChain(Ref<SExpression>& chain);

  Vesk2ContextStruct* context_;
  SExpression* certificates_;
  Cert* signer_;
  Ref<SExpression> validity_;  // (valid ...)
  Ref<TimeStamp> notBefore_;   // the period in which a revocation counts
  Ref<TimeStamp> notAfter_;
  Ref<SExpression> acls_;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_MANIFEST_MANIFEST_AUTHORITY_H
