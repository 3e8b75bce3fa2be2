// SPDX-License-Identifier: Apache-2.0
// crl_compare.h: what one revocation list revokes and another one lets go. A list that takes the
// place of another must not bring anything back unnoticed: what goes is said, and was named.
#ifndef VESK2_TOOLS_CRL_COMPARE_H
#define VESK2_TOOLS_CRL_COMPARE_H

#include <set>
#include <string>
#include <vector>

#include "tools/vesk2/say/report.h"

#include <vesk2/crl.h>
#include <vesk2/hash.h>
#include <vesk2/ref.h>

namespace vesk2_command {

struct Revoked {
  bool isKey = false;  // else a certificate
  ZvVesk2::Ref<ZvVesk2::Hash> named;
  std::string since;  // of a certificate, as the list has it; empty for a date that says nothing
  ZvVesk2::Ref<ZvVesk2::TimeStamp> date = {};

  // "key sha256:..." or "certificate sha256:..., revoked since STAMP".
  std::string Text() const;
};

// WhatIsLetGo returns what `before` revokes and `after` does not, or only from a later date on, in
// the order of `before`. Digests are compared as they stand: the same key by another algorithm is
// another item. A digest of zeros, which stands in lists that revoke nothing, names nothing.
std::vector<Revoked> WhatIsLetGo(const ZvVesk2::Crl& before, const ZvVesk2::Crl& after);

// TellLetGo notes each item after the words `what`, and returns all of them for machines.
Json TellLetGo(const std::vector<Revoked>& items, const std::string& what);

// What --drop names: digests as `crl show` writes them, or "all".
class Drops {
 public:
  explicit Drops(const std::vector<std::string>& arguments);

  // CarryOver has `list` revoke what `before` does, from the same dates, but for what is named.
  void CarryOver(const ZvVesk2::Crl& before, ZvVesk2::Crl& list) const;
  // Settle is Trouble when `after` lets go what one of the lists before it revokes and nobody
  // named, or when a name is of nothing that they revoke.
  void Settle(const std::vector<const ZvVesk2::Crl*>& before, const ZvVesk2::Crl& after) const;

  bool all() const { return all_; }

 private:
  bool Name(const Revoked& item) const;

  bool all_ = false;
  std::set<std::string> digests_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_CRL_COMPARE_H
