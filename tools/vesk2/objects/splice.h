// SPDX-License-Identifier: Apache-2.0
// splice.h: changing single certificates in the text of a chain or manifest.
//
// The certificates of a chain are signed one by one, and those of a manifest stand outside what its
// digest covers: one of them can be changed, or added, without its neighbours.
#ifndef VESK2_TOOLS_SPLICE_H
#define VESK2_TOOLS_SPLICE_H

#include <string>
#include <vector>

#include "tools/vesk2/objects/cert_chain.h"

namespace vesk2_command {

// A certificate and its signature as they stand in a file.
std::string PairText(const SignedCert& each);

struct Extent {
  size_t at = 0;
  size_t length = 0;
};
// FindPair returns where the certificate of a number from 1 stands with its signature in the text
// of `path`, whose certificates these are. Trouble when the file is not canonical.
Extent FindPair(const std::string& text, const std::vector<SignedCert>& certs, size_t number,
                const std::string& path);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_SPLICE_H
