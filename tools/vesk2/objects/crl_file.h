// SPDX-License-Identifier: Apache-2.0
// crl_file.h: revocation lists in files, and the tags that name where they come from.
#ifndef VESK2_TOOLS_CRL_FILE_H
#define VESK2_TOOLS_CRL_FILE_H

#include <string>

#include "tools/vesk2/objects/objects.h"

#include <vesk2/crl.h>

namespace vesk2_command {

using ZvVesk2::CrlSequence;

// Whether a tag ends in (revoke ...). The store loads the lists of such tags only.
bool IsRevocationTag(const SExpression* tag);
// ParseTag, with Trouble for one that does not.
Ref<SExpression> ParseRevocationTag(const std::string& text, const char* keyword = "tag");

// A revocation list file. Trouble names the byte where it stops making sense.
Ref<CrlSequence> ReadCrl(const std::string& path);

// CheckIssuerWord returns the code of a list's digest and signature, whoever its issuer is; 0 when
// both hold.
int CheckIssuerWord(CrlSequence& list);
// Why the ACL entries do not vouch for a list, by the code of CrlSequence::VerifySelf, in words.
std::string WhyNotVouched(CrlSequence& list, int code);
// "TAG by ISSUER, from STAMP until STAMP".
std::string CrlText(CrlSequence& list);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_CRL_FILE_H
