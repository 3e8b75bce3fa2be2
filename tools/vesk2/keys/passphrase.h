// SPDX-License-Identifier: Apache-2.0
// passphrase.h: passphrases of private keys: from the first line of a file or of an open
// descriptor, else from the terminal.
// Never from an argument or the environment, which other users of the machine can read.
#ifndef VESK2_TOOLS_PASSPHRASE_H
#define VESK2_TOOLS_PASSPHRASE_H

#include <exception>
#include <memory>
#include <string>

#include "tools/vesk2/options/options.h"

namespace vesk2_command {

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

struct PassphraseOptions {
  std::string file;
  int descriptor = -1;
  // What came of either: a pipe gives it only once, and several keys may be under it.
  mutable std::shared_ptr<const Secret> given = nullptr;

  bool Named() const { return given || !file.empty() || descriptor >= 0; }
};
void AddPassphraseOptions(OptionList& list, PassphraseOptions& options);

// A passphrase for new keys, typed twice unless the options name a source.
std::shared_ptr<const Secret> NewPassphrase(const PassphraseOptions& options);

// Asking is the user argument of GivePassphrase, libcrypto's callback for encrypted keys and for
// those of tokens.
struct Asking {
  const PassphraseOptions& options;
  const std::string& path;
  const char* what = "Passphrase";               // or "PIN", in the question
  bool asked = false;                            // the key is encrypted
  std::shared_ptr<const Secret> used = nullptr;  // under this
  bool failed = false;                           // or no passphrase was to be had
  std::exception_ptr problem = nullptr;          // because of this
};
int GivePassphrase(char* out, int size, int writing, void* asking);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_PASSPHRASE_H
