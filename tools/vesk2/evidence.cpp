// evidence.cpp: reading again what an answer rests on.
#include "tools/vesk2/evidence.h"

#include <algorithm>
#include <filesystem>

#include "tools/vesk2/key_source.h"
#include "tools/vesk2/manifest_file.h"
#include "tools/vesk2/report.h"
#include "tools/vesk2/stores.h"

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

void ReadFileParts(const Question& question, Evidence& evidence) {
  std::vector<SignedCert> certs;
  if (question.manifest) {
    SignatureBlock block = ReadSignatureBlock(question.file);
    certs = std::move(block.certs);
    evidence.signedAt = std::move(block.signedAt);
    evidence.damage = block.damage;
    evidence.contentSigned = block.contentSigned && block.damage.empty();
    for (const auto& list : block.crls) evidence.carried.push_back(Canonical(*list));
  } else {
    certs = ReadCerts(question.file);
  }
  for (SignedCert& each : certs) {
    const int code = each.signature->Verify(each.cert.get());
    Ref<SExpression> source = RevocationSource(*each.cert);
    evidence.certs.push_back(
        {std::move(each.cert), std::move(each.signature), code, std::move(source)});
  }
}

void ReadEntries(const Question& question, Evidence& evidence) {
  const std::string& extra = question.aclDirectory;
  Ref<SExpression> acls;
  if (AclEntry::Import(acls.Out(), nullptr, extra.empty() ? nullptr : extra.c_str()) != 0) return;
  for (auto it = acls->Begin(); it; it.Next()) {
    auto* entry = dynamic_cast<AclEntry*>(it.Value());
    if (entry == nullptr) continue;
    const std::filesystem::path path(entry->GetFileName() != nullptr ? entry->GetFileName() : "");
    const bool inStore = path.parent_path() == std::filesystem::path(AclDirectory());
    evidence.entries.push_back(
        {Ref<AclEntry>::Share(entry), inStore ? path.filename().string() : path.string(), inStore});
  }
}

// The library takes times as seconds about a manifest, and 0 for none.
TimeStamp* Asked(const Question& question, const Ref<TimeStamp>& stamp) {
  const bool none = !stamp || (question.manifest && stamp->ToTime() == 0);
  return none ? nullptr : stamp.get();
}

}  // namespace

Evidence GatherEvidence(const Question& question) {
  Evidence evidence;
  ReadFileParts(question, evidence);
  ReadEntries(question, evidence);
  evidence.first = Asked(question, question.period.notBefore);
  evidence.last = Asked(question, question.period.notAfter);
  if (question.manifest && evidence.first == nullptr && evidence.last == nullptr) {
    evidence.first = evidence.last = evidence.signedAt.get();
  }
  return evidence;
}

bool Names(Subject* subject, DExpression* key) {
  if (subject->IsEqual(key)) return true;
  if (const auto* hash = dynamic_cast<Hash*>(subject)) return IsDigestOf(*hash, *key);
  auto* threshold = dynamic_cast<ThresholdSubject*>(subject);
  auto* principal = dynamic_cast<ZvVesk2::Principal*>(key);
  return threshold != nullptr && principal != nullptr && threshold->HasMember(principal);
}

void InsertShared(SExpression& list, DExpression* item) {
  auto shared = Ref<DExpression>::Share(item);
  Check(list.Insert(shared.get()), "building a list");
  (void)shared.Release();
}

Ref<SExpression> RevocationSource(const Cert& cert) {
  const SExpression* element = cert.GetRevocationElement();
  Ref<SExpression> source;
  if (element == nullptr) return source;
  Check(SExpression::Create(source.Out(), "tag", nullptr), "building a tag");
  auto it = element->Begin();
  if (it) it.Next();  // the keyword
  for (; it; it.Next()) InsertShared(*source, it.Value());
  return source;
}

const EntryEvidence* Voucher(const Evidence& evidence, SExpression* source) {
  const auto found = std::find_if(
      evidence.entries.rbegin(), evidence.entries.rend(),
      [&](const EntryEvidence& each) { return each.entry->GetTag()->IsEqual(source); });
  return found != evidence.entries.rend() ? &*found : nullptr;
}

std::vector<AclEntry*> AllEntries(const Evidence& evidence) {
  std::vector<AclEntry*> entries;
  for (const EntryEvidence& each : evidence.entries) entries.push_back(each.entry.get());
  return entries;
}

Ref<SExpression> EntryList(const std::vector<AclEntry*>& entries) {
  Ref<SExpression> list;
  Check(SExpression::Create(list.Out(), "acl", nullptr), "building a list");
  for (AclEntry* entry : entries) InsertShared(*list, entry);
  return list;
}

Ref<SExpression> LoadLists(const Evidence& evidence, SExpression* entries) {
  Ref<SExpression> lists;
  Check(CrlSequence::ImportStore(lists.Out(), entries, nullptr), "reading revocation lists");
  for (const std::string& text : evidence.carried) {
    const Ref<CrlSequence> list(new CrlSequence(nullptr));
    const Buffer buffer = WrapBytes(text);
    if (list->Import(buffer.get()) == 0) InsertShared(*lists, list.get());
  }
  return lists;
}

}  // namespace vesk2_command
