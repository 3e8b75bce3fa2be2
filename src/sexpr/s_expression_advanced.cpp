// SPDX-License-Identifier: Apache-2.0
// Lists in advanced form, the text that people type and read:
//
//   "(" <token> { <white space> ( <token> | <list> ) } <white space> ")"
//
// A token may be empty, and the first element always is one, so "()" holds an empty byte string and
// so does "((a) b)", in first place.
//
// The form has no quoting. A byte string that holds a blank or a parenthesis is written as it is,
// and is read back as something else; the canonical form is the one that decides and is stored.
#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include <climits>
#include <cstring>
#include <memory>
#include <string_view>

#include "src/frame/check.h"
#include "src/platform/text.h"
#include "src/sexpr/advanced.h"
#include "src/sexpr/walk.h"

namespace ZvVesk2 {
namespace {

using Step = Walk::Step;

[[nodiscard]] int ReadList(Ref<DExpression>& out, const char* text, unsigned& pos,
                           Vesk2ContextStruct* context, unsigned level);

// Reads a token, or a list of nesting `level`, and appends it. `pos` is at its first byte, which is
// no white space. The recursion over lists is as deep as Limits::kMaxDepth allows.
[[nodiscard]] int ReadElement(SExpression& list, const char* text, unsigned& pos,
                              Vesk2ContextStruct* context, unsigned level) {
  Ref<DExpression> element;
  VESK2_TRY(text[pos] == '(' ? ReadList(element, text, pos, context, level)
                             : ByteString::ParseAdvanced(element.Out(), text, pos, context));
  VESK2_TRY(list.Insert(element.get()));
  (void)element.Release();
  return 0;
}

// A list cannot be empty after this reader: its head is a token whatever stands there.
[[nodiscard]] int ReadList(Ref<DExpression>& out, const char* text, unsigned& pos,
                           Vesk2ContextStruct* context, unsigned level) {
  VESK2_REQUIRE(level <= Limits::kMaxDepth, VESK2_ERR_INVALID_S_EXPRESSION);
  SkipSpace(text, pos);
  VESK2_TRY(ExpectChar('(', text, pos));
  Ref<DExpression> head;
  VESK2_TRY(ByteString::ParseAdvanced(head.Out(), text, pos, context));
  Ref<SExpression> list(TryNew<SExpression>(context));
  VESK2_REQUIRE(list, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(list->Insert(head.get()));
  (void)head.Release();
  for (SkipSpace(text, pos); text[pos] != ')'; SkipSpace(text, pos)) {
    VESK2_REQUIRE(text[pos] != '\0', VESK2_ERR_INVALID_S_EXPRESSION);
    VESK2_TRY(ReadElement(*list, text, pos, context, level + 1));
  }
  ++pos;
  out.Reset(list.Release());
  return 0;
}

// Positions are 32 bits wide: in a longer text they would wrap, and the readers never end.
bool IsTooLong(const char* text) { return std::strlen(text) >= Limits::kMaxExport; }

// The part of "(tag body)" that is `body`; for an empty tag, what is between the parentheses. Null
// view when the text has another head or no body.
std::string_view Body(std::string_view text, std::string_view tag) {
  if (text.size() <= tag.size() + 2 || !text.starts_with('(') || !text.ends_with(')')) return {};
  text = text.substr(1, text.size() - 2);
  if (tag.empty()) return text;
  if (!text.starts_with(tag) || text[tag.size()] != ' ') return {};
  return text.substr(tag.size() + 1);
}

}  // namespace

int SExpression::ParseAdvanced(DExpression*& out, const char* text, unsigned int& pos,
                               Vesk2ContextStruct* context) {
  VESK2_REQUIRE(out == nullptr && text != nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<DExpression> list;
  VESK2_TRY(ReadList(list, text, pos, context, 1));
  out = list.Release();
  return 0;
}

// The whole text is one list: what follows it is an error, not ignored as in the other readers,
// since a person who typed more meant it.
int SExpression::ParseAdvanced(SExpression*& out, const char* text, Vesk2ContextStruct* context) {
  VESK2_REQUIRE(out == nullptr && text != nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(!IsTooLong(text), VESK2_ERR_INVALID_S_EXPRESSION);
  Ref<DExpression> list;
  unsigned int pos = 0;
  VESK2_TRY(ReadList(list, text, pos, context, 1));
  SkipSpace(text, pos);
  VESK2_TRY(ExpectChar('\0', text, pos));
  out = static_cast<SExpression*>(list.Release());
  return 0;
}

int SExpression::ParseTagAdvanced(SExpression*& out, const char* text, const char* tag,
                                  Vesk2ContextStruct* context) {
  VESK2_REQUIRE(out == nullptr && text != nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(!IsTooLong(text), VESK2_ERR_INVALID_S_EXPRESSION);
  Ref<SExpression> list;
  VESK2_TRY(Create(list.Out(), tag, context));
  unsigned int pos = 0;
  for (SkipSpace(text, pos); text[pos] != '\0'; SkipSpace(text, pos)) {
    // Nothing is open that it could close, and as a token it would be read without end.
    VESK2_REQUIRE(text[pos] != ')', VESK2_ERR_UNEXPECTED_CHAR);
    VESK2_TRY(ReadElement(*list, text, pos, context, 2));
  }
  out = list.Release();
  return 0;
}

// Counts three for each list, its parentheses and a terminator, and for each string one more than
// its bytes: larger than the text, as ExportAdvanced's strict bounds need it. An empty list by
// itself needs one byte more than this.
unsigned int SExpression::AdvancedLength() {
  uint64_t length = 0;
  Walk walk(this);
  for (Step step = walk.Next(); step != Step::End; step = walk.Next()) {
    if (step == Step::TooDeep) return UINT_MAX;
    if (step == Step::Close) continue;
    if (!walk.IsFirst()) ++length;
    length += step == Step::Atom ? walk.Value()->AdvancedLength() : 3;
  }
  return length < UINT_MAX ? static_cast<unsigned>(length) : UINT_MAX;
}

// "(" needs a byte behind it and ")" two, of which one takes the final 0.
int SExpression::ExportAdvanced(unsigned char* buf, unsigned int& pos, unsigned int size) {
  VESK2_REQUIRE(buf != nullptr, VESK2_ERR_INVALID_PARAM);
  Walk walk(this);
  for (Step step = walk.Next(); step != Step::End; step = walk.Next()) {
    VESK2_REQUIRE(step != Step::TooDeep, VESK2_ERR_BUFFER_OVERFLOW);
    if (step != Step::Close && !walk.IsFirst()) {
      VESK2_REQUIRE(pos < size, VESK2_ERR_BUFFER_OVERFLOW);
      buf[pos++] = ' ';
    }
    if (step == Step::Atom) {
      (void)walk.Value()->ExportAdvanced(buf, pos, size);  // what does not fit is left out
      continue;
    }
    const unsigned needed = step == Step::Open ? 1 : 2;
    VESK2_REQUIRE(uint64_t{pos} + needed < size, VESK2_ERR_BUFFER_OVERFLOW);
    buf[pos++] = step == Step::Open ? '(' : ')';
  }
  buf[pos] = '\0';
  return 0;
}

// Each level counts one up from `depth`, and parentheses are written where the count is above 0: at
// depth 0 (a (b c)) prints as "a (b c)". 64 bits, since callers may pass the largest int.
int SExpression::PrintAdvanced(int (*write)(const char* text, unsigned int length, void* user),
                               void* user, int depth) {
  if (write == nullptr) return 0;
  Walk walk(this);
  for (Step step = walk.Next(); step != Step::End && step != Step::TooDeep; step = walk.Next()) {
    if (step != Step::Close && !walk.IsFirst()) write(" ", 1, user);
    const int64_t at = int64_t{depth} + walk.Level() - 1;
    if (step == Step::Atom) {
      static_cast<void>(walk.Value()->PrintAdvanced(write, user, static_cast<int>(at + 1)));
    } else if (at > 0) {
      write(step == Step::Open ? "(" : ")", 1, user);
    }
  }
  return 0;
}

// The body is moved to the front of the array that holds the whole text, so one array serves both.
// The head is compared as text, so a keyword "tag x" with a blank in it passes for the keyword
// "tag": a text says less than the tag does, and what must be exact compares tags.
char* SExpression::ExportTag(const char* tag) {
  const unsigned int size = AdvancedLength();
  if (size > Limits::kMaxExport) return nullptr;
  std::unique_ptr<char[]> text(TryNewArray<char>(size + 1));
  if (text == nullptr) return nullptr;
  unsigned int length = 0;
  if (ExportAdvanced(reinterpret_cast<unsigned char*>(text.get()), length, size)) return nullptr;
  if (tag == nullptr) return text.release();
  const std::string_view body = Body({text.get(), length}, tag);
  if (body.data() == nullptr) return nullptr;
  const size_t kept = body.size();
  std::memmove(text.get(), body.data(), kept);
  text[kept] = '\0';
  return text.release();
}

char* SExpression::ExportTagW(const char* tag) {
  const std::unique_ptr<char[]> text(ExportTag(tag));
  return ZVsysutil::zv_atof_copy(text.get());
}

}  // namespace ZvVesk2
