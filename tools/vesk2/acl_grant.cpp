// acl_grant.cpp: vesk2 acl grant.
#include <filesystem>

#include "tools/vesk2/command.h"
#include "tools/vesk2/grant.h"
#include "tools/vesk2/key_source.h"
#include "tools/vesk2/keys.h"
#include "tools/vesk2/report.h"

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;

struct Options {
  std::string subject;  // one of the three is given
  std::string issuerOf;
  std::string subjectOf;
  std::string tag;
  bool propagate = false;
  PeriodOptions period;
  std::string comment;
  std::string name;
  bool force = false;
};

Ref<PublicKey> ReadSubject(const Options& options) {
  if (!options.issuerOf.empty()) return ReadKeyOf(options.issuerOf, true);
  if (!options.subjectOf.empty()) return ReadKeyOf(options.subjectOf, false);
  return ReadPublicKey(options.subject);
}

// The name of the file that the key was taken from.
std::string StandardName(const Options& options) {
  std::string source = options.subject;
  for (const std::string* other : {&options.issuerOf, &options.subjectOf}) {
    if (!other->empty()) source = ParsePlace(*other).path;
  }
  return std::filesystem::path(source).stem().string();
}

ExitCode Run(const Options& options) {
  const Ref<AclEntry> entry =
      MakeEntry({ReadSubject(options), options.propagate, ParseTag(options.tag),
                 ParsePeriod(options.period), options.comment});
  const std::string name = options.name.empty() ? StandardName(options) : options.name;
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
  CLI::Option_group& subject = *app.add_option_group("Who is trusted");
  subject.add_option("--subject", options->subject, "The public key that is trusted");
  subject.add_option("--issuer-of", options->issuerOf,
                     "The issuer in a chain, manifest or revocation list: FILE, or FILE:N for the "
                     "N-th certificate [the last]");
  subject.add_option("--subject-of", options->subjectOf,
                     "The subject in a chain or manifest: FILE, or FILE:N [the first]");
  subject.require_option(1);
  app.add_option("--tag", options->tag, "What for: \"(install (app calc))\"")->required();
  app.add_flag("--propagate", options->propagate,
               "The key may pass the grant on: it can certify others and sign manifests");
  AddPeriodOptions(app, options->period);
  app.add_option("--comment", options->comment, "A text for people");
  app.add_option("--name", options->name, "Name of the entry [the file's name]");
  app.add_flag("-f,--force", options->force, "Replace an entry of that name");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
