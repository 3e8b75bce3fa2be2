// revocation.h: what the revocation lists at hand say, and since when.
#ifndef VESK2_TOOLS_REVOCATION_H
#define VESK2_TOOLS_REVOCATION_H

#include <string>

#include "tools/vesk2/explain/evidence.h"

namespace vesk2_command {

// The lists of an answer's evidence that count, each proved once.
class RevocationLists {
 public:
  explicit RevocationLists(const Evidence& evidence);

  // The list that speaks for a certificate: of its source the one that ends last. Null for none.
  CrlSequence* Deciding(SExpression* source) const;
  // Since when a certificate of that source, or with `key` its subject, is on a list, in the list's
  // words; empty when that says nothing.
  std::string RevokedSince(ZvVesk2::Cert& cert, SExpression* source, bool key) const;

 private:
  std::vector<Ref<CrlSequence>> proved_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_REVOCATION_H
