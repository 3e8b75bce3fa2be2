// crl_compare.h: what one revocation list revokes and another one lets go. A list that takes the
// place of another must not bring anything back unnoticed.
#ifndef VESK2_TOOLS_CRL_COMPARE_H
#define VESK2_TOOLS_CRL_COMPARE_H

#include <string>
#include <vector>

#include <vesk2/crl.h>
#include <vesk2/hash.h>
#include <vesk2/ref.h>

namespace vesk2_command {

struct Revoked {
  bool isKey = false;  // else a certificate
  ZvVesk2::Ref<ZvVesk2::Hash> named;
  std::string since;  // of a certificate, as the list has it; empty for a date that says nothing

  // "key sha256:..." or "certificate sha256:..., revoked since STAMP".
  std::string Text() const;
};

// WhatIsLetGo returns what `before` revokes and `after` does not, or only from a later date on, in
// the order of `before`. Digests are compared as they stand: the same key by another algorithm is
// another item. A digest of zeros, which stands in lists that revoke nothing, names nothing.
std::vector<Revoked> WhatIsLetGo(const ZvVesk2::Crl& before, const ZvVesk2::Crl& after);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_CRL_COMPARE_H
