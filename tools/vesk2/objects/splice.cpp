// SPDX-License-Identifier: Apache-2.0
// splice.cpp: finding certificates in a file's text.
#include "tools/vesk2/objects/splice.h"

namespace vesk2_command {

std::string PairText(const SignedCert& each) {
  return Canonical(*each.cert) + Canonical(*each.signature);
}

Extent FindPair(const std::string& text, const std::vector<SignedCert>& certs, size_t number,
                const std::string& path) {
  Extent extent;
  for (size_t i = 0; i < number; ++i) {
    const std::string pair = PairText(certs[i]);
    extent = {text.find(pair, extent.at + extent.length), pair.size()};
    if (extent.at != std::string::npos) continue;
    throw FileTrouble(path, "its certificates are not written canonically", "malformed");
  }
  return extent;
}

}  // namespace vesk2_command
