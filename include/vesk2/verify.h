// SPDX-License-Identifier: Apache-2.0
// verify.h: the two reductions, which decide what a chain of credentials grants.
//
// Results are library codes or, negative, the engine's SPKI_ERR_* codes (texts: V2SpkiError). One
// credential that the engine cannot read (an empty byte string, a hash other than sha1 and sha256,
// a k-of-n with k = 0 or k > n) makes the whole reduction fail: one odd file in the ACL store stops
// all verification. Work and memory are bounded, and so is what is granted in all
// (Limits::kMaxResult bytes; for ReductA the first entry alone): what is more is SPKI_ERR_NO_MEM,
// and a k-of-n that takes too long to search SPKI_ERR_THRESHOLD.
#ifndef VESK2_VERIFY_H
#define VESK2_VERIFY_H

#include <vesk2/expression.h>

#include <cstdint>

namespace ZvVesk2::Verify {

// ReductA decides whether the ACL entries in `acl` and the certificates in `sequence` (whose
// signatures the caller has checked) grant `requestedTag` to `third`, a key or a hash, for the
// period `fifth`, a (valid ...) list or null. Only the first granted entry is compared with the
// request.
//   0                              granted
//   VESK2_ERR_INVALID_PARAM        an argument other than `fifth` is null
//   VESK2_ERR_NOT_AUTHORIZED       nothing is granted
//   VESK2_ERR_PACKAGE_NOT_GRANTED  less than the tag is granted
//   VESK2_ERR_MEM_ALLOC, SPKI_ERR_*
[[nodiscard]] VESK2_API int ReductA(Vesk2ContextStruct* ctx, SExpression* acl,
                                    SExpression* sequence, SExpression* third,
                                    SExpression* requestedTag, SExpression* fifth);

// ReductB returns what the chain grants to `third`: the tag and the dates, as new lists for the
// caller to free, each null when the grant has none. An empty result is a success with all three
// null; of several grants, what is found last is returned, tag and dates each for themselves. The
// outputs must be null (VESK2_ERR_PARAM_NOT_NULL) and are null again after a failure.
// VESK2_ERR_INVALID_PARAM for a null argument, VESK2_ERR_MEM_ALLOC, SPKI_ERR_*.
[[nodiscard]] VESK2_API int ReductB(Vesk2ContextStruct* ctx, SExpression* acl,
                                    SExpression* sequence, SExpression* third, SExpression*& tag,
                                    SExpression*& notBefore, SExpression*& notAfter);

// WorkDone is the work that reductions and tag comparisons have done in this thread so far, in
// steps of some ten nanoseconds: the difference of two calls tells what came between them. A caller
// who asks more than once about what a stranger wrote stops by it.
[[nodiscard]] VESK2_API uint64_t WorkDone();

}  // namespace ZvVesk2::Verify

#endif  // VESK2_VERIFY_H
