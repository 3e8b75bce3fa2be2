// SPDX-License-Identifier: Apache-2.0
// tell_facts.h: what an answer rests on, as lines for people and as members for machines.
#ifndef VESK2_TOOLS_TELL_FACTS_H
#define VESK2_TOOLS_TELL_FACTS_H

#include <string>

#include "tools/vesk2/explain/evidence.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {

// A revocation list as what was asked: who made it, until when it counts, and how old it is.
Json ListJson(const CrlSequence& list);
std::string ListText(const Json& list);

// What the lists say of a certificate of evidence that was judged.
Json AskedRevocation(const ZvVesk2::Evidence& proved, size_t index);
// ToldCert is a certificate of an answer for machines, with what its signature is worth and what
// the lists say of it.
Json ToldCert(const Evidence& evidence, size_t index);

// TellFacts tells of the certificates, and of the entries that name one of their keys: "chain" and
// "acl" of the result.
void TellFacts(const Evidence& evidence);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_TELL_FACTS_H
