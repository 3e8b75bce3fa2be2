// SPDX-License-Identifier: Apache-2.0
// sign_again.h: a manifest signed anew by its signer, with the certificates that speak for it.
#ifndef VESK2_TOOLS_SIGN_AGAIN_H
#define VESK2_TOOLS_SIGN_AGAIN_H

#include "tools/vesk2/explain/evidence.h"
#include "tools/vesk2/explain/remedy.h"

namespace vesk2_command {

// SignAgain returns that remedy, for a change of the tree that is meant, if the manifest would then
// pass: none for a chain, or a signer who is revoked or has no authority.
std::vector<Remedy> SignAgain(const Question& question, const Evidence& evidence);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_SIGN_AGAIN_H
