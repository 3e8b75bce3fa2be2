// SPDX-License-Identifier: Apache-2.0
// Flat functions: revocation lists, read, found in the store, verified and imported into it.
// Reading, finding and verifying are apart, as the class has them: only Vesk2CrlVerify proves
// anything, and it asks the entries of this moment.
#include <vesk2/acl_entry.h>
#include <vesk2/crl.h>

#include <climits>
#include <cstring>
#include <memory>

#include "src/frame/check.h"
#include "src/frame/flat/ascii_text.h"
#include "src/frame/flat/tag_text.h"
#include "src/frame/handles.h"
#include "src/platform/wait.h"
#include "src/sexpr/storage.h"

using namespace ZvVesk2;

// ---- Importing ----

// Its answer is about the reading: whether a list was stored nobody is told here.
int Vesk2CrlImport(const char* directory, Vesk2ContextStruct* context) {
  return CrlSequence::ImportDirAndStore(directory, context);
}

int Vesk2CrlImportA(const char* directory, Vesk2ContextStruct* context) {
  const AsciiText name(directory);
  VESK2_REQUIRE(!name.OutOfMemory(), VESK2_ERR_MEM_ALLOC);
  return Vesk2CrlImport(name.get(), context);
}

int Vesk2ImportCrls(const char* directory) { return Vesk2CrlImport(directory, nullptr); }

int Vesk2ImportCrlsA(const char* directory) { return Vesk2CrlImportA(directory, nullptr); }

// ---- Records ----

namespace {

constexpr uint32_t kRecordMark = 20;  // what callers test; not the size of the record here

struct RecordFree {
  void operator()(Vesk2CrlInfoStruct* record) const { Vesk2CrlFree(record); }
};
using RecordOwner = std::unique_ptr<Vesk2CrlInfoStruct, RecordFree>;

// The record is whole before it gets the sequence: a failure frees each once.
[[nodiscard]] int MakeRecord(Vesk2CrlInfoStruct** out, Ref<CrlSequence> sequence) {
  RecordOwner record(TryNew<Vesk2CrlInfoStruct>());
  VESK2_REQUIRE(record, VESK2_ERR_MEM_ALLOC);
  const Cert* const cert = sequence->GetCert();
  record->size = kRecordMark;
  record->notBefore = cert->GetNotBefore() != nullptr ? cert->GetNotBefore()->ToTime() : 0;
  record->notAfter = cert->GetNotAfter() != nullptr ? cert->GetNotAfter()->ToTime() : 0;
  VESK2_TRY(TagText(record->tag, cert->GetTag(), "tag"));
  record->crl = sequence.Release();
  *out = record.release();
  return 0;
}

}  // namespace

// A list at any path; the store is asked by tag (Vesk2CrlFindA).
int Vesk2CrlRead(Vesk2CrlInfoStruct** out, const char* path, Vesk2ContextStruct* context) {
  *out = nullptr;
  Ref<CrlSequence> sequence(TryNew<CrlSequence>(context));
  VESK2_REQUIRE(sequence, VESK2_ERR_MEM_ALLOC);
  sequence->SetStorageType(StoragePath);
  // A path that cannot be one is a file that cannot be found.
  std::unique_ptr<char[]> file;
  const int code = FilePath(file, "", CrlSequence::ExtensionName(true), path, StoragePath);
  VESK2_REQUIRE(code != VESK2_ERR_FILE_OPEN, VESK2_ERR_FILE_NOT_FOUND);
  VESK2_TRY(code);
  VESK2_TRY(sequence->SetFileName(path));
  BufferOwner buffer;
  VESK2_TRY(WrapFile(buffer, sequence->GetFileName(), VESK2_ERR_FILE_NOT_FOUND));
  VESK2_TRY(sequence->Import(buffer.get()));
  return MakeRecord(out, std::move(sequence));
}

int Vesk2CrlReadA(Vesk2CrlInfoStruct** out, const char* path, Vesk2ContextStruct* context) {
  *out = nullptr;
  const AsciiText name(path);
  VESK2_REQUIRE(!name.OutOfMemory(), VESK2_ERR_MEM_ALLOC);
  return Vesk2CrlRead(out, name.get(), context);
}

// What the class hands out of a search without success is freed here: a C program gets a record or
// nothing.
int Vesk2CrlFindA(Vesk2CrlInfoStruct** out, const char* tagText, Vesk2ContextStruct* context) {
  *out = nullptr;
  Ref<SExpression> tag;
  VESK2_TRY(SExpression::ParseTagAdvanced(tag.Out(), tagText, "tag", context));
  Ref<CrlSequence> found;
  VESK2_TRY(CrlSequence::Find(found.Out(), tag.get()));
  // An empty store is no failure there.
  VESK2_REQUIRE(found, VESK2_ERR_CRL_NOT_FOUND);
  return MakeRecord(out, std::move(found));
}

// Null is no error here, unlike for a chain.
int Vesk2CrlFree(Vesk2CrlInfoStruct* record) {
  if (record == nullptr) return 0;
  if (record->crl != nullptr) record->crl->Free();
  delete[] record->tag;
  delete record;
  return 0;
}

// ---- Verifying ----

namespace {

// Whether the record's text is all of the tag's body. It ends at a 0 byte in the tag, and what
// follows would be another tag.
[[nodiscard]] int IsWholeText(bool& whole, const Vesk2CrlInfoStruct& record) {
  SExpression* const tag = record.crl->GetCert()->GetTag();
  unsigned int size = tag->AdvancedLength();
  VESK2_REQUIRE(size < UINT_MAX, VESK2_ERR_BUFFER_OVERFLOW);
  ++size;  // an empty list needs it
  const std::unique_ptr<unsigned char[]> text(TryNewArray<unsigned char>(size));
  VESK2_REQUIRE(text, VESK2_ERR_MEM_ALLOC);
  unsigned int length = 0;
  VESK2_TRY(tag->ExportAdvanced(text.get(), length, size));
  whole = length == std::strlen(record.tag) + std::strlen("(tag )");
  return 0;
}

// Compared as text, as callers write it, byte by byte.
[[nodiscard]] int RequireTag(const Vesk2CrlInfoStruct& record, const char* tagText) {
  VESK2_REQUIRE(record.tag != nullptr, VESK2_ERR_AUTH_TAG_MISSING);
  VESK2_REQUIRE(std::strcmp(tagText, record.tag) == 0, VESK2_ERR_NOT_AUTHORIZED);
  bool whole = false;
  VESK2_TRY(IsWholeText(whole, record));
  return whole ? 0 : VESK2_ERR_NOT_AUTHORIZED;
}

}  // namespace

// The tag first, then the proof, then the period: who asks about another source hears that first.
// Only two times ask about a period; a list without an end then counts as ended.
int Vesk2CrlVerify(Vesk2CrlInfoStruct* record, const char* tagText, time_t from, time_t to) {
  VESK2_REQUIRE(record != nullptr, VESK2_ERR_PARAM_NULL);
  if (tagText != nullptr) VESK2_TRY(RequireTag(*record, tagText));
  Ref<SExpression> acls;
  VESK2_TRY(AclEntry::Import(acls.Out(), record->crl->GetContext(), nullptr));
  VESK2_TRY(InOwnWords(record->crl->VerifySelf(acls.get())));
  if (from == 0 || to == 0) return 0;
  // Each code is named for the bound that was asked about and is missed.
  VESK2_REQUIRE(record->notBefore <= to, VESK2_ERR_NOT_AFTER);
  VESK2_REQUIRE(record->notAfter >= from, VESK2_ERR_NOT_BEFORE);
  return 0;
}

// One wait for the list and the entries together (ZvCall).
int Vesk2CrlVerifyFile(const char* path, const char* tagText, time_t from, time_t to,
                       Vesk2ContextStruct* context) {
  const ZVsysutil::ZvCall call;
  Vesk2CrlInfoStruct* read = nullptr;
  VESK2_TRY(Vesk2CrlRead(&read, path, context));
  const RecordOwner record(read);
  return Vesk2CrlVerify(record.get(), tagText, from, to);
}

int Vesk2CrlVerifyFileA(const char* path, const char* tagText, time_t from, time_t to,
                        Vesk2ContextStruct* context) {
  const AsciiText name(path);
  VESK2_REQUIRE(!name.OutOfMemory(), VESK2_ERR_MEM_ALLOC);
  return Vesk2CrlVerifyFile(name.get(), tagText, from, to, context);
}
