// SPDX-License-Identifier: Apache-2.0
// PublicKey: the key in the encodings of other programs. What other programs read: the blob of SSH,
// and what an X.509 certificate holds of a key.
#include <memory>

#include <vesk2/public_key.h>

#include "src/frame/check.h"
#include "src/platform/crypto.h"

namespace ZvVesk2 {
namespace {

// The size is asked first, so that nothing is guessed; both calls see the same key.
[[nodiscard]] int ExportKey(const ZVCLMPublicKeyData* key, int format, unsigned char*& out,
                            unsigned int& length, uint32_t handle) {
  // Asking for the size is answered with "too small".
  const int asked = zvclm_PublicKeyExport(key, format, 0, nullptr, &length, handle);
  VESK2_REQUIRE(asked == 0 || asked == ZVCLM_ERR_BUFFER_TOO_SMALL, asked);
  out = TryNewArray<unsigned char>(length);
  VESK2_REQUIRE(out != nullptr, VESK2_ERR_MEM_ALLOC);
  return zvclm_PublicKeyExport(key, format, 0, out, &length, handle);
}

}  // namespace

int PublicKey::SshExport(unsigned char*& out, unsigned int& length) {
  out = nullptr;
  return ExportKey(key, ZVCLM_FORMAT_SSH, out, length, CryptoHandle());
}

int PublicKey::X509Export(unsigned char*& out, unsigned int& length) {
  out = nullptr;
  return ExportKey(key, ZVCLM_FORMAT_X509, out, length, CryptoHandle());
}

}  // namespace ZvVesk2
