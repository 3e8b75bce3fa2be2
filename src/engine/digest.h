// SPDX-License-Identifier: Apache-2.0
// A running hash that canonical text is fed to piece by piece: principals and names are known by
// the digests of their canonical forms. No text is put together in memory for it: a derived tag,
// which shares its parts, would be far larger than the engine's memory.
#ifndef VESK2_SRC_ENGINE_DIGEST_H
#define VESK2_SRC_ENGINE_DIGEST_H

#include "src/engine/model.h"
#include "src/platform/crypto.h"

namespace ZvVesk2::Engine {

// Digests are kept in 32 bytes; a shorter one is padded with zeros.
inline constexpr size_t kSpkiDigestSize = 32;

// It is large, and stands in a frame.
struct spki_digest {
  ZVCLMHashContextData context;
  spki_engine* engine = nullptr;
};

// Starts a hash with the engine's provider; it and its pieces are charged to the engine, before the
// work is done. `digest` is fresh, and ends with its frame.
[[nodiscard]] spki_status spki_digest_start(spki_engine* engine, spki_digest* digest,
                                            ZvclmHashID id);
// Feeds one piece; a null one and an empty one are skipped.
[[nodiscard]] spki_status spki_digest_update(spki_digest* digest, const void* data, size_t length);
// Writes the digest, zero-padded. Nothing more can be fed.
[[nodiscard]] spki_status spki_digest_finish(spki_digest* digest,
                                             unsigned char (&out)[kSpkiDigestSize]);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_DIGEST_H
