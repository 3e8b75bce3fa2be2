// SPDX-License-Identifier: Apache-2.0
// manifest_verify.cpp: vesk2 manifest verify.
#include <algorithm>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/manifest_authority.h"
#include "tools/vesk2/explain/effort.h"
#include "tools/vesk2/explain/explain.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/objects/manifest_file.h"
#include "tools/vesk2/page/page.h"
#include "tools/vesk2/say/progress.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/tree/ignored_listing.h"
#include "tools/vesk2/tree/threads.h"
#include "tools/vesk2/tree/tree.h"
#include "tools/vesk2/tree/tree_findings.h"

#include <vesk2/manifest.h>

namespace vesk2_command {
namespace {

using ZvVesk2::Manifest;

struct Options {
  std::string directory;
  AuthorityOptions authority;
  bool allowExtra = false;
  bool allowLinks = false;
  IgnoreOptions ignore;
  bool allowEmpty = false;
  bool all = false;
  unsigned jobs = 0;
  PageOptions page;
};

// How to sign the tree again as it was asked about; empty when that is not to be had again.
std::vector<std::string> SigningWords(const Options& options) {
  const std::vector<std::string>& files = options.ignore.files;
  if (std::find(files.begin(), files.end(), kStandard) != files.end()) return {};
  std::vector<std::string> words = {options.directory};
  const std::vector<std::string> ignore = IgnoreWords(options.ignore);
  words.insert(words.end(), ignore.begin(), ignore.end());
  if (options.allowLinks) words.push_back("--allow-links");
  return words;
}

// One verification: what was asked, and what came of it.
class Answer {
 public:
  explicit Answer(const Options& options)
      : options_(options),
        authority_(options.authority, SigningWords(options)),
        rules_(options.ignore, options.directory),
        bytes_(InputPath(options.authority.manifest), rules_, options.directory),
        tree_{options.directory,  options.authority.manifest, bytes_.ignored(),
              options.allowExtra, options.allowLinks,         options.all},
        manifest_(nullptr) {
    authority_.Initialize(manifest_, options.directory, bytes_.path());
    manifest_.SetFailOnExtraEntries(!options.allowExtra);
    IgnoreEntries(manifest_, bytes_.ignored());
    manifest_.SetEvidence(&authority_.proved());
  }

  ExitCode Give() {
    code_ = VerifyFiles(
        [&] { return manifest_.VerifyManifest(authority_.First(), authority_.Last()); });
    const bool judgedTree = JudgedTree(manifest_, code_);
    const auto refused = authority_.Judge(manifest_, judgedTree ? 0 : code_);
    if (refused) return *refused;
    if (!judgedTree) CompareTree();
    return AnswerTree();
  }

 private:
  int VerifyFiles(const std::function<int()>& verify) {
    const ProgressLine progress("verifying", [&] { return FilesToRead(); });
    Detail("reads " + InputName(options_.authority.manifest) + ", and the files of " +
           Escape(options_.directory) + " that it lists");
    const LentThreads threads(options_.jobs, bytes_.path());
    Check(manifest_.SetFileCallbacks(progress.Callbacks()), "preparing");
    manifest_.SetTaskRunner(threads.Runner());
    const int code = verify();
    Check(manifest_.SetFileCallbacks(nullptr), "preparing");
    manifest_.SetTaskRunner(nullptr);
    return code;
  }

  size_t FilesToRead() const {
    const size_t listed = manifest_.CountListedFiles();
    return listed > bytes_.files() ? listed - bytes_.files() : 0;
  }

  // A signer who is only authorized by supposition: the verification did not come to the tree.
  void CompareTree() {
    ZvVesk2::Evidence read(nullptr);
    manifest_.SetEvidence(&read);
    ZvVesk2::ZvBuffer* handed = nullptr;
    const int code = manifest_.ReadManifest(false, 0, 0, &handed);
    const Buffer body(handed);
    const bool same = code == 0 && read.GetCert(0)->IsEqual(authority_.proved().GetCert(0));
    if (!same) throw Trouble(InputName(options_.authority.manifest) + ": changed meanwhile");
    code_ = VerifyFiles([&] { return manifest_.Verify(body.get(), options_.directory.c_str()); });
    if (code_ == VESK2_ERR_EXTRA_FILES && options_.allowExtra) code_ = 0;
    if (!JudgedTree(manifest_, code_)) Check(code_, Escape(options_.directory));
  }

  ExitCode AnswerTree() {
    Detail("compared " + Plural(manifest_.CountListedFiles(), "listed file") + ": " +
           (code_ == 0 ? "as signed" : Reason(code_)));
    Detail("looks for links and unlisted entries in " + Escape(options_.directory));
    const std::vector<Finding> findings = FindInTree(manifest_, tree_);
    const std::string summary = Summary(findings);
    const bool asSigned = code_ == 0 && summary.empty();
    const size_t checked = CountFiles(manifest_.GetValid());
    const bool empty = checked == 0 && !options_.allowEmpty;
    authority_.Keep(asSigned && !empty);
    if (!asSigned) return RefuseTree(findings, summary);
    if (empty) return RefuseEmpty(findings);
    if (const auto older = authority_.RaiseFloor()) return *older;
    const ExitCode verdict = Yes(Plural(checked, "file") + " of " + Escape(options_.directory) +
                                 (checked == 1 ? " is " : " are ") + authority_.SignedText() +
                                 IgnoredText(tree_.ignored.size()));
    TellTree(findings);
    authority_.TellYes();
    return verdict;
  }

  void TellTree(const std::vector<Finding>& findings) const {
    TellFindings(findings, tree_, manifest_);
    NoteUnused(rules_);
  }

  // Nothing would pass for something.
  ExitCode RefuseEmpty(const std::vector<Finding>& findings) {
    const ExitCode verdict =
        No("nothing-checked", "0 files of " + Escape(options_.directory) +
                                  " were checked (--allow-empty accepts that)" +
                                  IgnoredText(tree_.ignored.size()));
    TellTree(findings);
    return verdict;
  }

  ExitCode RefuseTree(const std::vector<Finding>& findings, const std::string& summary) {
    int code = code_;
    if (code == 0 && Found(findings, kUnlisted)) code = VESK2_ERR_EXTRA_FILES;
    const std::string text = summary + IgnoredText(tree_.ignored.size());
    const ExitCode verdict = code != 0 ? No(code, text) : No("link-leaves-tree", text);
    TellTree(findings);
    authority_.TellCollectedGrant();
    if (code != 0) ExplainTree(authority_.question());
    return verdict;
  }

  const Options& options_;
  ManifestAuthority authority_;
  IgnoreRules rules_;
  IgnoredListing bytes_;
  TreeQuestion tree_;
  Manifest manifest_;
  int code_ = 0;
};

}  // namespace

Action DefineManifestVerify(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("directory", options->directory, "The tree to check").Required();
  list.Add("manifest", options->authority.manifest, "The manifest file").Required();
  AddAuthorityOptions(list, options->authority);
  AddSuppositionOptions(list, options->authority.supposed);
  list.Add("--allow-extra", options->allowExtra, "Accept entries that are not listed");
  list.Add("--allow-links", options->allowLinks, "Accept links that lead out of the tree");
  AddIgnoreOptions(list, options->ignore);
  list.Add("--allow-empty", options->allowEmpty, "Accept an answer about no file at all");
  LentThreads::AddOption(list, options->jobs);
  list.Add("--all", options->all, "Tell every finding, on a terminal too");
  AddPageOptions(list, options->page);
  return WithPage(options->page, [options] {
    StartTreeResult();
    Result()["about"]["directory"] = Escape(options->directory);
    RealDirectory(options->directory);
    StartAnswer();
    return Answer(*options).Give();
  });
}

}  // namespace vesk2_command
