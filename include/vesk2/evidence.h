// SPDX-License-Identifier: Apache-2.0
// evidence.h: Evidence, what a verification of a manifest or of a chain read and what it found, and
// what the answer would be if some of it were different.
//
// Hand one to a verification (Manifest::SetEvidence, CertSequence::Verify) and look at it when that
// has answered: it is filled after success and failure alike. After a refusal the verification
// reads on, for the evidence only, as far as the file makes sense and the stores can be read; its
// answer and what it would have stored do not change by that. Nothing here opens a file: what is
// shown or judged is what was verified, whatever lies on the disk by now.
//
//   Evidence evidence(nullptr);
//   const int code = chain->Verify(nullptr, tag, now, now, evidence);
//   for (size_t i = 0; i < evidence.CountCerts(); ++i) Show(evidence.GetRevocationStatus(i));
//
//   Evidence later(nullptr);                               what if it were asked next week?
//   if (later.Copy(evidence) == 0) later.SetPeriod(nextWeek, nextWeek);
//   const int then = later.Judge(tag);
//
// Judging costs what a verification costs without its files, and is bounded as that is. An Evidence
// belongs to one thread, and so do the copies that share its objects.
#ifndef VESK2_EVIDENCE_H
#define VESK2_EVIDENCE_H

#include <vesk2/cert.h>
#include <vesk2/ref.h>
#include <vesk2/signature.h>

#include <cstddef>
#include <memory>

namespace ZvVesk2 {

class CrlSequence;
class Hash;

// Evidence is what an answer about authority rests on: certificates with their signatures'
// verdicts, entries, lists, and the moments that were asked about. It may lie on the stack. What is
// borrowed from it lives until it is cleared, filled again, or destroyed.
class VESK2_API Evidence {
 public:
  // A manifest leaves revoked certificates out and names its content first; a chain is refused for
  // one.
  enum Kind : int32_t { Chain = 0, SignedManifest = 1 };

  // An empty one, of a chain. `ctx` may be null, and must outlive it.
  explicit Evidence(Vesk2ContextStruct* ctx);
  ~Evidence();
  Evidence(const Evidence&) = delete;
  Evidence& operator=(const Evidence&) = delete;

  // Clear begins anew, without any change that was made. Copy makes this one equal to `other`, but
  // for its context; the objects are shared. VESK2_ERR_MEM_ALLOC leaves it empty.
  void Clear(Kind newKind);
  [[nodiscard]] int Copy(const Evidence& other);

  // ---- What was read, borrowed; null for what was not ----
  // Whether a chain or a manifest was verified; and the context that this was made with.
  Kind GetKind() const;
  Vesk2ContextStruct* GetContext() const;
  // The certificates, the end of the chain (of a manifest, the signer certificate) at 0. `index`
  // must be below the count, here and below: it is not tested. A signature is null where none was
  // kept.
  size_t CountCerts() const;
  // A certificate as it was read. Its own status is that of whoever asked last: GetRevocationStatus
  // keeps the one that this judgement found.
  Cert* GetCert(size_t index) const;
  // Its signature, which may not hold: see GetSignatureCode.
  Signature* GetSignature(size_t index) const;
  // The entries (acl <AclEntry>...) as they were loaded; AclEntry::GetFileName tells whence.
  SExpression* GetEntries() const;
  // The revocation lists of the store and those that a manifest carries, lists of CrlSequence.
  SExpression* GetStoredLists() const;
  // Anybody may have put these into the manifest: only those that verify counted.
  SExpression* GetCarriedLists() const;
  // The time of signing, as a manifest says; null of a chain.
  TimeStamp* GetSigningTime() const;
  // The period that was asked about, null where it is open; about a manifest without one, the time
  // of signing twice.
  TimeStamp* GetFirst() const;
  // The end of that period: with the same moment twice both are one.
  TimeStamp* GetLast() const;
  // The moments about which revocation was asked: those of SetRevocationTime, else the period's; of
  // a manifest the time of signing stands in for an end that is open.
  TimeStamp* GetRevocationFirst() const;
  TimeStamp* GetRevocationLast() const;

  // ---- What was found ----
  // 0 when the signature holds, else Signature::Verify's code.
  [[nodiscard]] int GetSignatureCode(size_t index) const;
  // Cert::RevocationStatus; Undetermined until the lists were asked.
  int32_t GetRevocationStatus(size_t index) const;
  // The tag of the lists that speak for the certificate; null when it names none, and its key alone
  // was looked up.
  SExpression* GetRevocationSource(size_t index) const;
  // The list that decided the status: the one that names the certificate or its key, with the date
  // since when (null: always), else of the lists of its source the one that ends last. Null for
  // none.
  CrlSequence* GetRevocationList(size_t index) const;
  // The date of the item that names it. An item without a full date revokes always.
  TimeStamp* GetRevokedSince(size_t index) const;
  // 0 when the signer certificate names the digest of the manifest's content, or when that was not
  // looked at. 0 when the listing can be read, else the code, and the byte of the file at which it
  // stops making sense.
  [[nodiscard]] int GetContentCode() const;
  // As BodyDirectory::ParseBody answered, or VESK2_ERR_PARSE_FILE for bytes behind the listing.
  [[nodiscard]] int GetListingCode() const;
  // Counted from the start of the manifest file.
  size_t GetListingPosition() const;

  // ---- Changes ----
  // The parts are shared. VESK2_ERR_MEM_ALLOC, VESK2_ERR_PARAM_NULL. Revocation is asked again by
  // MarkRevoked and Judge. Nothing that is changed here reaches a store or a file.
  //
  // AddCert adds a certificate at the issuing end, with the verdict on its signature, which is
  // believed; `signature` may be null.
  [[nodiscard]] int AddCert(Cert* cert, Signature* signature, int signatureCode);
  // RemoveCerts removes all. The question stays the one about the end of the chain that there was.
  void RemoveCerts();
  // RemoveCert removes one; `index` must be below the count. What was found about the others stays.
  void RemoveCert(size_t index);
  // Replaces the entries, by a list (acl <entry>...) or null, for no store.
  void SetEntries(SExpression* acl);
  // The entries that may grant; null for all. The others still vouch for revocation lists.
  void SetGrantingEntries(SExpression* acl);
  // Replaces the lists of both kinds; either may be null.
  void SetLists(SExpression* stored, SExpression* carried);
  // Takes it that there is a current list of this source, a tag as GetRevocationSource gives it,
  // which revokes no more than the others. VESK2_ERR_PARAM_NULL.
  [[nodiscard]] int AssumeList(SExpression* source);
  // Takes it that a list which counts names this digest, whenever it is asked: of a key, or of a
  // certificate that names a source. VESK2_ERR_PARAM_NULL.
  [[nodiscard]] int AssumeRevoked(Hash* digest);
  // Whom the question is about; null for the subject of the first certificate.
  void SetSubject(Subject* subject);
  // The time of signing of a manifest. It decides when no period is given.
  void SetSigningTime(TimeStamp* stamp);
  // The period that is asked about; null where it is open. Two nulls ask about the time of signing
  // of a manifest, and about no time of a chain. It must meet the periods of the chain, not lie
  // within them: give one moment twice.
  void SetPeriod(TimeStamp* first, TimeStamp* last);
  // Asks about revocation at this moment, whatever the period; null for the period. So a manifest
  // can be judged by its time of signing, and by what is revoked now.
  void SetRevocationTime(TimeStamp* stamp);
  // What GetContentCode, GetListingCode and GetListingPosition tell.
  void SetContent(int code, int codeOfListing, size_t position);

  // ---- Judging ----
  //
  // The rules of Manifest::VerifyManifest, up to the content, and of CertSequence::Verify: those
  // verifications take these steps themselves.

  // The rules of Manifest::VerifyManifest, up to the content, and of CertSequence::Verify: those
  // verifications take these steps themselves.
  //
  // MarkRevoked asks the lists about every certificate; proofs of an earlier question do not count.
  // VESK2_ERR_PARAM_NULL without entries, VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int MarkRevoked();
  // CheckRevoked is the refusal that comes of the answers: VESK2_ERR_CRL_NOT_FOUND,
  // VESK2_ERR_CERT_REVOKED, VESK2_ERR_SIGNING_CERT_ORDER, or 0.
  [[nodiscard]] int CheckRevoked() const;
  // Reduce asks whether what is left grants the tag: Verify::ReductA's codes. Prove checks the
  // answers about revocation first. Neither looks at signatures: Judge does.
  [[nodiscard]] int Reduce(SExpression* tag);
  // What a verification asks when signatures and form are done with: CheckRevoked's codes, then
  // Reduce's.
  [[nodiscard]] int Prove(SExpression* tag);
  // Judge takes all the steps: the code that a verification of this would give, of its form, its
  // signatures in their order, revocation and the reduction; the content of a manifest does not
  // enter.
  [[nodiscard]] int Judge(SExpression* tag);
  // Grants returns what is granted, whatever is asked: the outputs of Verify::ReductB, which must
  // be null, for the caller to free. A null tag means that nothing is.
  [[nodiscard]] int Grants(SExpression*& tag, SExpression*& notBefore,
                           SExpression*& notAfter) const;
  // RelevantEntries makes the list of the entries that name a key of the chain, for the caller to
  // free: that grant to it, to its digest, or to a k-of-n that counts it. `out` must be null.
  // VESK2_ERR_INVALID_PARAM, VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int RelevantEntries(SExpression*& out) const;
  // Size is about how many bytes one Judge works on, GetWork what the last reduction cost (see
  // Verify::WorkDone): what a further question about the same may cost.
  size_t Size() const;
  // 0 until there was a reduction.
  uint64_t GetWork() const;

 private:
  // A certificate with its signature, and what was found about both.
  struct Link;
  // Makes room for that many certificates.
  [[nodiscard]] VESK2_LOCAL int Reserve(size_t wanted);
  // Adds to what is assumed; whether AssumeList was told of the source.
  [[nodiscard]] VESK2_LOCAL int Assume(DExpression* item);
  [[nodiscard]] VESK2_LOCAL int Assumed(bool& assumed, SExpression* source) const;
  // What is refused before a store is asked: too few certificates, no digest, a signature that does
  // not hold.
  [[nodiscard]] VESK2_LOCAL int CheckForm() const;
  // The (valid ...) of the question, and the chain as the reduction gets it: without what is
  // revoked of a manifest, each certificate changed as its place wants it.
  [[nodiscard]] VESK2_LOCAL int MakePeriod(Ref<SExpression>& out) const;
  [[nodiscard]] VESK2_LOCAL int BuildChain(Ref<SExpression>& out) const;
  [[nodiscard]] VESK2_LOCAL int AppendLink(SExpression* chain, size_t index, size_t place) const;
  // Whether the question is about the time of signing, as no period was given; and whom it is
  // about.
  VESK2_LOCAL bool AskedAboutSigning() const;
  VESK2_LOCAL Subject* AskedSubject() const;

  Vesk2ContextStruct* context;
  // What was read, shared with the copies of this; what is set and not found follows it.
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
