// SPDX-License-Identifier: Apache-2.0
// verify.h: the two reductions, which decide what a chain of credentials grants.
//
// They decide from what they are given, and look at nothing else: signatures and revocation are the
// caller's to check first. CertSequence::Verify and Manifest::VerifyManifest do all of it.
//
// Results are library codes or, negative, the engine's SPKI_ERR_* codes (texts: V2SpkiError). One
// credential that the engine cannot read (an empty byte string, a hash other than sha1 and sha256,
// a k-of-n with k = 0 or k > n) makes the whole reduction fail: one odd file in the ACL store stops
// all verification. Work and memory are bounded (limits.h), and so is what is granted in all
// (Limits::kMaxResult bytes; for ReductA the first entry alone): what is more is SPKI_ERR_NO_MEM,
// and a k-of-n that takes too long to search SPKI_ERR_THRESHOLD. Answers of the crypto layer that
// the engine does not know count as success; the hashes that it calls give none of these.
//
// What the engine sees is the canonical form without display hints: keys that differ in hints alone
// are one key. In tags, strings are equal up to their first 0 byte.
#ifndef VESK2_VERIFY_H
#define VESK2_VERIFY_H

#include <vesk2/expression.h>

#include <cstdint>

namespace ZvVesk2::Verify {

// ReductA decides whether the ACL entries in `acl` and the certificates in `sequence` (whose
// signatures the caller has checked) grant `requestedTag` to `third`, a key or a hash, for the
// period `fifth`, a (valid ...) list or null. All are borrowed. Only the first granted entry is
// compared with the request.
//
// The period must meet that of each certificate and entry, not lie within it; with a not-after
// alone, whatever ended before it passes, and without a period only the periods of the chain must
// meet one another: ask about one moment, with both stamps the same. A member of a k-of-n counts
// although its key is revoked. A credential without a tag grants whatever is asked.
//   0                                granted
//   VESK2_ERR_INVALID_PARAM          an argument other than `fifth` (or `ctx`) is null
//   VESK2_ERR_NOT_AUTHORIZED         nothing is granted
//   VESK2_ERR_PACKAGE_NOT_GRANTED    less than the tag is granted
//   VESK2_ERR_BUFFER_OVERFLOW        an argument is nested too deeply, or too long
//   VESK2_ERR_MEM_ALLOC, SPKI_ERR_*  see above
[[nodiscard]] VESK2_API int ReductA(Vesk2ContextStruct* ctx, SExpression* acl,
                                    SExpression* sequence, SExpression* third,
                                    SExpression* requestedTag, SExpression* fifth);

// ReductB returns what the chain grants to `third`: the tag and the dates, as new lists for the
// caller to free, each null when the grant has none. An empty result is a success with all three
// null: a null tag is a refusal. Of several grants, what is found last is returned, tag and dates
// each for themselves, so that they may come from different grants, and a list named `not-before`
// or `not-after` inside a tag is taken for a date. Grants without a tag, which ReductA takes for
// whatever is asked, are not told. Ask ReductA about one tag and one moment in order to decide. The
// outputs must be null and are null again after a failure.
//   0                         also when nothing is granted
//   VESK2_ERR_INVALID_PARAM   a null argument other than `ctx`
//   VESK2_ERR_PARAM_NOT_NULL  an output is not null
//   VESK2_ERR_BUFFER_OVERFLOW, VESK2_ERR_MEM_ALLOC, SPKI_ERR_*
//                             as in ReductA
[[nodiscard]] VESK2_API int ReductB(Vesk2ContextStruct* ctx, SExpression* acl,
                                    SExpression* sequence, SExpression* third, SExpression*& tag,
                                    SExpression*& notBefore, SExpression*& notAfter);

// WorkDone is the work that reductions and tag comparisons have done in this thread so far, in
// steps of some ten nanoseconds: the difference of two calls tells what came between them. A caller
// who asks more than once about what a stranger wrote stops by it.
[[nodiscard]] VESK2_API uint64_t WorkDone();

}  // namespace ZvVesk2::Verify

#endif  // VESK2_VERIFY_H
