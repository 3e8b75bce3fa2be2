// SPDX-License-Identifier: Apache-2.0
// The canonical writer:
//
//   list = "(" 1*( atom / list ) ")"
//   atom = [ "[" length ":" hint "]" ] length ":" bytes
//
// A keyword is written as its row's name; one without a row of its own as "???". Every other piece
// is written as it was read, so what was not derived comes out byte for byte.
#include "src/engine/write.h"

#include <charconv>

#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

// Length, colon and bytes.
[[nodiscard]] spki_status PutString(const void* data, uint32_t length, spki_sink* sink) {
  char prefix[16];
  char* end = std::to_chars(prefix, prefix + sizeof prefix, length).ptr;
  *end++ = ':';
  VESK2_TRY(sink->Put(prefix, static_cast<size_t>(end - prefix)));
  return data == nullptr || length == 0 ? 0 : sink->Put(data, length);
}

[[nodiscard]] spki_status PutElem(const spki_elem* elem, spki_sink* sink) {
  switch (elem->kind) {
    case SPKI_ELEM_KEYWORD: {
      const spki_keyword_entry* row = spki_keyword_row(elem->value.keyword);
      return PutString(row->name, row->length, sink);
    }
    case SPKI_ELEM_HEAD:
    case SPKI_ELEM_STRING:
      return spki_write_atom(elem->value.atom, sink);
    case SPKI_ELEM_LIST:
      return spki_write_pieces(elem->value.list, sink);
  }
  return SPKI_ERR_BAD_SEXP;
}

}  // namespace

spki_status spki_write_atom(const spki_atom* atom, spki_sink* sink) {
  if (atom->hint_length > 0) {
    VESK2_TRY(sink->Put("[", 1));
    VESK2_TRY(PutString(atom->hint, atom->hint_length, sink));
    VESK2_TRY(sink->Put("]", 1));
  }
  return PutString(atom->data, atom->length, sink);
}

spki_status spki_write_pieces(const spki_elem* chain, spki_sink* sink) {
  VESK2_TRY(sink->Put("(", 1));
  for (const spki_elem* elem = chain; elem != nullptr; elem = elem->next) {
    VESK2_TRY(PutElem(elem, sink));
  }
  return sink->Put(")", 1);
}

}  // namespace ZvVesk2::Engine
