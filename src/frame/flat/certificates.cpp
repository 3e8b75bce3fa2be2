// SPDX-License-Identifier: Apache-2.0
// Flat functions: verifying certificate sequences, and listing those of a directory. They turn
// texts and seconds into objects, ask the class, and hand on its code. No rule of verification is
// here.
#include <vesk2/cert_sequence.h>
#include <vesk2/manifest.h>

#include <memory>

#include "src/frame/check.h"
#include "src/frame/flat/ascii_text.h"
#include "src/frame/flat/explanations.h"
#include "src/manifest/ignore.h"
#include "src/platform/text.h"
#include "src/platform/wait.h"
#include "src/trust/lists.h"
#include "src/trust/scan.h"

using namespace ZvVesk2;

namespace {

// ---- Verifying ----

// `out` is null when nobody wants to know why. `path` is for its texts. 0 seconds mean "not given",
// so that the epoch itself cannot be asked about. The code is in the library's own words, so that
// whoever calls from C tests for one lack of memory.
[[nodiscard]] int VerifySequence(CertSequence* sequence, const char* tagText, time_t notBefore,
                                 time_t notAfter, const char* path, Vesk2ExplanationStruct** out) {
  Vesk2ContextStruct* const context = sequence->GetContext();
  Ref<SExpression> tag;
  VESK2_TRY(SExpression::ParseTagAdvanced(tag.Out(), tagText, "tag", context));
  Ref<TimeStamp> from;
  Ref<TimeStamp> to;
  // Stamps of what is given; the other end stays open.
  if (notBefore != 0) VESK2_TRY(MakeStamp(from, notBefore, context));
  if (notAfter != 0) VESK2_TRY(MakeStamp(to, notAfter, context));
  // No subject: the chain is presented for whoever its first certificate is about.
  if (out == nullptr) {
    return InOwnWords(sequence->Verify(nullptr, tag.get(), from.get(), to.get()));
  }
  // Kept for the explanation alone; the verification answers the same with and without it.
  Evidence evidence(context);
  const int code = InOwnWords(sequence->Verify(nullptr, tag.get(), from.get(), to.get(), evidence));
  *out = ExplainAnswer({evidence, code, code, tag.get(), path, nullptr});
  return code;
}

// One ZvCall for reading and verifying: the wait for held files is one for the whole call.
[[nodiscard]] int VerifyFile(const char* path, const char* tagText, time_t notBefore,
                             time_t notAfter, Vesk2ExplanationStruct** out) {
  VESK2_REQUIRE(path != nullptr, VESK2_ERR_PARAM_NULL);
  const ZVsysutil::ZvCall call;
  Ref<CertSequence> sequence;
  VESK2_TRY(CertSequence::Import(sequence.Out(), path, true, nullptr));
  return VerifySequence(sequence.get(), tagText, notBefore, notAfter, path, out);
}

}  // namespace

int Vesk2CertVerify(Vesk2CertInfoStruct* chain, const char* tagText, time_t notBefore,
                    time_t notAfter) {
  VESK2_REQUIRE(chain != nullptr, VESK2_ERR_PARAM_NULL);
  return VerifySequence(chain->sequence, tagText, notBefore, notAfter, nullptr, nullptr);
}

// The output is null before anything can fail, so that a program can free it whatever is answered.
int Vesk2CertVerifyExplained(Vesk2CertInfoStruct* chain, const char* tagText, time_t notBefore,
                             time_t notAfter, Vesk2ExplanationStruct** out) {
  VESK2_REQUIRE(out != nullptr, VESK2_ERR_PARAM_NULL);
  *out = nullptr;
  VESK2_REQUIRE(chain != nullptr, VESK2_ERR_PARAM_NULL);
  return VerifySequence(chain->sequence, tagText, notBefore, notAfter, nullptr, out);
}

int Vesk2CertVerifyFile(const char* path, const char* tagText, time_t notBefore, time_t notAfter) {
  return VerifyFile(path, tagText, notBefore, notAfter, nullptr);
}

int Vesk2CertVerifyFileExplained(const char* path, const char* tagText, time_t notBefore,
                                 time_t notAfter, Vesk2ExplanationStruct** out) {
  VESK2_REQUIRE(out != nullptr, VESK2_ERR_PARAM_NULL);
  *out = nullptr;
  return VerifyFile(path, tagText, notBefore, notAfter, out);
}

int Vesk2CertVerifyFileExplainedA(const char* path, const char* tagText, time_t notBefore,
                                  time_t notAfter, Vesk2ExplanationStruct** out) {
  VESK2_REQUIRE(out != nullptr, VESK2_ERR_PARAM_NULL);
  *out = nullptr;
  const AsciiText name(path);
  VESK2_REQUIRE(!name.OutOfMemory(), VESK2_ERR_MEM_ALLOC);
  return VerifyFile(name.get(), tagText, notBefore, notAfter, out);
}

int Vesk2CertVerifyFileA(const char* path, const char* tagText, time_t notBefore, time_t notAfter) {
  const AsciiText name(path);
  VESK2_REQUIRE(!name.OutOfMemory(), VESK2_ERR_MEM_ALLOC);
  return Vesk2CertVerifyFile(name.get(), tagText, notBefore, notAfter);
}

// ---- Listing ----

namespace {

// A record of one name; null without memory. The name is the record's, or goes. It has memory of
// its own, as the chain is its caller's, who may keep the name.
FileItem* MakeItem(const char* name) {
  std::unique_ptr<char[]> copy(ZVsysutil::zv_fstrdup(name));
  FileItem* const item = copy ? FileItemCreate(copy.get(), nullptr) : nullptr;
  if (item != nullptr) static_cast<void>(copy.release());  // the record's now
  return item;
}

}  // namespace

// Bare names, since a program joins them with the directory that it asked about, or hands them to
// what looks into the home store.
FileItem* CertFind(const char* directory) {
  constexpr const char* kPattern = "*.cert";
  Scan scan;
  const int code = directory != nullptr
                       ? scan.Open(directory, kPattern)
                       : scan.OpenStore(CertSequence::DirectoryName(true), kPattern, StorageHome);
  // A record list has no place for a code: no directory and no memory are both null.
  if (code != 0) return nullptr;
  FileItemList chain;
  FileItem* last = nullptr;
  while (scan.Next()) {
    FileItem* const item = MakeItem(BareName(scan.Path()));
    if (item == nullptr) return nullptr;
    if (last == nullptr) {
      chain.reset(item);
    } else {
      last->next = item;
    }
    last = item;
  }
  // Half a list would pass for the whole one.
  return scan.Result(0) == 0 ? chain.release() : nullptr;
}

FileItem* CertFindA(const char* directory) {
  const AsciiText name(directory);
  // Null would mean the home store here.
  return name.OutOfMemory() ? nullptr : CertFind(name.get());
}
