// SPDX-License-Identifier: Apache-2.0
// join.h: chains for one key, issued on different machines, put together.
#ifndef VESK2_TOOLS_JOIN_H
#define VESK2_TOOLS_JOIN_H

#include <string>
#include <vector>

#include "tools/vesk2/objects/cert_chain.h"

namespace vesk2_command {

// A certificate of a chain. `extra` is the third item of its triple; null where it has none.
struct ChainPart {
  SignedCert signedCert;
  Ref<SExpression> extra = {};
};
// What a file says of the key that its first certificate is for.
struct ChainFile {
  std::string path;
  std::vector<ChainPart> parts;
};
// ReadChainFile reads a certificate file, and no manifest.
ChainFile ReadChainFile(const std::string& path);

// JoinChains returns each certificate of the files once: those for the key first, then those that
// lead up to it, in the order of the files. Of those for the key one that it may not pass on comes
// before the others: in a manifest it then counts all the same, since it names the signer.
// Trouble for files about different keys, and for a signature that does not hold.
std::vector<ChainPart> JoinChains(std::vector<ChainFile> files);

// How many of the certificates for the first one's key do not let it pass the grant on. Two or more
// do not combine to a manifest's authority.
size_t CountNotPassedOn(const std::vector<ChainPart>& parts);

// Notes what CountNotPassedOn is about, if it is so.
void NoteNotPassedOn(size_t count);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_JOIN_H
