// SPDX-License-Identifier: Apache-2.0
// What an Explanation holds: the question, what may still be spent, and what was found. The state
// is made anew for each answer and has no public name: an Explanation holds one or none.
#ifndef VESK2_SRC_TRUST_EXPLANATION_STATE_H
#define VESK2_SRC_TRUST_EXPLANATION_STATE_H

#include <vesk2/acl_entry.h>
#include <vesk2/explanation.h>

#include "src/trust/principals.h"
#include "src/trust/text_writer.h"

namespace ZvVesk2 {

struct ExplanationState {
  using Kind = Explanation::Kind;
  using Reason = Explanation::Reason;
  using End = Explanation::End;
  static constexpr size_t kNone = Explanation::kNone;
  // A reason and the text that it points to.
  struct Held {
    Reason reason = {};
    std::unique_ptr<char[]> text;
  };

  // All else is filled by Explain.
  explicit ExplanationState(Vesk2ContextStruct* ctx) : evidence(ctx) {}

  // ---- The question ----
  Evidence evidence;
  Principals principals;
  Ref<SExpression> relevant;  // the entries that name a key of the chain
  Ref<SExpression> tag;
  Ref<SExpression> members;
  bool IsManifest() const { return evidence.GetKind() == Evidence::SignedManifest; }
  // Runs `ask` on each tag that must be granted until it returns anything but 0.
  template <typename Ask>
  [[nodiscard]] int EachMember(Ask ask) const;
  // The code of the first tag that the evidence does not prove. A reduction that ran out of memory
  // or of work has not found out: the explanation is incomplete then.
  [[nodiscard]] int ProveMembers(Evidence& changed);

  // ---- What it may cost ----
  // From here on the explanation pays; what it cost to index the question is bounded by the
  // question.
  void StartCounting();
  // Afford counts `bytes` that are about to be worked on; false when no more may be spent.
  bool Afford(uint64_t bytes = 0);
  // Cleared when the budget or a limit ended the search; nothing sets it again.
  bool complete = true;

  // ---- Reasons ----
  // Adds a reason with its text; past the limit it only counts.
  [[nodiscard]] int Add(Reason reason, TextWriter& text);
  void DropReasons(size_t from);
  std::unique_ptr<Held[]> reasons;
  // `found` counts also what was dropped or had no room: it tells a place without a reason from one
  // whose reason did not fit.
  size_t count = 0;
  size_t capacity = 0;
  size_t found = 0;

  // ---- The path ----
  // Borrowed from the copy of the evidence above.
  AclEntry* entry = nullptr;
  std::unique_ptr<size_t[]> path;
  size_t pathCount = 0;
  TimeStamp* end = nullptr;
  End endKind = Explanation::NoEnd;
  size_t endCert = kNone;

 private:
  uint64_t workLimit = 0;
  uint64_t bytesLimit = 0;
  uint64_t bytesSpent = 0;
};

template <typename Ask>
int ExplanationState::EachMember(Ask ask) const {
  if (!members) return ask(tag.get());
  int code = 0;
  for (auto it = members->Begin(); it && code == 0; it.Next()) {
    if (auto* const member = dynamic_cast<SExpression*>(it.Value())) code = ask(member);
  }
  return code;
}

// Where authority was lost. The steps share one form: each looks at every certificate, or every
// entry, puts one question, and adds a reason where the answer is no. Texts are made here, so that
// all who show a reason show the same words.
class ExplanationLosses {
 public:
  using Kind = Explanation::Kind;
  using Reason = Explanation::Reason;
  static constexpr size_t kNone = Explanation::kNone;

  ExplanationLosses(ExplanationState& state, std::string_view file, std::string_view extraDirectory)
      : state_(state), evidence_(state.evidence), file_(file), extraDirectory_(extraDirectory) {}
  // Looks for what can have led to the code.
  [[nodiscard]] int Find(int code);

 private:
  // What a certificate, a manifest's order and content, and the lists say of themselves.
  [[nodiscard]] int Signatures();
  [[nodiscard]] int Order();
  [[nodiscard]] int Content();
  [[nodiscard]] int Revocations();
  // Where the grant is lost on its way along the chain.
  [[nodiscard]] int Certificates();
  // Of one certificate: whether another follows from it; and of pairs, whether their periods meet.
  [[nodiscard]] int Link(size_t index);
  [[nodiscard]] int Conflicts();
  // And where it would have to come from.
  [[nodiscard]] int Roots();
  // Of one entry that names a key of the chain; the two answers when there is none at all, and when
  // there is no store.
  [[nodiscard]] int Root(AclEntry* entry);
  [[nodiscard]] int Threshold(AclEntry* entry, ThresholdSubject* threshold);
  [[nodiscard]] int NoEntryAtAll();
  [[nodiscard]] int NoStore();
  // When each alone would do: what they come to together, and what cannot be read at all.
  [[nodiscard]] int Rest();
  [[nodiscard]] int Unreadable();
  // What the reduction says of one credential alone, a code below 0 when it cannot read it.
  [[nodiscard]] int TryReduction(int& code, bool isEntry, DExpression* credential);
  // The two questions that certificates and entries have in common. `where` has the kind and the
  // place, and becomes the reason.
  [[nodiscard]] int Period(const Reason& where, const TimeStamp* notBefore,
                           const TimeStamp* notAfter);
  [[nodiscard]] int Tag(const Reason& where, SExpression* tag);

  // A reason of a kind about a certificate, or an entry, and the text that begins with its name.
  static Reason About(Kind kind, size_t cert) {
    return {kind, 0, cert, kNone, nullptr, nullptr, nullptr};
  }
  static Reason About(Kind kind, AclEntry* entry) {
    return {kind, 0, kNone, kNone, entry, nullptr, nullptr};
  }
  // How a place is called, so that one certificate has one name in all texts.
  TextWriter& Name(TextWriter& text, const Reason& reason) const;
  TextWriter& CertName(TextWriter& text, size_t index) const;
  TextWriter& Store(TextWriter& text) const;
  TextWriter& Asked(TextWriter& text) const;

  // Which steps can have led to a code. A row, so that a new code is a line and not a branch.
  using Step = int (ExplanationLosses::*)();
  struct Row {
    int code;
    Step steps[4];
  };
  // One row for each code that has reasons.
  static const Row kRows[];

  ExplanationState& state_;
  Evidence& evidence_;
  std::string_view file_;
  std::string_view extraDirectory_;
};

// By which way authority came, and until when it lasts. It takes away what the answer does not need
// and asks again, so that what is left is by the library's own rules.
class ExplanationPath {
 public:
  using End = Explanation::End;
  static constexpr size_t kNone = Explanation::kNone;

  explicit ExplanationPath(ExplanationState& state)
      : state_(state), evidence_(state.evidence), alone_(evidence_.GetContext()) {}
  [[nodiscard]] int Find();

 private:
  // Which entry suffices alone, and what of the chain it needs.
  [[nodiscard]] int FindEntry();
  [[nodiscard]] int GrantAlone(bool& granted, AclEntry* entry);
  [[nodiscard]] int FindCerts();
  [[nodiscard]] int CanGo(bool& gone, size_t index, size_t second);
  // The earliest end of the path, of the entry, or of a list that speaks for one of its
  // certificates.
  void FindEnd();
  void EndsAt(TimeStamp* end, End kind, size_t cert);

  ExplanationState& state_;
  Evidence& evidence_;
  Evidence alone_;  // what is left: one entry, and the certificates that are needed
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_TRUST_EXPLANATION_STATE_H
