// SPDX-License-Identifier: Apache-2.0
// edits.h: single changes that may mend a refusal: each as an object for a hypothesis, and as the
// command lines that make it.
#ifndef VESK2_TOOLS_EDITS_H
#define VESK2_TOOLS_EDITS_H

#include <string>
#include <vector>

#include "tools/vesk2/explain/approvals.h"
#include "tools/vesk2/explain/hypothesis.h"
#include "tools/vesk2/explain/policy.h"
#include "tools/vesk2/explain/remedy.h"

namespace vesk2_command {

struct Edit {
  Remedy remedy;
  int cost = 0;          // the lower, the less it changes
  std::string target;    // what it changes; two edits of one thing exclude each other
  bool newRoot = false;  // it trusts a key that nobody vouches for
  // What it puts in place.
  size_t index = 0;
  Ref<ZvVesk2::Cert> cert = {};
  std::vector<Ref<PublicKey>> coSigners = {};  // of the certificate at the index
  std::vector<Ref<PublicKey>> approvers = {};  // of a manifest's content
  std::string file = {};                       // of the entry
  Ref<ZvVesk2::AclEntry> entry = {};
  Ref<SExpression> fresh = {};
};
void Apply(const Edit& edit, Hypothesis& hypothesis);

// EditMaker makes edits to one question. None trusts a key that is revoked or whose certificate
// was, or has one sign; none gives one key what several must agree on.
class EditMaker {
 public:
  EditMaker(const Question& question, const Evidence& evidence)
      : question_(question), evidence_(evidence), policy_(question, evidence) {}

  // Renews a certificate: as it stands, so that it covers what was asked, or so that it covers the
  // whole period of that too.
  enum class Reach { kAsItIs, kAsked, kWholePeriod };
  void Renew(std::vector<Edit>& edits, size_t index, Reach reach) const;
  // Has the keys that a k-of-n still wants certify what one of them did: of a manifest its content,
  // which gives nobody anything for another one.
  void CoSign(std::vector<Edit>& edits) const;
  // Widens an entry of the store, for the outermost issuer, in what it lacks.
  void Widen(std::vector<Edit>& edits, const EntryEvidence& entry) const;
  // Trusts the issuer of a certificate, if nobody certifies it, for what was asked.
  void NewRoot(std::vector<Edit>& edits, size_t index) const;
  // Has whoever revokes for a certificate's source make a current list, to be imported.
  void FreshList(std::vector<Edit>& edits, size_t index) const;

  const Policy& policy() const { return policy_; }

 private:
  std::string At(size_t index) const;
  bool Covers(SExpression* tag) const;
  bool CanIssue() const;
  void CoSign(std::vector<Edit>& edits, ZvVesk2::Subject* subject) const;
  void Approve(std::vector<Edit>& edits, const Approvals& approvals) const;
  Edit CoSignature(size_t index, std::vector<Ref<PublicKey>> keys) const;
  // Adds an edit whose words name the file that was asked about.
  void Add(std::vector<Edit>& edits, Edit edit) const;

  const Question& question_;
  const Evidence& evidence_;
  Policy policy_;
};

// "KEY-OF-" and the start of a key's fingerprint.
std::string KeyWord(DExpression& key);
// A path as a word that no option parser takes for an option.
std::string PathWord(const std::string& path);
// Notes the name of a file among the words that a stranger may have chosen, if it is no plain word.
void NoteName(Remedy& remedy, const std::string& path);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_EDITS_H
