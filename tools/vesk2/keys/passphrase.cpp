// SPDX-License-Identifier: Apache-2.0
// passphrase.cpp: passphrases from files, descriptors and the terminal.
#include "tools/vesk2/keys/passphrase.h"

#include <openssl/crypto.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/terminal.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

constexpr int kMaxPassphrase = 1024;

// One byte at a time, so that what follows the line is left for its reader.
std::string FirstLine(int descriptor) {
  std::string line;
  char byte = 0;
  while (line.size() <= kMaxPassphrase) {
    const ssize_t got = read(descriptor, &byte, 1);
    if (got < 0 && errno == EINTR) continue;
    if (got < 0) {
      throw Trouble("--passphrase-fd " + std::to_string(descriptor) + ": " + std::strerror(errno),
                    "passphrase");
    }
    if (got == 0 || byte == '\n') break;
    line += byte;
  }
  return line;
}

// The passphrase that the options name.
std::shared_ptr<const Secret> NamedPassphrase(const PassphraseOptions& options) {
  if (options.given) return options.given;
  const bool file = !options.file.empty();
  const Secret text(file ? ReadFile(options.file, kMaxPassphrase) : FirstLine(options.descriptor));
  const size_t end = text.text().find_first_of("\r\n");
  options.given = std::make_shared<const Secret>(text.text().substr(0, end));
  const size_t size = options.given->text().size();
  if (size == 0 || size > kMaxPassphrase) {
    throw Trouble(
        (file ? InputName(options.file) : "--passphrase-fd " + std::to_string(options.descriptor)) +
            (size == 0 ? ": holds no passphrase" : ": too long for a passphrase"),
        "passphrase");
  }
  return options.given;
}

int AskTerminal(char* out, int size, const std::string& prompt, bool twice) {
  const Terminal terminal;
  if (!terminal.IsThere()) return -1;
  const int length = terminal.Ask(prompt, out, size);
  if (!twice || length < 0) return length;
  char again[kMaxPassphrase] = "";
  const bool same = terminal.Ask("Verifying - " + prompt, again, sizeof again) == length &&
                    std::memcmp(out, again, static_cast<size_t>(length)) == 0;
  OPENSSL_cleanse(again, sizeof again);
  return same ? length : -1;
}

int FromOptions(char* out, int size, const PassphraseOptions& options) {
  const std::string& text = NamedPassphrase(options)->text();
  if (text.size() > static_cast<size_t>(size)) return -1;
  std::memcpy(out, text.data(), text.size());
  return static_cast<int>(text.size());
}

}  // namespace

void AddPassphraseOptions(OptionList& list, PassphraseOptions& options) {
  Option& file =
      list.Add("--passphrase-file", options.file,
               "Take the passphrase of private keys, or the PIN of a token, from this file's "
               "first line");
  list.Add("--passphrase-fd", options.descriptor,
           "Take it from the first line of this open file descriptor")
      .Range(0)
      .Excludes(file);
}

Secret::~Secret() { OPENSSL_cleanse(text_.data(), text_.size()); }

std::shared_ptr<const Secret> NewPassphrase(const PassphraseOptions& options) {
  if (options.Named()) return NamedPassphrase(options);
  char typed[kMaxPassphrase] = "";
  const int length = AskTerminal(typed, sizeof typed, "Passphrase: ", true);
  auto passphrase = std::make_shared<const Secret>(typed);
  OPENSSL_cleanse(typed, sizeof typed);
  if (length <= 0) {
    throw Trouble("no passphrase was given (--passphrase-file, --passphrase-fd)", "passphrase");
  }
  return passphrase;
}

int GivePassphrase(char* out, int size, int /*writing*/, void* user) {
  auto& asking = *static_cast<Asking*>(user);
  asking.asked = true;
  int length = -1;
  try {  // libcrypto calls this, and nothing may be thrown through it
    length =
        asking.options.Named()
            ? FromOptions(out, size, asking.options)
            : AskTerminal(out, size, asking.what + (" of " + InputName(asking.path)) + ": ", false);
    if (length >= 0) {
      asking.used = std::make_shared<const Secret>(std::string(out, static_cast<size_t>(length)));
    }
  } catch (...) {
    asking.problem = std::current_exception();
  }
  asking.failed = length < 0;
  return length;
}

}  // namespace vesk2_command
