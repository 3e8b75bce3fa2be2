// SPDX-License-Identifier: Apache-2.0
// RevocationLists: what the revocation lists of one call say, kept for all its questions. Each list
// is proved at most once, and only items of proved lists are looked at: whoever writes a manifest
// chooses how many certificates it has, and how many lists, true ones or not. It borrows all that
// it is given and lives for one call: nothing of it is kept for the next, as the store may have
// changed by then.
#ifndef VESK2_SRC_TRUST_REVOCATION_LISTS_H
#define VESK2_SRC_TRUST_REVOCATION_LISTS_H

#include <memory>
#include <span>

#include <vesk2/acl_entry.h>
#include <vesk2/crl.h>

#include "src/trust/item_index.h"
#include "src/trust/tag_index.h"

namespace ZvVesk2 {

class RevocationLists {
 public:
  // What decided an answer: the list that names the object, and since when it does (null: always);
  // else the list of the source that ends last, if there is one.
  struct Decision {
    CrlSequence* list = nullptr;
    TimeStamp* since = nullptr;
  };

  // `acls` vouch for the lists in `store`; either may be null, and both outlive this object.
  RevocationLists(SExpression* acls, SExpression* store) : acls_(acls), store_(store) {}

  // See CrlSequence::CheckStatusCritical and CheckStatusNonCritical.
  [[nodiscard]] int AskCritical(Decision& decision, SExpression* tag, SExpression* object);
  [[nodiscard]] int AskNonCritical(Decision& decision, SExpression* tag, SExpression* object,
                                   const TimeStamp* notBefore);
  // See Cert::IsRevoked. The status tells whether it was revoked.
  [[nodiscard]] int Mark(Decision& decision, Cert* cert, const TimeStamp* notBefore);
  // See CrlSequence::MarkRevoked.
  [[nodiscard]] int MarkAll(SExpression* certs, const TimeStamp* notBefore);
  // Store offers those of the `carried` lists that are proved to the store, in their order. All are
  // among the lists of this object.
  [[nodiscard]] int Store(SExpression* carried);

 private:
  // Asked for once: a list that fails fails for the whole call.
  enum class Proof : uint8_t { kUnknown, kHolds, kFails };
  struct List {
    CrlSequence* sequence;
    Proof proof;
  };
  using Source = TagIndex<List>::Entry;
  // What the lists of one source say together, or all lists. Their order makes no difference.
  struct Answers {
    // The items are gathered when a question asks for them first.
    bool ready = false;
    ItemIndex items;
    const TimeStamp* latest = nullptr;  // the latest end of a list
    CrlSequence* last = nullptr;        // that list
  };

  // The lists, each filed under its source's tag; and the roots, under theirs.
  [[nodiscard]] int Load();
  [[nodiscard]] int LoadRoots();
  // What a source answers, made ready by Collect; and the proof of one list, which is kept whatever
  // it was.
  [[nodiscard]] int Find(Answers*& answers, bool critical, SExpression* tag);
  // Gathers the items of the proved lists among `lists`.
  [[nodiscard]] int Collect(Answers& answers, bool critical, std::span<Source> lists);
  [[nodiscard]] int Prove(Source& list);

  SExpression* acls_;
  SExpression* store_;
  // Loading hashes every tag, which is only done when something is asked.
  bool loaded_ = false;
  bool rootsLoaded_ = false;
  TagIndex<List> lists_;  // by source; a list without one can never be proved
  TagIndex<AclEntry*> roots_;
  // For each of the two questions: of all lists, and at the place of the first list of a source.
  Answers all_[2];
  std::unique_ptr<Answers[]> bySource_[2];
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_TRUST_REVOCATION_LISTS_H
