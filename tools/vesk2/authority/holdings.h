// SPDX-License-Identifier: Apache-2.0
// holdings.h: what a question about authority is answered from: the entries and lists of this
// machine's stores, and the certificates that are at hand.
#ifndef VESK2_TOOLS_HOLDINGS_H
#define VESK2_TOOLS_HOLDINGS_H

#include <string>
#include <vector>

#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/options/options.h"
#include "tools/vesk2/verify/store_check.h"

#include <vesk2/cert.h>
#include <vesk2/evidence.h>
#include <vesk2/signature.h>

namespace vesk2_command {

struct HeldCert {
  Ref<ZvVesk2::Cert> cert;
  Ref<ZvVesk2::Signature> signature;  // which holds
  std::string file;                   // escaped
  size_t number = 0;                  // in it

  std::string Place() const { return file + ":" + std::to_string(number); }
};

struct Holdings {
  Ref<SExpression> entries;
  Ref<SExpression> lists;
  std::vector<HeldCert> certs;  // no two alike
};

struct HoldingsOptions {
  std::vector<std::string> certs;
  std::string aclDirectory;
  StoreCheck stores;
};
void AddHoldingsOptions(OptionList& list, HoldingsOptions& options);

// LoadHoldings reads the stores and the certificates of the user's store and of the files that are
// named, chains or manifests. Trouble for what a verification could not use of the machine's store
// (CheckStores), and for one of the files; what of the user's store cannot be read is noted, and so
// is a certificate that its issuer did not sign: without it there is only less authority.
Holdings LoadHoldings(const HoldingsOptions& options);
// LoadStores reads the machine's entries and lists alone into evidence that may hold others'.
void LoadStores(ZvVesk2::Evidence& evidence, const std::string& aclDirectory);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_HOLDINGS_H
