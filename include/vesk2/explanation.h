// SPDX-License-Identifier: Apache-2.0
// explanation.h: Explanation, why an answer about authority is what it is: of a no the reasons, the
// first place where authority was lost first; of a yes the certificates and the entry that it rests
// on, until when it holds and what ends it.
//
// It looks at an Evidence, opens no file and changes no answer. Whoever wrote what is explained can
// make each question about it expensive, and an explanation asks many: it stops at a small multiple
// of what the answer cost, and then is incomplete.
#ifndef VESK2_EXPLANATION_H
#define VESK2_EXPLANATION_H

#include <vesk2/evidence.h>

#include <cstddef>
#include <cstdint>
#include <memory>

namespace ZvVesk2 {

class AclEntry;
struct ExplanationState;

class VESK2_API Explanation {
 public:
  // What stands in the way of authority.
  enum Kind : int32_t {
    SignatureFails = 0,  // a signature does not hold
    OutOfOrder = 1,      // a manifest's first certificate is for no digest, or its second not for
                         // the signer
    OtherContent = 2,    // the signer certificate names another content, or the listing is damaged
    Revoked = 3,         // a certificate is revoked
    KeyRevoked = 4,      // the key that a certificate is for is revoked
    Undetermined = 5,    // no current list tells whether a certificate is revoked
    OutOfPeriod = 6,     // a period does not meet the asked one, or that of another certificate
    NarrowTag = 7,       // less than the asked tag is granted
    LeadsNowhere = 8,    // a certificate is for a key that issued none of this chain
    NotPassedOn = 9,     // a certificate or an entry does not let its key pass the grant on
    NoEntry = 10,        // no entry names a key of the chain
    TooFewKeys = 11,     // an entry wants more keys of its k-of-n
    NotCombined = 12,    // each grants enough, and all together do not
    CannotBeRead = 13,   // the reduction cannot read a certificate or an entry
  };
  // Word is a kind as programs know it: signature, order, content, revoked, key-revoked,
  // undetermined, period, tag, link, propagate, no-entry, threshold, combination, unreadable. Null
  // for no kind.
  static const char* Word(Kind kind);

  // A place that a reason does not have is kNone or null. All is borrowed.
  static constexpr size_t kNone = static_cast<size_t>(-1);
  struct Reason {
    Kind kind;
    int code;             // what the library says of a signature, a listing or a credential, or 0
    size_t cert;          // the certificate, counted from 0
    size_t otherCert;     // the one whose period it does not meet
    AclEntry* entry;      // the entry
    SExpression* source;  // the tag of the lists that were asked
    const char* text;     // safe for a terminal
  };

  // What an answer ends with.
  enum End : int32_t { NoEnd = 0, CertEnds = 1, EntryEnds = 2, ListEnds = 3 };

  explicit Explanation(Vesk2ContextStruct* ctx);
  ~Explanation();
  Explanation(const Explanation&) = delete;
  Explanation& operator=(const Explanation&) = delete;

  // SetNames gives the texts the name of the file that was asked about and of the directory whose
  // entries were trusted beside the store's; null for none. VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int SetNames(const char* file, const char* extraAclDirectory);

  // Explain begins anew: `code` is what was answered about `tag`, from this evidence. When the
  // answer is about several tags that must all be granted, `members` is the list of them. The
  // evidence is kept by its parts, and may go or change afterwards. VESK2_ERR_PARAM_NULL,
  // VESK2_ERR_MEM_ALLOC, the codes of hashing and writing what a text is to name; nothing is
  // explained then.
  [[nodiscard]] int Explain(const Evidence& evidence, int code, SExpression* tag,
                            SExpression* members = nullptr);

  // Whether it came to its end: not stopped by its cost or by Limits::kMaxReasons.
  bool IsComplete() const;

  // ---- Of a no ----
  size_t CountReasons() const;
  // `index` must be below the count.
  const Reason& GetReason(size_t index) const;

  // ---- Of a yes, borrowed ----
  // The entry that alone grants what was asked; null when several do together.
  AclEntry* GetEntry() const;
  // The certificates that are needed with it, from the root to the end of the chain.
  size_t CountPath() const;
  size_t GetPathCert(size_t index) const;
  // Asked about a moment after this one, the answer would be no; null when nothing of the path
  // ends.
  TimeStamp* GetEnd() const;
  // What ends then: the certificate GetEndCert, the entry, or the list that speaks for that
  // certificate.
  End GetEndKind() const;
  size_t GetEndCert() const;

 private:
  Vesk2ContextStruct* context;
  std::unique_ptr<char[]> file;
  std::unique_ptr<char[]> extraDirectory;
  std::unique_ptr<ExplanationState> state;
};

}  // namespace ZvVesk2

#endif  // VESK2_EXPLANATION_H
