// SPDX-License-Identifier: Apache-2.0
// markup.h: HTML that an XML parser reads too, written element by element.
//
// Names of elements and attributes are this program's own. Every text and every value is data,
// whoever wrote it, and passes through MarkupText: no byte of it can end an element or begin one.
// What comes out is ASCII, so that it reads the same whatever encoding somebody serves it as.
#ifndef VESK2_TOOLS_MARKUP_H
#define VESK2_TOOLS_MARKUP_H

#include <initializer_list>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace vesk2_command {

// MarkupText writes a text so that it stands for itself in an element and in a quoted value. What
// XML does not know, and what turns or breaks lines, becomes \xNN as on a terminal; what has been
// through Escape already stays as it is.
std::string MarkupText(std::string_view text);

class Markup {
 public:
  using Attributes = std::initializer_list<std::pair<const char*, std::string>>;

  // Opens an element, which the matching Close ends.
  Markup& Open(const char* name, Attributes attributes = {});
  Markup& Close();
  Markup& Text(std::string_view text);
  // An element with nothing but text in it.
  Markup& Leaf(const char* name, std::string_view text, Attributes attributes = {});
  // An element that never has a content, such as meta.
  Markup& Void(const char* name, Attributes attributes = {});

  // A style sheet of this program's own. Neither "<" nor "&" may be in it: HTML and XML read those
  // differently there.
  Markup& Style(const char* sheet);

  // The document, its elements closed.
  std::string Take();

 private:
  void Begin(const char* name, Attributes attributes);

  std::string text_;
  std::vector<const char*> open_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_MARKUP_H
