// authority.h: where authority was lost on its way from the ACL to the end of a chain, or by which
// way it came.
#ifndef VESK2_TOOLS_AUTHORITY_H
#define VESK2_TOOLS_AUTHORITY_H

#include <optional>
#include <string>
#include <vector>

#include "tools/vesk2/explain/evidence.h"

namespace vesk2_command {

// One reason; `kind` is a stable word: signature, order, content, revoked, key-revoked,
// undetermined, period, tag, propagate, link, threshold, no-entry, combination, unreadable.
struct Loss {
  std::string kind;
  std::string text;
};
// FindLosses names what can have led to a code, most telling first.
std::vector<Loss> FindLosses(const Question& question, const Evidence& evidence, int code);

// The way of a granted request: the entry that starts it and the certificates it needs, from the
// root to the end.
struct AuthorityPath {
  const EntryEvidence* entry = nullptr;
  std::vector<size_t> certs;
  TimeStamp* ends = nullptr;  // null: it does not
};
std::optional<AuthorityPath> FindPath(const Question& question, const Evidence& evidence);

// "certificate N (issuer FINGERPRINT)".
std::string CertName(const Evidence& evidence, size_t index);
std::string EntryName(const EntryEvidence& entry);
// Whether an entry grants to a key of the chain, or to a k-of-n that counts one.
bool IsRelevant(const EntryEvidence& entry, const Evidence& evidence);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_AUTHORITY_H
