// SPDX-License-Identifier: Apache-2.0
// token_uri.cpp: PKCS#11 URIs.
#include "tools/vesk2/keys/token_uri.h"

#include <algorithm>
#include <set>

#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

// The URI being read, for trouble: its text, but not its PIN.
[[noreturn]] void Refuse(const std::string& uri, const std::string& text) {
  throw Trouble(Escape(ShownTokenUri(uri)) + ": " + text, "usage");
}

int Digit(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  return c >= 'A' && c <= 'F' ? c - 'A' + 10 : -1;
}

std::string Decoded(const std::string& uri, std::string_view text) {
  std::string bytes;
  for (size_t at = 0; at < text.size(); ++at) {
    if (text[at] != '%') {
      bytes += text[at];
      continue;
    }
    const int high = at + 2 < text.size() ? Digit(text[at + 1]) : -1;
    const int low = at + 2 < text.size() ? Digit(text[at + 2]) : -1;
    if (high < 0 || low < 0) Refuse(uri, "% is not followed by two hexadecimal digits");
    bytes += static_cast<char>(high * 16 + low);
    at += 2;
  }
  return bytes;
}

// Calls `take` with each NAME and VALUE, as they stand.
template <typename Take>
void ForEachPart(const std::string& uri, std::string_view text, char separator, const Take& take) {
  std::set<std::string_view> seen;
  while (!text.empty()) {
    const std::string_view part = text.substr(0, text.find(separator));
    text.remove_prefix(std::min(part.size() + 1, text.size()));
    const size_t sign = part.find('=');
    const std::string_view name = part.substr(0, sign);
    if (sign == std::string_view::npos || sign + 1 == part.size()) {
      Refuse(uri, "\"" + Escape(name) + "\" has no value");
    }
    if (!seen.insert(name).second) Refuse(uri, Escape(name) + " is there twice");
    take(name, part.substr(sign + 1));
  }
}

void TakePath(const std::string& uri, std::string_view path, TokenUri& result) {
  bool named = false;
  ForEachPart(uri, path, ';', [&](std::string_view name, std::string_view value) {
    const std::string bytes = Decoded(uri, value);
    const bool key = name == "object" || name == "id";
    const bool token =
        name == "token" || name == "serial" || name == "manufacturer" || name == "model";
    if (name == "object") result.object = bytes;
    if (name == "type" && (bytes == "private" || bytes == "public")) return;
    if (!key && !token) Refuse(uri, Escape(name) + " is not understood here");
    const std::string part = std::string(name) + "=" + std::string(value);
    result.path += (result.path.empty() ? "" : ";") + part;
    if (token) result.token += part + ";";
    named = named || key;
  });
  result.path.insert(0, kTokenScheme);
  if (!named) Refuse(uri, "names no key: object=NAME, id=%01");
}

void TakePinSource(const std::string& uri, std::string source, TokenUri& result) {
  constexpr std::string_view kFile = "file:";
  if (source.rfind(kFile, 0) == 0) source.erase(0, kFile.size());
  if (source.rfind("//", 0) == 0) source.erase(0, 2);
  if (source.empty() || source[0] == '|') Refuse(uri, "pin-source is not a file");
  result.pin.file = source;
}

void TakeQuery(const std::string& uri, std::string_view query, TokenUri& result) {
  ForEachPart(uri, query, '&', [&](std::string_view name, std::string_view value) {
    const std::string bytes = Decoded(uri, value);
    if (name == "module-path") {
      // A bare name would be looked for, and found where others may write.
      if (bytes[0] != '/') Refuse(uri, "module-path is not absolute");
      result.modulePath = bytes;
    } else if (name == "pin-source") {
      TakePinSource(uri, bytes, result);
    } else if (name == "pin-value") {
      result.pin.given = std::make_shared<const Secret>(bytes);
    } else {
      Refuse(uri, Escape(name) + " is not understood here");
    }
  });
  if (result.pin.given && !result.pin.file.empty()) Refuse(uri, "pin-value and pin-source");
}

}  // namespace

TokenUri ParseTokenUri(const std::string& uri) {
  TokenUri result;
  const std::string_view rest = std::string_view(uri).substr(kTokenScheme.size());
  const size_t mark = rest.find('?');
  TakePath(uri, rest.substr(0, mark), result);
  if (mark != std::string_view::npos) TakeQuery(uri, rest.substr(mark + 1), result);
  return result;
}

// Without the query, and without a PIN that stands before the "?" by mistake.
std::string ShownTokenUri(const std::string& uri) {
  std::string shown = uri.substr(0, uri.find('?'));
  for (const char* pin : {":pin-", ";pin-", "&pin-"})
    shown.resize(std::min(shown.find(pin), shown.size()));
  return shown;
}

}  // namespace vesk2_command
