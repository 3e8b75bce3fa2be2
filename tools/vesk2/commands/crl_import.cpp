// SPDX-License-Identifier: Apache-2.0
// crl_import.cpp: vesk2 crl import.
#include <algorithm>
#include <filesystem>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/stores/acl_store.h"
#include "tools/vesk2/stores/crl_compare.h"
#include "tools/vesk2/stores/crl_store.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string source;
  bool force = false;
};

// The list files of a directory, or the one file.
std::vector<std::string> ListFiles(const std::string& source) {
  std::error_code error;
  if (!std::filesystem::is_directory(source, error)) return {source};
  const std::vector<std::string> files = FilesOf(source, ".crl");
  if (files.empty()) throw FileTrouble(source, "holds no revocation list (*.crl)", "nothing");
  return files;
}

// What taking a list in place of the stored one means.
struct Change {
  std::vector<Revoked> gone;
  bool isRenewal = false;  // it ends later than the stored one: what it lets go is meant so
};

bool IsInForce(const CrlSequence& list) {
  const TimeStamp* const begin = list.GetCert()->GetNotBefore();
  return begin == nullptr || !begin->IsAfter(ParseTime("now", false).get());
}

// The stored list is told when it does not count; the library passes over it in silence.
Change Compare(CrlSequence& list, SExpression* acls, bool force, Json& said) {
  const StoredList stored = FindStored(list.GetCert()->GetTag(), acls);
  if (!stored.problem.empty()) {
    if (stored.unread && !force) {
      throw Trouble(stored.problem + "; it may revoke what this list lets go (--force replaces it)",
                    "io");
    }
    Note("note: the stored list does not count: " + stored.problem);
    said["stored_problem"] = stored.problem;
  }
  if (!stored.problem.empty() || !stored.list) return {};
  const TimeStamp* const end = list.GetCert()->GetNotAfter();
  const TimeStamp* const storedEnd = stored.list->GetCert()->GetNotAfter();
  const bool later = end != nullptr && (storedEnd == nullptr || end->IsAfter(storedEnd));
  // The library keeps the stored one by itself.
  const bool older = !later && end != nullptr && end->IsBefore(storedEnd);
  if ((older || end == nullptr) && IsInForce(*stored.list)) return {};
  return {WhatIsLetGo(*stored.list->GetCrl(), *list.GetCrl()), later};
}

// Why a list is not in the store after it was offered; empty when it is.
std::string Store(CrlSequence& list, const std::string& path, SExpression* acls, bool force,
                  Json& said) {
  std::string reason = WhyRefused(list, acls);
  if (!reason.empty()) return reason;
  const Change change = Compare(list, acls, force, said);
  if (!change.gone.empty() && !change.isRenewal && !force) {
    said["lets_go"] = TellLetGo(change.gone, InputName(path) + " would let go:");
    return "it ends no later than the stored list, which revokes more (--force stores it all the "
           "same)";
  }
  reason = StoreCrl(list, acls, path);
  if (reason.empty() && !change.gone.empty()) {
    said["lets_go"] = TellLetGo(change.gone, "note: " + InputName(path) + " lets go:");
  }
  return reason;
}

// Offer hands one list to the store and says whether it is there now.
ExitCode Offer(const std::string& path, const Sources& sources, bool force, Json& said) {
  const Ref<CrlSequence> list = ReadCrl(path);
  const Ref<SExpression> acls = sources.AclsFor(list->GetCert()->GetTag());
  said.update(DescribeCrl(*list).members());
  const std::string reason = Store(*list, path, acls.get(), force, said);
  said["stored"] = reason.empty();
  if (!reason.empty()) said["why"] = reason;
  Say(reason.empty() ? "stored: " + InputName(path) + ": " + CrlText(*list)
                     : "not stored: " + InputName(path) + ": " + reason);
  return reason.empty() ? kYes : kNo;
}

ExitCode Run(const Options& options) {
  const std::vector<std::string> files = ListFiles(options.source);
  const Sources sources(LoadAcls().get());
  ExitCode worst = kYes;
  for (const std::string& path : files) {
    Json said = {{"file", InputName(path)}, {"stored", false}, {"why", Json()}};
    ExitCode code = kTrouble;
    try {
      code = Offer(path, sources, options.force, said);
    } catch (const Trouble& trouble) {  // one list does not keep the others out
      Note(std::string("vesk2: ") + trouble.what());
      said["why"] = trouble.what();
    }
    Result()["lists"].push_back(std::move(said));
    worst = std::max(worst, code);
  }
  return worst;
}

}  // namespace

Action DefineCrlImport(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("source", options->source, "A revocation list, or a directory of them (*.crl)")
      .Required();
  list.Add("-f,--force", options->force,
           "Store a list also where it revokes less than the stored one of the same end, or "
           "where that one cannot be read");
  list.Footer(
      "Exit status: 0 when every list is in the store now, 1 when one was refused, 2 when one "
      "could\nnot be read or written.");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
