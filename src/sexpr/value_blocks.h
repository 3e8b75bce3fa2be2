// SPDX-License-Identifier: Apache-2.0
// Values and nodes for readers of whole expressions, which make them by the thousand: cut from
// blocks. To whoever holds one it is a value like any other.
#ifndef VESK2_SRC_SEXPR_VALUE_BLOCKS_H
#define VESK2_SRC_SEXPR_VALUE_BLOCKS_H

#include <cstring>
#include <new>

#include <vesk2/expression.h>

#include "src/frame/check.h"
#include "src/platform/blocks.h"
#include "src/sexpr/read_atom.h"

namespace ZvVesk2 {

class ValueBlocks {
 public:
  explicit ValueBlocks(Vesk2ContextStruct* context) : context_(context) {}

  // Null without memory.
  ByteString* NewString() { return New<ByteString>(); }
  SExpression* NewList() { return New<SExpression>(); }

  // Reads into a new string, which nobody else knows yet: ByteString::Import.
  [[nodiscard]] static int Read(ByteString& string, ZvCursor& cursor) {
    const auto keep = [&](const unsigned char* bytes, unsigned size) {
      return Fill(string, bytes, size, cursor.Remaining());
    };
    return ReadAtom(cursor, string.type, keep);
  }
  // Makes a new string hold `size` bytes, of `available` that may be read. Null are no bytes yet.
  [[nodiscard]] static int Fill(ByteString& string, const unsigned char* bytes, unsigned size,
                                size_t available) {
    if (size > ByteString::kShort || available < ByteString::kShort || bytes == nullptr) {
      VESK2_TRY(string.Reserve(size));
      if (bytes != nullptr) std::memcpy(string.data, bytes, size);
      return 0;
    }
    // A copy of a fixed size is three instructions; what it brings too much nobody sees.
    std::memcpy(string.shortBytes, bytes, ByteString::kShort);
    string.data = string.shortBytes;
    string.length = size;
    return 0;
  }

  // SExpression::Insert.
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

 private:
  template <typename T>
  T* New() {
    uint32_t place = 0;
    void* const memory = blocks_.Cut(sizeof(T), place);
    if (memory == nullptr) return nullptr;
    T* const made = ::new (memory) T(context_);
    made->place = place & 0x7fffffff;
    return made;
  }

  Vesk2ContextStruct* context_;
  ZVsysutil::ZvBlocks blocks_;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_SEXPR_VALUE_BLOCKS_H
