// remedy.h: the smallest changes that would make a refusal a yes and keep the policy that refused.
//
// Candidates are built in memory and put to the library (hypothesis.h): what is named has been
// found to turn the answer. What restores comes first. What would trust a revoked key, one key
// where several must agree, or a key past those who certify it is no candidate (policy.h).
#ifndef VESK2_TOOLS_REMEDY_H
#define VESK2_TOOLS_REMEDY_H

#include <string>
#include <vector>

#include "tools/vesk2/evidence.h"

namespace vesk2_command {

struct Remedy {
  // A stable word: restore, revocation-list, co-sign, renew-certificate, sign-again, acl-entry;
  // new-root when a key is to be trusted that nobody vouches for, whatever else is to be done;
  // "several" when one of the others alone is not enough; new-key, for which there is no command
  // line.
  std::string kind;
  std::string text;
  // Command lines, to be run one after the other. "KEY-OF-" and the start of a fingerprint stands
  // for the file of a private key.
  std::vector<std::vector<std::string>> commands = {};
  std::vector<std::string> keys = {};     // the fingerprints of those keys
  std::vector<std::string> foreign = {};  // words that the refused object chose, not who asked
};

// FindRemedies returns alternatives, the smallest first; none when nothing was found. `code` is the
// refusal.
std::vector<Remedy> FindRemedies(const Question& question, const Evidence& evidence, int code);
// What mends a tree that is not as it was signed, by a signer who is authorized.
std::vector<Remedy> MendTree(const Question& question, const Evidence& evidence);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_REMEDY_H
