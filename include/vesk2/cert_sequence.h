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
  // path), VESK2_ERR_FILE_OPEN, and what the readers of the items report.
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
  // empty name, VESK2_ERR_FILE_OPEN, VESK2_ERR_WRITE_FILE.
  [[nodiscard]] int Export(const char* file);
  using SExpression::Export;
};

}  // namespace ZvVesk2

#endif  // VESK2_CERT_SEQUENCE_H
