// key_new.cpp: vesk2 key new.
#include "tools/vesk2/command.h"
#include "tools/vesk2/files.h"
#include "tools/vesk2/keys.h"
#include "tools/vesk2/report.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string type = "rsa";
  int bits = 3072;
  std::string output;
  bool force = false;
  bool encrypt = false;
  PassphraseOptions passphrase;
};

ExitCode Run(const Options& options) {
  const std::string privatePath = options.output + ".pem";
  const std::string publicPath = options.output + ".pub";
  RefuseExisting(privatePath, options.force);
  RefuseExisting(publicPath, options.force);

  std::unique_ptr<Secret> passphrase;
  if (options.encrypt || !options.passphrase.file.empty()) {
    passphrase = NewPassphrase(options.passphrase);
  }
  const PrivateKey key = PrivateKey::Generate(options.bits);
  const Ref<PublicKey> publicKey = key.Public();
  WriteFile(privatePath, key.Pem(passphrase.get())->text(), {0600, options.force});
  WriteFile(publicPath, Canonical(*publicKey), {0666, options.force});

  Note("wrote " + Escape(privatePath) +
       (passphrase ? ", under a passphrase" : ", not protected by a passphrase: keep it private"));
  Note("wrote " + Escape(publicPath));
  Say(Fingerprint(*publicKey));
  return kYes;
}

}  // namespace

Action DefineKeyNew(CLI::App& app) {
  auto options = std::make_shared<Options>();
  app.add_option("-o,--output", options->output, "NAME of the two files, without extension")
      ->required();
  app.add_option("--type", options->type, "Kind of key")
      ->check(CLI::IsMember({"rsa"}))
      ->capture_default_str();
  app.add_option("--bits", options->bits, "Size of the modulus")->capture_default_str();
  app.add_flag("--encrypt", options->encrypt, "Protect the private key; ask for a passphrase");
  AddPassphraseOptions(app, options->passphrase);
  app.add_flag("-f,--force", options->force, "Replace existing files");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
