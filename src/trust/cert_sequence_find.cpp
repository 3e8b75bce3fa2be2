// SPDX-License-Identifier: Apache-2.0
// CertSequence: looking for a stored chain by what its first certificate grants. Nothing is
// verified: who finds a chain here presents it, and is judged then. The two searches differ in what
// a file that cannot be read means: for "the one chain" it is an error, for "all that could do" one
// fewer.
#include <vesk2/cert_sequence.h>

#include <cstring>

#include "src/platform/text.h"
#include "src/sexpr/same.h"
#include "src/trust/lists.h"
#include "src/trust/scan.h"

namespace ZvVesk2 {
namespace {

// Programs know a missing home root by this code.
[[nodiscard]] int OpenStore(Scan& scan) {
  TextPtr directory;
  VESK2_REQUIRE(StoreDirectory(directory, CertSequence::DirectoryName(true), StorageHome) == 0,
                VESK2_ERR_MEM_ALLOC);
  return scan.Open(directory.get(), "*.cert");
}

// What the chain is for is said by the tag of its first certificate: the rest of the file is not
// read.
[[nodiscard]] int ReadFirst(Ref<Cert>& cert, const char* path, Vesk2ContextStruct* ctx) {
  BufferOwner buffer;
  VESK2_TRY(WrapFile(buffer, path, VESK2_ERR_FILE_OPEN));
  Ref<Signature> signature;
  Ref<SExpression> extra;
  return CertSequence::Import(cert.Out(), signature.Out(), extra.Out(), buffer.get(), ctx);
}

// The bare name of what was found. A scan's paths always have a "/".
const char* NameOf(const char* path) { return std::strrchr(path, '/') + 1; }

// Appends the name together with its terminating 0 byte: callers print the bytes as a C string.
[[nodiscard]] int AppendName(SExpression* names, const char* name) {
  Ref<ByteString> text(TryNew<ByteString>(names->GetContext()));
  VESK2_REQUIRE(text, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(text->Set(reinterpret_cast<const unsigned char*>(name),
                      static_cast<unsigned int>(std::strlen(name)) + 1, ByteString::BsNone));
  return Append(names, std::move(text));
}

}  // namespace

// Goes on after the first match: that there are several is the answer, and the first name is handed
// out with it.
int CertSequence::Find(char*& fileName, SExpression* tag) {
  VESK2_REQUIRE(fileName == nullptr && tag != nullptr, VESK2_ERR_INVALID_PARAM);
  Scan scan;
  VESK2_TRY(OpenStore(scan));
  TextPtr found;
  int status = VESK2_ERR_FILE_NOT_FOUND;
  while (scan.Next()) {
    // A file that cannot be read might carry the tag too: the answer would not be the only one.
    Ref<Cert> cert;
    VESK2_TRY(ReadFirst(cert, scan.Path(), tag->GetContext()));
    bool equal = false;
    VESK2_TRY(CompareValues(equal, cert->GetTag(), tag));
    if (!equal) continue;
    status = found ? VESK2_ERR_MULTI_AUTH_MATCH : 0;
    if (found) continue;
    found.reset(ZVsysutil::zv_strdup(NameOf(scan.Path())));
    VESK2_REQUIRE(found, VESK2_ERR_MEM_ALLOC);
  }
  VESK2_TRY(scan.Result(0));
  fileName = found.release();
  return status;
}

// A comparison that fails reads as "does not cover" (IsSubset), so that a chain may be left out;
// none is named that does not.
int CertSequence::Find(SExpression*& names, SExpression* tag) {
  VESK2_REQUIRE(names == nullptr && tag != nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<SExpression> list(TryNew<SExpression>(tag->GetContext()));
  VESK2_REQUIRE(list, VESK2_ERR_MEM_ALLOC);
  Scan scan;
  VESK2_TRY(OpenStore(scan));
  while (scan.Next()) {
    Ref<Cert> cert;
    if (!scan.Took(ReadFirst(cert, scan.Path(), tag->GetContext()))) continue;
    if (!tag->IsSubset(cert->GetTag())) continue;
    VESK2_TRY(AppendName(list.get(), NameOf(scan.Path())));
  }
  VESK2_TRY(scan.Result(0));
  names = list.Release();
  return 0;
}

}  // namespace ZvVesk2
