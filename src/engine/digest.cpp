// SPDX-License-Identifier: Apache-2.0
// Digests over the platform's hashes, with its results folded into the engine's codes.
#include "src/engine/digest.h"

#include <cstring>

#include "src/engine/budget.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {

spki_status spki_digest_start(spki_engine* engine, spki_digest* digest, ZvclmHashID id) {
  digest->engine = engine;
  VESK2_TRY(spki_charge_units(engine, kUnitsPerHash));
  return spki_map_crypto_status(zvclm_HashStart(&digest->context, id, engine->hash_provider));
}

spki_status spki_digest_update(spki_digest* digest, const void* data, size_t length) {
  if (data == nullptr || length == 0) return 0;
  VESK2_TRY(spki_charge_hashed(digest->engine, length));
  const auto* bytes = static_cast<const unsigned char*>(data);
  return spki_map_crypto_status(
      zvclm_HashUpdate(&digest->context, bytes, length, digest->engine->hash_provider));
}

spki_status spki_digest_finish(spki_digest* digest, unsigned char (&out)[kSpkiDigestSize]) {
  std::memset(out, 0, sizeof out);
  return spki_map_crypto_status(
      zvclm_HashFinal(&digest->context, out, digest->engine->hash_provider));
}

// The provider's results that are not listed are success: that is how callers of the engine have
// always seen them, and the platform's hashes return no other failure.
spki_status spki_map_crypto_status(int status) {
  switch (status) {
    case ZVCLM_ERR_NULL_PARAM:
      return SPKI_ERR_NULL_PARAM;
    case ZVCLM_ERR_UNKNOWN_HASH:
    case 1020:
      return SPKI_ERR_UNKNOWN_HASH_ALG;
    case ZVCLM_ERR_NO_MEM:
      return SPKI_ERR_NO_MEM;
    case ZVCLM_ERR_KEY:
    case ZVCLM_ERR_KEY_TYPE:
    case ZVCLM_ERR_FORMAT:
    case ZVCLM_ERR_FAILURE:
      return SPKI_ERR_UNKNOWN;
    default:
      return 0;
  }
}

}  // namespace ZvVesk2::Engine
