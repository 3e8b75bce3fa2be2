// SPDX-License-Identifier: Apache-2.0
// Lists read from canonical bytes in memory:
//
//   "(" <byte string> { <white space> ( <byte string> | <list> ) } <white space> ")"
//
// with white space also before the "(". The first element is always read as a byte string: a "(" in
// its place is taken for the separator of an empty one. An empty list ends before its ")".
//
//   ((1:a))    a list of "" and "a"; the last ")" is left unread
//   (1:a())    a list of "a" and (); the last ")" is left unread
//   (3;abc)    like (3:abc): separators behind position 0 are not compared (DExpression::Expect)
//
// Programs hold texts that read in no other way, so each of these stays. Whoever wants to know that
// a text is whole asks whether `pos` is at its end.
#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include "src/frame/check.h"
#include "src/sexpr/chars.h"
#include "src/sexpr/value_blocks.h"

namespace ZvVesk2 {
namespace {

// Looks for the last list, in the order in which they close, that is headed by `tag`.
// The innermost of two that nest closes first, so the outer one wins; of two beside one another the
// later one does. The list that is read as a whole is never tested.
struct Search {
  const char* tag;
  SExpression* found = nullptr;

  void Test(DExpression* list) {
    auto* closed = static_cast<SExpression*>(list);
    const auto* head = dynamic_cast<ByteString*>(closed->First());
    if (head != nullptr && head->IsEqual(tag)) found = closed;
  }
};

// Every read is bounded by `size_`: lengths that lead beyond it are VESK2_ERR_BUFFER_OVERFLOW.
class MemoryReader {
 public:
  MemoryReader(unsigned char* buf, unsigned size, unsigned& pos, Vesk2ContextStruct* context,
               Search* search)
      : buf_(buf), size_(size), pos_(pos), values_(context), search_(search) {}

  // Reads a list of nesting `level`. It returns before the ")" of an empty list: within another
  // list, that ")" then ends the outer one.
  [[nodiscard]] int ReadList(Ref<DExpression>& out, unsigned level) {
    VESK2_REQUIRE(level <= Limits::kMaxDepth, VESK2_ERR_INVALID_S_EXPRESSION);
    SkipSpace();
    VESK2_TRY(ExpectByte('(', buf_, size_, pos_));
    Ref<SExpression> list(values_.NewList());
    VESK2_REQUIRE(list, VESK2_ERR_MEM_ALLOC);
    VESK2_TRY(Look());
    if (buf_[pos_] != ')') VESK2_TRY(ReadElements(*list, level));
    out.Reset(list.Release());
    return 0;
  }

 private:
  void SkipSpace() {
    while (pos_ < size_ && IsSpace(buf_[pos_])) ++pos_;
  }

  // Whether there is a byte that an element or a ")" can begin with. A 0 byte is none, so that a
  // text that ends in one before its time is malformed rather than a list of empty strings.
  [[nodiscard]] int Look() const {
    VESK2_REQUIRE(pos_ < size_, VESK2_ERR_BUFFER_OVERFLOW);
    VESK2_REQUIRE(buf_[pos_] != '\0', VESK2_ERR_INVALID_S_EXPRESSION);
    return 0;
  }

  [[nodiscard]] int AppendString(SExpression& list) {
    unsigned length = 0;
    VESK2_TRY(ReadMemoryLength(length, buf_, size_, pos_));
    Ref<ByteString> string(values_.NewString());
    VESK2_REQUIRE(string, VESK2_ERR_MEM_ALLOC);
    VESK2_TRY(values_.Fill(*string, buf_ + pos_, length, size_ - pos_));
    pos_ += length;
    // A list that lost an element would be another one, and as a tag a wider one.
    VESK2_TRY(values_.Insert(list, string.get()));
    (void)string.Release();
    return 0;
  }

  [[nodiscard]] int AppendList(SExpression& to, unsigned level) {
    Ref<DExpression> list;
    VESK2_TRY(ReadList(list, level));
    VESK2_TRY(values_.Insert(to, list.get()));
    if (search_ != nullptr) search_->Test(list.get());
    (void)list.Release();
    return 0;
  }

  // Reads the elements of a list that has some, and its ")".
  [[nodiscard]] int ReadElements(SExpression& list, unsigned level) {
    VESK2_TRY(AppendString(list));
    while (true) {
      SkipSpace();
      VESK2_TRY(Look());
      if (buf_[pos_] == ')') return ExpectByte(')', buf_, size_, pos_);
      VESK2_TRY(buf_[pos_] == '(' ? AppendList(list, level + 1) : AppendString(list));
    }
  }

  unsigned char* buf_;
  unsigned size_;
  unsigned& pos_;
  ValueBlocks values_;
  Search* search_;
};

}  // namespace

int SExpression::ParseCanonical(DExpression*& out, unsigned char* buf, unsigned int size,
                                unsigned int& pos, Vesk2ContextStruct* context) {
  VESK2_REQUIRE(out == nullptr && buf != nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<DExpression> list;
  VESK2_TRY(MemoryReader(buf, size, pos, context, nullptr).ReadList(list, 1));
  out = list.Release();
  return 0;
}

int SExpression::ParseCanonical2(DExpression*& out, unsigned char* buf, unsigned int size,
                                 unsigned int& pos, const char* tag, SExpression*& found,
                                 Vesk2ContextStruct* context) {
  VESK2_REQUIRE(out == nullptr && buf != nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<DExpression> list;
  Search search{tag};
  VESK2_TRY(MemoryReader(buf, size, pos, context, &search).ReadList(list, 1));
  if (search.found != nullptr) found = search.found;
  out = list.Release();
  return 0;
}

int SExpression::FindSubExpression(SExpression*& found, unsigned char* buf, unsigned int size,
                                   const char* tag, Vesk2ContextStruct* context) {
  VESK2_REQUIRE(found == nullptr, VESK2_ERR_PARAM_NOT_NULL);
  VESK2_REQUIRE(buf != nullptr && tag != nullptr, VESK2_ERR_PARAM_NULL);
  Ref<DExpression> root;
  SExpression* match = nullptr;
  unsigned int pos = 0;
  VESK2_TRY(ParseCanonical2(root.Out(), buf, size, pos, tag, match, context));
  found = Ref<SExpression>::Share(match).Release();  // outlives the rest of the tree
  return 0;
}

}  // namespace ZvVesk2
