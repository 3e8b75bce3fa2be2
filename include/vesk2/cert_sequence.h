// SPDX-License-Identifier: Apache-2.0
// cert_sequence.h: CertSequence, the chain that a requester presents:
//
//   (sequence <certificate> <signature> <expression> <certificate> <signature> <expression> ...)
//
// the end-entity certificate first. The third item of each triple ("owner") is carried along and
// not interpreted. It is not signed: show it as hearsay. Files: "cert"/*.cert below the home root,
// or any path. `usePath` tells which: false resolves the name in the home store, true takes it as a
// path, ".cert" appended unless it is there.
//
//   Ref<CertSequence> chain;
//   int code = CertSequence::Import(chain.Out(), "calc.cert", true, nullptr);
//   if (code == 0) code = chain->Verify(nullptr, tag, now, now);        0: granted
#ifndef VESK2_CERT_SEQUENCE_H
#define VESK2_CERT_SEQUENCE_H

#include <vesk2/cert.h>
#include <vesk2/signature.h>

namespace ZvVesk2 {

class Evidence;

// CertSequence is a list of triples that readers guarantee and Insert does not: the verifications
// refuse what is not whole.
class VESK2_API CertSequence : public SExpression {
 public:
  // An empty object, without its keyword: Init adds it. Readers make their own.
  explicit CertSequence(Vesk2ContextStruct* context);

 protected:
  ~CertSequence() override;

 public:
  const char* DirectoryName() const override;
  const char* ExtensionName() const override;
  // "cert" and ".cert"; the argument changes nothing.
  static const char* DirectoryName(bool);
  static const char* ExtensionName(bool);
  // See SExpression::CalcDir and CalcPath. The store is that of StorageHome.
  static char* CalcDir(StorageType type);
  static char* CalcPath(const char* name, StorageType type);

  // Init adds the keyword to an empty object (VESK2_ERR_INVALID_PARAM for another one); Insert the
  // items of each triple afterwards.
  [[nodiscard]] int Init();

  // Import reads a whole sequence, for the caller to free; one without triples is fine. `out` must
  // be null. What follows it is ignored, and in a buffer left unread; the command refuses it.
  // Nothing is verified. A sequence from a file keeps its path.
  //   VESK2_ERR_INVALID_PARAM            `out` is not null, no buffer, or no name
  //   VESK2_ERR_FILE_OPEN                the file cannot be opened or read
  //   VESK2_ERR_READ_FILE                another process held the file for Limits::kMaxHeldWait
  //   VESK2_ERR_MEM_ALLOC                memory or descriptors ran out; also: no such path, as when
  //                                      there is no home root
  //   VESK2_ERR_PARSE_FILE and the like  what the readers of the items report
  [[nodiscard]] static int Import(CertSequence*& out, ZvBuffer* buffer, Vesk2ContextStruct* ctx);
  [[nodiscard]] static int Import(CertSequence*& out, const char* name, bool usePath,
                                  Vesk2ContextStruct* ctx);
  // Import reads the first triple only, each item for the caller to free; the rest of the text is
  // not read. The outputs must be null (the buffer form does not test `extra`, and overwrites it)
  // and are null again after a failure. Codes as above.
  [[nodiscard]] static int Import(Cert*& cert, Signature*& signature, SExpression*& extra,
                                  ZvBuffer* buffer, Vesk2ContextStruct* ctx);
  [[nodiscard]] static int Import(Cert*& cert, Signature*& signature, SExpression*& extra,
                                  const char* name, bool usePath, Vesk2ContextStruct* ctx);
  using SExpression::Import;

  // ---- One triple at a time ----

  // GetFirstPair opens a sequence file and reads its first triple; `buffer` stays open at the next
  // one, for GetNextPair or zv_buffer_free. `buffer`, `cert` and `signature` must be null and
  // `name` given (VESK2_ERR_INVALID_PARAM); `extra` is overwritten. After a failure `buffer` is
  // freed and null; outputs that were set by then are the caller's. Codes as in Import.
  //
  //   int code = CertSequence::GetFirstPair(buffer, cert, signature, extra, name, true, nullptr);
  //   while (code == 0 && cert != nullptr) {
  //     const Ref<Cert> held(cert);                 each of the three is to be freed
  //     const Ref<Signature> heldToo(signature);
  //     const Ref<SExpression> heldAsWell(extra);
  //     Use(*cert);
  //     code = CertSequence::GetNextPair(buffer, cert, signature, extra, nullptr);
  //   }
  //   zv_buffer_free(buffer);
  [[nodiscard]] static int GetFirstPair(ZvBuffer*& buffer, Cert*& cert, Signature*& signature,
                                        SExpression*& extra, const char* name, bool usePath,
                                        Vesk2ContextStruct* ctx);
  // GetNextPair reads the next triple over the three outputs; what they held stays the caller's. At
  // the end it returns 0 with `cert` and `signature` null, `extra` as it was and the buffer open,
  // for the caller to free. After a failure the buffer is freed, and `buffer`, `cert` and
  // `signature` are null. VESK2_ERR_INVALID_PARAM without a buffer; codes of the readers.
  [[nodiscard]] static int GetNextPair(ZvBuffer*& buffer, Cert*& cert, Signature*& signature,
                                       SExpression*& extra, Vesk2ContextStruct* ctx);

  // ---- Finding in the home store ----

  // Find returns the bare name (free with Vesk2Free) of the stored sequence whose first certificate
  // carries exactly `tag`. Nothing is verified.
  //   0                           there is one
  //   VESK2_ERR_MULTI_AUTH_MATCH  there are several; `fileName` is that of the first
  //   VESK2_ERR_FILE_NOT_FOUND    there is none
  //   VESK2_ERR_INVALID_PARAM     `fileName` is not null, or no tag
  //   VESK2_ERR_FIND_DIR          there is no such directory
  //   VESK2_ERR_MEM_ALLOC         memory or descriptors ran out; also: no home root
  //   and what Import reports     of a file that cannot be read, which ends the search
  [[nodiscard]] static int Find(char*& fileName, SExpression* tag);
  // Find makes a list, for the caller to free, of byte strings, each a bare name and its
  // terminating 0 byte, of all stored sequences whose first certificate's tag contains `tag`. Files
  // that cannot be read are skipped; no match is an empty list. Nothing is verified. Other codes as
  // above.
  [[nodiscard]] static int Find(SExpression*& names, SExpression* tag);

  // ---- Verification ----
  //
  // Three stages: every signature; no certificate revoked or undetermined; the reduction of the
  // chain, with the ACL store, to the tag. The stores are read afresh by each stage. Results are
  // library codes or, from the reduction, negative engine codes. `tag` is required by the
  // reduction.

  // Three stages: every signature; no certificate revoked or undetermined; the reduction of the
  // chain, with the ACL store, to the tag. The stores are read afresh by each stage. Results are
  // library codes or, from the reduction, negative engine codes. All arguments are borrowed.
  //
  // Verify runs the three stages; the first failure is the result. `subject` null means the subject
  // of the first certificate, which must then be a key or a hash (a k-of-n subject is refused with
  // SPKI_ERR_KEY_OR_HASH_EXPECTED). `tag` is required, by the reduction.
  //
  // Times may be null. With two nulls the periods of the chain must meet one another and nothing
  // else is asked about time: certificates and entries that have ended pass. A period must meet
  // that of each certificate and entry only, not lie within it; with a not-after alone, whatever
  // ended before it passes. Give the moment that is meant twice. Revocation is asked about
  // `notBefore`; without it every item counts, but a list that has ended still serves as proof that
  // nothing else is revoked. The command asks about now.
  //   0                              granted
  //   VESK2_ERR_INVALID_SEQUENCE     empty, or not whole triples
  //   Signature::Verify's            of the first signature that does not hold
  //   VESK2_ERR_CERT_REVOKED         a certificate, or the key that it is for, is revoked
  //   VESK2_ERR_CRL_NOT_FOUND        undetermined: no current list of the source that one names
  //   VESK2_ERR_ACL_ENTRY_NOT_FOUND  no ACL store, or its last file cannot be read
  //   VESK2_ERR_NOT_AUTHORIZED, VESK2_ERR_PACKAGE_NOT_GRANTED, VESK2_ERR_INVALID_PARAM,
  //     SPKI_ERR_*
  //                                  of Verify::ReductA
  //   VESK2_ERR_FILE_OPEN            the root is so long that a stored list can have no path
  //   VESK2_ERR_MEM_ALLOC, VESK2_ERR_READ_FILE
  //                                  a file of a store could not be read for want of memory or
  //                                  descriptors, or because another process held it
  [[nodiscard]] int Verify(Subject* subject, SExpression* tag, TimeStamp* notBefore,
                           TimeStamp* notAfter);
  // The same, keeping what was read and found in `evidence`, which is cleared first: also what
  // comes after a failure, which does not change the answer. VESK2_ERR_MEM_ALLOC when memory runs
  // out on the way.
  [[nodiscard]] int Verify(Subject* subject, SExpression* tag, TimeStamp* notBefore,
                           TimeStamp* notAfter, Evidence& evidence);
  // The same for a sequence file. VESK2_ERR_PARAM_NULL for a null name, Import's codes.
  [[nodiscard]] static int Verify(Subject* subject, SExpression* tag, TimeStamp* notBefore,
                                  TimeStamp* notAfter, const char* name, bool usePath,
                                  Vesk2ContextStruct* ctx);
  // The stages, each with its codes of above and alone: a caller who leaves one out decides without
  // what it proves.
  [[nodiscard]] int VerifySignatures();
  [[nodiscard]] int VerifyRevocations(TimeStamp* notBefore, TimeStamp* notAfter);
  [[nodiscard]] int VerifyChain(Subject* subject, SExpression* tag, TimeStamp* notBefore,
                                TimeStamp* notAfter);

  // Verify2 drops the certificates that fail and returns what the others grant to the subject of
  // the first of them: the tag and the two dates of Verify::ReductB, for the caller to free. The
  // outputs must be null (VESK2_ERR_INVALID_PARAM). Without any certificate left:
  // VESK2_ERR_INVALID_SEQUENCE; other codes as in Verify, but VESK2_ERR_FILE_NOT_FOUND for no ACL
  // entry when the lists are loaded.
  //
  // It does not decide. It succeeds with null outputs when nothing is granted: a null tag is a
  // refusal. A certificate whose revocation state cannot be determined (Cert::Undetermined) is
  // kept, and revocation is asked without a time, so that a list that has ended counts. The tag and
  // the dates may come from different grants. Use Verify, which refuses all that, or look at
  // GetRevocationStatus in the evidence; the command never decides by it.
  [[nodiscard]] int Verify2(SExpression*& first, SExpression*& second, SExpression*& third);
  // The same, keeping in `evidence` the certificates whose signature holds, and what the stores say
  // of them.
  [[nodiscard]] int Verify2(SExpression*& first, SExpression*& second, SExpression*& third,
                            Evidence& evidence);
  // The stages of Verify2. VerifySignatures2 shares the certificates whose signature holds, and
  // their extra items, into the two lists; after one that fails it goes on with that triple's extra
  // item as the next certificate, so that a sequence of whole triples may end in the middle of one
  // (VESK2_ERR_INVALID_SEQUENCE). VerifyRevocations2 replaces the lists by what is not revoked of
  // them, frees the old ones, and leaves both as they were after a failure. VerifyChain2 reduces
  // what is left. VESK2_ERR_PARAM_NULL for a null list.
  [[nodiscard]] int VerifySignatures2(SExpression* goodCerts, SExpression* goodExtras);
  [[nodiscard]] int VerifyRevocations2(SExpression*& goodCerts, SExpression*& goodExtras);
  [[nodiscard]] int VerifyChain2(SExpression* goodCerts, SExpression*& first, SExpression*& second,
                                 SExpression*& third);
};

// CertRequest is a certificate sequence kept in a ".req" file, at a path of its own: there is no
// store of requests.
class VESK2_API CertRequest : public CertSequence {
 public:
  explicit CertRequest(Vesk2ContextStruct* context);

 protected:
  ~CertRequest() override;

 public:
  // "" and ".req": requests have no store.
  const char* DirectoryName() const override;
  const char* ExtensionName() const override;
  using CertSequence::DirectoryName;
  using CertSequence::ExtensionName;

  // Import reads the first triple of the file, ".req" appended unless the name ends in it, each
  // item for the caller to free; `sequence` receives the third. VESK2_ERR_INVALID_PARAM unless all
  // outputs are null and a name is given, VESK2_ERR_FILE_OPEN and CertSequence::Import's.
  [[nodiscard]] static int Import(Cert*& cert, Signature*& signature, SExpression*& sequence,
                                  const char* file, Vesk2ContextStruct* context);
  using CertSequence::Import;
  // Export writes the request to the file, by the same rule. When writing fails the file is left as
  // far as it was written: write elsewhere and rename. VESK2_ERR_INVALID_PARAM for a null or empty
  // name, VESK2_ERR_FILE_OPEN (also: a name that is too long), VESK2_ERR_WRITE_FILE,
  // VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int Export(const char* file);
  using SExpression::Export;
};

}  // namespace ZvVesk2

#endif  // VESK2_CERT_SEQUENCE_H
