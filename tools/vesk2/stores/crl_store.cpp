// SPDX-License-Identifier: Apache-2.0
// crl_store.cpp: stored revocation lists, and offering lists to the store.
#include "tools/vesk2/stores/crl_store.h"

#include <sys/stat.h>

#include <algorithm>
#include <cctype>
#include <cstring>
#include <filesystem>

#include "tools/vesk2/files/descriptor.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/objects/acl_file.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/grant.h"

#include <vesk2/context.h>

namespace vesk2_command {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;

namespace {

std::string WhyKept(CrlSequence& list, CrlSequence& kept) {
  const Cert& cert = *list.GetCert();
  const Cert& other = *kept.GetCert();
  const Ref<TimeStamp> now = ParseTime("now", false);
  if (cert.GetNotBefore() != nullptr && cert.GetNotBefore()->IsAfter(now.get())) {
    return "it begins only at " + StampText(*cert.GetNotBefore());
  }
  const bool premature =
      other.GetNotBefore() != nullptr && other.GetNotBefore()->IsAfter(now.get());
  const TimeStamp* const end = cert.GetNotAfter();
  if (premature || (end != nullptr && end->IsAfterOrEqual(other.GetNotAfter()))) return "";
  return "it is older than the stored list, which is valid " +
         PeriodText(other.GetNotBefore(), other.GetNotAfter());
}

// "carol-install-revoke-all": a name without anything that shells read.
std::string SourceName(const std::string& keyName, SExpression* tag) {
  constexpr size_t kLongest = 200;
  std::string name = keyName + "-";
  for (const char c : TagText(tag)) {
    const bool plain = std::isalnum(static_cast<unsigned char>(c)) != 0;
    if (plain) name += c;
    if (!plain && name.back() != '-') name += '-';
  }
  if (name.back() == '-') name.pop_back();
  return name.substr(0, kLongest);
}

// Why the entries do not vouch for a list, with the code's name; empty when they do.
std::string WhyUnproved(CrlSequence& list, SExpression* acls) {
  const int code = list.VerifySelf(acls);
  if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
  return code == 0 ? "" : WhyNotVouched(list, code) + " (" + CodeName(code) + ")";
}

}  // namespace

std::string ListPath(SExpression* tag) {
  char* path = nullptr;
  const int code = tag != nullptr ? CrlSequence::StorePath(path, tag) : 0;
  if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
  const Text owner(path);
  return path != nullptr ? path : "";
}

std::string ListDirectory() {
  return std::string(ZvVesk2::VeskConf::GetGlobalDirectory()) + "/cert";
}

Sources::Sources(SExpression* acls) {
  for (AclEntry* const entry : ItemsOf<AclEntry>(acls)) {
    if (!IsRevocationTag(entry->GetTag())) continue;
    last_[Fingerprint(*entry->GetTag())] = Ref<AclEntry>::Share(entry);
  }
}

Ref<SExpression> Sources::AclsFor(SExpression* tag) const {
  const auto entry = tag != nullptr ? last_.find(Fingerprint(*tag)) : last_.end();
  return entry != last_.end() ? ListOf({entry->second.get()}, "acl") : ListOf({}, "acl");
}

std::map<std::string, CrlSequence*> ListsBySource(const SExpression* lists) {
  std::map<std::string, CrlSequence*> found;
  for (CrlSequence* const list : ItemsOf<CrlSequence>(lists)) {
    SExpression* const tag = list->GetCert()->GetTag();
    if (tag != nullptr) found[Canonical(*tag)] = list;
  }
  return found;
}

std::string WhyListUnusable(CrlSequence& list, const std::string& path, SExpression* acls) {
  SExpression* const tag = list.GetCert()->GetTag();
  if (std::filesystem::path(path).filename() != std::filesystem::path(ListPath(tag)).filename()) {
    return "the list of another source, " + TagText(tag);
  }
  return WhyUnproved(list, acls);
}

StoredList FindStored(SExpression* tag, SExpression* acls) {
  StoredList stored;
  const std::string path = ListPath(tag);
  if (path.empty()) return stored;
  struct stat status = {};
  if (stat(path.c_str(), &status) != 0) {
    stored.unread = !IsNothing(errno);
    if (stored.unread) stored.problem = Escape(path) + ": " + std::strerror(errno);
    return stored;
  }
  try {
    stored.list = ReadCrl(path);
  } catch (const Trouble& trouble) {
    stored.problem = trouble.what();
    stored.unread = trouble.reason == "io";
    return stored;
  }
  std::string why;
  // Texts of different tags can read the same, and then name one file.
  SExpression* const own = stored.list->GetCert()->GetTag();
  if (own == nullptr || !own->IsEqual(tag)) {
    why = "the list of another source, " + TagText(own);
    stored.list.Reset();
  } else if (acls != nullptr) {
    why = WhyListUnusable(*stored.list, path, acls);
  }
  if (!why.empty()) stored.problem = Escape(path) + ": " + why;
  return stored;
}

// ---- Offering lists ----

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
  return WhyUnproved(list, acls);
}

std::string StoreCrl(CrlSequence& list, SExpression* acls, const std::string& path) {
  const std::string reason = WhyRefused(list, acls);
  if (!reason.empty()) return reason;
  Check(list.UpdateStore(acls), Escape(path));
  const Ref<CrlSequence> kept = FindStored(list.GetCert()->GetTag(), nullptr).list;
  if (kept && Canonical(*kept) == Canonical(list)) return "";
  const std::string why = kept ? WhyKept(list, *kept) : "";
  if (!why.empty()) return why;
  const Text directory(CrlSequence::CalcDir(ZvVesk2::StorageGlobal));
  throw Trouble(Escape(path) + ": cannot be written to " +
                    (directory ? Escape(directory.get()) : "the store"),
                "io");
}

void TrustSource(PublicKey& issuer, SExpression* tag, const std::string& keyName, bool dryRun) {
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
  GrantEntry(*entry, {FreeEntryName(*entry, SourceName(keyName, tag)), {false, dryRun}});
}

}  // namespace vesk2_command
