// SPDX-License-Identifier: Apache-2.0
// manifest_authority.cpp: judging who signed a manifest.
#include "tools/vesk2/commands/manifest_authority.h"

#include "tools/vesk2/commands/no_store.h"
#include "tools/vesk2/confine/confine.h"
#include "tools/vesk2/explain/explain.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/objects/manifest_file.h"
#include "tools/vesk2/objects/shapes.h"
#include "tools/vesk2/verify/keep_lists.h"

namespace vesk2_command {
namespace {

constexpr const char* kSigning = "signing";

Period AskedPeriod(const AuthorityOptions& options) {
  if (options.at == kSigning) return {};
  return ParseMoment(options.period, options.at);
}

// Whether nobody said what moment the answer is about.
bool IsAboutToday(const AuthorityOptions& options) {
  return options.at.empty() && options.period.notBefore.empty() && options.period.notAfter.empty();
}

// Of a verification that did not come to the tree: no entry could be loaded.
bool IsAboutStore(int code) {
  return code == VESK2_ERR_FILE_NOT_FOUND || code == VESK2_ERR_FIND_DIR;
}

}  // namespace

void AddAuthorityOptions(OptionList& list, AuthorityOptions& options) {
  list.Add("--tag", options.tag, "What the signer must be authorized for; of a set, every member")
      .Required();
  AddMomentOptions(list, options.period, options.at,
                   "Authorized, and not revoked, at this moment; \"signing\" for the time of "
                   "signing [authorized at the time of signing, not revoked now]");
  list.Add(
      "--no-store-update", options.noStoreUpdate,
      "Keep nothing: neither the revocation lists that the manifest carries nor a higher floor");
  AddFloorOptions(list, options.floor);
  list.Add("--acl-dir", options.aclDirectory, "Trust the entries of this directory too");
  AddStoreCheckOptions(list, options.stores);
  list.Add("--explain", options.explain, "Tell why also when the answer is yes");
}

void StartTreeResult() {
  for (const char* member :
       {"about", "hypothetical", "as_it_is", "tag", "signer", "signed_at", "counts", "changed",
        "missing", "links_out", "unlisted", "ignored", "ignored_nothing", "floor"}) {
    Result()[member] = Json();
  }
  StartExplanation();
}

bool JudgedTree(const ZvVesk2::Manifest& manifest, int code) {
  return code == 0 || manifest.GetInvalid() != nullptr || manifest.GetMissing() != nullptr ||
         (code == VESK2_ERR_EXTRA_FILES && manifest.GetExtra() != nullptr);
}

ManifestAuthority::ManifestAuthority(const AuthorityOptions& options,
                                     std::vector<std::string> signing)
    : options_(options), request_(ParseRequest(options.tag)), supposition_(options.supposed) {
  question_.file = options.manifest;
  question_.manifest = true;
  question_.request = &request_;
  question_.period = AskedPeriod(options);
  question_.aclDirectory = options.aclDirectory;
  question_.signing = std::move(signing);
  question_.proved = &proved_;
  Result()["tag"] = TagText(request_.tag.get());
  Result()["about"]["file"] = InputName(options.manifest);
  Result()["about"].update(PeriodJson(question_.period));
  floor_.emplace(options.floor, *request_.tag,
                 IsAboutToday(options) && !options.noStoreUpdate && !IsHypothetical());
}

void ManifestAuthority::Initialize(ZvVesk2::Manifest& manifest, const std::string& directory,
                                   const std::string& path) const {
  Check(manifest.Initialize(directory.c_str(), path.c_str(), request_.members[0].text.c_str()),
        "preparing");
  manifest.SetStoreUpdate(false);  // the answer decides what is kept
  if (!options_.aclDirectory.empty()) manifest.SetExtraAclDirectory(NewText(options_.aclDirectory));
}

long ManifestAuthority::First() const {
  return question_.period.notBefore ? question_.period.notBefore->ToTime() : 0;
}

long ManifestAuthority::Last() const {
  return question_.period.notAfter ? question_.period.notAfter->ToTime() : 0;
}

std::optional<ExitCode> ManifestAuthority::Judge(const ZvVesk2::Manifest& manifest, int code) {
  Result()["signed_at"] = StampJson(proved_.GetSigningTime());
  if (proved_.CountCerts() > 0) {
    Result()["signer"] = Fingerprint(*proved_.GetCert(0)->GetIssuer());
  }
  DetailEvidence(question_);
  Detail("authority, as asked: " + (code == 0 ? "granted" : Reason(code)));
  if (IsAboutStore(code)) return RefuseWithoutStore(question_, code);
  if (code != 0 && !IsRefusal(code)) ThrowTrouble(manifest, code);
  broken_ = CheckStores(question_, options_.stores);
  if (IsHypothetical()) code = Suppose(code);
  if (IsAboutToday(options_)) today_.emplace(proved_, *supposition_.Now());
  const int refused = JudgeAll(code);
  if (refused != 0) return Refuse(refused);
  return RefuseTime();
}

void ManifestAuthority::ThrowTrouble(const ZvVesk2::Manifest& manifest, int code) const {
  ExplainTrouble(question_, code);
  ThrowUnreadable(options_.manifest, manifest, code);
}

// The same evidence with what is supposed, after the answer without.
int ManifestAuthority::Suppose(int code) {
  if (code == 0 && IsAboutToday(options_)) {
    const Today today(proved_, *ParseTime("now", false));
    for (const Request::Member& member : request_.members) {
      if (code == 0) code = JudgeMember(member.tag.get());
      if (code == 0) code = today.Judge(member.tag.get());
    }
  }
  if (code == 0 && IsAboutToday(options_) && IsSignedInFuture(proved_, *ParseTime("now", false))) {
    Supposition::TellAsItIs(false, "signed-in-future", 0, "its time of signing is yet to come");
  } else {
    Supposition::TellAsItIs(code);
  }
  supposition_.Change(proved_);
  Check(proved_.MarkRevoked(), "judging a supposition");
  return JudgeMember(request_.members[0].tag.get());
}

// The first refusal of a member of the asked set; `first` is the library's for the first member.
int ManifestAuthority::JudgeAll(int first) {
  int refused = 0;
  for (size_t i = 0; i < request_.members.size(); ++i) {
    int code = i == 0 ? first : JudgeMember(request_.members[i].tag.get());
    if (code == 0 && today_) {
      code = today_->Judge(request_.members[i].tag.get());
      Detail("authority, by what is revoked today: " + (code == 0 ? "granted" : Reason(code)));
      byToday_ |= refused == 0 && code != 0;
    }
    TellMember(request_, i, code);
    if (refused == 0) refused = code;
  }
  return refused;
}

int ManifestAuthority::JudgeMember(SExpression* tag) const {
  ZvVesk2::Evidence same(nullptr);
  Check(same.Copy(proved_), "judging a member");
  const int code = same.Judge(tag);
  if (code < 0 || code == VESK2_ERR_MEM_ALLOC) Check(code, InputName(options_.manifest));
  return code != 0 ? code : proved_.GetContentCode();
}

ExitCode ManifestAuthority::Refuse(int code) {
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

std::optional<ExitCode> ManifestAuthority::RefuseTime() {
  if (today_ && IsSignedInFuture(proved_, *supposition_.Now())) {
    Keep(false);
    return No("signed-in-future", "the manifest says it was signed at " +
                                      StampText(*proved_.GetSigningTime()) +
                                      ", which is yet to come (--at tells when to judge it)");
  }
  const std::optional<ExitCode> older = floor_->Refuse(*proved_.GetSigningTime());
  if (older) Keep(false);
  return older;
}

void ManifestAuthority::Keep(bool yes) const {
  if (!options_.noStoreUpdate && !IsHypothetical()) KeepLists(proved_, yes, broken_);
}

std::optional<ExitCode> ManifestAuthority::RaiseFloor(const std::function<void()>& accept) {
  return floor_->Raise(*proved_.GetSigningTime(), accept);
}

std::string ManifestAuthority::SignedText() const {
  const bool aboutSigning = today_ || options_.at == kSigning;
  return "as signed at " + StampText(*proved_.GetSigningTime()) + " by " +
         Fingerprint(*proved_.GetCert(0)->GetIssuer()) +
         (aboutSigning ? EndedSince(proved_, *supposition_.Now()) : "");
}

void ManifestAuthority::TellYes() {
  if (options_.explain) Note(Confinement());
  options_.explain ? TellGrant() : TellCollectedGrant();
}

void ManifestAuthority::TellCollectedGrant() {
  const UnshownNotes unshown;
  if (CollectsFacts()) TellGrant();
}

void ManifestAuthority::TellGrant() {
  if (today_) question_.proved = &today_->evidence();
  ExplainGrant(question_);
  question_.proved = &proved_;
}

}  // namespace vesk2_command
