// SPDX-License-Identifier: Apache-2.0
// shapes.h: what machines are told of an object, one shape for each kind wherever it is told. Every
// member is always there, null where the object says nothing; no tag is no limit.
#ifndef VESK2_TOOLS_SHAPES_H
#define VESK2_TOOLS_SHAPES_H

#include "tools/vesk2/objects/crl_file.h"
#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/objects/times.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/acl_entry.h>
#include <vesk2/cert.h>
#include <vesk2/hash.h>

namespace vesk2_command {

Json StampJson(const TimeStamp* stamp);
// {"not_before", "not_after"}.
Json PeriodJson(const Period& period);
Json TagJson(SExpression* tag);
Json TextJson(const ByteString* text);
// "key", "hash" or "k-of-n".
const char* SubjectKind(const ZvVesk2::Subject& subject);
// {"k", "n", "members"} of a k-of-n, else null.
Json ThresholdJson(ZvVesk2::Subject& subject);
// {"holds", "reason", "code"} of a checked signature.
Json SignatureJson(int code);

// What the lists say of a certificate: its source, and the rest where they were asked.
Json RevocationJson(const ZvVesk2::Cert& cert);
// A certificate. Its number and signature, and the third item of its triple as "owner" or "extra",
// are null until the caller puts them there.
Json CertJson(const ZvVesk2::Cert& cert);
// An ACL entry; `file` is null for one that is in no store yet.
Json EntryJson(const ZvVesk2::AclEntry& entry, const Json& file);

// The items of one list of a Crl, each {"digest", "from"}. One with a digest of nothing has the
// list count although it revokes nothing; it is left out.
Json ItemsJson(const SExpression& items);
bool IsDummy(const ZvVesk2::Hash& hash);
// A revocation list with what vouches for it.
Json CrlJson(CrlSequence& list);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_SHAPES_H
