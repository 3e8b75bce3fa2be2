// SPDX-License-Identifier: Apache-2.0
// remedy.h: a change that would make a refusal a yes, in words and as command lines.
#ifndef VESK2_TOOLS_REMEDY_H
#define VESK2_TOOLS_REMEDY_H

#include <string>
#include <vector>

namespace vesk2_command {

struct Remedy {
  // A stable word: restore, revocation-list, approve, co-sign, renew-certificate, sign-again,
  // acl-entry; new-root when a key is to be trusted that nobody vouches for, whatever else is to be
  // done; "several" when one of the others alone is not enough; new-key, for which there is no
  // command line.
  std::string kind;
  std::string text;
  // Command lines, to be run one after the other. "KEY-OF-" and the start of a fingerprint stands
  // for the file of a private key.
  std::vector<std::vector<std::string>> commands = {};
  std::vector<std::string> keys = {};     // the fingerprints of those keys
  std::vector<std::string> foreign = {};  // words that the refused object chose, not who asked
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_REMEDY_H
