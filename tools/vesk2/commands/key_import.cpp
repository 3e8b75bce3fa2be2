// SPDX-License-Identifier: Apache-2.0
// key_import.cpp: vesk2 key import.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/foreign_key.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string file;
  std::string output;
  bool encrypt = false;
  PassphraseOptions passphrase;
  WriteFlags flags;
};

// A key stays under its passphrase.
std::shared_ptr<const Secret> PassphraseFor(const ForeignKey& key, const Options& options) {
  if (key.passphrase || !(options.encrypt || options.passphrase.Named())) return key.passphrase;
  return NewPassphrase(options.passphrase);
}

void WritePrivate(const ForeignKey& key, const Options& options) {
  const std::shared_ptr<const Secret> passphrase =
      options.flags.dryRun ? key.passphrase : PassphraseFor(key, options);
  const std::string said =
      passphrase ? ", under a passphrase" : ", not protected by a passphrase: keep it private";
  WriteFile(options.output + ".pem", key.privateKey->Pem(passphrase.get())->text(),
            {options.flags, {}, said, 0600});
  Result()["encrypted"] = passphrase != nullptr;
}

ExitCode Run(const Options& options) {
  if (options.output == kStandard) {
    throw Trouble("a key is two files and cannot go to -", "usage");
  }
  const ForeignKey key = ReadForeignKey(options.file, options.passphrase);
  for (const char* extension : {".pem", ".pub"}) {  // before the first is written
    const bool written = key.privateKey != nullptr || extension == std::string(".pub");
    if (written) RefuseExisting(options.output + extension, options.flags.force);
  }
  if (key.privateKey) WritePrivate(key, options);
  WriteFile(options.output + ".pub", Canonical(*key.publicKey), {options.flags});
  Say(Fingerprint(*key.publicKey) + "  " + Escape(options.output));
  if (key.certificate) {
    Note("note: the key of an X.509 certificate; who signed it and until when was not looked at");
  }
  Result().update(DescribeKey(*key.publicKey).members());
  Result()["private"] = key.privateKey != nullptr;
  Result()["form"] = key.form;
  return kYes;
}

}  // namespace

Action DefineKeyImport(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("file", options->file,
           "An RSA or DSA key: X.509 certificate, PKCS#8, PKCS#1 (PEM or DER), or OpenSSH")
      .Required();
  list.Add("-o,--output", options->output, "NAME of the key's files, without extension").Required();
  list.Add("--encrypt", options->encrypt,
           "Protect a private key that has no passphrase yet; ask for one");
  AddPassphraseOptions(list, options->passphrase);
  AddWriteFlags(list, options->flags);
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
