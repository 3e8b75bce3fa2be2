// manifest_verify.cpp: vesk2 manifest verify.
#include <algorithm>
#include <cerrno>
#include <cstring>

#include "tools/vesk2/command.h"
#include "tools/vesk2/explain.h"
#include "tools/vesk2/files.h"
#include "tools/vesk2/manifest_file.h"
#include "tools/vesk2/progress.h"
#include "tools/vesk2/report.h"
#include "tools/vesk2/tree.h"

#include <vesk2/manifest.h>

namespace vesk2_command {
namespace {

using ZvVesk2::Manifest;

struct Options {
  std::string directory;
  std::string manifest;
  std::string tag;
  PeriodOptions period;
  std::string at;
  bool allowExtra = false;
  bool allowLinks = false;
  bool noStoreUpdate = false;
  std::string aclDirectory;
  std::vector<std::string> ignored;
  bool explain = false;
};

Period AskedPeriod(const Options& options) {
  if (options.at.empty()) return ParsePeriod(options.period);
  return {ParseTime(options.at, false), ParseTime(options.at, false)};
}

void Configure(Manifest& manifest, const Options& options, const std::string& tag,
               const std::set<std::string>& ignored) {
  Check(manifest.Initialize(options.directory.c_str(), options.manifest.c_str(), tag.c_str()),
        "preparing");
  manifest.SetFailOnExtraEntries(!options.allowExtra);
  manifest.SetStoreUpdate(!options.noStoreUpdate);
  if (!options.aclDirectory.empty()) manifest.SetExtraAclDirectory(NewText(options.aclDirectory));
  IgnoreEntries(manifest, ignored);
}

// ---- Findings about the tree ----

// One kind of finding: what it is called, and the entries, sorted.
struct Finding {
  const char* kind;
  std::vector<std::string> entries;
};

std::vector<Finding> TreeFindings(const Manifest& manifest, const std::vector<std::string>& leaving,
                                  bool allowExtra) {
  const std::set<std::string> parents = FoundParents(manifest);
  std::vector<Finding> findings = {
      {"changed", FoundNames(manifest.GetInvalid(), parents)},
      {"missing", FoundNames(manifest.GetMissing(), parents)},
      {"link out of the tree", leaving},
  };
  if (!allowExtra) findings.push_back({"not listed", FoundNames(manifest.GetExtra(), parents)});
  return findings;
}

// "missing" covers all that could not be opened; a look at the disk tells more.
std::string Detail(const std::string& path) {
  const std::string why = WhyUnreadable(path);
  return why == std::strerror(ENOENT) || why == "cannot be read" ? "" : " (" + why + ")";
}

void PrintFindings(const std::vector<Finding>& findings) {
  for (const Finding& finding : findings) {
    const bool unreadable = std::string(finding.kind) == "missing";
    for (const std::string& entry : finding.entries) {
      Note(std::string(finding.kind) + ": " + Escape(entry) + (unreadable ? Detail(entry) : ""));
    }
  }
}

std::string Summary(const std::vector<Finding>& findings) {
  std::string text;
  for (const Finding& finding : findings) {
    if (finding.entries.empty()) continue;
    text +=
        (text.empty() ? "" : ", ") + std::to_string(finding.entries.size()) + " " + finding.kind;
  }
  return text;
}

// ---- Verdicts ----

bool JudgedTree(const Manifest& manifest, int code) {
  return code == 0 || manifest.GetInvalid() != nullptr || manifest.GetMissing() != nullptr ||
         (code == VESK2_ERR_EXTRA_FILES && manifest.GetExtra() != nullptr);
}

[[noreturn]] void ThrowTrouble(const Options& options, const Manifest& manifest, int code) {
  if (code == VESK2_ERR_FILE_NOT_FOUND || code == VESK2_ERR_FIND_DIR) {
    ThrowNoStore(code);
  }
  ThrowUnreadable(options.manifest, manifest, code);
}

ExitCode AnswerAuthority(const Options& options, const Manifest& manifest, const Question& question,
                         int code) {
  if (!IsRefusal(code)) {
    if (code < 0) ExplainUnreadable(question, code);
    ThrowTrouble(options, manifest, code);
  }
  const ExitCode verdict = No(code, CodeWords(code));
  ExplainRefusal(question, code);
  return verdict;
}

ExitCode AnswerTree(const Options& options, const Manifest& manifest, const Question& question,
                    const std::set<std::string>& ignored, int code) {
  const auto root = ReadListing(options.manifest, options.directory);
  const TreeNotes notes = InspectTree(*root, ignored);
  const std::vector<std::string> none;
  const std::vector<Finding> findings =
      TreeFindings(manifest, options.allowLinks ? none : notes.leaving, options.allowExtra);
  const std::string summary = Summary(findings);
  ExitCode verdict = kNo;
  if (code == 0 && summary.empty()) {
    const SignatureBlock block = ReadSignatureBlock(options.manifest);
    verdict = Yes(std::to_string(CountFiles(manifest.GetValid())) + " files of " +
                  Escape(options.directory) + " are as signed at " + StampText(*block.signedAt) +
                  " by " + Fingerprint(*block.certs.front().cert->GetIssuer()));
  } else {
    verdict = code != 0 ? No(code, summary) : No("link-leaves-tree", summary);
    PrintFindings(findings);
    if (code != 0) ExplainTree(question);
  }
  if (options.explain && verdict == kYes) ExplainGrant(question);
  if (!options.allowExtra) {
    for (const std::string& name : notes.unlisted) {
      Note("note: " + Escape(name) + " is not listed; the top directory may hold more");
    }
  }
  return verdict;
}

int Verify(Manifest& manifest, const Options& options, long notBefore, long notAfter) {
  const ProgressLine progress("verifying", options.directory);
  Check(manifest.SetFileCallbacks(progress.Callbacks()), "preparing");
  const int code = manifest.VerifyManifest(notBefore, notAfter);
  Check(manifest.SetFileCallbacks(nullptr), "preparing");
  return code;
}

// How to sign the tree again as it was asked about.
std::vector<std::string> SigningWords(const Options& options) {
  std::vector<std::string> words = {options.directory};
  for (const std::string& name : options.ignored) {
    words.push_back("--ignore");
    words.push_back(name);
  }
  if (options.allowLinks) words.push_back("--allow-links");
  return words;
}

// The answers about the members of a set behind the first, for which the tree was compared.
int VerifyOthers(const Options& options, const Question& question, long notBefore, long notAfter) {
  const Request& request = *question.request;
  int first = 0;
  for (size_t i = 1; i < request.members.size(); ++i) {
    Manifest manifest(nullptr);
    Configure(manifest, options, request.members[i].text, {});
    const int code = manifest.ReadManifest(true, notBefore, notAfter, nullptr);
    if (code != 0 && !IsRefusal(code)) {
      AnswerAuthority(options, manifest, question, code);
    }
    TellMember(request, i, code);
    if (first == 0) first = code;
  }
  return first;
}

ExitCode Run(const Options& options) {
  RealDirectory(options.directory);
  const Request request = ParseRequest(options.tag);
  Question question;
  question.file = options.manifest;
  question.manifest = true;
  question.request = &request;
  question.period = AskedPeriod(options);
  question.aclDirectory = options.aclDirectory;
  question.signing = SigningWords(options);
  const Period& period = question.period;
  const long notBefore = period.notBefore ? period.notBefore->ToTime() : 0;
  const long notAfter = period.notAfter ? period.notAfter->ToTime() : 0;
  std::set<std::string> ignored;
  for (const std::string& name : options.ignored) ignored.insert(PlainRelative(name));

  Manifest manifest(nullptr);
  Configure(manifest, options, request.members[0].text, ignored);
  const int code = Verify(manifest, options, notBefore, notAfter);
  const bool judged = JudgedTree(manifest, code);
  if (!judged && !IsRefusal(code)) return AnswerAuthority(options, manifest, question, code);
  TellMember(request, 0, judged ? 0 : code);
  const int others = VerifyOthers(options, question, notBefore, notAfter);
  const int refused = judged ? others : code;
  if (refused != 0) return AnswerAuthority(options, manifest, question, refused);
  return AnswerTree(options, manifest, question, ignored, code);
}

}  // namespace

Action DefineManifestVerify(CLI::App& app) {
  auto options = std::make_shared<Options>();
  app.add_option("directory", options->directory, "The tree to check")->required();
  app.add_option("manifest", options->manifest, "The manifest file")->required();
  app.add_option("--tag", options->tag,
                 "What the signer must be authorized for; of a set, every member")
      ->required();
  AddPeriodOptions(app, options->period);
  app.add_option("--at", options->at, "Authorized at this moment [at the time of signing]")
      ->excludes("--not-before")
      ->excludes("--not-after");
  app.add_flag("--allow-extra", options->allowExtra, "Accept entries that are not listed");
  app.add_flag("--allow-links", options->allowLinks, "Accept links that lead out of the tree");
  app.add_flag("--no-store-update", options->noStoreUpdate,
               "Write nothing: do not keep the revocation lists that the manifest carries");
  app.add_option("--acl-dir", options->aclDirectory, "Trust the entries of this directory too");
  app.add_option("--ignore", options->ignored, "Leave this entry out (a path below the directory)")
      ->allow_extra_args(false);
  app.add_flag("--explain", options->explain, "Tell why also when the answer is yes");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
