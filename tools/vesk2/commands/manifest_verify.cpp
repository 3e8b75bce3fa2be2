// SPDX-License-Identifier: Apache-2.0
// manifest_verify.cpp: vesk2 manifest verify.
#include <algorithm>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/confine/confine.h"
#include "tools/vesk2/explain/effort.h"
#include "tools/vesk2/explain/explain.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/objects/manifest_file.h"
#include "tools/vesk2/objects/shapes.h"
#include "tools/vesk2/say/progress.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/acl_store.h"
#include "tools/vesk2/tree/ignored_listing.h"
#include "tools/vesk2/tree/threads.h"
#include "tools/vesk2/tree/tree.h"
#include "tools/vesk2/tree/tree_findings.h"
#include "tools/vesk2/verify/keep_floor.h"
#include "tools/vesk2/verify/keep_lists.h"
#include "tools/vesk2/verify/store_check.h"
#include "tools/vesk2/verify/today.h"

#include <vesk2/evidence.h>
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
  IgnoreOptions ignore;
  bool allowEmpty = false;
  bool explain = false;
  bool all = false;
  unsigned jobs = 0;
  StoreCheck stores;
  FloorOptions floor;
};

constexpr const char* kSigning = "signing";

Period AskedPeriod(const Options& options) {
  if (options.at == kSigning) return {};
  if (options.at.empty()) return ParsePeriod(options.period);
  return {ParseTime(options.at, false), ParseTime(options.at, false)};
}

// Whether nobody said what moment the answer is about.
bool IsAboutToday(const Options& options) {
  return options.at.empty() && options.period.notBefore.empty() && options.period.notAfter.empty();
}

void Configure(Manifest& manifest, const Options& options, const std::string& tag,
               const IgnoredListing& bytes) {
  Check(manifest.Initialize(options.directory.c_str(), bytes.path().c_str(), tag.c_str()),
        "preparing");
  manifest.SetFailOnExtraEntries(!options.allowExtra);
  manifest.SetStoreUpdate(false);  // the answer decides what is kept
  if (!options.aclDirectory.empty()) manifest.SetExtraAclDirectory(NewText(options.aclDirectory));
  IgnoreEntries(manifest, bytes.ignored());
}

bool JudgedTree(const Manifest& manifest, int code) {
  return code == 0 || manifest.GetInvalid() != nullptr || manifest.GetMissing() != nullptr ||
         (code == VESK2_ERR_EXTRA_FILES && manifest.GetExtra() != nullptr);
}

int VerifyFiles(Manifest& manifest, const Options& options, const Period& period) {
  const ProgressLine progress("verifying", [&] { return manifest.CountListedFiles(); });
  const LentThreads threads(options.jobs, options.manifest);
  Check(manifest.SetFileCallbacks(progress.Callbacks()), "preparing");
  manifest.SetTaskRunner(threads.Runner());
  const int code = manifest.VerifyManifest(period.notBefore ? period.notBefore->ToTime() : 0,
                                           period.notAfter ? period.notAfter->ToTime() : 0);
  Check(manifest.SetFileCallbacks(nullptr), "preparing");
  manifest.SetTaskRunner(nullptr);
  return code;
}

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

// A program finds every member in every answer.
void StartResult() {
  for (const char* member : {"tag", "signer", "signed_at", "counts", "changed", "missing",
                             "links_out", "unlisted", "ignored", "ignored_nothing", "floor"}) {
    Result()[member] = Json();
  }
  StartExplanation();
}

// One verification: what was asked, and what came of it.
class Answer {
 public:
  explicit Answer(const Options& options)
      : options_(options),
        request_(ParseRequest(options.tag)),
        rules_(options.ignore, options.directory),
        bytes_(options.manifest, rules_, options.directory),
        tree_{options.directory,  options.manifest,   bytes_.ignored(),
              options.allowExtra, options.allowLinks, options.all},
        manifest_(nullptr) {
    question_.file = options.manifest;
    question_.manifest = true;
    question_.request = &request_;
    question_.period = AskedPeriod(options);
    question_.aclDirectory = options.aclDirectory;
    question_.signing = SigningWords(options);
    question_.proved = &proved_;
    Configure(manifest_, options, request_.members[0].text, bytes_);
    manifest_.SetEvidence(&proved_);
    Result()["tag"] = TagText(request_.tag.get());
    const bool raises = IsAboutToday(options) && !options.noStoreUpdate;
    floor_.emplace(options.floor, *request_.tag, raises);
  }

  ExitCode Give() {
    code_ = VerifyFiles(manifest_, options_, question_.period);
    Result()["signed_at"] = StampJson(proved_.GetSigningTime());
    if (proved_.CountCerts() > 0) {
      Result()["signer"] = Fingerprint(*proved_.GetCert(0)->GetIssuer());
    }
    const bool judged = JudgedTree(manifest_, code_);
    if (!judged && !IsRefusal(code_)) ThrowTrouble();
    broken_ = CheckStores(question_, options_.stores);
    if (IsAboutToday(options_)) today_.emplace(proved_);
    const int refused = JudgeMembers(judged ? 0 : code_);
    return refused != 0 ? Refuse(refused) : AnswerTree();
  }

 private:
  [[noreturn]] void ThrowTrouble() {
    ExplainTrouble(question_, code_);
    if (code_ == VESK2_ERR_FILE_NOT_FOUND || code_ == VESK2_ERR_FIND_DIR) ThrowNoStore(code_);
    ThrowUnreadable(options_.manifest, manifest_, code_);
  }

  // The first refusal of a member of the asked set; `first` is the library's for the first member.
  int JudgeMembers(int first) {
    int refused = 0;
    for (size_t i = 0; i < request_.members.size(); ++i) {
      int code = i == 0 ? first : JudgeMember(request_.members[i].tag.get());
      if (code == 0 && today_) {
        code = today_->Judge(request_.members[i].tag.get());
        byToday_ |= refused == 0 && code != 0;
      }
      TellMember(request_, i, code);
      if (refused == 0) refused = code;
    }
    return refused;
  }

  int JudgeMember(SExpression* tag) {
    ZvVesk2::Evidence same(nullptr);
    Check(same.Copy(proved_), "judging a member");
    const int code = same.Judge(tag);
    if (code < 0 || code == VESK2_ERR_MEM_ALLOC) Check(code, Escape(options_.manifest));
    return code != 0 ? code : proved_.GetContentCode();
  }

  // Before the verdict is told: trouble with the store must not follow a yes.
  void Keep(bool yes) const {
    if (!options_.noStoreUpdate) KeepLists(proved_, yes, broken_);
  }

  ExitCode Refuse(int code) {
    Keep(false);
    int explained = code;
    if (today_) {
      question_.proved = &today_->evidence();
      const int now = today_->Judge(request_.members[0].tag.get());
      if (now != 0) explained = now;
    }
    const ExitCode verdict = byToday_ ? today_->Refuse(question_, code) : No(code, CodeWords(code));
    ExplainRefusal(question_, explained);
    return verdict;
  }

  ExitCode AnswerTree() {
    const std::string signedAt = StampText(*proved_.GetSigningTime());
    if (today_ && IsSignedInFuture(proved_)) {
      Keep(false);
      return No("signed-in-future", "the manifest says it was signed at " + signedAt +
                                        ", which is yet to come (--at tells when to judge it)");
    }
    if (const auto older = floor_->Refuse(*proved_.GetSigningTime())) {
      Keep(false);
      return *older;
    }
    const std::vector<Finding> findings = FindInTree(manifest_, tree_);
    const std::string summary = Summary(findings);
    const bool asSigned = code_ == 0 && summary.empty();
    const size_t checked = CountFiles(manifest_.GetValid());
    const bool empty = checked == 0 && !options_.allowEmpty;
    Keep(asSigned && !empty);
    if (!asSigned) return RefuseTree(findings, summary);
    if (empty) return RefuseEmpty(findings);
    if (const auto older = floor_->Raise(*proved_.GetSigningTime())) return *older;
    const bool aboutSigning = today_ || options_.at == kSigning;
    const ExitCode verdict = Yes(
        std::to_string(checked) + " files of " + Escape(options_.directory) + " are as signed at " +
        signedAt + " by " + Fingerprint(*proved_.GetCert(0)->GetIssuer()) +
        (aboutSigning ? EndedSince(proved_) : "") + IgnoredText(tree_.ignored.size()));
    TellTree(findings);
    if (options_.explain) Note(Confinement());
    if (options_.explain || GetStyle().json) TellGrant();
    return verdict;
  }

  void TellTree(const std::vector<Finding>& findings) const {
    TellFindings(findings, tree_, manifest_);
    NoteUnused(rules_);
  }

  // Explains by what is known today, where that is what was asked.
  void TellGrant() {
    if (today_) question_.proved = &today_->evidence();
    ExplainGrant(question_);
    question_.proved = &proved_;
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
    if (GetStyle().json) TellGrant();
    if (code != 0) ExplainTree(question_);
    return verdict;
  }

  const Options& options_;
  Request request_;
  IgnoreRules rules_;
  IgnoredListing bytes_;
  TreeQuestion tree_;
  Question question_;
  ZvVesk2::Evidence proved_{nullptr};
  Manifest manifest_;
  std::optional<Today> today_;
  std::optional<KeepFloor> floor_;
  std::set<std::string> broken_;  // sources whose stored list does not count
  int code_ = 0;
  bool byToday_ = false;  // refused by what is known now, not by what was at the time of signing
};

}  // namespace

Action DefineManifestVerify(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("directory", options->directory, "The tree to check").Required();
  list.Add("manifest", options->manifest, "The manifest file").Required();
  list.Add("--tag", options->tag, "What the signer must be authorized for; of a set, every member")
      .Required();
  AddPeriodOptions(list, options->period);
  list.Add("--at", options->at,
           "Authorized, and not revoked, at this moment; \"signing\" for the time of signing "
           "[authorized at the time of signing, not revoked now]")
      .Excludes("--not-before")
      .Excludes("--not-after");
  list.Add("--allow-extra", options->allowExtra, "Accept entries that are not listed");
  list.Add("--allow-links", options->allowLinks, "Accept links that lead out of the tree");
  list.Add("--no-store-update", options->noStoreUpdate,
           "Write nothing: do not keep the revocation lists that the manifest carries");
  AddFloorOptions(list, options->floor);
  list.Add("--acl-dir", options->aclDirectory, "Trust the entries of this directory too");
  AddIgnoreOptions(list, options->ignore);
  list.Add("--allow-empty", options->allowEmpty, "Accept an answer about no file at all");
  AddStoreCheckOptions(list, options->stores);
  list.Add("--explain", options->explain, "Tell why also when the answer is yes");
  LentThreads::AddOption(list, options->jobs);
  list.Add("--all", options->all, "Tell every finding, on a terminal too");
  return [options] {
    StartResult();
    RealDirectory(options->directory);
    StartAnswer();
    return Answer(*options).Give();
  };
}

}  // namespace vesk2_command
