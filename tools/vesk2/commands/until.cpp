// SPDX-License-Identifier: Apache-2.0
// until.cpp: vesk2 until: when an answer about authority becomes another one by itself.
#include "tools/vesk2/authority/search.h"
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/explain/effort.h"
#include "tools/vesk2/keys/key_reference.h"
#include "tools/vesk2/objects/cert_chain.h"
#include "tools/vesk2/objects/manifest_file.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/acl_store.h"
#include "tools/vesk2/verify/today.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string what;
  std::string tag;
  HoldingsOptions holdings;
  SuppositionOptions supposed;
};

// Something whose authority is asked about.
class Subject {
 public:
  virtual ~Subject() = default;
  virtual const char* kind() const = 0;
  virtual std::string Name() const = 0;
  // 0 for yes, else the refusal.
  virtual int Judge(TimeStamp* at) = 0;
  virtual Moments AllMoments() const = 0;
  // Why it is yes on one side of a moment and no on the other, at `refused`.
  virtual Cause CauseOf(long second, long refused) = 0;
};

// ---- A key ----

class KeySubject : public Subject {
 public:
  KeySubject(const Options& options, const Request& request, const Supposition& supposition)
      : holdings_(LoadHoldings(options.holdings)), search_(holdings_, request, supposition) {
    Ref<PublicKey> key;
    const Ref<ZvVesk2::Hash> fingerprint = ParseFingerprint(options.what);
    name_ = options.what;
    if (fingerprint) {
      key = search_.keys().FindKey(options.what);
    } else {
      key = ReadPublicKey(options.what);
      name_ = Fingerprint(*key);
    }
    if (key) key_ = OneKey(key);
    if (key && search_.keys().IsInGroup(*key)) {
      Note("note: it is one of several keys that must agree; who tells what they may do together");
    }
  }

  const char* kind() const override { return "key"; }
  std::string Name() const override { return Escape(name_); }

  int Judge(TimeStamp* at) override {
    const bool yes = !key_.keys.empty() && search_.MaySign(key_, at, known_);
    return yes ? 0 : VESK2_ERR_NOT_AUTHORIZED;
  }
  Moments AllMoments() const override {
    return key_.keys.empty() ? Moments() : search_.MomentsOf(key_);
  }

  // By a way that is good on the other side.
  Cause CauseOf(long second, long refused) override {
    const Ref<TimeStamp> good = StampOf(refused == second ? second - 1 : second);
    for (const Way& way : known_) {
      if (search_.Judge(way, good.get()) != 0) continue;
      ZvVesk2::Evidence evidence(nullptr);
      search_.MakeEvidence(way, StampOf(refused).get(), evidence);
      return FindCause(evidence, search_.request(), second, search_.Places(way));
    }
    throw Trouble("no way is good just before that changes");
  }

 private:
  Holdings holdings_;
  Search search_;
  Signers key_;
  std::string name_;
  std::vector<Way> known_;
};

// ---- A file ----

// What was read of a file, and asked about at other moments.
class FileSubject : public Subject {
 public:
  FileSubject(const Options& options, const Request& request)
      : path_(options.what), request_(request), proved_(nullptr) {}

  Moments AllMoments() const override {
    Moments moments;
    moments.AddLists(proved_.GetStoredLists());
    moments.AddLists(proved_.GetCarriedLists());
    return moments;
  }

  Cause CauseOf(long second, long refused) override {
    ZvVesk2::Evidence evidence(nullptr);
    CopyAt(*StampOf(refused), evidence);
    std::vector<std::string> places;
    for (size_t i = 0; i < evidence.CountCerts(); ++i) {
      places.push_back(Escape(path_) + ":" + std::to_string(i + 1));
    }
    return FindCause(evidence, request_, second, places);
  }

 protected:
  virtual void SetMoment(ZvVesk2::Evidence& evidence, TimeStamp& at) const = 0;

  void CopyAt(TimeStamp& at, ZvVesk2::Evidence& evidence) const {
    Check(evidence.Copy(proved_), "judging another moment");
    SetMoment(evidence, at);
  }
  int JudgeAt(TimeStamp& at) const {
    ZvVesk2::Evidence evidence(nullptr);
    CopyAt(at, evidence);
    return JudgeMembers(evidence, request_);
  }
  // The stores are those of this machine, with what is supposed of them.
  void CheckAndChange(const Options& options, const Supposition& supposition, bool manifest) {
    Question question;
    question.file = path_;
    question.manifest = manifest;
    question.request = &request_;
    question.aclDirectory = options.holdings.aclDirectory;
    question.proved = &proved_;
    (void)CheckStores(question, options.holdings.stores);
    supposition.Change(proved_);
  }

  std::string path_;
  const Request& request_;
  ZvVesk2::Evidence proved_;
};

// As cert verify judges it.
class ChainSubject : public FileSubject {
 public:
  ChainSubject(const Options& options, const Request& request, const Supposition& supposition)
      : FileSubject(options, request) {
    if (!options.holdings.aclDirectory.empty()) {
      throw Trouble("--acl-dir is for keys and manifests", "usage");
    }
    const CertChain chain = ReadCertChain(path_);
    name_ = SubjectText(*ChainLinks(chain, path_)[0].cert->GetSubject());
    const Ref<TimeStamp> now = supposition.Now();
    const int code =
        chain->Verify(nullptr, request.members.at(0).tag.get(), now.get(), now.get(), proved_);
    if (code == VESK2_ERR_MEM_ALLOC || code == VESK2_ERR_READ_FILE) Check(code, Escape(path_));
    if (proved_.GetEntries() == nullptr) {
      proved_.SetEntries(NoEntries("", VESK2_ERR_ACL_ENTRY_NOT_FOUND).get());
      proved_.SetLists(nullptr, proved_.GetCarriedLists());
    }
    if (code < 0) Check(code, Escape(path_));
    CheckAndChange(options, supposition, false);
  }

  const char* kind() const override { return "certificate"; }
  std::string Name() const override { return name_; }
  int Judge(TimeStamp* at) override { return JudgeAt(*at); }

  Moments AllMoments() const override {
    Moments moments = FileSubject::AllMoments();
    for (size_t i = 0; i < proved_.CountCerts(); ++i) moments.AddCert(*proved_.GetCert(i));
    moments.AddEntries(proved_.GetEntries());
    return moments;
  }

 protected:
  void SetMoment(ZvVesk2::Evidence& evidence, TimeStamp& at) const override {
    evidence.SetPeriod(&at, &at);
  }

 private:
  std::string name_;
};

// As manifest verify judges who signed it: by the time of signing, and by what is revoked.
class ManifestSubject : public FileSubject {
 public:
  ManifestSubject(const Options& options, const Request& request, const Supposition& supposition)
      : FileSubject(options, request) {
    const SignatureBlock block = ReadSignatureBlock(path_);
    if (block.listing == nullptr) Malformed(path_, block.position, "manifest", block.code);
    code_ = block.code;
    Check(proved_.Copy(*block.proved), "reading a manifest");
    LoadStores(proved_, options.holdings.aclDirectory);
    CheckAndChange(options, supposition, true);
  }

  const char* kind() const override { return "manifest"; }
  std::string Name() const override {
    return Escape(path_) + ", signed by " + Fingerprint(*proved_.GetCert(0)->GetIssuer()) + ",";
  }

  int Judge(TimeStamp* at) override {
    if (code_ != 0) return code_;
    ZvVesk2::Evidence signing(nullptr);
    Check(signing.Copy(proved_), "judging another moment");
    const int code = JudgeMembers(signing, request_);
    if (code != 0) return code;
    return IsSignedInFuture(proved_, *at) ? VESK2_ERR_NOT_AUTHORIZED : JudgeAt(*at);
  }

  Moments AllMoments() const override {
    Moments moments = FileSubject::AllMoments();
    moments.AddSecond(FirstAccepted());
    return moments;
  }

  Cause CauseOf(long second, long refused) override {
    if (!IsSignedInFuture(proved_, *StampOf(refused))) {
      return FileSubject::CauseOf(second, refused);
    }
    return {"signed-in-future",
            "it says that it was signed at " + StampText(*proved_.GetSigningTime()), "", "", ""};
  }

 protected:
  void SetMoment(ZvVesk2::Evidence& evidence, TimeStamp& at) const override {
    evidence.SetRevocationTime(&at);
  }

 private:
  long FirstAccepted() const { return proved_.GetSigningTime()->ToTime() - kClockDifference; }

  int code_ = 0;
};

std::unique_ptr<Subject> ReadSubject(const Options& options, const Request& request,
                                     const Supposition& supposition) {
  const auto aboutKey = [&] { return std::make_unique<KeySubject>(options, request, supposition); };
  if (ParseFingerprint(options.what)) return aboutKey();
  const Buffer buffer = OpenBuffer(options.what);
  const bool manifest = buffer->LooksAt("(8:manifest");
  if (!manifest && !buffer->LooksAt("(8:sequence")) return aboutKey();
  if (!options.holdings.certs.empty()) {
    throw Trouble("--cert is for keys: a file brings its own certificates", "usage");
  }
  if (manifest) return std::make_unique<ManifestSubject>(options, request, supposition);
  return std::make_unique<ChainSubject>(options, request, supposition);
}

ExitCode Run(const Options& options) {
  for (const char* member : {"tag", "kind", "subject", "hypothetical", "until", "because"}) {
    Result()[member] = Json();
  }
  StartSearch();
  const Request request = ParseRequest(options.tag);
  const std::string tag = TagText(request.tag.get());
  Result()["tag"] = tag;
  const Supposition supposition(options.supposed);
  const std::unique_ptr<Subject> subject = ReadSubject(options, request, supposition);
  Result()["kind"] = subject->kind();
  Result()["subject"] = subject->Name();

  const Ref<TimeStamp> now = supposition.Now();
  const int code = subject->Judge(now.get());
  const std::optional<long> change = subject->AllMoments().FirstChange(
      now->ToTime(), [&](TimeStamp* at) { return subject->Judge(at) == 0; });
  std::string text = subject->Name();
  if (code == 0) text += " is authorized for " + tag;
  if (code != 0) text += " is not authorized for " + tag + ": " + CodeWords(code);
  if (code != 0) NoteMeantRequest(request);
  if (!change) {
    text += code == 0 ? ", without end" : ", and nothing that is known will change that";
    return code == 0 ? Yes(text) : No(code, text);
  }
  const Cause cause = subject->CauseOf(*change, code == 0 ? *change : *change - 1);
  Result()["until"] = StampText(*StampOf(*change - 1));
  Result()["because"] = CauseJson(cause);
  text += (code == 0 ? " until " : "; it will be, after ") + StampText(*StampOf(*change - 1)) +
          ": then " + cause.text;
  return code == 0 ? Yes(text) : No(code, text);
}

}  // namespace

Action DefineUntil(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("what", options->what,
           "A manifest, a certificate file, or a key: its file or its fingerprint")
      .Required();
  list.Add("--tag", options->tag, "What it is to be authorized for; of a set, every member")
      .Required();
  AddHoldingsOptions(list, options->holdings);
  AddSuppositionOptions(list, options->supposed);
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
