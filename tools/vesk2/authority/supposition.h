// SPDX-License-Identifier: Apache-2.0
// supposition.h: --if-revoked, --if-without and --if-at: an answer about a machine that differs in
// these. The library judges a changed copy of what it read; nothing is stored, and the answer says
// in its first line that it is hypothetical.
#ifndef VESK2_TOOLS_SUPPOSITION_H
#define VESK2_TOOLS_SUPPOSITION_H

#include <string>
#include <vector>

#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/objects/times.h"
#include "tools/vesk2/options/options.h"

#include <vesk2/evidence.h>

namespace vesk2_command {

struct SuppositionOptions {
  std::vector<std::string> revoked;
  std::vector<std::string> without;
  std::string at;
};
// --if-at excludes the options of `list` that ask about another moment.
void AddSuppositionOptions(OptionList& list, SuppositionOptions& options);
// Whether any of them was given.
bool IsHypothetical(const SuppositionOptions& options);

class Supposition {
 public:
  // Nothing is supposed.
  Supposition() = default;
  // Reads what is named. Every verdict then begins with it, and the result tells of it.
  explicit Supposition(const SuppositionOptions& options);
  // These digests are revoked.
  explicit Supposition(std::vector<Ref<ZvVesk2::Hash>> revoked)
      : any_(true), revoked_(std::move(revoked)) {}

  bool Any() const { return any_; }
  // What the clock shows.
  Ref<TimeStamp> Now() const;
  // The entries that are there then. Trouble for a name that none of `entries` has.
  Ref<SExpression> Entries(SExpression* entries) const;
  // Has what is revoked then count as revoked, whenever the evidence is judged.
  void Revoke(ZvVesk2::Evidence& evidence) const;
  // Both, for evidence that holds its entries; it must be judged anew.
  void Change(ZvVesk2::Evidence& evidence) const;
  // What the answer is as things are, which the result and a note tell beside the other.
  static void TellAsItIs(int code);
  static void TellAsItIs(bool yes, const std::string& reason, int code, const std::string& why);

 private:
  void AddRevoked(const std::string& argument);

  bool any_ = false;
  std::vector<Ref<ZvVesk2::Hash>> revoked_;
  std::vector<std::string> without_;
  Ref<TimeStamp> at_;
};

// ParseFingerprint reads "sha256:" and 64 digits; null for any other text.
Ref<ZvVesk2::Hash> ParseFingerprint(const std::string& text);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_SUPPOSITION_H
