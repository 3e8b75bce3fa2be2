// SPDX-License-Identifier: Apache-2.0
// Flat functions: why an answer is what it is, as records. A C program gets no objects, so that all
// it may want to know is copied into one record with its texts, which it frees by one call. An
// explanation that cannot be made is null: it never changes an answer.
#include "src/frame/flat/explanations.h"

#include <cstring>
#include <memory>

#include <vesk2/explanation.h>
#include <vesk2/manifest_body.h>
#include <vesk2/wording.h>

#include "src/frame/check.h"
#include "src/platform/text.h"

namespace ZvVesk2 {
namespace {

struct RecordFree {
  void operator()(Vesk2ExplanationStruct* record) const { Vesk2FreeExplanation(record); }
};
using RecordOwner = std::unique_ptr<Vesk2ExplanationStruct, RecordFree>;

// Certificates are told by numbers from 1.
uint32_t Number(size_t index) {
  return index != Explanation::kNone ? static_cast<uint32_t>(index + 1) : 0;
}

// A text that was made; null means that there was no memory for it. Handed to the record at once,
// whether or not the next one can be made.
[[nodiscard]] int Take(char*& out, char* made) {
  out = made;
  return made != nullptr ? 0 : VESK2_ERR_MEM_ALLOC;
}

// Texts were made safe where they were written (TextWriter); only names are made anew here, by the
// same.
[[nodiscard]] int FillReason(Vesk2ReasonStruct& record, const Explanation::Reason& reason) {
  record.kind = Explanation::Word(reason.kind);
  record.certificate = Number(reason.cert);
  record.otherCertificate = Number(reason.otherCert);
  VESK2_TRY(Take(record.text, ZVsysutil::zv_strdup(reason.text)));
  if (reason.entry != nullptr) VESK2_TRY(Take(record.entry, Wording::OfEntry(reason.entry)));
  return reason.source != nullptr ? Take(record.source, Wording::OfTag(reason.source)) : 0;
}

// In their order: the first tells where authority was lost first.
[[nodiscard]] int AddReasons(Vesk2ExplanationStruct& record, const Explanation& explanation) {
  Vesk2ReasonStruct** tail = &record.reasons;
  for (size_t i = 0; i < explanation.CountReasons(); ++i) {
    *tail = TryNew<Vesk2ReasonStruct>();
    VESK2_REQUIRE(*tail != nullptr, VESK2_ERR_MEM_ALLOC);
    VESK2_TRY(FillReason(**tail, explanation.GetReason(i)));
    tail = &(*tail)->next;
  }
  return 0;
}

// Without an entry that grants alone there is no path to tell, and no end.
[[nodiscard]] int AddPath(Vesk2ExplanationStruct& record, const Explanation& explanation) {
  if (explanation.GetEntry() == nullptr) return 0;
  VESK2_TRY(Take(record.entry, Wording::OfEntry(explanation.GetEntry())));
  const size_t count = explanation.CountPath();
  record.certificates = TryNewArray<uint32_t>(count);
  VESK2_REQUIRE(record.certificates != nullptr, VESK2_ERR_MEM_ALLOC);
  for (size_t i = 0; i < count; ++i) record.certificates[i] = Number(explanation.GetPathCert(i));
  record.certificateCount = static_cast<uint32_t>(count);
  if (explanation.GetEnd() == nullptr) return 0;
  // By End, in its order.
  constexpr const char* kEnds[] = {nullptr, "certificate", "entry", "list"};
  record.holdsUntil = explanation.GetEnd()->ToTime();
  record.endedBy = kEnds[explanation.GetEndKind()];
  record.endCertificate = Number(explanation.GetEndCert());
  return 0;
}

// The time as the manifest says, proved or not; the signer only when its signature holds: a name
// that was merely claimed must not look like one that signed.
[[nodiscard]] int AddSigner(Vesk2ExplanationStruct& record, const Evidence& evidence) {
  if (evidence.GetKind() != Evidence::SignedManifest) return 0;
  if (evidence.GetSigningTime() != nullptr) record.signedAt = evidence.GetSigningTime()->ToTime();
  if (evidence.CountCerts() == 0 || evidence.GetSignatureCode(0) != 0) return 0;
  return Take(record.signer, Wording::Fingerprint(evidence.GetCert(0)->GetIssuer()));
}

// Explained from what the verification kept: no file is opened.
[[nodiscard]] int Fill(Vesk2ExplanationStruct& record, const Answer& answer) {
  // So that a program compiled with a shorter record knows what it may read.
  record.size = sizeof record;
  record.code = answer.code;
  Explanation explanation(answer.evidence.GetContext());
  VESK2_TRY(explanation.SetNames(answer.path, answer.extraAclDirectory));
  VESK2_TRY(explanation.Explain(answer.evidence, answer.authority, answer.tag));
  record.isComplete = explanation.IsComplete() ? 1 : 0;
  VESK2_TRY(AddSigner(record, answer.evidence));
  VESK2_TRY(AddReasons(record, explanation));
  return AddPath(record, explanation);
}

// ---- Counting ----

// As deep as the listing nests, which its reader bounds.
uint64_t CountListed(BodyDirectory& directory) {
  uint64_t count = directory.GetFiles().GetCount();
  PointerArray<BodyObject>& subdirectories = directory.GetSubdirectories();
  for (uint32_t i = 0; i < subdirectories.GetCount(); ++i) {
    count += CountListed(static_cast<BodyDirectory&>(*subdirectories.at(i)));
  }
  return count;
}

// Files only: a directory stands in a list for what is in it.
uint64_t CountFiles(const FileItem* list) {
  uint64_t count = 0;
  for (; list != nullptr; list = list->next) count += list->isDirectory == 0 ? 1 : 0;
  return count;
}

// A directory that could not be listed is recorded twice, one after the other; one that changed by
// what is in it counts by that. Findings of a directory that holds a changed file would count the
// file again.
uint64_t CountChanged(const Manifest& manifest) {
  uint64_t count = CountFiles(manifest.GetInvalid());
  for (const FileItem* item = manifest.GetInvalid(); item != nullptr; item = item->next) {
    if (item->isDirectory == 0 || manifest.GetReason(item) == 0) continue;
    const bool again = item->next != nullptr && std::strcmp(item->next->name, item->name) == 0;
    if (!again) ++count;
  }
  return count;
}

// A listed directory stands before what is too much in it; an unlisted one was not looked into. By
// the order of the list: the directory comes before the entries in it, since records are in
// reverse.
uint64_t CountExtra(const FileItem* list) {
  uint64_t count = 0;
  for (; list != nullptr; list = list->next) {
    const size_t length = std::strlen(list->name);
    const char* const next = list->next != nullptr ? list->next->name : "";
    const bool holdsNext = std::strncmp(next, list->name, length) == 0 && next[length] == '/';
    if (list->isDirectory == 0 || !holdsNext) ++count;
  }
  return count;
}

}  // namespace

// After a lack of memory there is nothing to tell but that.
Vesk2ExplanationStruct* ExplainAnswer(const Answer& answer) {
  RecordOwner record(TryNew<Vesk2ExplanationStruct>());
  if (!record || LacksMemory(answer.code)) return nullptr;
  return Fill(*record, answer) == 0 ? record.release() : nullptr;
}

// From the lists that the comparison made; without a listing nothing was compared.
void CountEntries(Vesk2ExplanationStruct& record, const Manifest& manifest) {
  if (manifest.GetListing() == nullptr) return;
  record.listed = CountListed(*manifest.GetListing());
  record.valid = CountFiles(manifest.GetValid());
  record.changed = CountChanged(manifest);
  record.missing = CountFiles(manifest.GetMissing());
  record.extra = CountExtra(manifest.GetExtra());
}

}  // namespace ZvVesk2

void Vesk2FreeExplanation(Vesk2ExplanationStruct* explanation) {
  if (explanation == nullptr) return;
  while (explanation->reasons != nullptr) {
    const std::unique_ptr<Vesk2ReasonStruct> reason(explanation->reasons);
    explanation->reasons = reason->next;
    for (char* text : {reason->text, reason->entry, reason->source}) delete[] text;
  }
  delete[] explanation->signer;
  delete[] explanation->entry;
  delete[] explanation->certificates;
  delete explanation;
}
