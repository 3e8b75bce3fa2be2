// key_show.cpp: vesk2 key show.
#include <openssl/evp.h>

#include "tools/vesk2/command.h"
#include "tools/vesk2/keys.h"
#include "tools/vesk2/report.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string file;
  bool ssh = false;
  bool x509 = false;
  PassphraseOptions passphrase;
};

using Exporter = int (PublicKey::*)(unsigned char*&, unsigned int&);

std::string Export(PublicKey& key, Exporter exporter) {
  unsigned char* data = nullptr;
  unsigned int length = 0;
  const int code = (key.*exporter)(data, length);
  const std::unique_ptr<unsigned char[]> owner(data);
  Check(code, "exporting the key");
  return {reinterpret_cast<char*>(data), length};
}

std::string Base64(const std::string& bytes) {
  std::string out(4 * ((bytes.size() + 2) / 3) + 1, '\0');
  const int length = EVP_EncodeBlock(reinterpret_cast<unsigned char*>(out.data()),
                                     reinterpret_cast<const unsigned char*>(bytes.data()),
                                     static_cast<int>(bytes.size()));
  out.resize(static_cast<size_t>(length));
  return out;
}

void SayPem(const std::string& der) {
  constexpr size_t kLine = 64;
  const std::string text = Base64(der);
  Say("-----BEGIN PUBLIC KEY-----");
  for (size_t at = 0; at < text.size(); at += kLine) Say(text.substr(at, kLine));
  Say("-----END PUBLIC KEY-----");
}

ExitCode Run(const Options& options) {
  const Ref<PublicKey> key = IsPrivatePem(options.file)
                                 ? PrivateKey::Read(options.file, options.passphrase).Public()
                                 : ReadPublicKey(options.file);
  const bool rsa = key->GetType() == ZVCLM_KEY_RSA;
  if (options.ssh) {
    Say((rsa ? "ssh-rsa " : "ssh-dss ") + Base64(Export(*key, &PublicKey::SshExport)));
  } else if (options.x509) {
    SayPem(Export(*key, &PublicKey::X509Export));
  } else {
    Say(std::string("type         ") + (rsa ? "rsa" : "dsa"));
    Say("bits         " + std::to_string(key->GetLength()));
    Say("fingerprint  " + Fingerprint(*key));
  }
  return kYes;
}

}  // namespace

Action DefineKeyShow(CLI::App& app) {
  auto options = std::make_shared<Options>();
  app.add_option("file", options->file, "A key file: .pub, or PEM")->required();
  auto* ssh = app.add_flag("--ssh", options->ssh, "Print the public key as SSH writes it");
  app.add_flag("--x509", options->x509, "Print the public key in PEM")->excludes(ssh);
  AddPassphraseOptions(app, options->passphrase);
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
