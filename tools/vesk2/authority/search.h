// SPDX-License-Identifier: Apache-2.0
// search.h: which keys may sign a manifest, and by which way.
//
// The library judges each way as a manifest that is signed at the moment asked about, with what is
// revoked then: what `manifest verify` would answer. Here is only what is put to it: which keys,
// and which of the certificates at hand.
#ifndef VESK2_TOOLS_SEARCH_H
#define VESK2_TOOLS_SEARCH_H

#include <functional>
#include <string>
#include <vector>

#include "tools/vesk2/authority/change.h"
#include "tools/vesk2/authority/named_keys.h"
#include "tools/vesk2/authority/supposition.h"
#include "tools/vesk2/objects/request.h"
#include "tools/vesk2/objects/times.h"

#include <vesk2/acl_entry.h>
#include <vesk2/evidence.h>

namespace vesk2_command {

// What a manifest would carry beside the certificates for its content.
struct Way {
  static constexpr size_t kSelf = static_cast<size_t>(-1);

  PublicKey* signer = nullptr;
  std::vector<PublicKey*> approvers = {};
  // The certificate that names the signer, by its number among those at hand; kSelf for one that
  // the signer makes for itself, and the others, the signer's end first.
  size_t own = kSelf;
  std::vector<size_t> rest = {};
  ZvVesk2::AclEntry* entry = nullptr;  // which alone grants; null: several do together
};

class Search {
 public:
  // All must outlive it.
  Search(const Holdings& holdings, const Request& request, const Supposition& supposition);

  // The ways that are good at a moment: of a key one for each entry and certificate of its own,
  // `most` at most; of a group those of as many members as must agree.
  std::vector<Way> FindWays(const Signers& signers, TimeStamp* at, size_t most) const;
  // Those of a group who are in such a way; a key itself, or none.
  Signers Agreeing(const Signers& signers, TimeStamp* at) const;
  // Whether somebody may sign. Tries the ways in `known` first, and adds what it finds.
  bool MaySign(const Signers& signers, TimeStamp* at, std::vector<Way>& known) const;

  // When that can change.
  Moments MomentsOf(const Signers& signers) const;

  // The code of the library for a way, with `alone` of its entry alone.
  int Judge(const Way& way, TimeStamp* at, bool alone = false) const;
  // What Judge judges, its certificates, null for those that are only made up, and their places.
  void MakeEvidence(const Way& way, TimeStamp* at, ZvVesk2::Evidence& evidence) const;
  std::vector<const HeldCert*> Carried(const Way& way) const;
  std::vector<std::string> Places(const Way& way) const;

  const NamedKeys& keys() const { return keys_; }
  const Request& request() const { return request_; }

 private:
  bool Covers(SExpression* tag) const;
  std::vector<size_t> OwnCerts(PublicKey& signer, const std::vector<size_t>& reached) const;
  bool IsRevoked(PublicKey& key, TimeStamp* at) const;
  void Shorten(Way& way, TimeStamp* at, bool alone) const;
  // Adds the ways of these keys together, the first of them the signer.
  void FindFor(const std::vector<PublicKey*>& keys, TimeStamp* at, size_t most,
               std::vector<Way>& ways) const;
  void ForEachChoice(const Signers& signers, TimeStamp* at,
                     const std::function<bool(const std::vector<PublicKey*>&)>& goesOn) const;

  const Holdings& holdings_;
  const Request& request_;
  const Supposition& supposition_;
  Ref<SExpression> entries_;
  NamedKeys keys_;
  std::vector<bool> covers_;  // of each certificate: all that is asked
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_SEARCH_H
