// SPDX-License-Identifier: Apache-2.0
// Values and nodes for readers, which make them by the thousand: cut from blocks. To whoever holds
// one it is a value like any other.
//
// Where a value lies is known by its `place`, the distance to its block's start, 0 for memory of
// its own; DExpression::Free and SExpression::DeleteNode give it back accordingly. The blocks
// outlive this object as long as anything in them does. Only ByteString and SExpression themselves
// are made here, never a class derived from them: Free and AtomText::IsPlain rest on that.
#ifndef VESK2_SRC_SEXPR_VALUE_BLOCKS_H
#define VESK2_SRC_SEXPR_VALUE_BLOCKS_H

#include <cstring>
#include <new>

#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include "src/frame/check.h"
#include "src/platform/blocks.h"
#include "src/sexpr/read_atom.h"

namespace ZvVesk2 {

class ValueBlocks {
 public:
  explicit ValueBlocks(Vesk2ContextStruct* context) : context_(context) {}
  // With room for that many lists and strings in the first block.
  ValueBlocks(Vesk2ContextStruct* context, size_t lists, size_t strings)
      : context_(context),
        blocks_(ZVsysutil::ZvBlocks::kBlockHead + lists * sizeof(SExpression) +
                strings * sizeof(ByteString)) {}

  // Null without memory; else a value with one reference, the caller's, released by Free like all
  // others.
  ByteString* NewString() { return New<ByteString>(); }
  SExpression* NewList() { return New<SExpression>(); }

  // Reads into a new string, which nobody else knows yet: ByteString::Import, but after a failure
  // the string may hold anything, and is only to be freed.
  [[nodiscard]] static int Read(ByteString& string, ZvCursor& cursor) {
    const auto keep = [&](const unsigned char* bytes, unsigned size) {
      return Fill(string, bytes, size, cursor.Remaining());
    };
    return ReadAtom(cursor, string.type, keep);
  }
  // Makes a new string hold `size` bytes, of `available` that may be read. Null `bytes` only make
  // the room: the length was stated, but the input ends before it. The string must be new, since
  // the short form drops its array without releasing it.
  [[nodiscard]] static int Fill(ByteString& string, const unsigned char* bytes, unsigned size,
                                size_t available) {
    if (size > ByteString::kShort || available < ByteString::kShort || bytes == nullptr) {
      VESK2_TRY(string.Reserve(size));
      if (bytes != nullptr) std::memcpy(string.data, bytes, size);
      return 0;
    }
    // A copy of a fixed size is three instructions. What is behind `size` are the input's next
    // bytes, within `available`; nobody reads them, since `length` bounds every reader.
    std::memcpy(string.shortBytes, bytes, ByteString::kShort);
    string.data = string.shortBytes;
    string.length = size;
    return 0;
  }

  // SExpression::Insert, with the node cut from a block once the list's own nodes are used up.
  [[nodiscard]] int Insert(SExpression& list, DExpression* value) {
    SExpression::Node* node = nullptr;
    if (list.ownUsed < SExpression::kOwnNodes) {
      node = &list.ownNodes[list.ownUsed++];
      *node = {nullptr, value, SExpression::Node::kOwn};
    } else {
      uint32_t place = 0;
      void* const memory = blocks_.Cut(sizeof(SExpression::Node), place);
      VESK2_REQUIRE(memory != nullptr, VESK2_ERR_MEM_ALLOC);
      node = ::new (memory) SExpression::Node{nullptr, value, place};
    }
    list.Link(node);
    return 0;
  }
  [[nodiscard]] int Insert(SExpression& list, const char* text) {
    VESK2_REQUIRE(text != nullptr, VESK2_ERR_INVALID_PARAM);
    Ref<ByteString> value(NewString());
    VESK2_REQUIRE(value, VESK2_ERR_MEM_ALLOC);
    VESK2_TRY(value->Set(text, ByteString::BsNone));
    VESK2_TRY(Insert(list, value.get()));
    (void)value.Release();  // the list's now
    return 0;
  }

 private:
  template <typename T>
  T* New() {
    uint32_t place = 0;
    void* const memory = blocks_.Cut(sizeof(T), place);
    if (memory == nullptr) return nullptr;
    T* const made = ::new (memory) T(context_);
    made->place = place & 0x7fffffff;  // blocks are far smaller than 2 GiB: no bit is lost
    return made;
  }

  Vesk2ContextStruct* context_;
  ZVsysutil::ZvBlocks blocks_;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_SEXPR_VALUE_BLOCKS_H
