// edits.h: single changes that may mend a refusal: each as an object for a hypothesis, and as the
// command lines that make it.
#ifndef VESK2_TOOLS_EDITS_H
#define VESK2_TOOLS_EDITS_H

#include <string>
#include <vector>

#include "tools/vesk2/authority.h"
#include "tools/vesk2/hypothesis.h"
#include "tools/vesk2/remedy.h"

namespace vesk2_command {

struct Edit {
  Remedy remedy;
  int cost = 0;        // the lower, the less it changes
  std::string target;  // what it changes; two edits of one thing exclude each other
  // What it puts in place.
  size_t index = 0;
  Ref<ZvVesk2::Cert> cert = {};
  std::string file = {};  // of the entry
  Ref<ZvVesk2::AclEntry> entry = {};
  Ref<SExpression> fresh = {};
};
void Apply(const Edit& edit, Hypothesis& hypothesis);

// Edits to one question.
class EditMaker {
 public:
  EditMaker(const Question& question, const Evidence& evidence)
      : question_(question), evidence_(evidence) {}

  // Renews a certificate: as it stands, so that it covers what was asked, or so that it covers the
  // whole period of that too.
  enum class Reach { kAsItIs, kAsked, kWholePeriod };
  void Renew(std::vector<Edit>& edits, size_t index, Reach reach) const;
  // Widens an entry of the store in what it lacks.
  void Widen(std::vector<Edit>& edits, const EntryEvidence& entry) const;
  // Trusts the issuer of a certificate for what was asked.
  void GrantIssuer(std::vector<Edit>& edits, size_t index) const;
  // Trusts whom a chain is for.
  void GrantSubject(std::vector<Edit>& edits) const;
  // Has a current list of a certificate's revocation source made and imported.
  void FreshList(std::vector<Edit>& edits, size_t index) const;
  // Trusts the signer of the stored list of that source.
  void TrustList(std::vector<Edit>& edits, size_t index) const;

 private:
  std::string At(size_t index) const;
  bool Covers(SExpression* tag) const;
  // Fills in a grant of `tag` to a key; `who` are the options that name it.
  void FillGrant(Edit& edit, PublicKey* key, const std::vector<std::string>& who,
                 const std::string& tag, bool propagate, const std::string& prefix) const;

  const Question& question_;
  const Evidence& evidence_;
};

// "KEY-OF-" and the start of a key's fingerprint.
std::string KeyWord(DExpression& key);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_EDITS_H
