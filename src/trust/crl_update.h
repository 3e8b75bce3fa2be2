// SPDX-License-Identifier: Apache-2.0
// The CRL store: one file for each source of revocation lists that the trust roots name, holding
// the newest list that verified. The file's name is made of the source's tag, so that a source is
// found without reading the others', and nobody's list can push another's out.
#ifndef VESK2_SRC_TRUST_CRL_UPDATE_H
#define VESK2_SRC_TRUST_CRL_UPDATE_H

#include "src/trust/lists.h"

namespace ZvVesk2 {

// StoreName makes the name of the file that keeps the list of the source `tag` (may be null): the
// text of the tag's body. Success with null for a tag that names none. VESK2_ERR_MEM_ALLOC.
[[nodiscard]] int StoreName(TextPtr& name, SExpression* tag);
// StoredPath makes the path of the file of that name. The codes of FilePath.
[[nodiscard]] int StoredPath(TextPtr& path, const char* name);

}  // namespace ZvVesk2

#endif  // VESK2_SRC_TRUST_CRL_UPDATE_H
