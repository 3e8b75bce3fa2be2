// crl_store.cpp: offering revocation lists to the store.
#include "tools/vesk2/stores/crl_store.h"

#include <algorithm>
#include <cctype>
#include <filesystem>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/objects/acl_file.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/crl_stored.h"
#include "tools/vesk2/stores/grant.h"

namespace vesk2_command {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;

namespace {

std::string WhyKept(CrlSequence& list, CrlSequence& kept) {
  const Cert& cert = *list.GetCert();
  const Ref<TimeStamp> now = ParseTime("now", false);
  if (cert.GetNotBefore() != nullptr && cert.GetNotBefore()->IsAfter(now.get())) {
    return "it begins only at " + StampText(*cert.GetNotBefore());
  }
  return "it is older than the stored list, which is valid " +
         PeriodText(kept.GetCert()->GetNotBefore(), kept.GetCert()->GetNotAfter());
}

// "carol-install-revoke-all": a name without anything that shells read.
std::string SourceName(const std::string& keyPath, SExpression* tag) {
  constexpr size_t kLongest = 200;
  std::string name = std::filesystem::path(keyPath).stem().string() + "-";
  for (const char c : TagText(tag)) {
    const bool plain = std::isalnum(static_cast<unsigned char>(c)) != 0;
    if (plain) name += c;
    if (!plain && name.back() != '-') name += '-';
  }
  if (name.back() == '-') name.pop_back();
  return name.substr(0, kLongest);
}

}  // namespace

bool NamesFile(SExpression* tag) {
  const std::string text = TagText(tag);
  const auto slashes = static_cast<size_t>(std::count(text.begin(), text.end(), '/'));
  return text.size() + 2 * slashes <= ZvVesk2::Limits::kMaxStoreName;  // "%2F" for each
}

std::string WhyRefused(CrlSequence& list, SExpression* acls) {
  if (!IsRevocationTag(list.GetCert()->GetTag())) {
    return "its tag " + TagText(list.GetCert()->GetTag()) + " does not end in (revoke ...)";
  }
  if (!NamesFile(list.GetCert()->GetTag())) {
    return "its tag is too long to name a file of the store (" + CodeName(VESK2_ERR_INVALID_PARAM) +
           ")";
  }
  const int code = list.VerifySelf(acls);
  if (code == VESK2_ERR_MEM_ALLOC) throw Trouble(Reason(code), ReasonWord(code));
  return code == 0 ? "" : WhyNotVouched(list, code) + " (" + CodeName(code) + ")";
}

std::string StoreCrl(CrlSequence& list, SExpression* acls, const std::string& path) {
  const std::string reason = WhyRefused(list, acls);
  if (!reason.empty()) return reason;
  Check(list.UpdateStore(acls), Escape(path));
  const Ref<CrlSequence> kept = FindStored(list.GetCert()->GetTag(), nullptr).list;
  if (!kept) {
    const Text directory(CrlSequence::CalcDir(ZvVesk2::StorageGlobal));
    throw Trouble(Escape(path) + ": cannot be written to " +
                      (directory ? Escape(directory.get()) : "the store"),
                  "io");
  }
  return Canonical(*kept) == Canonical(list) ? "" : WhyKept(list, *kept);
}

void TrustSource(PublicKey& issuer, SExpression* tag, const std::string& keyPath, bool dryRun) {
  // The last entry of the tag decides whose lists count.
  for (const std::string& path : StoreFilesOf(AclDirectory(), ".acl")) {
    Ref<AclEntry> entry;
    try {
      entry = ReadEntry(path);
    } catch (const Trouble&) {
      continue;  // the store passes over it too
    }
    if (!entry->GetTag()->IsEqual(tag)) continue;
    if (entry->GetSubject()->IsEqual(&issuer)) return Note(Escape(path) + " says so already");
    throw FileTrouble(
        path,
        "lets another key revoke for " + TagText(tag) + ": " + SubjectText(*entry->GetSubject()),
        "source-taken");
  }
  const Ref<AclEntry> entry =
      MakeEntry({Ref<ZvVesk2::Subject>::Share(&issuer), false, Ref<SExpression>::Share(tag)});
  GrantEntry(*entry, {FreeEntryName(*entry, SourceName(keyPath, tag)), false, dryRun});
}

}  // namespace vesk2_command
