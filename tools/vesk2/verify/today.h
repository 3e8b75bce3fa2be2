// SPDX-License-Identifier: Apache-2.0
// today.h: a manifest's authority with what is known about revocation now.
//
// The signer writes the time of signing. A key that was lost can write any, so a certificate that
// is revoked by now counts as revoked, whenever the manifest says that it was signed. The periods
// are judged at the time of signing all the same: certificates end, and what they were used for in
// their time stands.
#ifndef VESK2_TOOLS_TODAY_H
#define VESK2_TOOLS_TODAY_H

#include "tools/vesk2/explain/evidence.h"

namespace vesk2_command {

class Today {
 public:
  // `proved` is what the verification kept, by the time of signing; `now` is what the clock shows.
  Today(const ZvVesk2::Evidence& proved, TimeStamp& now);

  // What a verification would answer today about the authority for a tag.
  int Judge(SExpression* tag) const;
  // The same evidence, asked about revocation now.
  const ZvVesk2::Evidence& evidence() const { return today_; }
  // The no for a manifest that was authorized when it says that it was signed. `question` is about
  // evidence().
  ExitCode Refuse(const Question& question, int code) const;

 private:
  const ZvVesk2::Evidence& proved_;
  ZvVesk2::Evidence today_;
};

// Clocks of machines that sign and verify differ by less, in seconds.
inline constexpr long kClockDifference = 300;
// Whether a manifest claims to be signed later than that.
bool IsSignedInFuture(const ZvVesk2::Evidence& proved, const TimeStamp& now);
// "; certificate 2 ended at STAMP" for each certificate that has ended by then.
std::string EndedSince(const ZvVesk2::Evidence& proved, const TimeStamp& now);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_TODAY_H
