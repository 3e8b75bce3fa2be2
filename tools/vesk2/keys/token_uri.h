// SPDX-License-Identifier: Apache-2.0
// token_uri.h: keys of tokens as PKCS#11 URIs name them:
//
//   pkcs11:token=LABEL;object=NAME?pin-source=FILE
//
// No part is passed over: it would name another key than meant.
#ifndef VESK2_TOOLS_TOKEN_URI_H
#define VESK2_TOOLS_TOKEN_URI_H

#include <string>

#include "tools/vesk2/keys/passphrase.h"

namespace vesk2_command {

inline constexpr std::string_view kTokenScheme = "pkcs11:";

struct TokenUri {
  std::string path;   // what names the key, as it was written, from the scheme to the "?"
  std::string token;  // of this what names the token
  std::string object;
  std::string modulePath;  // the library that drives the token; empty for the machine's own choice
  PassphraseOptions pin;   // where the URI says that the PIN is
};
TokenUri ParseTokenUri(const std::string& uri);

// The URI without what may hold the PIN, for messages.
std::string ShownTokenUri(const std::string& uri);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_TOKEN_URI_H
