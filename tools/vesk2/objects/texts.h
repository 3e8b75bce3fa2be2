// SPDX-License-Identifier: Apache-2.0
// texts.h: subjects, periods and revocation sources in words.
#ifndef VESK2_TOOLS_TEXTS_H
#define VESK2_TOOLS_TEXTS_H

#include <string>

#include "tools/vesk2/objects/times.h"

#include <vesk2/subject.h>

namespace vesk2_command {

using ZvVesk2::SExpression;

// "sha256:" and a digest, of a key or of what a hash names; the members of a k-of-n.
std::string SubjectText(ZvVesk2::Subject& subject);
// "from STAMP until STAMP", as far as given; "at STAMP" for one moment.
std::string PeriodText(const TimeStamp* notBefore, const TimeStamp* notAfter);
// What a revocation element says after its keyword: the tag of the lists to ask.
std::string SourceText(SExpression& element);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_TEXTS_H
