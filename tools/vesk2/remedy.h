// remedy.h: the smallest changes that would make a refusal a yes.
//
// Candidates are built in memory and put to the library (hypothesis.h): what is named has been
// found to turn the answer.
#ifndef VESK2_TOOLS_REMEDY_H
#define VESK2_TOOLS_REMEDY_H

#include <string>
#include <vector>

#include "tools/vesk2/evidence.h"

namespace vesk2_command {

struct Remedy {
  // A stable word: grant, acl-entry, renew-certificate, revocation-list, sign-again; "several" when
  // one of these alone is not enough; new-key, for which there is no command line.
  std::string kind;
  std::string text;
  // Command lines, to be run one after the other. "KEY-OF-" and the start of a fingerprint stands
  // for the file of a private key.
  std::vector<std::vector<std::string>> commands = {};
  std::vector<std::string> keys = {};  // the fingerprints of those keys
};

// FindRemedies returns alternatives, the smallest first; none when nothing was found. `code` is the
// refusal.
std::vector<Remedy> FindRemedies(const Question& question, const Evidence& evidence, int code);
// What mends a tree that is not as it was signed, by a signer who is authorized.
std::vector<Remedy> SignAgain(const Question& question, const Evidence& evidence);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_REMEDY_H
