// SPDX-License-Identifier: Apache-2.0
// cert_store.h: the chains of the user's store, HOME/cert/NAME.cert, which are found by their tags.
#ifndef VESK2_TOOLS_CERT_STORE_H
#define VESK2_TOOLS_CERT_STORE_H

#include <string>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/objects/cert_chain.h"

namespace vesk2_command {

// ChainPath returns the path of a chain NAME in the user's store. Trouble for what is no name, and
// without a home store.
std::string ChainPath(const std::string& name);

// Whether exactly this chain has that name there already.
bool IsStored(ZvVesk2::CertSequence& chain, const std::string& name);
// StoreChain writes a chain there whole, and makes the directory if need be. A chain of that name
// that says the same stays as it is; another one is Trouble unless it is to be replaced.
void StoreChain(ZvVesk2::CertSequence& chain, const std::string& name, const WriteFlags& flags);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_CERT_STORE_H
