// SPDX-License-Identifier: Apache-2.0
// letters.h: texts letter by letter, and how much room they take.
#ifndef VESK2_TOOLS_LETTERS_H
#define VESK2_TOOLS_LETTERS_H

#include <string>
#include <string_view>
#include <vector>

namespace vesk2_command {

// LetterReader goes through UTF-8 that has been through Escape: every letter of it is whole.
class LetterReader {
 public:
  explicit LetterReader(std::string_view text) : rest_(text) {}

  // Whether there is another letter.
  bool Next();
  std::string_view letter() const { return letter_; }
  char32_t point() const { return point_; }

 private:
  std::string_view rest_;
  std::string_view letter_;
  char32_t point_ = 0;
};

// Wrap breaks a text into at most `most` lines of `width` columns, at blanks where there are some;
// what is left over is cut with an ellipsis. Any bytes may be in the text.
std::vector<std::string> Wrap(std::string_view text, size_t width, size_t most);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_LETTERS_H
