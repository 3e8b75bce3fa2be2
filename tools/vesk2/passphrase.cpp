// passphrase.cpp: passphrases from files and from the terminal.
#include "tools/vesk2/passphrase.h"

#include <fcntl.h>
#include <openssl/crypto.h>
#include <openssl/evp.h>
#include <unistd.h>

#include <cstring>

#include "tools/vesk2/files.h"
#include "tools/vesk2/report.h"

namespace vesk2_command {
namespace {

constexpr int kMaxPassphrase = 1024;

std::unique_ptr<Secret> PassphraseFromFile(const std::string& path) {
  const Secret text(ReadFile(path, kMaxPassphrase));
  const size_t end = text.text().find_first_of("\r\n");
  auto passphrase = std::make_unique<Secret>(text.text().substr(0, end));
  if (passphrase->text().empty()) throw Trouble(Escape(path) + ": holds no passphrase");
  return passphrase;
}

// Without a terminal libcrypto would read standard input, where nobody was asked for anything.
bool HaveTerminal() {
  const int terminal = open("/dev/tty", O_RDWR | O_CLOEXEC | O_NOCTTY);
  if (terminal >= 0) close(terminal);
  return terminal >= 0;
}

int AskTerminal(char* out, int size, const std::string& prompt, bool twice) {
  if (!HaveTerminal()) return -1;
  if (EVP_read_pw_string(out, size, prompt.c_str(), twice ? 1 : 0) != 0) return -1;
  return static_cast<int>(std::strlen(out));
}

int FromFile(char* out, int size, const std::string& path) {
  const auto passphrase = PassphraseFromFile(path);
  const std::string& text = passphrase->text();
  if (text.size() > static_cast<size_t>(size)) return -1;
  std::memcpy(out, text.data(), text.size());
  return static_cast<int>(text.size());
}

}  // namespace

void AddPassphraseOptions(CLI::App& app, PassphraseOptions& options) {
  app.add_option("--passphrase-file", options.file,
                 "Take the private key's passphrase from the first line of this file");
}

Secret::~Secret() { OPENSSL_cleanse(text_.data(), text_.size()); }

std::unique_ptr<Secret> NewPassphrase(const PassphraseOptions& options) {
  if (!options.file.empty()) return PassphraseFromFile(options.file);
  char typed[kMaxPassphrase] = "";
  const int length = AskTerminal(typed, sizeof typed, "Passphrase of the new key: ", true);
  auto passphrase = std::make_unique<Secret>(typed);
  OPENSSL_cleanse(typed, sizeof typed);
  if (length <= 0) throw Trouble("no passphrase was given");
  return passphrase;
}

int GivePassphrase(char* out, int size, int /*writing*/, void* user) {
  auto& asking = *static_cast<Asking*>(user);
  asking.asked = true;
  int length = -1;
  try {  // libcrypto calls this, and nothing may be thrown through it
    length = asking.options.file.empty()
                 ? AskTerminal(out, size, "Passphrase of " + Escape(asking.path) + ": ", false)
                 : FromFile(out, size, asking.options.file);
  } catch (const std::exception& error) {
    Note(std::string("vesk2: ") + error.what());
  }
  asking.failed = length < 0;
  return length;
}

}  // namespace vesk2_command
