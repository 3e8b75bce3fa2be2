// acl_grant.cpp: vesk2 acl grant.
#include <filesystem>

#include "tools/vesk2/command.h"
#include "tools/vesk2/grant.h"
#include "tools/vesk2/keys.h"
#include "tools/vesk2/report.h"

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;

struct Options {
  std::string subject;
  std::string tag;
  bool propagate = false;
  PeriodOptions period;
  std::string comment;
  std::string name;
  bool force = false;
};

ExitCode Run(const Options& options) {
  const Ref<AclEntry> entry =
      MakeEntry({ReadPublicKey(options.subject), options.propagate, ParseTag(options.tag),
                 ParsePeriod(options.period), options.comment});
  const std::string name =
      options.name.empty() ? std::filesystem::path(options.subject).stem().string() : options.name;
  GrantEntry(*entry, {name, options.force});
  if (!options.propagate) {
    Note(
        "note: without --propagate this key may use the grant but not pass it on: certificates "
        "that it issues, and manifests that it signs, are refused");
  }
  return kYes;
}

}  // namespace

Action DefineAclGrant(CLI::App& app) {
  auto options = std::make_shared<Options>();
  app.add_option("--subject", options->subject, "The public key that is trusted")->required();
  app.add_option("--tag", options->tag, "What for: \"(install (app calc))\"")->required();
  app.add_flag("--propagate", options->propagate,
               "The key may pass the grant on: it can certify others and sign manifests");
  AddPeriodOptions(app, options->period);
  app.add_option("--comment", options->comment, "A text for people");
  app.add_option("--name", options->name, "Name of the entry [the key file's name]");
  app.add_flag("-f,--force", options->force, "Replace an entry of that name");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
