// SPDX-License-Identifier: Apache-2.0
// See signed_digest.h.
#include "src/manifest/signed_digest.h"

#include <climits>

#include "src/frame/check.h"

namespace ZvVesk2 {

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
