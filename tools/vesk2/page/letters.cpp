// SPDX-License-Identifier: Apache-2.0
// letters.cpp: letters of UTF-8, and lines of them.
#include "tools/vesk2/page/letters.h"

#include <algorithm>

namespace vesk2_command {
namespace {

// Letters of many scripts are twice as wide as Latin ones; some are narrower than is counted here.
size_t Columns(char32_t point) { return point >= 0x1100 ? 2 : 1; }

// How many bytes of the text fit into a line.
size_t Fitting(std::string_view text, size_t width) {
  size_t bytes = 0;
  size_t columns = 0;
  for (LetterReader letters(text); letters.Next(); bytes += letters.letter().size()) {
    columns += Columns(letters.point());
    if (columns > width) break;
  }
  return bytes;
}

}  // namespace

bool LetterReader::Next() {
  if (rest_.empty()) return false;
  const auto lead = static_cast<unsigned char>(rest_[0]);
  const size_t length = lead < 0xc0 ? 1 : lead < 0xe0 ? 2 : lead < 0xf0 ? 3 : 4;
  letter_ = rest_.substr(0, length);
  point_ = letter_.size() == 1 ? lead : lead & (0x7fU >> length);
  for (const char byte : letter_.substr(1)) {
    point_ = (point_ << 6) | (static_cast<unsigned char>(byte) & 0x3fU);
  }
  rest_.remove_prefix(letter_.size());
  return true;
}

std::vector<std::string> Wrap(std::string_view text, size_t width, size_t most) {
  std::vector<std::string> lines;
  while (!text.empty()) {
    size_t fits = Fitting(text, width);
    if (fits < text.size() && lines.size() + 1 == most) {
      lines.push_back(std::string(text.substr(0, Fitting(text, width - 1))) + "\xe2\x80\xa6");
      break;
    }
    if (fits < text.size()) {
      const size_t blank = text.rfind(' ', fits);
      if (blank != std::string_view::npos && blank > fits / 2) fits = blank;
    }
    lines.emplace_back(text.substr(0, std::max<size_t>(fits, 1)));
    text.remove_prefix(lines.back().size());
    text.remove_prefix(std::min(text.find_first_not_of(' '), text.size()));
  }
  return lines;
}

}  // namespace vesk2_command
