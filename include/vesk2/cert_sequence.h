// SPDX-License-Identifier: Apache-2.0
// cert_sequence.h: CertSequence, the chain that a requester presents:
//
//   (sequence <certificate> <signature> <expression> <certificate> <signature> <expression> ...)
//
// the end-entity certificate first. The third item of each triple is carried along and not
// interpreted. Files: "cert"/*.cert below the home root, or any path. `usePath` tells which: false
// resolves the name in the home store, true takes it as a path, ".cert" appended unless it is
// there.
#ifndef VESK2_CERT_SEQUENCE_H
#define VESK2_CERT_SEQUENCE_H

#include <vesk2/cert.h>
#include <vesk2/signature.h>

namespace ZvVesk2 {

class Evidence;

class VESK2_API CertSequence : public SExpression {
 public:
  explicit CertSequence(Vesk2ContextStruct* context);

 protected:
  ~CertSequence() override;

 public:
  const char* DirectoryName() const override;
  const char* ExtensionName() const override;
  // "cert" and ".cert"; the argument changes nothing.
  static const char* DirectoryName(bool);
  static const char* ExtensionName(bool);
  // See SExpression::CalcDir and CalcPath.
  static char* CalcDir(StorageType type);
  static char* CalcPath(const char* name, StorageType type);

  // Init adds the keyword to an empty object; Insert the items of each triple afterwards.
  [[nodiscard]] int Init();

  // Import reads a whole sequence. VESK2_ERR_INVALID_PARAM, VESK2_ERR_MEM_ALLOC (also: no such
  // path), VESK2_ERR_FILE_OPEN, VESK2_ERR_READ_FILE (another process held the file for
  // Limits::kMaxHeldWait), and what the readers of the items report.
  [[nodiscard]] static int Import(CertSequence*& out, ZvBuffer* buffer, Vesk2ContextStruct* ctx);
  [[nodiscard]] static int Import(CertSequence*& out, const char* name, bool usePath,
                                  Vesk2ContextStruct* ctx);
  // Import reads the first triple only; the rest of the text is not read. The outputs must be null
  // (the buffer form does not test `extra`, and overwrites it) and are null again after a failure.
  [[nodiscard]] static int Import(Cert*& cert, Signature*& signature, SExpression*& extra,
                                  ZvBuffer* buffer, Vesk2ContextStruct* ctx);
  [[nodiscard]] static int Import(Cert*& cert, Signature*& signature, SExpression*& extra,
                                  const char* name, bool usePath, Vesk2ContextStruct* ctx);
  using SExpression::Import;

  // ---- One triple at a time ----

  // GetFirstPair opens a sequence file and reads its first triple; `buffer` stays open at the next
  // one. `buffer`, `cert` and `signature` must be null and `name` given (VESK2_ERR_INVALID_PARAM).
  // After a failure `buffer` is freed and null; outputs that were set by then are the caller's.
  [[nodiscard]] static int GetFirstPair(ZvBuffer*& buffer, Cert*& cert, Signature*& signature,
                                        SExpression*& extra, const char* name, bool usePath,
                                        Vesk2ContextStruct* ctx);
  // GetNextPair reads the next triple over the three outputs; what they held stays the caller's. At
  // the end it returns 0 with `cert` and `signature` null, `extra` as it was and the buffer open,
  // for the caller to free. After a failure the buffer is freed, and `buffer`, `cert` and
  // `signature` are null.
  [[nodiscard]] static int GetNextPair(ZvBuffer*& buffer, Cert*& cert, Signature*& signature,
                                       SExpression*& extra, Vesk2ContextStruct* ctx);

  // ---- Finding in the home store ----

  // Find returns the bare name (free with Vesk2Free) of the stored sequence whose first certificate
  // carries exactly `tag`. VESK2_ERR_FILE_NOT_FOUND; VESK2_ERR_MULTI_AUTH_MATCH for several, with
  // the first one's name; a file that cannot be read ends the search with its error.
  // VESK2_ERR_INVALID_PARAM, VESK2_ERR_MEM_ALLOC (also: no home root).
  [[nodiscard]] static int Find(char*& fileName, SExpression* tag);
  // Find makes a list of byte strings, each a bare name and its terminating 0 byte, of all stored
  // sequences whose first certificate's tag contains `tag`. Files that cannot be read are skipped;
  // no match is an empty list.
  [[nodiscard]] static int Find(SExpression*& names, SExpression* tag);

  // ---- Verification ----
  //
  // Three stages: every signature; no certificate revoked or undetermined; the reduction of the
  // chain, with the ACL store, to the tag. The stores are read afresh by each stage. Results are
  // library codes or, from the reduction, negative engine codes. `tag` is required by the
  // reduction.

  // Verify runs the three stages; the first failure is the result. `subject` null means the subject
  // of the first certificate, which must then be a key or a hash (a k-of-n subject is refused with
  // SPKI_ERR_KEY_OR_HASH_EXPECTED). Times may be null.
  //   VESK2_ERR_INVALID_SEQUENCE (empty, or not whole triples), Signature::Verify's,
  //   VESK2_ERR_CERT_REVOKED, VESK2_ERR_CRL_NOT_FOUND (undetermined), VESK2_ERR_ACL_ENTRY_NOT_FOUND
  //   (no ACL store), VESK2_ERR_MEM_ALLOC and VESK2_ERR_READ_FILE (a file of a store could not be
  //   read for want of memory or descriptors, or because another process held it),
  //   Verify::ReductA's.
  [[nodiscard]] int Verify(Subject* subject, SExpression* tag, TimeStamp* notBefore,
                           TimeStamp* notAfter);
  // The same, keeping what was read and found in `evidence`: also what comes after a failure, which
  // does not change the answer. VESK2_ERR_MEM_ALLOC when memory runs out on the way.
  [[nodiscard]] int Verify(Subject* subject, SExpression* tag, TimeStamp* notBefore,
                           TimeStamp* notAfter, Evidence& evidence);
  // The same for a sequence file. VESK2_ERR_PARAM_NULL for a null name.
  [[nodiscard]] static int Verify(Subject* subject, SExpression* tag, TimeStamp* notBefore,
                                  TimeStamp* notAfter, const char* name, bool usePath,
                                  Vesk2ContextStruct* ctx);
  // The stages.
  [[nodiscard]] int VerifySignatures();
  [[nodiscard]] int VerifyRevocations(TimeStamp* notBefore, TimeStamp* notAfter);
  [[nodiscard]] int VerifyChain(Subject* subject, SExpression* tag, TimeStamp* notBefore,
                                TimeStamp* notAfter);

  // Verify2 drops the certificates that fail and returns what the others grant to the subject of
  // the first of them: the outputs of Verify::ReductB, which must be null
  // (VESK2_ERR_INVALID_PARAM). A certificate whose revocation state cannot be determined is kept.
  // Without any certificate left: VESK2_ERR_INVALID_SEQUENCE.
  [[nodiscard]] int Verify2(SExpression*& first, SExpression*& second, SExpression*& third);
  // The same, keeping in `evidence` the certificates whose signature holds, and what the stores say
  // of them.
  [[nodiscard]] int Verify2(SExpression*& first, SExpression*& second, SExpression*& third,
                            Evidence& evidence);
  // The stages of Verify2. VerifySignatures2 shares the certificates whose signature holds, and
  // their extra items, into the two lists; after one that fails it goes on with that triple's extra
  // item as the next certificate. VerifyRevocations2 replaces the lists by what is not revoked of
  // them.
  [[nodiscard]] int VerifySignatures2(SExpression* goodCerts, SExpression* goodExtras);
  [[nodiscard]] int VerifyRevocations2(SExpression*& goodCerts, SExpression*& goodExtras);
  [[nodiscard]] int VerifyChain2(SExpression* goodCerts, SExpression*& first, SExpression*& second,
                                 SExpression*& third);
};

// CertRequest is a certificate sequence kept in a ".req" file.
class VESK2_API CertRequest : public CertSequence {
 public:
  explicit CertRequest(Vesk2ContextStruct* context);

 protected:
  ~CertRequest() override;

 public:
  const char* DirectoryName() const override;
  const char* ExtensionName() const override;
  using CertSequence::DirectoryName;
  using CertSequence::ExtensionName;

  // Import reads the first triple of the file, ".req" appended unless the name ends in it.
  // VESK2_ERR_INVALID_PARAM, VESK2_ERR_FILE_OPEN and CertSequence::Import's.
  [[nodiscard]] static int Import(Cert*& cert, Signature*& signature, SExpression*& sequence,
                                  const char* file, Vesk2ContextStruct* context);
  using CertSequence::Import;
  // Export writes the request to the file, by the same rule. VESK2_ERR_INVALID_PARAM for a null or
  // empty name, VESK2_ERR_FILE_OPEN (also: a name that is too long), VESK2_ERR_WRITE_FILE.
  [[nodiscard]] int Export(const char* file);
  using SExpression::Export;
};

}  // namespace ZvVesk2

#endif  // VESK2_CERT_SEQUENCE_H
