// texts.cpp: subjects, periods and revocation sources in words.
#include "tools/vesk2/objects/texts.h"

#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/hash.h>

namespace vesk2_command {

using ZvVesk2::Hash;
using ZvVesk2::Subject;
using ZvVesk2::ThresholdSubject;

std::string SubjectText(Subject& subject) {
  if (const auto* hash = dynamic_cast<Hash*>(&subject)) {
    const char* name = hash->GetAlgorithm() == ZVCLM_HASH_SHA256 ? "sha256:"
                       : hash->GetAlgorithm() == ZVCLM_HASH_SHA1 ? "sha1:"
                                                                 : "rmd160:";
    return name + Hex(BytesOf(*hash->GetDigest()));
  }
  auto* threshold = dynamic_cast<ThresholdSubject*>(&subject);
  if (threshold == nullptr) return Fingerprint(subject);
  std::string text = std::to_string(threshold->GetK()) + " of";
  Ref<SExpression> members;
  Check(threshold->GetSubjects(members.Out()), "reading a subject");
  for (auto it = members->Begin(); it; it.Next()) text += " " + Fingerprint(*it.Value());
  return text;
}

std::string PeriodText(const TimeStamp* notBefore, const TimeStamp* notAfter) {
  if (notBefore == nullptr && notAfter == nullptr) return "always";
  if (notBefore != nullptr && notAfter != nullptr && !notBefore->IsBefore(notAfter) &&
      !notBefore->IsAfter(notAfter)) {
    return "at " + StampText(*notBefore);
  }
  const std::string from = notBefore != nullptr ? "from " + StampText(*notBefore) : "";
  const std::string until = notAfter != nullptr ? "until " + StampText(*notAfter) : "";
  return from + (from.empty() || until.empty() ? "" : " ") + until;
}

std::string SourceText(SExpression& element) {
  const Ref<SExpression> source(element.Rest());
  if (!source) throw std::bad_alloc();
  const std::string text = AdvancedText(*source);
  return text.substr(1, text.size() - 2);
}

}  // namespace vesk2_command
