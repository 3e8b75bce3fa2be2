// SPDX-License-Identifier: Apache-2.0
// Flat functions: manifest contexts and the records of their results. A manifest context is a
// Manifest; the getters and setters do not test its pointer. Codes are the class's own, a lack of
// memory told by one code (InOwnWords).
#include <vesk2/file_item.h>
#include <vesk2/manifest.h>

#include <memory>

#include "src/frame/check.h"
#include "src/frame/flat/ascii_text.h"
#include "src/frame/flat/explanations.h"
#include "src/platform/text.h"

using ZvVesk2::AsciiText;
using ZvVesk2::TryNew;

unsigned int FreeFileItemList(FileItem* chain) { return ZvVesk2::FileItemDelete(chain); }

// ---- Making and configuring ----

// *out is tested and not overwritten: a context that a program still holds would be lost.
int CreateManifestContext(Manifest** out, const char* directory, const char* manifestPath,
                          const char* tagText) {
  VESK2_REQUIRE(
      out != nullptr && *out == nullptr && directory != nullptr && manifestPath != nullptr,
      VESK2_ERR_INVALID_PARAM);
  std::unique_ptr<Manifest> manifest(TryNew<Manifest>(nullptr));
  VESK2_REQUIRE(manifest, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(manifest->Initialize(directory, manifestPath, tagText));
  *out = manifest.release();
  return 0;
}

int CreateManifestContextA(Manifest** out, const char* directory, const char* manifestPath,
                           const char* tagText) {
  const AsciiText directoryName(directory);
  const AsciiText manifestName(manifestPath);
  VESK2_REQUIRE(!directoryName.OutOfMemory() && !manifestName.OutOfMemory(), VESK2_ERR_MEM_ALLOC);
  // The tag's text stays as it is: it is parsed, not used as a name.
  return CreateManifestContext(out, directoryName.get(), manifestName.get(), tagText);
}

void DeleteManifestContext(Manifest* manifest) { delete manifest; }

void FailOnExtraEntries(Manifest* manifest) { manifest->SetFailOnExtraEntries(true); }

void SetExtraAclDirectory(Manifest* manifest, const char* directory) {
  static_cast<void>(manifest->CopyExtraAclDirectory(directory));  // the verification tells
}

// Copied by the base function, in the one form that there is.
void SetExtraAclDirectoryA(Manifest* manifest, const char* directory) {
  SetExtraAclDirectory(manifest, directory);
}

void SetIgnoredEntries(Manifest* manifest, const FileItem* list) {
  // Without memory nothing is ignored, and the verification can only find more.
  static_cast<void>(manifest->SetIgnoredEntries(list));
}

int SetFileCallbacks(Manifest* manifest, const Vesk2FileCallbacks* callbacks) {
  return manifest->SetFileCallbacks(callbacks);
}

void SetStoreUpdate(Manifest* manifest, int update) { manifest->SetStoreUpdate(update != 0); }

// ---- Verifying ----

// None of what a careful caller sets (vesk2.h) is set here: unlisted entries pass, and carried
// lists are stored, until it is said otherwise.
int VerifyManifest(Manifest* manifest, time_t notBefore, time_t notAfter) {
  return ZvVesk2::InOwnWords(manifest->VerifyManifest(notBefore, notAfter));
}

// The evidence lives as long as this call, and is taken back from the manifest before it goes.
int VerifyManifestExplained(Manifest* manifest, time_t notBefore, time_t notAfter,
                            Vesk2ExplanationStruct** out) {
  VESK2_REQUIRE(out != nullptr, VESK2_ERR_PARAM_NULL);
  *out = nullptr;
  ZvVesk2::Evidence evidence(manifest->GetContext());
  manifest->SetEvidence(&evidence);
  const int code = VerifyManifest(manifest, notBefore, notAfter);
  manifest->SetEvidence(nullptr);
  // Where the tree was compared, authority was proved.
  const int authority = manifest->GetListing() != nullptr ? 0 : code;
  Vesk2ExplanationStruct* const explanation =
      ZvVesk2::ExplainAnswer({evidence, code, authority, manifest->GetTag(),
                              manifest->GetManifestPath(), manifest->GetExtraAclDirectory()});
  if (explanation != nullptr && authority == 0) ZvVesk2::CountEntries(*explanation, *manifest);
  *out = explanation;
  return code;
}

int CompareManifest(Manifest* manifest, const char* otherManifestPath) {
  return ZvVesk2::InOwnWords(manifest->CompareManifest(otherManifestPath));
}

int CompareManifestA(Manifest* manifest, const char* otherManifestPath) {
  const AsciiText path(otherManifestPath);
  VESK2_REQUIRE(!path.OutOfMemory(), VESK2_ERR_MEM_ALLOC);
  return CompareManifest(manifest, path.get());
}

// ---- Results ----

// Of the last read that proved it.
time_t GetTimeOfSigning(Manifest* manifest) {
  const ZvVesk2::TimeStamp* const stamp = manifest->GetSigningTime();
  return stamp != nullptr ? stamp->ToTime() : 0;
}

// The lists as they are: handed out, not copied.
FileItem* GetValidEntries(Manifest* manifest) { return manifest->GetValid(); }

FileItem* GetInvalidEntries(Manifest* manifest) { return manifest->GetInvalid(); }

FileItem* GetMissingEntries(Manifest* manifest) { return manifest->GetMissing(); }

FileItem* GetExtraEntries(Manifest* manifest) { return manifest->GetExtra(); }
