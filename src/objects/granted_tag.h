// SPDX-License-Identifier: Apache-2.0
// The reduction's answer is canonical text that looks like a list of ACL entries. It is read here,
// below both who makes it (engine/interface) and who offers the reader to callers (AclEntry).
#ifndef VESK2_SRC_OBJECTS_GRANTED_TAG_H
#define VESK2_SRC_OBJECTS_GRANTED_TAG_H

#include <vesk2/expression.h>

namespace ZvVesk2 {

// ReadGrantedTag returns the tag of the first entry of
//
//   (3:acl(5:entry SUBJECT [(9:propagate)] TAG ...)...)
//
// The reduction writes no version; where there is one it is taken for the subject and the subject
// for the tag. VESK2_ERR_INVALID_PARAM for null or no bytes and for an `out` that is not null, else
// the code of the reader that stopped.
[[nodiscard]] int ReadGrantedTag(SExpression*& out, unsigned char* data, unsigned int length,
                                 Vesk2ContextStruct* ctx);

}  // namespace ZvVesk2

#endif  // VESK2_SRC_OBJECTS_GRANTED_TAG_H
