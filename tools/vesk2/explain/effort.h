// SPDX-License-Identifier: Apache-2.0
// effort.h: what an explanation may cost. Whoever wrote what is judged can make each question about
// it expensive, and an explanation asks hundreds: it stops at a small multiple of the answer's
// cost.
#ifndef VESK2_TOOLS_EFFORT_H
#define VESK2_TOOLS_EFFORT_H

#include <cstdint>

#include <vesk2/evidence.h>

namespace vesk2_command {

// StartAnswer begins an answer, StartEffort its explanation.
void StartAnswer();
void StartEffort();
// StartSearch begins an answer that is a search itself, over certificates that others wrote: it may
// cost some seconds.
void StartSearch();
// SpendEffort throws the Trouble that ends it when it has cost too much; the first form also counts
// one judgement of the evidence. Nothing is counted before StartEffort.
void SpendEffort(const ZvVesk2::Evidence& judged);
void SpendEffort();
void SpendEffort(uint64_t bytes);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_EFFORT_H
