// CertRequest: a certificate sequence in a ".req" file, outside every store.
#include <vesk2/cert_sequence.h>

#include "src/trust/lists.h"

namespace ZvVesk2 {

CertRequest::CertRequest(Vesk2ContextStruct* ctx) : CertSequence(ctx) {}

CertRequest::~CertRequest() = default;

const char* CertRequest::DirectoryName() const { return ""; }

const char* CertRequest::ExtensionName() const { return ".req"; }

int CertRequest::Import(Cert*& cert, Signature*& signature, SExpression*& sequence,
                        const char* file, Vesk2ContextStruct* context) {
  VESK2_REQUIRE(cert == nullptr && signature == nullptr && sequence == nullptr && file != nullptr,
                VESK2_ERR_INVALID_PARAM);
  const TextPtr path(SExpression::CalcPath("", ".req", file, StoragePath));
  VESK2_REQUIRE(path, VESK2_ERR_MEM_ALLOC);
  BufferOwner buffer;
  VESK2_TRY(WrapFile(buffer, path.get(), VESK2_ERR_FILE_OPEN));
  return CertSequence::Import(cert, signature, sequence, buffer.get(), context);
}

int CertRequest::Export(const char* file) {
  VESK2_REQUIRE(file != nullptr && *file != '\0', VESK2_ERR_INVALID_PARAM);
  SetStorageType(StoragePath);
  return SExpression::Export(file);
}

}  // namespace ZvVesk2
