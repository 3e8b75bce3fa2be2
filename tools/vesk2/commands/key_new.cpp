// SPDX-License-Identifier: Apache-2.0
// key_new.cpp: vesk2 key new.
#include <set>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/keys.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

struct Options {
  std::vector<std::string> names;
  std::string output;
  std::string type = "rsa";
  int bits = 3072;
  bool encrypt = false;
  PassphraseOptions passphrase;
  WriteFlags flags;
};

std::vector<std::string> Names(const Options& options) {
  std::vector<std::string> names = options.names;
  if (!options.output.empty()) names.push_back(options.output);
  if (names.empty()) throw Trouble("key new needs a NAME, or several", "usage");
  std::set<std::string> seen;
  for (const std::string& name : names) {
    if (name == kStandard) throw Trouble("a key is two files and cannot go to -", "usage");
    if (!seen.insert(name).second) throw Trouble(Escape(name) + " is named twice", "usage");
  }
  return names;
}

void MakeKey(const std::string& name, const Options& options, const Secret* passphrase) {
  const PrivateKey key = PrivateKey::Generate(options.bits);
  const Ref<PublicKey> publicKey = key.Public();
  const std::string privatePath = name + ".pem";
  const std::string publicPath = name + ".pub";
  const std::string said = passphrase != nullptr
                               ? ", under a passphrase"
                               : ", not protected by a passphrase: keep it private";
  WriteFile(privatePath, key.Pem(passphrase)->text(), {options.flags, {}, said, 0600});
  WriteFile(publicPath, Canonical(*publicKey), {options.flags});
  const std::string fingerprint = Fingerprint(*publicKey);
  Say(fingerprint + "  " + Escape(name));
  Result()["keys"].push_back({{"name", Escape(name)},
                              {"private_key", Escape(privatePath)},
                              {"public_key", Escape(publicPath)},
                              {"fingerprint", fingerprint},
                              {"type", options.type},
                              {"bits", options.bits},
                              {"encrypted", passphrase != nullptr}});
}

ExitCode Run(const Options& options) {
  PrivateKey::CheckBits(options.bits);
  const std::vector<std::string> names = Names(options);
  // Before the first is made: none of them, or all.
  for (const std::string& name : names) {
    for (const char* extension : {".pem", ".pub"}) {
      if (!options.flags.dryRun) RefuseExisting(name + extension, options.flags.force);
      if (options.flags.dryRun) WriteFile(name + extension, "", {options.flags});
    }
  }
  if (options.flags.dryRun) return kYes;
  std::shared_ptr<const Secret> passphrase;
  if (options.encrypt || options.passphrase.Named()) passphrase = NewPassphrase(options.passphrase);
  for (const std::string& name : names) MakeKey(name, options, passphrase.get());
  return kYes;
}

}  // namespace

Action DefineKeyNew(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("names", options->names, "NAME of each key's two files, without extension");
  list.Add("-o,--output", options->output, "The same, for one key");
  list.Add("--type", options->type, "Kind of key").Choices({"rsa"}).ShowPreset();
  list.Add("--bits", options->bits, "Size of the modulus").ShowPreset();
  list.Add("--encrypt", options->encrypt, "Protect the private keys; ask for a passphrase");
  AddPassphraseOptions(list, options->passphrase);
  AddWriteFlags(list, options->flags);
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
