// SPDX-License-Identifier: Apache-2.0
// no_store.h: the answer of a machine that trusts nobody.
#ifndef VESK2_TOOLS_NO_STORE_H
#define VESK2_TOOLS_NO_STORE_H

#include "tools/vesk2/explain/evidence.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {

// RefuseWithoutStore answers a question for which no entry could be loaded: no, and what would make
// it a yes, where there is none. It throws the Trouble, with `code` as the library's, where there
// is a store and it cannot be read. The question is the same afterwards.
ExitCode RefuseWithoutStore(Question& question, int code);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_NO_STORE_H
