// SPDX-License-Identifier: Apache-2.0
// store_check.cpp: looking for files of the stores that could not be read.
#include "tools/vesk2/verify/store_check.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <map>

#include "tools/vesk2/files/descriptor.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/objects/crl_file.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/crl_store.h"

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;

// Why a file that is there cannot be read; empty for one that can, or is no file or gone.
std::string WhyNotRead(const std::string& path) {
  struct stat status = {};
  if (stat(path.c_str(), &status) != 0) {
    return IsNothing(errno) ? "" : std::strerror(errno);
  }
  if (!S_ISREG(status.st_mode)) return "";
  const Descriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
  char byte = 0;
  const bool read = file.get() >= 0 && ::read(file.get(), &byte, 1) >= 0;
  return read ? "" : std::strerror(errno);
}

void Report(const std::string& path, const std::string& text, const std::string& reason,
            bool ignored, const std::string& option) {
  if (!ignored) throw FileTrouble(path, text + " (" + option + " passes over it)", reason);
  Note("note: " + Escape(path) + ": " + text + "; passed over");
}

// The entries of a directory that were not loaded.
void CheckEntries(const std::string& directory, const std::set<std::filesystem::path>& loaded,
                  bool ignore) {
  constexpr const char* kOption = "--ignore-broken-entries";
  for (const std::string& path : FilesOf(directory, ".acl")) {
    if (loaded.count(std::filesystem::path(path).lexically_normal()) != 0) continue;
    const std::string why = WhyNotRead(path);
    if (!why.empty()) {
      Report(path, why, "broken-entry", ignore, kOption);
      continue;
    }
    const Ref<AclEntry> entry(new AclEntry(nullptr));
    const int code = entry->Import(path.c_str());
    if (code == 0) {
      Report(path, "could not be read a moment ago", "broken-entry", ignore, kOption);
    } else {
      Note("note: " + Escape(path) + ": not an ACL entry, and passed over: " + Reason(code));
    }
  }
}

void CheckAllEntries(const Question& question, const Evidence& evidence, bool ignore) {
  std::set<std::filesystem::path> loaded;
  for (const EntryEvidence& each : evidence.entries) {
    loaded.insert(std::filesystem::path(each.entry->GetFileName()).lexically_normal());
  }
  for (const std::string& directory : {AclDirectory(), question.aclDirectory}) {
    struct stat status = {};
    if (directory.empty() || (stat(directory.c_str(), &status) != 0 && errno == ENOENT)) continue;
    CheckEntries(directory, loaded, ignore);
  }
}

// Why a stored list does not count; empty for one that does and for none.
std::string WhyBroken(CrlSequence* list, const std::string& path, SExpression* entries) {
  if (list != nullptr) {
    const int code = list->VerifySelf(entries);
    if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
    return code == 0 ? "" : "the stored list is not vouched for: " + WhyNotVouched(*list, code);
  }
  struct stat status = {};
  if (lstat(path.c_str(), &status) != 0 && (IsNothing(errno))) return "";
  const std::string why = WhyNotRead(path);
  return why.empty() ? "not the revocation list of its source" : why;
}

}  // namespace

void AddStoreCheckOptions(OptionList& list, StoreCheck& check) {
  list.Add("--ignore-broken-entries", check.ignoreEntries,
           "Answer also when an ACL entry cannot be read");
  list.Add("--ignore-broken-lists", check.ignoreLists,
           "Answer also when a stored revocation list cannot be read or does not verify");
}

std::set<std::string> CheckStores(const Question& question, const StoreCheck& check) {
  const Evidence evidence = GatherEvidence(question);
  CheckAllEntries(question, evidence, check.ignoreEntries);
  const std::map<std::string, CrlSequence*> stored =
      ListsBySource(question.proved->GetStoredLists());
  const Ref<TimeStamp> now = ParseTime("now", false);
  std::set<std::string> broken;
  for (const EntryEvidence& each : evidence.entries) {
    SExpression* tag = each.entry->GetTag();
    const TimeStamp* end = each.entry->GetNotAfter();
    if (!IsRevocationTag(tag) || (end != nullptr && end->IsBefore(now.get()))) continue;
    const std::string source = Canonical(*tag);
    const std::string path = ListPath(tag);
    const auto list = stored.find(source);
    if (path.empty() || broken.count(source) != 0) continue;
    const std::string why = WhyBroken(list != stored.end() ? list->second : nullptr, path,
                                      question.proved->GetEntries());
    if (why.empty()) continue;
    broken.insert(source);
    Report(path, why, "broken-list", check.ignoreLists, "--ignore-broken-lists");
  }
  return broken;
}

}  // namespace vesk2_command
