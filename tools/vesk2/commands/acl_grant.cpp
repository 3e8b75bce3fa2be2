// SPDX-License-Identifier: Apache-2.0
// acl_grant.cpp: vesk2 acl grant.
#include <set>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/key_reference.h"
#include "tools/vesk2/keys/key_source.h"
#include "tools/vesk2/objects/crl_file.h"
#include "tools/vesk2/objects/tag_bounds.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/grant.h"
#include "tools/vesk2/verify/self_check.h"

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Subject;
using ZvVesk2::ThresholdSubject;

struct Options {
  std::vector<std::string> subjects;  // one of the three is given
  std::string issuerOf;
  std::string subjectOf;
  unsigned threshold = 0;
  std::string tag;
  bool propagate = false;
  PeriodOptions period;
  std::string comment;
  std::string name;
  bool strict = false;
  WriteFlags flags;
};

std::vector<Ref<PublicKey>> ReadKeys(const Options& options) {
  std::vector<Ref<PublicKey>> keys;
  if (!options.issuerOf.empty()) keys.push_back(ReadKeyOf(options.issuerOf, true));
  if (!options.subjectOf.empty()) keys.push_back(ReadKeyOf(options.subjectOf, false));
  for (const std::string& path : options.subjects) keys.push_back(ReadPublicKey(path));
  if (keys.empty())
    throw Trouble("nobody to trust: --subject, --issuer-of or --subject-of", "usage");
  return keys;
}

// One key, or k of several together.
Ref<Subject> MakeSubject(std::vector<Ref<PublicKey>> keys, unsigned threshold) {
  if (keys.size() == 1 && threshold == 0) return Ref<Subject>(keys[0].Release());
  const std::string count = Plural(keys.size(), "key");
  if (threshold == 0) {
    throw Trouble(count + ": --threshold says how many of them must agree", "usage");
  }
  if (threshold > keys.size()) {
    throw Trouble("--threshold " + std::to_string(threshold) + " of " + count, "usage");
  }
  if (keys.size() > 255) throw Trouble(count + ": a threshold is of 255 at most", "usage");
  Ref<ThresholdSubject> subject(new ThresholdSubject(nullptr));
  Check(subject->Set(threshold, static_cast<unsigned>(keys.size())), "building a threshold");
  std::set<std::string> seen;
  for (Ref<PublicKey>& key : keys) {
    // A key that is there twice would count twice.
    const std::string fingerprint = Fingerprint(*key);
    if (!seen.insert(fingerprint).second) throw Trouble(fingerprint + " is named twice", "usage");
    Check(subject->Insert(key.get()), "building a threshold");
    (void)key.Release();
  }
  return Ref<Subject>(subject.Release());
}

std::string EntryName(const Options& options) {
  if (!options.name.empty()) return options.name;
  std::vector<std::string> sources = options.subjects;
  for (const std::string* other : {&options.issuerOf, &options.subjectOf}) {
    if (!other->empty()) sources.push_back(ParsePlace(*other).path);
  }
  std::string name;
  for (const std::string& source : sources) {
    name += (name.empty() ? "" : "-") + KeyNickname(source);
  }
  constexpr size_t kLongest = 100;
  if (name.size() > kLongest) throw Trouble("so many keys need a --name for the entry", "usage");
  return name;
}

ExitCode Run(const Options& options) {
  const std::string name = EntryName(options);
  const Ref<AclEntry> entry =
      MakeEntry({MakeSubject(ReadKeys(options), options.threshold), options.propagate,
                 ParseIssuedTag(options.tag), ParsePeriod(options.period), options.comment});
  const bool issuer = !options.issuerOf.empty();
  CheckGrant(*entry, issuer ? options.issuerOf : options.subjectOf, issuer, options.strict);
  const std::string file = GrantEntry(*entry, {name, options.flags});
  Result()["entry"] = DescribeEntry(*entry, file).members();
  // The lists of a revocation source are believed without it.
  if (!options.propagate && !IsRevocationTag(entry->GetTag())) {
    Note(
        "note: without --propagate this key may use the grant but not pass it on: certificates "
        "that it issues, and manifests that it signs, are refused");
  }
  return kYes;
}

}  // namespace

Action DefineAclGrant(OptionList& list) {
  auto options = std::make_shared<Options>();
  Option& subject = list.Add("--subject", options->subjects,
                             "The public key that is trusted; several, with --threshold");
  Option& issuer = list.Add("--issuer-of", options->issuerOf,
                            "Or the issuer in a chain, manifest or revocation list: FILE, or "
                            "FILE:N for the N-th certificate [the last]");
  Option& other = list.Add(
      "--subject-of", options->subjectOf,
      "Or the signer of a manifest, or the subject in a chain: FILE, or FILE:N [the first]");
  subject.Several().Excludes(issuer).Excludes(other);
  issuer.Excludes(other);
  list.Add("--threshold", options->threshold,
           "How many of the keys must agree: each certifies whom they mean to let")
      .Range(1);
  list.Add("--tag", options->tag, "What for: \"(install (app calc))\"").Required();
  list.Add("--propagate", options->propagate,
           "The key may pass the grant on: it can certify others and sign manifests");
  AddPeriodOptions(list, options->period);
  list.Add("--comment", options->comment, "A text for people");
  list.Add("--name", options->name, "Name of the entry [the file's name, or the files']");
  AddStrictFlag(list, options->strict);
  AddWriteFlags(list, options->flags);
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
