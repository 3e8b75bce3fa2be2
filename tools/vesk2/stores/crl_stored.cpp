// crl_stored.cpp: stored revocation lists.
#include "tools/vesk2/stores/crl_stored.h"

#include <sys/stat.h>

#include <cerrno>
#include <cstring>
#include <filesystem>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/context.h>

namespace vesk2_command {

using ZvVesk2::AclEntry;

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
  if (acls == nullptr) return;
  for (auto it = acls->Begin(); it; it.Next()) {
    auto* entry = dynamic_cast<AclEntry*>(it.Value());
    if (entry == nullptr || !IsRevocationTag(entry->GetTag())) continue;
    last_[Fingerprint(*entry->GetTag())] = Ref<AclEntry>::Share(entry);
  }
}

Ref<SExpression> Sources::AclsFor(SExpression* tag) const {
  Ref<SExpression> acls;
  Check(SExpression::Create(acls.Out(), "acl", nullptr), "building a list");
  const auto entry = tag != nullptr ? last_.find(Fingerprint(*tag)) : last_.end();
  if (entry == last_.end()) return acls;
  auto shared = Ref<AclEntry>::Share(entry->second.get());
  Check(acls->Insert(shared.get()), "building a list");
  (void)shared.Release();
  return acls;
}

std::string WhyListUnusable(CrlSequence& list, const std::string& path, SExpression* acls) {
  SExpression* const tag = list.GetCert()->GetTag();
  if (std::filesystem::path(path).filename() != std::filesystem::path(ListPath(tag)).filename()) {
    return "the list of another source, " + TagText(tag);
  }
  const int code = list.VerifySelf(acls);
  if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
  return code == 0 ? "" : WhyNotVouched(list, code) + " (" + CodeName(code) + ")";
}

StoredList FindStored(SExpression* tag, SExpression* acls) {
  StoredList stored;
  const std::string path = ListPath(tag);
  if (path.empty()) return stored;
  struct stat status = {};
  if (stat(path.c_str(), &status) != 0) {
    stored.unread = errno != ENOENT && errno != ENOTDIR;
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

}  // namespace vesk2_command
