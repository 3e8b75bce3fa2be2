// CertSequence: looking for a stored chain by what its first certificate grants.
#include <vesk2/cert_sequence.h>

#include <cstring>

#include "src/platform/file.h"
#include "src/platform/text.h"
#include "src/sexpr/same.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {
namespace {

using ZVsysutil::ZvDir;

int OpenStore(ZvDir& directory) {
  const TextPtr path(CertSequence::CalcDir(StorageHome));
  VESK2_REQUIRE(path, VESK2_ERR_MEM_ALLOC);
  return directory.open(path.get(), "*.cert");
}

int ReadFirst(Ref<Cert>& cert, const char* name, Vesk2ContextStruct* ctx) {
  Ref<Signature> signature;
  Ref<SExpression> extra;
  return CertSequence::Import(cert.Out(), signature.Out(), extra.Out(), name, false, ctx);
}

// Appends the name together with its terminating 0 byte: callers print the bytes as a C string.
int AppendName(SExpression* names, const char* name) {
  Ref<ByteString> text(TryNew<ByteString>(names->GetContext()));
  VESK2_REQUIRE(text, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(text->Set(reinterpret_cast<const unsigned char*>(name),
                      static_cast<unsigned int>(std::strlen(name)) + 1, ByteString::BsNone));
  return Append(names, std::move(text));
}

}  // namespace

int CertSequence::Find(char*& fileName, SExpression* tag) {
  VESK2_REQUIRE(fileName == nullptr && tag != nullptr, VESK2_ERR_INVALID_PARAM);
  ZvDir directory;
  VESK2_TRY(OpenStore(directory));
  TextPtr found;
  int status = VESK2_ERR_FILE_NOT_FOUND;
  while (const char* name = directory.read(false)) {
    // A file that cannot be read might carry the tag too: the answer would not be the only one.
    Ref<Cert> cert;
    VESK2_TRY(ReadFirst(cert, name, tag->GetContext()));
    bool equal = false;
    VESK2_TRY(CompareValues(equal, cert->GetTag(), tag));
    if (!equal) continue;
    status = found ? VESK2_ERR_MULTI_AUTH_MATCH : 0;
    if (found) continue;
    found.reset(ZVsysutil::zv_strdup(name));
    VESK2_REQUIRE(found, VESK2_ERR_MEM_ALLOC);
  }
  VESK2_REQUIRE(!directory.failed(), VESK2_ERR_MEM_ALLOC);
  fileName = found.release();
  return status;
}

int CertSequence::Find(SExpression*& names, SExpression* tag) {
  VESK2_REQUIRE(names == nullptr && tag != nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<SExpression> list(TryNew<SExpression>(tag->GetContext()));
  VESK2_REQUIRE(list, VESK2_ERR_MEM_ALLOC);
  ZvDir directory;
  VESK2_TRY(OpenStore(directory));
  while (const char* name = directory.read(false)) {
    Ref<Cert> cert;
    const int code = ReadFirst(cert, name, tag->GetContext());
    VESK2_REQUIRE(!LacksMemory(code), VESK2_ERR_MEM_ALLOC);
    if (code != 0 || !tag->IsSubset(cert->GetTag())) continue;
    VESK2_TRY(AppendName(list.get(), name));
  }
  VESK2_REQUIRE(!directory.failed(), VESK2_ERR_MEM_ALLOC);
  names = list.Release();
  return 0;
}

}  // namespace ZvVesk2
