// SPDX-License-Identifier: Apache-2.0
// What the two ways of verifying a sequence share: walking its triples, asking the stores about its
// certificates, and copying them for the reduction.
#ifndef VESK2_SRC_TRUST_CHAIN_H
#define VESK2_SRC_TRUST_CHAIN_H

#include <vesk2/cert.h>
#include <vesk2/ref.h>
#include <vesk2/signature.h>

namespace ZvVesk2 {

// One triple of a sequence, borrowed. An item of another kind is null: anybody can insert anything.
struct ChainLink {
  Cert* cert = nullptr;
  Signature* signature = nullptr;
  DExpression* extra = nullptr;
};

// FirstItem is the place behind the keyword of a sequence.
SExpression::Iterator FirstItem(const SExpression* sequence);
// ReadLink reads three items from `at`, and leaves it at the third. VESK2_ERR_INVALID_SEQUENCE when
// there are fewer.
[[nodiscard]] int ReadLink(ChainLink& link, SExpression::Iterator& at);
// ReadWholeLink also insists on the kinds (VESK2_ERR_INVALID_SEQUENCE), and moves on to the next
// triple.
[[nodiscard]] int ReadWholeLink(ChainLink& link, SExpression::Iterator& at);

// LoadRoots loads the ACL store. A store that is absent or empty, or whose last file cannot be
// read, is VESK2_ERR_ACL_ENTRY_NOT_FOUND: nobody is trusted then. A lack of memory and a file that
// another process holds (VESK2_ERR_READ_FILE) are no absence and come through.
[[nodiscard]] int LoadRoots(Ref<SExpression>& acls, Vesk2ContextStruct* ctx);

// The two changes that a chain makes to a certificate, each in a clone that shares the other parts.
// AppendIrrevocable leaves out the revocation element, which the reduction knows nothing of.
// AppendPropagating lets it pass its grant on, whatever it says.
[[nodiscard]] int AppendIrrevocable(SExpression* chain, const Cert& cert);
[[nodiscard]] int AppendPropagating(SExpression* chain, const Cert& cert);

}  // namespace ZvVesk2

#endif  // VESK2_SRC_TRUST_CHAIN_H
