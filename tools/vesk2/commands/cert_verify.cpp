// SPDX-License-Identifier: Apache-2.0
// cert_verify.cpp: vesk2 cert verify.
#include "tools/vesk2/authority/change.h"
#include "tools/vesk2/authority/supposition.h"
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/no_store.h"
#include "tools/vesk2/confine/confine.h"
#include "tools/vesk2/explain/effort.h"
#include "tools/vesk2/explain/explain.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/objects/cert_chain.h"
#include "tools/vesk2/objects/shapes.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/page/page.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/verify/store_check.h"

#include <vesk2/evidence.h>

namespace vesk2_command {
namespace {

struct Options {
  std::string file;
  std::string tag;
  std::string at;
  PeriodOptions period;
  bool explain = false;
  StoreCheck stores;
  PageOptions page;
  SuppositionOptions supposed;
};

Period AskedPeriod(const Options& options, const Supposition& supposition) {
  if (!options.supposed.at.empty()) return {supposition.Now(), supposition.Now()};
  const bool open = options.period.notBefore.empty() && options.period.notAfter.empty();
  return ParseMoment(options.period, options.at.empty() && open ? "now" : options.at);
}

void RequireAnswer(const Question& question, int code) {
  if (code >= 0 && code != VESK2_ERR_MEM_ALLOC && code != VESK2_ERR_READ_FILE) return;
  if (code < 0) ExplainTrouble(question, code);
  Check(code, InputName(question.file));
}

// The same evidence with what is supposed, and what the answer is without.
int Suppose(const Question& question, const Options& options, const Supposition& supposition,
            ZvVesk2::Evidence& proved) {
  ZvVesk2::Evidence now(nullptr);
  Check(now.Copy(proved), "judging a supposition");
  const Period period = AskedPeriod(options, Supposition());
  if (!options.supposed.at.empty()) now.SetPeriod(period.notBefore.get(), period.notAfter.get());
  Supposition::TellAsItIs(JudgeMembers(now, *question.request));
  supposition.Change(proved);
  return proved.Judge(question.request->members[0].tag.get());
}

// The answer about every member; the first refusal is the answer to all. None where no entry could
// be loaded.
std::optional<int> VerifyMembers(const CertChain& chain, const Question& question,
                                 const Options& options, const Supposition& supposition,
                                 ZvVesk2::Evidence& proved) {
  const Request& request = *question.request;
  int first = 0;
  for (size_t i = 0; i < request.members.size(); ++i) {
    SExpression* tag = request.members[i].tag.get();
    int code = i != 0 ? proved.Judge(tag)
                      : chain->Verify(nullptr, tag, question.period.notBefore.get(),
                                      question.period.notAfter.get(), proved);
    if (proved.GetEntries() == nullptr && code >= 0 && code != VESK2_ERR_MEM_ALLOC &&
        code != VESK2_ERR_READ_FILE) {
      return std::nullopt;
    }
    RequireAnswer(question, code);
    if (i == 0) DetailEvidence(question);
    Detail("authority for " + Escape(request.members[i].text) + ": " +
           (code == 0 ? "granted" : Reason(code)));
    if (i == 0) {
      (void)CheckStores(question, options.stores);
      if (supposition.Any()) code = Suppose(question, options, supposition, proved);
      RequireAnswer(question, code);
    }
    TellMember(request, i, code);
    if (first == 0) first = code;
  }
  return first;
}

ExitCode Run(const Options& options) {
  Result() = {{"about", Json()},
              {"subject", Json()},
              {"tag", Json()},
              {"hypothetical", Json()},
              {"as_it_is", Json()}};
  StartExplanation();
  StartAnswer();
  const Request request = ParseRequest(options.tag);
  Question question;
  question.file = options.file;
  question.request = &request;
  const Supposition supposition(options.supposed);
  question.period = AskedPeriod(options, supposition);
  Result()["about"] = {{"file", InputName(options.file)}};
  Result()["about"].update(PeriodJson(question.period));
  const CertChain chain = ReadCertChain(options.file);
  const std::vector<ChainLink> links = ChainLinks(chain, options.file);

  const std::string tag = TagText(request.tag.get());
  const std::string subject = SubjectText(*links[0].cert->GetSubject());
  Result()["subject"] = subject;
  Result()["tag"] = tag;
  ZvVesk2::Evidence proved(nullptr);
  question.proved = &proved;
  const std::optional<int> code = VerifyMembers(chain, question, options, supposition, proved);
  if (!code) return RefuseWithoutStore(question, VESK2_ERR_ACL_ENTRY_NOT_FOUND);
  if (*code != 0) {
    const ExitCode verdict = No(*code, CodeWords(*code));
    ExplainRefusal(question, *code);
    return verdict;
  }
  const ExitCode verdict = Yes(subject + " is granted " + tag);
  if (options.explain) Note(Confinement());
  std::optional<UnshownNotes> unshown;
  if (!options.explain) unshown.emplace();
  if (options.explain || CollectsFacts()) ExplainGrant(question);
  return verdict;
}

}  // namespace

Action DefineCertVerify(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("file", options->file, "The certificate file: a chain").Required();
  list.Add("--tag", options->tag,
           "What its first subject must be authorized for; of a set, every member")
      .Required();
  AddMomentOptions(list, options->period, options->at, "Authorized at this moment [now]");
  AddStoreCheckOptions(list, options->stores);
  list.Add("--explain", options->explain, "Tell why also when the answer is yes");
  AddSuppositionOptions(list, options->supposed);
  AddPageOptions(list, options->page);
  return WithPage(options->page, [options] { return Run(*options); });
}

}  // namespace vesk2_command
