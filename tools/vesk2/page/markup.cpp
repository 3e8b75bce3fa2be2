// SPDX-License-Identifier: Apache-2.0
// markup.cpp: HTML that is XML.
#include "tools/vesk2/page/markup.h"

#include <cstdint>

#include "tools/vesk2/page/letters.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

// Escape leaves these alone: they are no letters for XML, or turn lines without being seen.
bool IsUnfit(char32_t point) {
  return point == 0x61c || (point & 0xfffeU) == 0xfffe || (point >= 0xfdd0 && point <= 0xfdef);
}

void AppendPoint(std::string& out, std::string_view letter, char32_t point) {
  switch (point) {
    case '&':
      out += "&amp;";
      return;
    case '<':
      out += "&lt;";
      return;
    case '>':
      out += "&gt;";
      return;
    case '"':
      out += "&quot;";
      return;
    case '\'':
      out += "&#39;";
      return;
    default:
      break;
  }
  if (IsUnfit(point)) {
    for (const char byte : letter) out += "\\x" + Hex({&byte, 1});
  } else if (point < 0x80) {
    out += letter;
  } else {
    out += "&#" + std::to_string(static_cast<uint32_t>(point)) + ";";
  }
}

}  // namespace

std::string MarkupText(std::string_view text) {
  std::string out;
  for (;;) {
    const size_t slash = text.find('\\');
    const std::string piece = Escape(text.substr(0, slash));
    for (LetterReader letters(piece); letters.Next();) {
      AppendPoint(out, letters.letter(), letters.point());
    }
    if (slash == std::string_view::npos) return out;
    out += '\\';
    text.remove_prefix(slash + 1);
  }
}

void Markup::Begin(const char* name, Attributes attributes) {
  text_ += std::string("<") + name;
  for (const auto& [attribute, value] : attributes) {
    text_ += std::string(" ") + attribute + "=\"" + MarkupText(value) + "\"";
  }
}

Markup& Markup::Open(const char* name, Attributes attributes) {
  Begin(name, attributes);
  text_ += ">";
  open_.push_back(name);
  return *this;
}

Markup& Markup::Close() {
  text_ += std::string("</") + open_.back() + ">\n";
  open_.pop_back();
  return *this;
}

Markup& Markup::Text(std::string_view text) {
  text_ += MarkupText(text);
  return *this;
}

Markup& Markup::Leaf(const char* name, std::string_view text, Attributes attributes) {
  return Open(name, attributes).Text(text).Close();
}

Markup& Markup::Void(const char* name, Attributes attributes) {
  Begin(name, attributes);
  text_ += "/>\n";
  return *this;
}

Markup& Markup::Style(const char* sheet) {
  Open("style");
  text_ += sheet;
  return Close();
}

std::string Markup::Take() {
  while (!open_.empty()) Close();
  return "<!DOCTYPE html>\n" + text_;
}

}  // namespace vesk2_command
