// SPDX-License-Identifier: Apache-2.0
// stored.h: everything that both stores hold, read once for the checks of the audit.
#ifndef VESK2_TOOLS_STORED_H
#define VESK2_TOOLS_STORED_H

#include <string>
#include <vector>

#include "tools/vesk2/audit/findings.h"
#include "tools/vesk2/objects/cert_chain.h"
#include "tools/vesk2/objects/crl_file.h"

#include <vesk2/acl_entry.h>

namespace vesk2_command {

template <typename Object>
struct Stored {
  std::string path;
  Ref<Object> object;
};

struct Stores {
  std::vector<Stored<ZvVesk2::AclEntry>> entries;
  std::vector<Stored<CrlSequence>> lists;
  std::vector<Stored<ZvVesk2::CertSequence>> chains;
  // As the library loads them: (acl ENTRY...), and the list of each source that an entry names.
  Ref<SExpression> acls;
  Ref<SExpression> believed;
};

// ReadStores reads them; what cannot be read, or would stop every verification, is found.
Stores ReadStores(Findings& findings);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_STORED_H
