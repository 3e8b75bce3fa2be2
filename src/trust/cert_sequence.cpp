// SPDX-License-Identifier: Apache-2.0
// CertSequence: reading a chain of certificates, whole, triple by triple, or only its first triple.
// A chain comes from whoever wants something granted. Reading it proves nothing; what it costs is
// bounded by the file's size and by the depth of lists.
#include <vesk2/cert_sequence.h>

#include "src/sexpr/storage.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {

CertSequence::CertSequence(Vesk2ContextStruct* ctx) : SExpression(ctx) {}

CertSequence::~CertSequence() = default;

const char* CertSequence::DirectoryName() const { return DirectoryName(true); }

const char* CertSequence::ExtensionName() const { return ExtensionName(true); }

const char* CertSequence::DirectoryName(bool) { return "cert"; }

const char* CertSequence::ExtensionName(bool) { return ".cert"; }

char* CertSequence::CalcDir(StorageType type) {
  return SExpression::CalcDir(DirectoryName(true), type);
}

char* CertSequence::CalcPath(const char* name, StorageType type) {
  return SExpression::CalcPath(DirectoryName(true), ExtensionName(true), name, type);
}

int CertSequence::Init() {
  VESK2_REQUIRE(First() == nullptr, VESK2_ERR_INVALID_PARAM);
  return Insert("sequence");
}

namespace {

constexpr const char* kOpening = "(8:sequence";

// CERT SIGNATURE EXPRESSION
struct Triple {
  Ref<Cert> cert;
  Ref<Signature> signature;
  Ref<SExpression> extra;

  // In this order, as each kind has another reader: a certificate where a signature belongs fails
  // here, and later stages need not ask what they hold.
  [[nodiscard]] int Import(ZvBuffer* buffer, Vesk2ContextStruct* ctx) {
    VESK2_TRY(ImportNew(cert, buffer, ctx));
    VESK2_TRY(ImportNew(signature, buffer, ctx));
    return SExpression::Import(extra.Out(), buffer, ctx);
  }
};

// Finds and reads the file of a sequence, whole: a file that changes while triples are read from it
// would be a chain that nobody wrote.
[[nodiscard]] int OpenFile(BufferOwner& buffer, TextPtr& path, const char* name, bool usePath) {
  const int code =
      FilePath(path, CertSequence::DirectoryName(true), CertSequence::ExtensionName(true), name,
               usePath ? StoragePath : StorageHome);
  VESK2_REQUIRE(code == 0, VESK2_ERR_MEM_ALLOC);  // callers know a name without a path so
  return WrapFile(buffer, path.get(), VESK2_ERR_FILE_OPEN);
}

}  // namespace

// (8:sequence (CERT SIGNATURE EXPRESSION)...)
//
// A sequence without triples is one: what needs a certificate says so itself. Bytes after the last
// ")" are nobody's, and left.
int CertSequence::Import(CertSequence*& out, ZvBuffer* buffer, Vesk2ContextStruct* ctx) {
  VESK2_REQUIRE(out == nullptr && buffer != nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_TRY(buffer->Expect(kOpening));
  Ref<CertSequence> sequence(TryNew<CertSequence>(ctx));
  VESK2_REQUIRE(sequence, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(sequence->Init());
  while (buffer->Peek() == '(') {
    Triple triple;
    VESK2_TRY(triple.Import(buffer, ctx));
    VESK2_TRY(Append(sequence.get(), std::move(triple.cert)));
    VESK2_TRY(Append(sequence.get(), std::move(triple.signature)));
    VESK2_TRY(Append(sequence.get(), std::move(triple.extra)));
  }
  VESK2_TRY(buffer->Expect(")"));
  out = sequence.Release();
  return 0;
}

int CertSequence::Import(CertSequence*& out, const char* name, bool usePath,
                         Vesk2ContextStruct* ctx) {
  VESK2_REQUIRE(out == nullptr && name != nullptr && *name != '\0', VESK2_ERR_INVALID_PARAM);
  BufferOwner buffer;
  TextPtr path;
  VESK2_TRY(OpenFile(buffer, path, name, usePath));
  Ref<CertSequence> sequence;
  VESK2_TRY(Import(sequence.Out(), buffer.get(), ctx));
  // So that a program can write it back to where it was.
  sequence->SetStorageType(usePath ? StoragePath : StorageHome);
  VESK2_TRY(sequence->SetFilePath(path.get()));
  out = sequence.Release();
  return 0;
}

// The first triple tells what a stored chain is about: a store of many is searched without reading
// chains to their ends.
int CertSequence::Import(Cert*& cert, Signature*& signature, SExpression*& extra, ZvBuffer* buffer,
                         Vesk2ContextStruct* ctx) {
  // `extra` may be left over from an earlier read; it is overwritten.
  VESK2_REQUIRE(cert == nullptr && signature == nullptr && buffer != nullptr,
                VESK2_ERR_INVALID_PARAM);
  extra = nullptr;
  VESK2_TRY(buffer->Expect(kOpening));
  Triple triple;
  VESK2_TRY(triple.Import(buffer, ctx));
  cert = triple.cert.Release();
  signature = triple.signature.Release();
  extra = triple.extra.Release();
  return 0;
}

// Here all three must be empty: a name is for one chain, and no output is left over from another.
int CertSequence::Import(Cert*& cert, Signature*& signature, SExpression*& extra, const char* name,
                         bool usePath, Vesk2ContextStruct* ctx) {
  VESK2_REQUIRE(cert == nullptr && signature == nullptr && extra == nullptr && name != nullptr,
                VESK2_ERR_INVALID_PARAM);
  BufferOwner buffer;
  TextPtr path;
  VESK2_TRY(OpenFile(buffer, path, name, usePath));
  return Import(cert, signature, extra, buffer.get(), ctx);
}

// ---- One triple at a time ----

// The walk holds a buffer and no sequence: a program can look at one triple at a time of a chain
// that it would not want in memory as objects.
int CertSequence::GetFirstPair(ZvBuffer*& buffer, Cert*& cert, Signature*& signature,
                               SExpression*& extra, const char* name, bool usePath,
                               Vesk2ContextStruct* ctx) {
  VESK2_REQUIRE(buffer == nullptr && cert == nullptr && signature == nullptr && name != nullptr,
                VESK2_ERR_INVALID_PARAM);
  extra = nullptr;
  BufferOwner opened;
  TextPtr path;
  VESK2_TRY(OpenFile(opened, path, name, usePath));
  VESK2_TRY(opened->Expect(kOpening));
  Triple triple;
  const int code = triple.Import(opened.get(), ctx);
  // Callers look at what was read before the failure, and free it.
  cert = triple.cert.Release();
  signature = triple.signature.Release();
  extra = triple.extra.Release();
  VESK2_TRY(code);
  buffer = opened.release();
  return 0;
}

// The outputs are emptied before anything is tested, so that a loop that looks at `cert` ends on
// every failure.
int CertSequence::GetNextPair(ZvBuffer*& buffer, Cert*& cert, Signature*& signature,
                              SExpression*& extra, Vesk2ContextStruct* ctx) {
  // What the outputs held is the caller's: nothing here frees it.
  cert = nullptr;
  signature = nullptr;
  VESK2_REQUIRE(buffer != nullptr, VESK2_ERR_INVALID_PARAM);
  if (buffer->Peek() == ')') return 0;
  // After a failure the place in the text means nothing, so nobody is to go on from it.
  BufferOwner opened(std::exchange(buffer, nullptr));
  Triple triple;
  VESK2_TRY(triple.Import(opened.get(), ctx));
  buffer = opened.release();
  cert = triple.cert.Release();
  signature = triple.signature.Release();
  extra = triple.extra.Release();
  return 0;
}

}  // namespace ZvVesk2
