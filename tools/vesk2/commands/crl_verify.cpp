// SPDX-License-Identifier: Apache-2.0
// crl_verify.cpp: vesk2 crl verify.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/acl_store.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string file;
  std::string tag;
  std::string at = "now";
};

// The code, and why, of a list that does not count at the moment asked about.
struct Refusal {
  int code = 0;
  std::string text;
};

Refusal Judge(CrlSequence& list, SExpression* tag, SExpression* acls, TimeStamp& at) {
  const ZvVesk2::Cert& cert = *list.GetCert();
  if (tag != nullptr && cert.GetTag() == nullptr) {
    return {VESK2_ERR_AUTH_TAG_MISSING, "the list has no tag, and is of no source"};
  }
  if (tag != nullptr && !tag->IsEqual(cert.GetTag())) {
    return {VESK2_ERR_NOT_AUTHORIZED, "it is of the source " + TagText(cert.GetTag())};
  }
  const int vouched = list.VerifySelf(acls);
  if (vouched == VESK2_ERR_MEM_ALLOC) throw Trouble(Reason(vouched));
  if (vouched != 0) return {vouched, WhyNotVouched(list, vouched)};
  long first = at.ToTime();
  long last = first;
  const int current = list.VerifyValidity(&first, &last);
  if (current == 0) return {};
  return {current, "it is valid " + PeriodText(cert.GetNotBefore(), cert.GetNotAfter()) +
                       ", asked was " + StampText(at)};
}

ExitCode Run(const Options& options) {
  Ref<SExpression> tag;
  if (!options.tag.empty()) tag = ParseRevocationTag(options.tag);
  const Ref<TimeStamp> at = ParseTime(options.at, false);
  const Ref<CrlSequence> list = ReadCrl(options.file);
  const Ref<SExpression> acls = LoadAcls();
  const Refusal refusal = Judge(*list, tag.get(), acls.get(), *at);
  Result() = {{"list", DescribeCrl(*list).members()}, {"at", StampText(*at)}};
  return refusal.code == 0 ? Yes(CrlText(*list)) : No(refusal.code, refusal.text);
}

}  // namespace

Action DefineCrlVerify(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("file", options->file, "The revocation list file").Required();
  list.Add("--tag", options->tag, "The source that it must be of");
  list.Add("--at", options->at, "Valid at this moment").ShowPreset();
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
