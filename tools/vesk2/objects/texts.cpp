// SPDX-License-Identifier: Apache-2.0
// texts.cpp: subjects, periods and revocation sources in words.
#include "tools/vesk2/objects/texts.h"

#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/wording.h>

namespace vesk2_command {

namespace Wording = ZvVesk2::Wording;

std::string SubjectText(ZvVesk2::Subject& subject) { return Owned(Wording::OfSubject(&subject)); }

std::string PeriodText(const TimeStamp* notBefore, const TimeStamp* notAfter) {
  return Owned(Wording::OfPeriod(notBefore, notAfter));
}

std::string SourceText(SExpression& element) {
  const Ref<SExpression> source(element.Rest());
  if (!source) throw std::bad_alloc();
  const std::string text = AdvancedText(*source);
  return text.substr(1, text.size() - 2);
}

}  // namespace vesk2_command
