// crl_import.cpp: vesk2 crl import.
#include <algorithm>
#include <filesystem>

#include "tools/vesk2/command.h"
#include "tools/vesk2/crl_store.h"
#include "tools/vesk2/describe.h"
#include "tools/vesk2/inspect.h"
#include "tools/vesk2/stores.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string source;
};

// The list files of a directory, or the one file.
std::vector<std::string> ListFiles(const std::string& source) {
  std::error_code error;
  if (!std::filesystem::is_directory(source, error)) return {source};
  const std::vector<std::string> files = FilesOf(source, ".crl");
  if (files.empty()) throw FileTrouble(source, "holds no revocation list (*.crl)", "nothing");
  return files;
}

// Offer hands one list to the store and says whether it is there now.
ExitCode Offer(const std::string& path, SExpression* acls, Json& said) {
  const Ref<CrlSequence> list = ReadCrl(path);
  said.update(DescribeCrl(*list).members());
  const std::string reason = StoreCrl(*list, acls, path);
  said["stored"] = reason.empty();
  if (!reason.empty()) said["why"] = reason;
  Say(reason.empty() ? "stored: " + Escape(path) + ": " + CrlText(*list)
                     : "not stored: " + Escape(path) + ": " + reason);
  return reason.empty() ? kYes : kNo;
}

ExitCode Run(const Options& options) {
  const std::vector<std::string> files = ListFiles(options.source);
  const Ref<SExpression> acls = LoadAcls();
  ExitCode worst = kYes;
  for (const std::string& path : files) {
    Json said = {{"file", Escape(path)}, {"stored", false}};
    ExitCode code = kTrouble;
    try {
      code = Offer(path, acls.get(), said);
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
