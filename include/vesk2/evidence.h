// SPDX-License-Identifier: Apache-2.0
// evidence.h: Evidence, what a verification of a manifest or of a chain read and what it found, and
// what the answer would be if some of it were different.
//
// Hand one to a verification (Manifest::SetEvidence, CertSequence::Verify) and look at it when that
// has answered: it is filled after success and failure alike. After a refusal the verification
// reads on, for the evidence only, as far as the file makes sense and the stores can be read; its
// answer and what it would have stored do not change by that. Nothing here opens a file: what is
// shown or judged is what was verified, whatever lies on the disk by now.
#ifndef VESK2_EVIDENCE_H
#define VESK2_EVIDENCE_H

#include <vesk2/cert.h>
#include <vesk2/ref.h>
#include <vesk2/signature.h>

#include <cstddef>
#include <memory>

namespace ZvVesk2 {

class CrlSequence;

class VESK2_API Evidence {
 public:
  // A manifest leaves revoked certificates out and names its content first; a chain is refused for
  // one.
  enum Kind : int32_t { Chain = 0, SignedManifest = 1 };

  explicit Evidence(Vesk2ContextStruct* ctx);
  ~Evidence();
  Evidence(const Evidence&) = delete;
  Evidence& operator=(const Evidence&) = delete;

  // Clear begins anew. Copy makes this one equal to `other`; the objects are shared.
  // VESK2_ERR_MEM_ALLOC leaves it empty.
  void Clear(Kind newKind);
  [[nodiscard]] int Copy(const Evidence& other);

  // ---- What was read, borrowed; null for what was not ----
  Kind GetKind() const;
  Vesk2ContextStruct* GetContext() const;
  // The certificates, the end of the chain (of a manifest, the signer certificate) at 0. `index`
  // must be below the count.
  size_t CountCerts() const;
  Cert* GetCert(size_t index) const;
  Signature* GetSignature(size_t index) const;
  // The entries (acl <AclEntry>...) as they were loaded; AclEntry::GetFileName tells whence.
  SExpression* GetEntries() const;
  // The revocation lists of the store and those that a manifest carries, lists of CrlSequence.
  SExpression* GetStoredLists() const;
  SExpression* GetCarriedLists() const;
  TimeStamp* GetSigningTime() const;
  // The period that was asked about, null where it is open; about a manifest without one, the time
  // of signing twice.
  TimeStamp* GetFirst() const;
  TimeStamp* GetLast() const;
  // The moments about which revocation was asked.
  TimeStamp* GetRevocationFirst() const;
  TimeStamp* GetRevocationLast() const;

  // ---- What was found ----
  // 0 when the signature holds, else Signature::Verify's code.
  [[nodiscard]] int GetSignatureCode(size_t index) const;
  // Cert::RevocationStatus; Undetermined until the lists were asked.
  int32_t GetRevocationStatus(size_t index) const;
  // The tag of the lists that speak for the certificate; null when it names none.
  SExpression* GetRevocationSource(size_t index) const;
  // The list that decided the status: the one that names the certificate or its key, with the date
  // since when (null: always), else of the lists of its source the one that ends last. Null for
  // none.
  CrlSequence* GetRevocationList(size_t index) const;
  TimeStamp* GetRevokedSince(size_t index) const;
  // 0 when the signer certificate names the digest of the manifest's content. 0 when the listing
  // can be read, else the code, and the byte of the file at which it stops making sense.
  [[nodiscard]] int GetContentCode() const;
  [[nodiscard]] int GetListingCode() const;
  size_t GetListingPosition() const;

  // ---- Changes ----
  //
  // The parts are shared. VESK2_ERR_MEM_ALLOC, VESK2_ERR_PARAM_NULL. Revocation is asked again by
  // MarkRevoked and Judge.
  [[nodiscard]] int AddCert(Cert* cert, Signature* signature, int signatureCode);
  // RemoveCerts removes all. The question stays the one about the end of the chain that there was.
  void RemoveCerts();
  // RemoveCert removes one. What was found about the others stays.
  void RemoveCert(size_t index);
  void SetEntries(SExpression* acl);
  // The entries that may grant; null for all. The others still vouch for revocation lists.
  void SetGrantingEntries(SExpression* acl);
  void SetLists(SExpression* stored, SExpression* carried);
  // Takes it that there is a current list of this source, which revokes no more than the others.
  [[nodiscard]] int AssumeList(SExpression* source);
  void SetSubject(Subject* subject);
  void SetSigningTime(TimeStamp* stamp);
  void SetPeriod(TimeStamp* first, TimeStamp* last);
  // Asks about revocation at this moment, whatever the period; null for the period.
  void SetRevocationTime(TimeStamp* stamp);
  void SetContent(int code, int codeOfListing, size_t position);

  // ---- Judging ----
  //
  // The rules of Manifest::VerifyManifest, up to the content, and of CertSequence::Verify: those
  // verifications take these steps themselves.

  // MarkRevoked asks the lists about every certificate. VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int MarkRevoked();
  // CheckRevoked is the refusal that comes of the answers: VESK2_ERR_CRL_NOT_FOUND,
  // VESK2_ERR_CERT_REVOKED, VESK2_ERR_SIGNING_CERT_ORDER, or 0.
  [[nodiscard]] int CheckRevoked() const;
  // Reduce asks whether what is left grants the tag: Verify::ReductA's codes. Prove checks the
  // answers about revocation first.
  [[nodiscard]] int Reduce(SExpression* tag);
  [[nodiscard]] int Prove(SExpression* tag);
  // Judge takes all the steps: the code that a verification of this would give.
  [[nodiscard]] int Judge(SExpression* tag);
  // Grants returns what is granted, whatever is asked: the outputs of Verify::ReductB.
  [[nodiscard]] int Grants(SExpression*& tag, SExpression*& notBefore,
                           SExpression*& notAfter) const;
  // RelevantEntries makes the list of the entries that name a key of the chain: that grant to it,
  // to its digest, or to a k-of-n that counts it. `out` must be null. VESK2_ERR_INVALID_PARAM,
  // VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int RelevantEntries(SExpression*& out) const;
  // Size is about how many bytes one Judge works on, GetWork what the last reduction cost (see
  // Verify::WorkDone): what a further question about the same may cost.
  size_t Size() const;
  uint64_t GetWork() const;

 private:
  struct Link;
  [[nodiscard]] VESK2_LOCAL int Reserve(size_t wanted);
  [[nodiscard]] VESK2_LOCAL int Assumed(bool& assumed, SExpression* source) const;
  [[nodiscard]] VESK2_LOCAL int CheckForm() const;
  [[nodiscard]] VESK2_LOCAL int MakePeriod(Ref<SExpression>& out) const;
  [[nodiscard]] VESK2_LOCAL int BuildChain(Ref<SExpression>& out) const;
  [[nodiscard]] VESK2_LOCAL int AppendLink(SExpression* chain, size_t index, size_t place) const;
  VESK2_LOCAL bool AskedAboutSigning() const;
  VESK2_LOCAL Subject* AskedSubject() const;

  Vesk2ContextStruct* context;
  Kind kind = Chain;
  std::unique_ptr<Link[]> links;
  size_t count = 0;
  size_t capacity = 0;
  Ref<SExpression> entries;
  Ref<SExpression> granting;
  Ref<SExpression> storedLists;
  Ref<SExpression> carriedLists;
  Ref<SExpression> assumed;
  Ref<Subject> subject;
  Ref<TimeStamp> signingTime;
  Ref<TimeStamp> first;
  Ref<TimeStamp> last;
  Ref<TimeStamp> revocationTime;
  int contentCode = 0;
  int listingCode = 0;
  size_t listingPosition = 0;
  uint64_t work = 0;
};

}  // namespace ZvVesk2

#endif  // VESK2_EVIDENCE_H
