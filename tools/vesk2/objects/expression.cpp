// SPDX-License-Identifier: Apache-2.0
// expression.cpp: S-expressions as trees. The library's readers bound how deep lists nest, and with
// it every recursion here.
#include "tools/vesk2/objects/expression.h"

#include <algorithm>

namespace vesk2_command {
namespace {

constexpr size_t kLine = 100;

std::string WordText(const ByteString& word) {
  constexpr size_t kShown = 16;
  const std::string_view bytes = BytesOf(word);
  const std::string text = Escape(bytes);
  const bool binary = text.size() > 2 * bytes.size() || word.GetType() == ByteString::BsBin;
  if (binary && bytes.size() <= kShown) return "#" + Hex(bytes) + "#";
  if (binary) {
    return "#" + Hex(bytes.substr(0, kShown)) + "... " + std::to_string(bytes.size()) + " bytes#";
  }
  const bool plain =
      text == bytes && !bytes.empty() && bytes.find_first_of(" ()\"#") == std::string_view::npos;
  return plain ? text : "\"" + text + "\"";
}

// Appends the text of an expression unless it grows past `limit`; what is then in `text` is of no
// use.
bool AppendInline(DExpression& expression, size_t limit, std::string& text) {
  if (const auto* word = dynamic_cast<ByteString*>(&expression)) {
    text += WordText(*word);
    return text.size() <= limit;
  }
  text += "(";
  for (auto it = static_cast<SExpression&>(expression).Begin(); it; it.Next()) {
    if (text.back() != '(') text += " ";
    if (!AppendInline(*it.Value(), limit, text)) return false;
  }
  text += ")";
  return text.size() <= limit;
}

// The words that a list begins with stand on its first line, everything else below it.
void AppendTree(DExpression& expression, const std::string& indent,
                std::vector<std::string>& lines) {
  std::string line = indent;
  if (AppendInline(expression, std::max(kLine, indent.size() + kLine / 2), line) ||
      !expression.IsSExpression()) {
    return lines.push_back(line);
  }
  line = indent + "(";
  auto it = static_cast<SExpression&>(expression).Begin();
  for (; it && !it.Value()->IsSExpression() && line.size() < kLine; it.Next()) {
    line += (line.back() == '(' ? "" : " ") + InlineText(*it.Value());
  }
  lines.push_back(line);
  for (; it; it.Next()) AppendTree(*it.Value(), indent + "  ", lines);
  lines.back() += ")";
}

}  // namespace

std::string InlineText(DExpression& expression) {
  std::string text;
  AppendInline(expression, std::string::npos, text);
  return text;
}

std::vector<std::string> TreeLines(DExpression& expression) {
  std::vector<std::string> lines;
  AppendTree(expression, "", lines);
  return lines;
}

Json ExpressionJson(DExpression& expression) {
  const auto* word = dynamic_cast<ByteString*>(&expression);
  if (word == nullptr) {
    Json list = Json::array();
    for (auto it = static_cast<SExpression&>(expression).Begin(); it; it.Next()) {
      list.push_back(ExpressionJson(*it.Value()));
    }
    return list;
  }
  const std::string_view bytes = BytesOf(*word);
  const bool clean = Escape(bytes) == bytes;
  const ByteString::BsType hint = word->GetType();
  if (hint == ByteString::BsNone && clean) return bytes;
  Json object = Json::object();
  if (hint != ByteString::BsNone) {
    object["hint"] = hint == ByteString::BsBin    ? "bin"
                     : hint == ByteString::BsUtf8 ? "utf-8"
                                                  : "num";
  }
  object[clean ? "text" : "hex"] = clean ? std::string(bytes) : Hex(bytes);
  return object;
}

}  // namespace vesk2_command
