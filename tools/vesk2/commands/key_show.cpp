// SPDX-License-Identifier: Apache-2.0
// key_show.cpp: vesk2 key show.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"
#include "tools/vesk2/keys/key_reference.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string file;
  PassphraseOptions passphrase;
};

ExitCode Run(const Options& options) {
  const PublicHalf half = ReadPublicHalf(options.file, options.passphrase);
  Present(DescribeKey(*half.key));
  Result()["private"] = half.ofPrivate;
  return kYes;
}

}  // namespace

Action DefineKeyShow(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("file", options->file,
           "A key: a .pub or PEM file, pkcs11:URI, or ssh-agent:SHA256:FINGERPRINT")
      .Required();
  AddPassphraseOptions(list, options->passphrase);
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
