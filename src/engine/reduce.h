// SPDX-License-Identifier: Apache-2.0
// Tuple reduction: ACL entries and certificates become 5-tuples (issuer, subject, propagate, tag,
// validity), which are combined until it is known which grants of the ACL reach the requester.
//
//   the ACL grants A, who may delegate, (tag (install))             ( -, A, yes, (tag (install)))
//   A certifies B for (tag (install (app calc)))                    (A, B, no, ...)
//   together                                                        ( -, B, no, (tag (install
//                                                                                (app calc))))
//
// The engine does not look at signatures and revocation: it takes every certificate for genuine.
#ifndef VESK2_SRC_ENGINE_REDUCE_H
#define VESK2_SRC_ENGINE_REDUCE_H

#include "src/engine/model.h"

namespace ZvVesk2::Engine {

// spki_reduce reduces `acl` and `sequence` (chains; borrowed, never disposed here) for the
// principal `third` (null: any), the tag `requestedTag` and the validity `fifth` (both may be
// null), and stores the list (acl (entry ...) ...) of what is granted in *result, for the caller to
// release. Entries in `sequence` and certificates in `acl` are ignored: an (entry ...) in an
// untrusted sequence would be a trust root. Everything that the tables held is released before it
// returns.
[[nodiscard]] spki_status spki_reduce(spki_engine* engine, spki_elem* acl, spki_elem* sequence,
                                      spki_elem* third, spki_elem* requestedTag, spki_elem* fifth,
                                      spki_elem** result);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_REDUCE_H
