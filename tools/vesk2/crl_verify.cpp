// crl_verify.cpp: vesk2 crl verify.
#include "tools/vesk2/command.h"
#include "tools/vesk2/crl_file.h"
#include "tools/vesk2/inspect.h"
#include "tools/vesk2/report.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string file;
  std::string tag;
  std::string at = "now";
};

// Why the list does not count at the moment asked about; empty when it does.
std::string WhyNot(CrlSequence& list, SExpression* tag, SExpression* acls, TimeStamp& at) {
  const ZvVesk2::Cert& cert = *list.GetCert();
  if (tag != nullptr && !tag->IsEqual(cert.GetTag())) {
    return "it is of the source " + TagText(cert.GetTag()) + " (" +
           CodeName(VESK2_ERR_NOT_AUTHORIZED) + ")";
  }
  const int vouched = list.VerifySelf(acls);
  if (vouched == VESK2_ERR_MEM_ALLOC) throw Trouble(Reason(vouched));
  if (vouched != 0) return WhyNotVouched(list, vouched);
  long first = at.ToTime();
  long last = first;
  const int current = list.VerifyValidity(&first, &last);
  if (current == 0) return "";
  return "it is valid " + PeriodText(cert.GetNotBefore(), cert.GetNotAfter()) + ", asked was " +
         StampText(at) + " (" + CodeName(current) + ")";
}

ExitCode Run(const Options& options) {
  Ref<SExpression> tag;
  if (!options.tag.empty()) tag = ParseRevocationTag(options.tag);
  const Ref<TimeStamp> at = ParseTime(options.at, false);
  const Ref<CrlSequence> list = ReadCrl(options.file);
  const Ref<SExpression> acls = LoadAcls();
  const std::string reason = WhyNot(*list, tag.get(), acls.get(), *at);
  Say(reason.empty() ? "yes: " + CrlText(*list) : "no: " + reason);
  return reason.empty() ? kYes : kNo;
}

}  // namespace

Action DefineCrlVerify(CLI::App& app) {
  auto options = std::make_shared<Options>();
  app.add_option("file", options->file, "The revocation list file")->required();
  app.add_option("--tag", options->tag, "The source that it must be of");
  app.add_option("--at", options->at, "Valid at this moment")->capture_default_str();
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
