// SPDX-License-Identifier: Apache-2.0
// The digest that a manifest's signer signs, for its reader and its writer. What it leaves out
// anybody can exchange: the chain and the revocation lists of a manifest.
#ifndef VESK2_SRC_MANIFEST_SIGNED_DIGEST_H
#define VESK2_SRC_MANIFEST_SIGNED_DIGEST_H

#include <vesk2/hash.h>
#include <vesk2/ref.h>

namespace ZvVesk2 {

// The elements in front of the signature block, and the one that begins it.
struct ManifestHead {
  Ref<SExpression> version;  // (version "1" <text>)
  Ref<SExpression> type;     // (type "plain")
  Ref<SExpression> time;     // (time-of-signing <stamp>)
};

// SignedDigest hashes the head and the body's bytes as they stand in the file.
[[nodiscard]] int SignedDigest(Ref<Hash>& out, ZvclmHashID id, const ManifestHead& head,
                               const unsigned char* body, size_t length);

}  // namespace ZvVesk2

#endif  // VESK2_SRC_MANIFEST_SIGNED_DIGEST_H
