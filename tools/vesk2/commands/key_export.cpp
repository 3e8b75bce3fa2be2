// SPDX-License-Identifier: Apache-2.0
// key_export.cpp: vesk2 key export.
#include <unistd.h>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/key_reference.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string file;
  std::string format;
  std::string output = kStandard;
  PassphraseOptions passphrase;
  WriteFlags flags;
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

std::string Pem(const std::string& der) {
  constexpr size_t kLine = 64;
  const std::string text = Base64(der);
  std::string pem = "-----BEGIN PUBLIC KEY-----\n";
  for (size_t at = 0; at < text.size(); at += kLine) pem += text.substr(at, kLine) + "\n";
  return pem + "-----END PUBLIC KEY-----\n";
}

std::string Ssh(PublicKey& key) {
  const char* type = key.GetType() == ZVCLM_KEY_RSA ? "ssh-rsa " : "ssh-dss ";
  return type + Base64(Export(key, &PublicKey::SshExport)) + "\n";
}

ExitCode Run(const Options& options) {
  const PublicHalf half = ReadPublicHalf(options.file, options.passphrase);
  const std::string text = options.format == "ssh" ? Ssh(*half.key)
                           : options.format == "x509"
                               ? Pem(Export(*half.key, &PublicKey::X509Export))
                               : Canonical(*half.key);
  Result()["format"] = options.format;
  Result()["base64"] = Base64(text);
  const bool standard = options.output == kStandard;
  if (standard && GetStyle().json) return kYes;  // the answer holds it
  if (standard && options.format == "canonical" && isatty(STDOUT_FILENO) == 1) {
    throw Trouble("the canonical form is not for a terminal: --output FILE", "usage");
  }
  WriteFile(options.output, text, {options.flags});
  return kYes;
}

}  // namespace

Action DefineKeyExport(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("file", options->file,
           "A key: a .pub or PEM file, pkcs11:URI, or ssh-agent:SHA256:FINGERPRINT")
      .Required();
  list.Add("--format", options->format,
           "How: a line for SSH, an X.509 SubjectPublicKeyInfo in PEM, or our own form")
      .Choices({"ssh", "x509", "canonical"})
      .Required();
  list.Add("-o,--output", options->output, "The file to write, or - for standard output")
      .ShowPreset();
  AddPassphraseOptions(list, options->passphrase);
  AddWriteFlags(list, options->flags);
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
