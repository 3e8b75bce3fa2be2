// cert_verify.cpp: vesk2 cert verify.
#include "tools/vesk2/command.h"
#include "tools/vesk2/explain.h"
#include "tools/vesk2/inspect.h"
#include "tools/vesk2/report.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string file;
  std::string tag;
  std::string at;
  PeriodOptions period;
  bool explain = false;
};

Period AskedPeriod(const Options& options) {
  if (!options.period.notBefore.empty() || !options.period.notAfter.empty()) {
    return ParsePeriod(options.period);
  }
  const std::string at = options.at.empty() ? "now" : options.at;
  return {ParseTime(at, false), ParseTime(at, false)};
}

// The answer about every member; the first refusal is the answer to all.
int VerifyMembers(const CertChain& chain, const Question& question) {
  const Request& request = *question.request;
  int first = 0;
  for (size_t i = 0; i < request.members.size(); ++i) {
    const int code = chain->Verify(nullptr, request.members[i].tag.get(),
                                   question.period.notBefore.get(), question.period.notAfter.get());
    if (code < 0 || code == VESK2_ERR_MEM_ALLOC || code == VESK2_ERR_READ_FILE) {
      ExplainUnreadable(question, code);
      Check(code, Escape(question.file));
    }
    TellMember(request, i, code);
    if (first == 0) first = code;
  }
  return first;
}

ExitCode Run(const Options& options) {
  const Request request = ParseRequest(options.tag);
  Question question;
  question.file = options.file;
  question.request = &request;
  question.period = AskedPeriod(options);
  const CertChain chain = ReadCertChain(options.file);
  const std::vector<ChainLink> links = ChainLinks(chain, options.file);
  (void)LoadAcls();  // says why there is nothing to go by

  const std::string tag = TagText(request.tag.get());
  const std::string subject = SubjectText(*links[0].cert->GetSubject());
  Result()["subject"] = subject;
  Result()["tag"] = tag;
  const int code = VerifyMembers(chain, question);
  if (code != 0) {
    const ExitCode verdict = No(code, CodeWords(code));
    ExplainRefusal(question, code);
    return verdict;
  }
  const ExitCode verdict = Yes(subject + " is granted " + tag);
  if (options.explain) ExplainGrant(question);
  return verdict;
}

}  // namespace

Action DefineCertVerify(CLI::App& app) {
  auto options = std::make_shared<Options>();
  app.add_option("file", options->file, "The certificate file: a chain")->required();
  app.add_option("--tag", options->tag,
                 "What its first subject must be authorized for; of a set, every member")
      ->required();
  AddPeriodOptions(app, options->period);
  app.add_option("--at", options->at, "Authorized at this moment [now]")
      ->excludes("--not-before")
      ->excludes("--not-after");
  app.add_flag("--explain", options->explain, "Tell why also when the answer is yes");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
