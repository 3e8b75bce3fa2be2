// passphrase.h: passphrases of private keys: from the first line of a file, else from the terminal.
// Never from an argument or the environment, which other users of the machine can read.
#ifndef VESK2_TOOLS_PASSPHRASE_H
#define VESK2_TOOLS_PASSPHRASE_H

#include <CLI/CLI.hpp>
#include <memory>
#include <string>

namespace vesk2_command {

struct PassphraseOptions {
  std::string file;
};
void AddPassphraseOptions(CLI::App& app, PassphraseOptions& options);

// A string that is wiped when it goes.
class Secret {
 public:
  explicit Secret(std::string text) : text_(std::move(text)) {}
  ~Secret();
  Secret(const Secret&) = delete;
  Secret& operator=(const Secret&) = delete;
  const std::string& text() const { return text_; }

 private:
  std::string text_;
};

// A passphrase for a new key, typed twice unless it comes from a file.
std::unique_ptr<Secret> NewPassphrase(const PassphraseOptions& options);

// Asking is the user argument of GivePassphrase, libcrypto's callback for encrypted PEM.
struct Asking {
  const PassphraseOptions& options;
  const std::string& path;
  bool asked = false;   // the key is encrypted
  bool failed = false;  // and no passphrase was to be had
};
int GivePassphrase(char* out, int size, int writing, void* asking);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_PASSPHRASE_H
