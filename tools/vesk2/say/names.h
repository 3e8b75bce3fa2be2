// SPDX-License-Identifier: Apache-2.0
// names.h: the pet names of keys in what the command says.
//
// A name stands beside a fingerprint, never in its place: "alice (sha256:...)", and for machines a
// member of its own. What is not a whole fingerprint is left as it is.
#ifndef VESK2_TOOLS_NAMES_H
#define VESK2_TOOLS_NAMES_H

#include <map>
#include <nlohmann/json.hpp>
#include <string>

namespace vesk2_command {

// Pet names by fingerprint; each can be shown as it is.
using KeyNames = std::map<std::string, std::string>;

// UseNames sets the names that are shown from now on.
void UseNames(KeyNames names);

// WithNames puts the name before each fingerprint of a text that has one.
std::string WithNames(const std::string& text);
// AddNames puts beside each member that is a fingerprint one with "_name" appended, and beside each
// list of them one with "_names": the name, or null.
void AddNames(nlohmann::ordered_json& value);

// Whether a text is a whole fingerprint: "sha256:" and 64 digits.
bool IsFingerprint(const std::string& text);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_NAMES_H
