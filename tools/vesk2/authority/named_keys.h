// SPDX-License-Identifier: Apache-2.0
// named_keys.h: the keys that entries and certificates name, and which of these lead to a key.
#ifndef VESK2_TOOLS_NAMED_KEYS_H
#define VESK2_TOOLS_NAMED_KEYS_H

#include <map>
#include <string>
#include <vector>

#include "tools/vesk2/authority/holdings.h"

#include <vesk2/acl_entry.h>

namespace vesk2_command {

// Who may sign: one key, or k of several that must agree.
struct Signers {
  std::vector<Ref<PublicKey>> keys;
  size_t k = 1;

  bool IsGroup() const { return k > 1; }
};
Signers OneKey(const Ref<PublicKey>& key);

// Certificates are told by their numbers among those at hand.
class NamedKeys {
 public:
  // Both must outlive it.
  NamedKeys(const Holdings& holdings, const SExpression& entries);

  // Every key that an entry or a certificate names, and every k-of-n.
  std::vector<Signers> Candidates() const;
  // A key that is named anywhere; null for none.
  Ref<PublicKey> FindKey(const std::string& fingerprint) const;
  // Whether a k-of-n names it.
  bool IsInGroup(PublicKey& key) const;

  ZvVesk2::Cert& CertOf(size_t number) const { return *holdings_.certs[number].cert; }
  // The certificates that lead to the keys, the nearest first.
  std::vector<size_t> Reach(const std::vector<PublicKey*>& keys) const;
  // The entries that name one of the keys or an issuer of these certificates, in the order of the
  // store.
  std::vector<ZvVesk2::AclEntry*> EntriesFor(const std::vector<PublicKey*>& keys,
                                             const std::vector<size_t>& reached) const;

 private:
  // By how a subject names a key: numbers of entries or certificates.
  using Named = std::map<std::string, std::vector<size_t>>;

  void AddKey(DExpression* subject);
  void AddSubject(ZvVesk2::Subject* subject, size_t number, Named& named);
  static std::vector<size_t> Numbers(const Named& named, PublicKey& key);

  const Holdings& holdings_;
  std::vector<ZvVesk2::AclEntry*> entryList_;
  std::map<std::string, Ref<PublicKey>> keys_;  // by fingerprint
  std::map<std::string, Signers> groups_;       // by how they are told
  Named entriesFor_;
  Named certsFor_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_NAMED_KEYS_H
