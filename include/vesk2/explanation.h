// SPDX-License-Identifier: Apache-2.0
// explanation.h: Explanation, why an answer about authority is what it is: of a no the reasons, the
// first place where authority was lost first; of a yes the certificates and the entry that it rests
// on, until when it holds and what ends it.
//
// It looks at an Evidence, opens no file and changes no answer. Whoever wrote what is explained can
// make each question about it expensive, and an explanation asks many: it stops at a small multiple
// of what the answer cost, and then is incomplete.
//
//   Evidence evidence(nullptr);
//   const int code = chain->Verify(nullptr, tag, now, now, evidence);
//   Explanation why(nullptr);
//   if (why.Explain(evidence, code, tag) == 0) {
//     for (size_t i = 0; i < why.CountReasons(); ++i) puts(why.GetReason(i).text);
//   }
//
// A reason says what stands in the way, not what should be done about it: what would turn a no may
// be the trust in another key. C programs get the same as records (Vesk2ExplanationStruct in
// vesk2.h).
#ifndef VESK2_EXPLANATION_H
#define VESK2_EXPLANATION_H

#include <vesk2/evidence.h>

#include <cstddef>
#include <cstdint>
#include <memory>

namespace ZvVesk2 {

class AclEntry;
struct ExplanationState;

// Explanation is the answer to one question at a time. It may lie on the stack. What is borrowed
// from it lives until it explains anew, or is destroyed.
class VESK2_API Explanation {
 public:
  // What stands in the way of authority.
  enum Kind : int32_t {
    // A signature does not hold.
    SignatureFails = 0,
    // A manifest's first certificate is for no digest, or its second not for the signer.
    OutOfOrder = 1,
    // The signer certificate names another content, or the listing is damaged.
    OtherContent = 2,
    // A certificate is revoked.
    Revoked = 3,
    // The key that a certificate is for is revoked.
    KeyRevoked = 4,
    // No current list tells whether a certificate is revoked.
    Undetermined = 5,
    // A period does not meet the asked one, or that of another certificate.
    OutOfPeriod = 6,
    // Less than the asked tag is granted.
    NarrowTag = 7,
    // A certificate is for a key that issued none of this chain.
    LeadsNowhere = 8,
    // A certificate or an entry does not let its key pass the grant on.
    NotPassedOn = 9,
    // No entry names a key of the chain, or none could be loaded.
    NoEntry = 10,
    // An entry wants more keys of its k-of-n.
    TooFewKeys = 11,
    // Each grants enough, and all together do not.
    NotCombined = 12,
    // The reduction cannot read a certificate or an entry.
    CannotBeRead = 13,
  };
  // Word is a kind as programs know it, static: signature, order, content, revoked, key-revoked,
  // undetermined, period, tag, link, propagate, no-entry, threshold, combination, unreadable. Null
  // for no kind. The words stay as they are; docs/json.md says of each what to do.
  static const char* Word(Kind kind);

  // The number of no certificate.
  static constexpr size_t kNone = static_cast<size_t>(-1);
  // A reason with its place. A place that it does not have is kNone or null. All is borrowed. The
  // text is for people, and may be worded anew in another version: go by the kind and the numbers.
  struct Reason {
    Kind kind;
    // What the library says of a signature, a listing or a credential, or 0.
    int code;
    // The certificate, counted from 0 as in the Evidence; texts count from 1.
    size_t cert;
    // The one whose period it does not meet.
    size_t otherCert;
    // The entry; AclEntry::GetFileName tells where it lies.
    AclEntry* entry;
    // The tag of the lists that were asked.
    SExpression* source;
    // The reason in words: safe for a terminal, not for a shell.
    const char* text;
  };

  // What an answer ends with.
  enum End : int32_t { NoEnd = 0, CertEnds = 1, EntryEnds = 2, ListEnds = 3 };

  // An empty one. `ctx` may be null, and must outlive it.
  explicit Explanation(Vesk2ContextStruct* ctx);
  ~Explanation();
  Explanation(const Explanation&) = delete;
  Explanation& operator=(const Explanation&) = delete;

  // SetNames gives the texts the name of the file that was asked about and of the directory whose
  // entries were trusted beside the store's; null for none. Both are copied, and count from the
  // next Explain on. VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int SetNames(const char* file, const char* extraAclDirectory);

  // Explain begins anew: `code` is what was answered about `tag`, from this evidence. When the
  // answer is about several tags that must all be granted, `members` is the list of them. The tags
  // are shared. The evidence is kept by its parts, and may go or change afterwards. A code that is
  // not about authority (a file that cannot be read, a tree that differs) has no reasons: ask with
  // 0 where authority was proved.
  //   VESK2_ERR_PARAM_NULL              no tag
  //   VESK2_ERR_MEM_ALLOC               memory ran out
  //   the codes of hashing and writing  of what a text is to name
  // After a failure nothing is explained; the answer stands.
  [[nodiscard]] int Explain(const Evidence& evidence, int code, SExpression* tag,
                            SExpression* members = nullptr);

  // Whether it came to its end: not stopped by its cost or by Limits::kMaxReasons. False before the
  // first Explain. Of an explanation that is not complete what there is holds.
  bool IsComplete() const;

  // ---- Of a no ----
  // How many reasons there are: 0 of a yes, and of a code that has none.
  size_t CountReasons() const;
  // A reason. `index` must be below the count: beyond it the record has no place, code 0 and an
  // empty text, and its kind says nothing.
  const Reason& GetReason(size_t index) const;

  // ---- Of a yes, borrowed ----
  // The entry that alone grants what was asked; null when several do together, and of a no.
  AclEntry* GetEntry() const;
  // The certificates that are needed with it, from the root to the end of the chain, by their
  // numbers in the evidence; kNone past the count.
  size_t CountPath() const;
  // What is not on the path could be left out, and the answer would be the same.
  size_t GetPathCert(size_t index) const;
  // Asked about a moment after this one, the answer would be no; null when nothing of the path
  // ends. Lists that are not here yet, and entries that are taken back, can end it before.
  TimeStamp* GetEnd() const;
  // What ends then: the certificate GetEndCert, the entry, or the list that speaks for that
  // certificate.
  End GetEndKind() const;
  // kNone when the entry ends first, and when nothing does.
  size_t GetEndCert() const;

 private:
  Vesk2ContextStruct* context;
  std::unique_ptr<char[]> file;
  std::unique_ptr<char[]> extraDirectory;
  std::unique_ptr<ExplanationState> state;
};

}  // namespace ZvVesk2

#endif  // VESK2_EXPLANATION_H
