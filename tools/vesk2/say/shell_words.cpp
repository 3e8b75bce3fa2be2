// SPDX-License-Identifier: Apache-2.0
// shell_words.cpp: quoting for shells.
#include "tools/vesk2/say/shell_words.h"

#include <algorithm>
#include <string_view>

namespace vesk2_command {
namespace {

bool IsPrintable(char c) { return c >= ' ' && c <= '~'; }

bool IsPlain(char c) {
  const bool letter = (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9');
  return letter || std::string_view("-_./:=,+@%").find(c) != std::string_view::npos;
}

// A byte within $'...'. An interactive shell looks for "!" before it looks for quotes, and a shell
// that does not know $'...' ends the quotes at the first "'": bytes that mean something anywhere
// are numbers.
std::string AnsiByte(char c) {
  const bool special = std::string_view("'\"`$\\!").find(c) != std::string_view::npos;
  if (IsPrintable(c) && !special) return {c};
  const unsigned byte = static_cast<unsigned char>(c);
  std::string text = "\\";
  for (const unsigned shift : {6U, 3U, 0U}) text += static_cast<char>('0' + ((byte >> shift) & 7));
  return text;
}

std::string AnsiQuoted(const std::string& word) {
  std::string text = "$'";
  for (const char c : word) text += AnsiByte(c);
  return text += '\'';
}

// What JSON can hold comes back as it was.
bool IsUtf8(const std::string& word) {
  return Json::parse(Json(word).dump(-1, ' ', false, Json::error_handler_t::ignore)) == word;
}

}  // namespace

std::string ShellWord(const std::string& word) {
  const bool plain = std::all_of(word.begin(), word.end(), IsPlain);
  if (plain && !word.empty() && word[0] != '=') return word;  // zsh looks for a program behind it
  if (!std::all_of(word.begin(), word.end(), IsPrintable)) return AnsiQuoted(word);
  std::string text = "'";
  for (const char c : word) {
    if (c == '\'') text += "'\\'";
    text += c;
  }
  text += '\'';
  return text;
}

std::string ShellLine(const std::vector<std::string>& words) {
  std::string line;
  for (const std::string& word : words) {
    if (!line.empty()) line += ' ';
    line += ShellWord(word);
  }
  return line;
}

Json JsonWord(const std::string& word) {
  return IsUtf8(word) ? Json(word) : Json{{"hex", Hex(word)}};
}

Json JsonWords(const std::vector<std::string>& words) {
  Json list = Json::array();
  for (const std::string& word : words) list.push_back(JsonWord(word));
  return list;
}

}  // namespace vesk2_command
