// SPDX-License-Identifier: Apache-2.0
// evidence.cpp: what an answer rests on.
#include "tools/vesk2/explain/evidence.h"

#include <algorithm>
#include <filesystem>
#include <set>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/hash.h>

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;
using ZvVesk2::CrlSequence;
using ZvVesk2::Hash;
using ZvVesk2::Subject;
using ZvVesk2::ThresholdSubject;

bool IsDigestOf(const Hash& hash, DExpression& key) {
  unsigned char* digest = nullptr;
  unsigned int length = 0;
  if (key.ComputeHash(digest, length, hash.GetAlgorithm(), true) != 0) return false;
  const std::unique_ptr<unsigned char[]> owner(digest);
  const ByteString* named = hash.GetDigest();
  return named != nullptr && named->GetLength() == length &&
         std::equal(digest, digest + length, named->GetData());
}

void TakeCerts(Evidence& evidence) {
  const ZvVesk2::Evidence& proved = *evidence.proved;
  for (size_t i = 0; i < proved.CountCerts(); ++i) {
    evidence.certs.push_back({Ref<Cert>::Share(proved.GetCert(i)),
                              Ref<ZvVesk2::Signature>::Share(proved.GetSignature(i)),
                              proved.GetSignatureCode(i),
                              Ref<SExpression>::Share(proved.GetRevocationSource(i))});
  }
}

std::set<const DExpression*> RelevantEntries(const ZvVesk2::Evidence& proved) {
  Ref<SExpression> list;
  Check(proved.RelevantEntries(list.Out()), "looking at the ACL entries");
  std::set<const DExpression*> relevant;
  for (const AclEntry* const entry : ItemsOf<AclEntry>(list.get())) relevant.insert(entry);
  return relevant;
}

void TakeEntries(Evidence& evidence) {
  if (evidence.proved->GetEntries() == nullptr) return;
  const std::set<const DExpression*> relevant = RelevantEntries(*evidence.proved);
  for (AclEntry* const entry : ItemsOf<AclEntry>(evidence.proved->GetEntries())) {
    const std::filesystem::path path(entry->GetFileName() != nullptr ? entry->GetFileName() : "");
    const bool inStore = path.parent_path() == std::filesystem::path(AclDirectory());
    evidence.entries.push_back({Ref<AclEntry>::Share(entry),
                                inStore ? path.filename().string() : path.string(), inStore,
                                relevant.count(entry) != 0});
  }
}

std::vector<CrlSequence*> ListsOf(const SExpression* lists) {
  std::vector<CrlSequence*> found = ItemsOf<CrlSequence>(lists);
  std::erase_if(found, [](const CrlSequence* list) { return list->First() == nullptr; });
  return found;
}

}  // namespace

Evidence GatherEvidence(const Question& question) {
  Evidence evidence;
  evidence.proved = question.proved;
  if (evidence.proved == nullptr) return evidence;
  const ZvVesk2::Evidence& proved = *evidence.proved;
  TakeCerts(evidence);
  TakeEntries(evidence);
  for (CrlSequence* list : ListsOf(proved.GetCarriedLists())) {
    evidence.carried.push_back(Canonical(*list));
  }
  evidence.signedAt = Ref<TimeStamp>::Share(proved.GetSigningTime());
  evidence.first = proved.GetFirst();
  evidence.last = proved.GetLast();
  evidence.contentSigned = proved.GetContentCode() == 0 && proved.GetListingCode() == 0;
  return evidence;
}

void DetailEvidence(const Question& question) {
  const ZvVesk2::Evidence& proved = *question.proved;
  const SExpression* entries = proved.GetEntries();
  const std::string beside =
      question.aclDirectory.empty() ? "" : " and " + Escape(question.aclDirectory);
  Detail("read " + Plural(proved.CountCerts(), "certificate") + " of " + InputName(question.file));
  Detail("read " + std::to_string(entries != nullptr ? entries->Count() - 1 : 0) +
         " of the entries in " + Escape(AclDirectory()) + beside);
  Detail("read " + Plural(ListsOf(proved.GetStoredLists()).size(), "revocation list") +
         " of the store, and " + std::to_string(ListsOf(proved.GetCarriedLists()).size()) +
         " that the file carries");
}

std::string CertName(const Evidence& evidence, size_t index) {
  return "certificate " + std::to_string(index + 1) + " (issuer " +
         SubjectText(*evidence.certs[index].cert->GetIssuer()) + ")";
}

std::string EntryName(const EntryEvidence& entry) { return "ACL entry " + Escape(entry.file); }

bool Names(Subject* subject, DExpression* key) {
  if (subject->IsEqual(key)) return true;
  if (const auto* hash = dynamic_cast<Hash*>(subject)) return IsDigestOf(*hash, *key);
  auto* threshold = dynamic_cast<ThresholdSubject*>(subject);
  auto* principal = dynamic_cast<ZvVesk2::Principal*>(key);
  return threshold != nullptr && principal != nullptr && threshold->HasMember(principal);
}

const EntryEvidence* Voucher(const Evidence& evidence, SExpression* source) {
  const auto found = std::find_if(
      evidence.entries.rbegin(), evidence.entries.rend(),
      [&](const EntryEvidence& each) { return each.entry->GetTag()->IsEqual(source); });
  return found != evidence.entries.rend() ? &*found : nullptr;
}

Ref<SExpression> AllEntries(const Evidence& evidence) {
  std::vector<DExpression*> entries;
  for (const EntryEvidence& each : evidence.entries) entries.push_back(each.entry.get());
  return ListOf(entries, "acl");
}

Ref<SExpression> LoadLists(const Evidence& evidence) {
  std::vector<std::string> texts;
  if (evidence.proved != nullptr) {
    for (CrlSequence* list : ListsOf(evidence.proved->GetStoredLists())) {
      texts.push_back(Canonical(*list));
    }
  }
  texts.insert(texts.end(), evidence.carried.begin(), evidence.carried.end());
  // A list remembers who proved it; copies do not.
  Ref<SExpression> lists(new SExpression(nullptr));
  for (const std::string& text : texts) {
    const Ref<CrlSequence> list(new CrlSequence(nullptr));
    const Buffer buffer = WrapBytes(text);
    if (list->Import(buffer.get()) == 0) Append(*lists, *list);
  }
  return lists;
}

}  // namespace vesk2_command
