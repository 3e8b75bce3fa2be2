// SPDX-License-Identifier: Apache-2.0
// The records of explanations.
#ifndef VESK2_SRC_FRAME_FLAT_EXPLANATIONS_H
#define VESK2_SRC_FRAME_FLAT_EXPLANATIONS_H

#include <vesk2/evidence.h>
#include <vesk2/manifest.h>

namespace ZvVesk2 {

struct Answer {
  const Evidence& evidence;
  int code;
  // What was found about authority: the answer, unless that is about a tree, before which authority
  // was proved.
  int authority;
  SExpression* tag;
  const char* path;  // of the file, and of the directory of further entries; or null
  const char* extraAclDirectory;
};

// ExplainAnswer makes the record of an answer; null without memory, which changes no answer.
Vesk2ExplanationStruct* ExplainAnswer(const Answer& answer);
// CountEntries fills in what a comparison found.
void CountEntries(Vesk2ExplanationStruct& record, const Manifest& manifest);

}  // namespace ZvVesk2

#endif  // VESK2_SRC_FRAME_FLAT_EXPLANATIONS_H
