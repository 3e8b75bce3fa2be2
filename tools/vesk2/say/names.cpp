// SPDX-License-Identifier: Apache-2.0
// names.cpp: pet names beside fingerprints.
#include "tools/vesk2/say/names.h"

#include <algorithm>
#include <string_view>

namespace vesk2_command {
namespace {

using Json = nlohmann::ordered_json;

constexpr std::string_view kLead = "sha256:";
constexpr size_t kDigits = 64;

KeyNames used;

bool IsDigit(char c) { return (c >= '0' && c <= '9') || (c >= 'a' && c <= 'f'); }

bool IsWordByte(char c) {
  return IsDigit(c) || (c >= 'g' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '_' || c == '-' ||
         c == '/' || c == '.';
}

// Whether a whole fingerprint begins at a place of a text.
bool IsFingerprintAt(const std::string& text, size_t at) {
  const size_t digits = at + kLead.size();
  const size_t end = digits + kDigits;
  return text.size() >= end && std::all_of(&text[digits], &text[digits] + kDigits, IsDigit) &&
         (at == 0 || !IsWordByte(text[at - 1])) && (text.size() == end || !IsWordByte(text[end]));
}

Json NameOf(const Json& value) {
  if (!value.is_string()) return {};
  const auto name = used.find(value.get_ref<const std::string&>());
  return name != used.end() ? Json(name->second) : Json();
}

bool IsOneOf(const std::string& word, std::initializer_list<const char*> words) {
  return std::ranges::any_of(words, [&](const char* each) { return word == each; });
}

bool IsKeyText(const Json& value) {
  return value.is_string() && IsFingerprint(value.get_ref<const std::string&>());
}

// Members that are always there have a name beside them also when nothing is known.
bool IsKeyMember(const std::string& member, const Json& value) {
  if (value.is_null() || value.is_string()) {
    if (IsOneOf(member, {"fingerprint", "issuer", "signer", "subject"})) return true;
  }
  return member != "tag_digest" && IsKeyText(value);
}

bool IsKeyList(const std::string& member, const Json& value) {
  if (!value.is_array() || IsOneOf(member, {"commands", "foreign_words"})) return false;
  if (IsOneOf(member, {"approved", "approved_by", "would_count"})) return true;
  return !value.empty() && std::ranges::all_of(value, IsKeyText);
}

}  // namespace

void UseNames(KeyNames names) { used = std::move(names); }

bool IsFingerprint(const std::string& text) {
  return text.size() == kLead.size() + kDigits && text.starts_with(kLead) &&
         IsFingerprintAt(text, 0);
}

std::string WithNames(const std::string& text) {
  if (used.empty()) return text;
  std::string named;
  size_t told = 0;
  for (size_t at = text.find(kLead); at != std::string::npos; at = text.find(kLead, at + 1)) {
    if (!IsFingerprintAt(text, at)) continue;
    const std::string fingerprint = text.substr(at, kLead.size() + kDigits);
    const auto name = used.find(fingerprint);
    if (name == used.end()) continue;
    named += text.substr(told, at - told) + name->second + " (" + fingerprint + ")";
    told = at + fingerprint.size();
  }
  return named + text.substr(told);
}

void AddNames(Json& value) {
  if (value.is_array()) {
    for (Json& each : value) AddNames(each);
  }
  if (!value.is_object()) return;
  Json named = Json::object();
  for (auto& [member, each] : value.items()) {
    AddNames(each);
    Json names = Json::array();
    const bool list = IsKeyList(member, each);
    if (list) std::ranges::transform(each, std::back_inserter(names), NameOf);
    const bool one = IsKeyMember(member, each);
    Json name = NameOf(each);
    named[member] = std::move(each);
    if (one) named[member + "_name"] = std::move(name);
    if (list) named[member + "_names"] = std::move(names);
  }
  value = std::move(named);
}

}  // namespace vesk2_command
