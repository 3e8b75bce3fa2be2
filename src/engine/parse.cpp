// SPDX-License-Identifier: Apache-2.0
// The canonical parser:
//
//   list = "(" atom *( list / atom ) ")"
//   atom = [ "[" length hint "]" ] length bytes
//   length = a decimal number from 1 without leading zeros, then ":"
//
// An atom points into the input. Zero lengths, blanks and lists without a head atom are refused;
// what follows the outermost ")" is the caller's business.
//
// This is no second opinion on what a stranger wrote: the objects' readers have been there, and
// what arrives is their canonical text. It is strict all the same, since one list has to have one
// text: principals and tuples are told apart by digests of it. An empty byte string, which objects
// may hold, ends the whole reduction here.
#include <cstring>

#include "src/engine/owned.h"
#include "src/engine/tag.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

// A length may have one more digit as long as it is not above this: 2147483649 is the greatest.
// Whether the input holds as much is asked of what remains, never by adding to a pointer.
constexpr uint32_t kLengthBeforeLastDigit = 0x0CCCCCCC;

size_t Remaining(const spki_input* input) {
  return static_cast<size_t>(input->end - input->position);
}

// The next byte, not consumed; -1 at the end.
[[nodiscard]] int Peek(const spki_input* input) {
  return input->position == input->end ? -1 : *input->position;
}

// The next byte, consumed; -1 at the end.
[[nodiscard]] int Next(spki_input* input) {
  return input->position == input->end ? -1 : *input->position++;
}

// At a "[".
[[nodiscard]] spki_status ParseHint(spki_atom* atom, spki_input* input) {
  ++input->position;
  VESK2_TRY(spki_parse_length(&atom->hint_length, input));
  atom->hint = input->position;
  // A hint with nothing behind it is too long before it is anything else: callers know malformed
  // hints at the end of the input by that code.
  VESK2_REQUIRE(atom->hint_length < Remaining(input), SPKI_ERR_DISP_HINT_TOO_LONG);
  input->position += atom->hint_length;
  const bool closed = Next(input) == ']';
  VESK2_REQUIRE(Remaining(input) > 0, SPKI_ERR_DISP_HINT_TOO_LONG);
  return closed ? 0 : SPKI_ERR_DISP_HINT_NOT_CLOSED;
}

// Nothing is copied: the input outlives the atom.
[[nodiscard]] spki_status ParseString(spki_atom* atom, spki_input* input) {
  VESK2_TRY(spki_parse_length(&atom->length, input));
  VESK2_REQUIRE(atom->length <= Remaining(input), SPKI_ERR_STRING_TOO_LONG);
  atom->data = input->position;
  input->position += atom->length;
  return 0;
}

// A keyword with a display hint is no keyword: its atom's id is -1, so it stays an atom.
[[nodiscard]] spki_status ParseHead(spki_engine* engine, spki_elem* head, spki_input* input) {
  spki_atom* slot = nullptr;
  VESK2_TRY(spki_parse_atom(engine, &slot, input));
  const spki_atom_owner atom = Own(engine, slot);
  if (atom->keyword >= 1) {
    head->kind = SPKI_ELEM_KEYWORD;
    head->value.keyword = atom->keyword;
  } else {
    head->kind = SPKI_ELEM_HEAD;
    spki_atom_assign(engine, &head->value.atom, atom.get());
  }
  return 0;
}

[[nodiscard]] spki_status ParseList(spki_engine* engine, spki_elem** slot, spki_input* input,
                                    unsigned depth);

// One element behind the head, at the byte that decides what it is.
[[nodiscard]] spki_status ParseElement(spki_engine* engine, spki_elem* elem, spki_input* input,
                                       unsigned depth) {
  const int next = Peek(input);
  if (next == '(') {
    elem->kind = SPKI_ELEM_LIST;
    return ParseList(engine, &elem->value.list, input, depth + 1);
  }
  VESK2_REQUIRE(next == '[' || (next >= '1' && next <= '9'), SPKI_ERR_BAD_SEXP_FORMAT);
  elem->kind = SPKI_ELEM_STRING;
  return spki_parse_atom(engine, &elem->value.atom, input);
}

[[nodiscard]] spki_status ParseList(spki_engine* engine, spki_elem** slot, spki_input* input,
                                    unsigned depth) {
  // The recursion here bounds every other one in the engine: they follow the lists that it made.
  VESK2_REQUIRE(depth <= Limits::kMaxDepth, SPKI_ERR_BAD_SEXP);
  const unsigned char* start = input->position;
  VESK2_REQUIRE(Next(input) == '(', SPKI_ERR_BAD_SEXP_START);
  spki_elem_owner head = Own(engine, spki_elem_new(engine));
  VESK2_REQUIRE(head != nullptr, SPKI_ERR_NO_MEM);
  VESK2_TRY(ParseHead(engine, head.get(), input));
  head->text = start;

  spki_elem* last = head.get();
  while (Peek(input) != ')') {
    VESK2_REQUIRE(Remaining(input) > 0, SPKI_ERR_SEXP_NOT_CLOSED);
    spki_elem_owner elem = Own(engine, spki_elem_new(engine));
    VESK2_REQUIRE(elem != nullptr, SPKI_ERR_NO_MEM);
    VESK2_TRY(ParseElement(engine, elem.get(), input, depth));
    last->next = elem.release();
    last = last->next;
  }
  ++input->position;
  head->text_length = static_cast<uint32_t>(input->position - start);
  *slot = head.release();
  return 0;
}

void ForgetText(spki_elem* list) {
  list->text = nullptr;
  list->text_length = 0;
  for (spki_elem* elem = list->next; elem != nullptr; elem = elem->next) {
    if (elem->kind == SPKI_ELEM_LIST) ForgetText(elem->value.list);
  }
}

}  // namespace

spki_status spki_parse_length(uint32_t* length, spki_input* input) {
  VESK2_REQUIRE(length != nullptr && input != nullptr, SPKI_ERR_NULL_PARAM);
  const int first = Next(input);
  VESK2_REQUIRE(first >= '1' && first <= '9', SPKI_ERR_BAD_LTH_FORMAT);
  auto value = static_cast<uint32_t>(first - '0');
  for (int next = Next(input); next != ':'; next = Next(input)) {
    VESK2_REQUIRE(next >= '0' && next <= '9', SPKI_ERR_COLON_EXPECTED);
    VESK2_REQUIRE(value <= kLengthBeforeLastDigit, SPKI_ERR_LTH_TOO_BIG);
    value = value * 10 + static_cast<uint32_t>(next - '0');
  }
  *length = value;
  return 0;
}

spki_status spki_parse_atom(spki_engine* engine, spki_atom** slot, spki_input* input) {
  VESK2_REQUIRE(slot != nullptr && input != nullptr, SPKI_ERR_NULL_PARAM);
  const spki_atom_owner atom = Own(engine, spki_atom_new(engine));
  VESK2_REQUIRE(atom != nullptr, SPKI_ERR_NO_MEM);
  if (Peek(input) == '[') VESK2_TRY(ParseHint(atom.get(), input));
  VESK2_TRY(ParseString(atom.get(), input));
  atom->keyword = atom->hint_length == 0 ? spki_keyword_id(atom->data, atom->length) : -1;
  spki_atom_assign(engine, slot, atom.get());
  return 0;
}

spki_status spki_parse_list(spki_engine* engine, spki_elem** slot, spki_input* input) {
  VESK2_REQUIRE(slot != nullptr && input != nullptr, SPKI_ERR_NULL_PARAM);
  *slot = nullptr;
  return ParseList(engine, slot, input, 1);
}

// A list made from a template never owns its text, so it must not look like one that does:
// spki_list_dispose would delete a constant.
spki_status spki_parse_template(spki_engine* engine, spki_elem** slot, const char* text) {
  VESK2_REQUIRE(slot != nullptr && text != nullptr, SPKI_ERR_NULL_PARAM);
  const auto* start = reinterpret_cast<const unsigned char*>(text);
  spki_input input = {start, start, start + std::strlen(text)};
  VESK2_TRY(spki_parse_list(engine, slot, &input));
  ForgetText(*slot);
  return 0;
}

}  // namespace ZvVesk2::Engine
