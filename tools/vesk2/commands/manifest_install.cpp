// SPDX-License-Identifier: Apache-2.0
// manifest_install.cpp: vesk2 manifest install. Who signed is judged first; then what is listed is
// taken into a directory that only we can enter, verified there, and put in its place.
#include <cerrno>
#include <cstring>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/manifest_authority.h"
#include "tools/vesk2/explain/effort.h"
#include "tools/vesk2/files/descriptor.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/install/destination.h"
#include "tools/vesk2/install/fill.h"
#include "tools/vesk2/objects/manifest_file.h"
#include "tools/vesk2/say/progress.h"
#include "tools/vesk2/tree/names.h"
#include "tools/vesk2/tree/threads.h"
#include "tools/vesk2/tree/tree_findings.h"

#include <vesk2/limits.h>
#include <vesk2/manifest_body.h>

namespace vesk2_command {
namespace {

using ZvVesk2::Manifest;

struct Options {
  std::string source;
  std::string dest;
  AuthorityOptions authority;
  DestinationOptions place;
  std::string below;
  std::string mostBytes;
  bool allowEmpty = false;
  bool dryRun = false;
  bool all = false;
  unsigned jobs = 0;
};

class Installation {
 public:
  // The manifest is read here once: what is judged, taken and verified are the same bytes.
  explicit Installation(const Options& options)
      : options_(options),
        most_(ParseSize(options.mostBytes)),
        authority_(options.authority, {}),
        bytes_(MemoryFile(ReadFile(options.authority.manifest, ZvVesk2::Limits::kMaxFile))) {}

  ExitCode Run() {
    ZvVesk2::BodyDirectory listing(nullptr);
    if (const auto refused = JudgeAuthority(listing)) return *refused;
    const Wanted wanted(listing, options_.authority.manifest);
    if (wanted.files() == 0 && !options_.allowEmpty) {
      authority_.Keep(false);
      return No("nothing-checked", "the manifest lists no file (--allow-empty accepts that)");
    }
    Destination place(options_.dest, options_.place);
    const std::unique_ptr<Source> source = OpenSource(options_.source, options_.below, wanted);
    if (options_.dryRun) return TellDryRun(wanted);
    try {
      return Install(*source, wanted, place);
    } catch (const Trouble& trouble) {
      if (!place.IsDone()) throw;
      TellPlace(place);
      Trouble told(std::string(trouble.what()) + "; but " + Escape(options_.dest) + " is installed",
                   trouble.reason);
      told.code = trouble.code;
      told.file = trouble.file;
      throw told;
    }
  }

 private:
  std::optional<ExitCode> JudgeAuthority(ZvVesk2::BodyDirectory& listing) {
    Manifest manifest(nullptr);
    authority_.Initialize(manifest, "", bytes_.Path());
    manifest.SetEvidence(&authority_.proved());
    ZvBuffer* read = nullptr;
    int code = manifest.ReadManifest(true, authority_.First(), authority_.Last(), &read);
    const Buffer body(read);
    if (const auto refused = authority_.Judge(manifest, code)) return refused;
    code = listing.ParseBody(body.get(), nullptr);
    if (code != 0) ThrowUnreadable(options_.authority.manifest, manifest, code);
    return std::nullopt;
  }

  ExitCode Install(Source& source, const Wanted& wanted, Destination& place) {
    RemoveLeftovers(place.parent(), place.name());
    Stage stage(place.parent(), place.above(), place.name());
    stage.MakeDirectories(wanted);
    if (const auto refused = FillStage(stage, source, wanted)) return Refused(*refused);
    if (const auto refused = VerifyStage(stage)) return Refused(*refused);
    stage.Finish(wanted);
    authority_.Keep(true);
    if (const auto older = authority_.RaiseFloor([&] { place.Put(stage); })) return *older;
    TellPlace(place);
    place.RemoveOld();
    const ExitCode verdict =
        Yes("installed " + Plural(wanted.files(), "file") + " of " + Escape(options_.source) +
            " as " + Escape(options_.dest) + ", " + authority_.SignedText());
    if (filled_.passedOver > 0) {
      Note("note: passed over, as they are not listed: " + std::to_string(filled_.passedOver));
    }
    if (!place.KeptOld().empty()) Note("kept what was there: " + Escape(place.KeptOld()));
    authority_.TellYes();
    return verdict;
  }

  std::optional<ExitCode> FillStage(Stage& stage, Source& source, const Wanted& wanted) {
    const ProgressLine progress("taking", [&] { return wanted.files(); });
    const auto refused = Fill(stage, source, wanted, most_, progress.Callbacks(), filled_);
    Result()["passed_over"] = filled_.passedOver;
    return refused;
  }

  // The one decision about contents. Authority is asked again with it, of the stores as they are by
  // now.
  std::optional<ExitCode> VerifyStage(const Stage& stage) {
    Manifest manifest(nullptr);
    ZvVesk2::Evidence seen(nullptr);
    authority_.Initialize(manifest, stage.Path(), bytes_.Path());
    manifest.SetFailOnExtraEntries(true);
    manifest.SetEvidence(&seen);
    const ProgressLine progress("verifying", [&] { return manifest.CountListedFiles(); });
    const LentThreads threads(options_.jobs, bytes_.Path());
    Check(manifest.SetFileCallbacks(progress.Callbacks()), "preparing");
    manifest.SetTaskRunner(threads.Runner());
    const int code = manifest.VerifyManifest(authority_.First(), authority_.Last());
    if (!JudgedTree(manifest, code)) {
      if (!IsRefusal(code)) ThrowUnreadable(options_.authority.manifest, manifest, code);
      return No(code, CodeWords(code));
    }
    return TellTree(manifest, code, stage.Path());
  }

  std::optional<ExitCode> TellTree(const Manifest& manifest, int code, const std::string& root) {
    const TreeQuestion question{root, "", {}, false, false, options_.all};
    std::vector<Finding> findings = FindInTree(manifest, question);
    const std::string summary = Summary(findings);
    std::optional<ExitCode> refused;
    if (code != 0 || !summary.empty())
      refused = No(code != 0 ? code : VESK2_ERR_EXTRA_FILES, summary);
    for (Finding& finding : findings) NameBySource(finding, root);
    TellFindings(findings, question, manifest);
    if (CountFiles(manifest.GetValid()) == 0 && !filled_.common.value_or("").empty()) {
      Note("what is there is all in " + Escape(*filled_.common) + ", which --below names");
    }
    return refused;
  }

  // A finding about the stage, as one about where its files came from.
  void NameBySource(Finding& finding, const std::string& root) const {
    for (std::string& entry : finding.entries) {
      const std::string path = entry.substr(root.size() + 1);
      const auto problem = filled_.problems.find(path);
      entry = Join(options_.source, path);
      const bool known =
          problem != filled_.problems.end() && problem->second != std::strerror(ENOENT);
      finding.reasons[entry] = known ? problem->second : "";
    }
  }

  ExitCode Refused(ExitCode verdict) {
    authority_.Keep(false);
    authority_.TellCollectedGrant();
    return verdict;
  }

  void TellPlace(const Destination& place) const {
    if (!place.IsDone()) return;
    Result()["installed"] = Escape(options_.dest);
    Result()["kept_old"] = OrNull(Escape(place.KeptOld()));
  }

  ExitCode TellDryRun(const Wanted& wanted) {
    Result()["would_write"].push_back(Escape(options_.dest));
    const ExitCode verdict = Yes("would install " + Plural(wanted.files(), "file") + " as " +
                                 Escape(options_.dest) + ", " + authority_.SignedText());
    Note("what " + Escape(options_.source) + " holds was not looked at");
    authority_.TellYes();
    return verdict;
  }

  const Options& options_;
  const uint64_t most_;
  ManifestAuthority authority_;
  const Descriptor bytes_;  // of the manifest
  Filled filled_;
};

}  // namespace

Action DefineManifestInstall(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("source", options->source,
           "What to install: a directory, or an archive (tar, also with gzip, xz or zstd; zip)")
      .Required();
  list.Add("manifest", options->authority.manifest, "The manifest file").Required();
  list.Add("dest", options->dest, "Where: a name that nothing has yet").Required();
  AddAuthorityOptions(list, options->authority);
  AddDestinationOptions(list, options->place);
  list.Add("--below", options->below, "Of an archive, install what is in this directory of it");
  AddSizeOption(list, options->mostBytes);
  list.Add("--allow-empty", options->allowEmpty, "Install also what lists no file at all");
  list.Add("-n,--dry-run", options->dryRun, "Judge who signed, and write nothing");
  LentThreads::AddOption(list, options->jobs);
  list.Add("--all", options->all, "Tell every finding, on a terminal too");
  return [options] {
    StartTreeResult();
    for (const char* member : {"installed", "kept_old", "passed_over"}) Result()[member] = Json();
    options->authority.noStoreUpdate |= options->dryRun;
    StartAnswer();
    return Installation(*options).Run();
  };
}

}  // namespace vesk2_command
