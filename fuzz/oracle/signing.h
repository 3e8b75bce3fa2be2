// SPDX-License-Identifier: Apache-2.0
// Signs what a mutation has changed, with one small key that is no secret.
#ifndef VESK2_FUZZ_SIGNING_H
#define VESK2_FUZZ_SIGNING_H

#include <string>
#include <string_view>
#include <vector>

namespace vesk2fuzz {

// The elements of the canonical list that a text begins with; empty when it begins with none.
std::vector<std::string_view> Elements(std::string_view list);

// The key that signs, and a manifest in which it speaks for everything: each certificate is issued
// by it, and each signature and digest is made anew. Empty for what has not the form of a manifest.
std::string SignersKey();
std::string SignedAgain(std::string_view manifest);

}  // namespace vesk2fuzz

#endif  // VESK2_FUZZ_SIGNING_H
