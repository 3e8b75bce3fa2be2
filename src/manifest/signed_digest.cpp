// SPDX-License-Identifier: Apache-2.0
// See signed_digest.h. Reader and writer share it, so that they cannot disagree about what is
// signed.
#include "src/manifest/signed_digest.h"

#include <climits>

#include "src/frame/check.h"

namespace ZvVesk2 {

// The elements are hashed as they are written, hints included, and the body as it stands: what the
// signer saw is what counts, without the certificates and lists that lie between.
int SignedDigest(Ref<Hash>& out, ZvclmHashID id, const ManifestHead& head,
                 const unsigned char* body, size_t length) {
  VESK2_REQUIRE(length <= UINT_MAX, VESK2_ERR_INVALID_PARAM);
  Ref<Hash> digest(TryNew<Hash>(head.version->GetContext()));
  VESK2_REQUIRE(digest, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(digest->Init(id));
  for (const auto* element : {&head.version, &head.type, &head.time}) {
    VESK2_TRY(digest->Update(element->get()));
  }
  VESK2_TRY(digest->Update(body, static_cast<unsigned int>(length)));
  VESK2_TRY(digest->Finalize());
  out = std::move(digest);
  return 0;
}

}  // namespace ZvVesk2
