// crl_drop.h: saying what a revocation list lets go that the one before it revokes, and letting go
// only what was named.
#ifndef VESK2_TOOLS_CRL_DROP_H
#define VESK2_TOOLS_CRL_DROP_H

#include <set>
#include <string>
#include <vector>

#include "tools/vesk2/objects/crl_file.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/crl_compare.h"

namespace vesk2_command {

// TellLetGo notes each item after the words `what`, and returns all of them for machines.
Json TellLetGo(const std::vector<Revoked>& items, const std::string& what);

// What --drop names: digests as `crl show` writes them, or "all".
class Drops {
 public:
  explicit Drops(const std::vector<std::string>& arguments);

  // ItemsOf returns the items of list1 or list2 that are not named, as they stand there.
  std::string ItemsOf(const SExpression& list) const;
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

#endif  // VESK2_TOOLS_CRL_DROP_H
