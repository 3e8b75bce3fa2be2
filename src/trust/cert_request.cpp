// SPDX-License-Identifier: Apache-2.0
// CertRequest: a certificate sequence in a ".req" file, outside every store. A request travels to
// who may grant it and is not kept: it has no store, and its name is a path wherever it is given.
#include <vesk2/cert_sequence.h>

#include "src/sexpr/storage.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {

CertRequest::CertRequest(Vesk2ContextStruct* ctx) : CertSequence(ctx) {}

CertRequest::~CertRequest() = default;

const char* CertRequest::DirectoryName() const { return ""; }

const char* CertRequest::ExtensionName() const { return ".req"; }

// Only the first triple: what a requester asks for is one certificate, and the rest of the file is
// not read for it.
int CertRequest::Import(Cert*& cert, Signature*& signature, SExpression*& sequence,
                        const char* file, Vesk2ContextStruct* context) {
  VESK2_REQUIRE(cert == nullptr && signature == nullptr && sequence == nullptr && file != nullptr,
                VESK2_ERR_INVALID_PARAM);
  TextPtr path;
  VESK2_TRY(FilePath(path, "", ".req", file, StoragePath));
  BufferOwner buffer;
  VESK2_TRY(WrapFile(buffer, path.get(), VESK2_ERR_FILE_OPEN));
  return CertSequence::Import(cert, signature, sequence, buffer.get(), context);
}

int CertRequest::Export(const char* file) {
  VESK2_REQUIRE(file != nullptr && *file != '\0', VESK2_ERR_INVALID_PARAM);
  SetStorageType(StoragePath);
  // A name that no file can have, told apart here from a lack of memory.
  TextPtr path;
  VESK2_TRY(FilePath(path, DirectoryName(), ExtensionName(), file, StoragePath));
  return SExpression::Export(file);
}

}  // namespace ZvVesk2
