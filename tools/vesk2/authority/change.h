// SPDX-License-Identifier: Apache-2.0
// change.h: when an answer about authority becomes another by itself, and why.
//
// It can change only where something that was read begins or ends: an entry, a certificate, a list,
// or a revocation that a list announces. The library is asked about each of these moments in turn.
#ifndef VESK2_TOOLS_CHANGE_H
#define VESK2_TOOLS_CHANGE_H

#include <functional>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/objects/request.h"
#include "tools/vesk2/objects/times.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/cert.h>
#include <vesk2/evidence.h>

namespace vesk2_command {

// The first seconds at which something is otherwise than the second before.
class Moments {
 public:
  void AddPeriod(const TimeStamp* notBefore, const TimeStamp* notAfter);
  void AddEntries(const SExpression* entries);
  void AddLists(const SExpression* lists);
  void AddCert(const ZvVesk2::Cert& cert);
  void AddSecond(long second) { seconds_.insert(second); }
  // The first after `from` at which `answer` is not what it is at `from`.
  std::optional<long> FirstChange(long from, const std::function<bool(TimeStamp*)>& answer) const;

 private:
  std::set<long> seconds_;
};

// The code of all that is asked: 0, or the first refusal.
int JudgeMembers(ZvVesk2::Evidence& evidence, const Request& request);

Ref<TimeStamp> StampOf(long second);

// What makes an answer another one at a moment.
struct Cause {
  std::string kind;         // as a reason's: see Explanation::Word
  std::string text;         // "certificate signer.cert:1 ends"
  std::string certificate;  // its place; empty for none
  std::string entry;
  std::string source;  // of revocation lists
};
// FindCause looks at evidence that says no on one side of `second`; `places` are those of its
// certificates.
Cause FindCause(ZvVesk2::Evidence& refused, const Request& request, long second,
                const std::vector<std::string>& places);
Json CauseJson(const Cause& cause);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_CHANGE_H
