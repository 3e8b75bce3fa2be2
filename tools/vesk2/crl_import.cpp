// crl_import.cpp: vesk2 crl import.
#include <algorithm>
#include <filesystem>

#include "tools/vesk2/command.h"
#include "tools/vesk2/crl_file.h"
#include "tools/vesk2/inspect.h"
#include "tools/vesk2/report.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string source;
};

// The list files of a directory, sorted, or the one file.
std::vector<std::string> ListFiles(const std::string& source) {
  std::error_code error;
  if (!std::filesystem::is_directory(source, error)) return {source};
  std::vector<std::string> files;
  std::filesystem::directory_iterator entry(source, error);
  for (; !error && entry != std::filesystem::directory_iterator(); entry.increment(error)) {
    if (entry->path().extension() == ".crl") files.push_back(entry->path().string());
  }
  if (error) throw Trouble(Escape(source) + ": " + error.message());
  if (files.empty()) throw Trouble(Escape(source) + ": holds no revocation list (*.crl)");
  std::sort(files.begin(), files.end());
  return files;
}

// The stored list of the same source; null when there is none that can be read.
Ref<CrlSequence> Stored(CrlSequence& list) {
  Ref<CrlSequence> stored;
  const int code = CrlSequence::Find(stored.Out(), list.GetCert()->GetTag());
  if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
  if (code != 0) stored.Reset();
  return stored;
}

std::string WhyKept(CrlSequence& list, CrlSequence& kept) {
  const ZvVesk2::Cert& cert = *list.GetCert();
  const Ref<TimeStamp> now = ParseTime("now", false);
  if (cert.GetNotBefore() != nullptr && cert.GetNotBefore()->IsAfter(now.get())) {
    return "it begins only at " + StampText(*cert.GetNotBefore());
  }
  return "it is older than the stored list, which is valid " +
         PeriodText(kept.GetCert()->GetNotBefore(), kept.GetCert()->GetNotAfter());
}

// Why a list must not be stored; empty when the store is to decide.
std::string WhyRefused(CrlSequence& list, SExpression* acls) {
  if (!IsRevocationTag(list.GetCert()->GetTag())) {
    return "its tag " + TagText(list.GetCert()->GetTag()) + " does not end in (revoke ...)";
  }
  const int code = list.VerifySelf(acls);
  if (code == VESK2_ERR_MEM_ALLOC) throw Trouble(Reason(code));
  return code == 0 ? "" : WhyNotVouched(list, code) + " (" + CodeName(code) + ")";
}

// Offer hands one list to the store and says whether it is there now.
ExitCode Offer(const std::string& path, SExpression* acls) {
  const Ref<CrlSequence> list = ReadCrl(path);
  std::string reason = WhyRefused(*list, acls);
  if (reason.empty()) {
    Check(list->UpdateStore(acls), Escape(path));
    const Ref<CrlSequence> kept = Stored(*list);
    if (!kept) {
      const Text directory(CrlSequence::CalcDir(ZvVesk2::StorageGlobal));
      throw Trouble(Escape(path) + ": cannot be written to " +
                    (directory ? Escape(directory.get()) : "the store"));
    }
    if (Canonical(*kept) != Canonical(*list)) reason = WhyKept(*list, *kept);
  }
  Say(reason.empty() ? "stored: " + Escape(path) + ": " + CrlText(*list)
                     : "not stored: " + Escape(path) + ": " + reason);
  return reason.empty() ? kYes : kNo;
}

ExitCode Run(const Options& options) {
  const std::vector<std::string> files = ListFiles(options.source);
  const Ref<SExpression> acls = LoadAcls();
  ExitCode worst = kYes;
  for (const std::string& path : files) {
    ExitCode code = kTrouble;
    try {
      code = Offer(path, acls.get());
    } catch (const Trouble& trouble) {  // one list does not keep the others out
      Note(std::string("vesk2: ") + trouble.what());
    }
    worst = std::max(worst, code);
  }
  return worst;
}

}  // namespace

Action DefineCrlImport(CLI::App& app) {
  auto options = std::make_shared<Options>();
  app.add_option("source", options->source, "A revocation list, or a directory of them (*.crl)")
      ->required();
  app.footer(
      "Exit status: 0 when every list is in the store now, 1 when one was refused, 2 when one "
      "could\nnot be read or written.");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
