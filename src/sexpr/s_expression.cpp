// SPDX-License-Identifier: Apache-2.0
// SExpression as a list: nodes, and who owns the elements. A list takes over the reference of what
// is inserted and hands it back with what is removed.
//
// Nodes are linked forward only: lists are built once and read many times, and removal, which has
// to search, is rare. A node lies in one of three places, which its `place` tells: in the list
// itself (kOwn), in memory of its own (kAlone), or in a reader's block. An own node that was given
// out is not used again before the list is emptied.
#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include <memory>
#include <utility>

#include "src/frame/check.h"
#include "src/sexpr/value_blocks.h"

namespace ZvVesk2 {

using ZVsysutil::ZvDrops;

SExpression::SExpression(Vesk2ContextStruct* owner) : DExpression(owner) { isList = 1; }

SExpression::~SExpression() {
  DeleteNodes();
  delete[] fileName;
}

const char* SExpression::DirectoryName() const { return ""; }

const char* SExpression::ExtensionName() const { return ""; }

bool SExpression::IsHash() const { return false; }

void SExpression::Link(Node* node) {
  (first != nullptr ? last->next : first) = node;
  last = node;
}

// Gives back a node's memory, not its element. Those of one block go together when `drops` ends.
void SExpression::DeleteNode(Node* node, ZvDrops& drops) {
  if (node->place == Node::kOwn) return;
  if (node->place == Node::kAlone) {
    delete node;
  } else {
    drops.Add(node, node->place, sizeof *node);
  }
}

// ---- Building ----

// The list and its tag share a block. The value is inserted last, so a failure leaves its reference
// with the caller.
int SExpression::Create(SExpression*& out, const char* tag, ByteString* value,
                        Vesk2ContextStruct* context) {
  out = nullptr;
  ValueBlocks blocks(context, 1, 1);
  Ref<SExpression> list(blocks.NewList());
  VESK2_REQUIRE(list, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(blocks.Insert(*list, tag));
  if (value != nullptr) VESK2_TRY(list->Insert(value));
  out = list.Release();
  return 0;
}

int SExpression::Create(SExpression*& out, const char* tag, const char* value,
                        Vesk2ContextStruct* context) {
  out = nullptr;
  Ref<SExpression> list;
  VESK2_TRY(Create(list.Out(), tag, context));
  VESK2_TRY(list->Insert(value));
  out = list.Release();
  return 0;
}

int SExpression::Create(SExpression*& out, const char* tag, Vesk2ContextStruct* context) {
  return Create(out, tag, static_cast<ByteString*>(nullptr), context);
}

int SExpression::Insert(DExpression* value) {
  VESK2_REQUIRE(value != nullptr, VESK2_ERR_PARAM_NULL);
  const bool own = ownUsed < kOwnNodes;
  Node* node = own ? &ownNodes[ownUsed++] : TryNew<Node>();
  VESK2_REQUIRE(node != nullptr, VESK2_ERR_MEM_ALLOC);
  *node = {nullptr, value, own ? Node::kOwn : Node::kAlone};
  Link(node);
  return 0;
}

int SExpression::Insert(const char* text) {
  VESK2_REQUIRE(text != nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<ByteString> value(TryNew<ByteString>(GetContext()));
  VESK2_REQUIRE(value, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(value->Set(text, ByteString::BsNone));
  VESK2_TRY(Insert(value.get()));
  (void)value.Release();  // the list's now
  return 0;
}

int SExpression::Remove(DExpression* value) {
  VESK2_REQUIRE(value != nullptr, VESK2_ERR_PARAM_NULL);
  Node* previous = nullptr;
  Node* node = first;
  for (; node != nullptr && node->value != value; node = node->next) previous = node;
  VESK2_REQUIRE(node != nullptr, VESK2_ERR_NOT_IN_LIST);
  (previous != nullptr ? previous->next : first) = node->next;
  if (node == last) last = previous;
  ZvDrops drops;
  DeleteNode(node, drops);
  return 0;
}

// The nodes of a list that only its parent holds go into the chain before it is freed, so that no
// destructor nests, however deeply the lists do. Its own node comes again behind them, since some
// stand in the list. For (a (b c) d):
//
//   chain at the inner list:   (b c) -> d
//   spliced in front:          b -> c -> (b c), now empty -> d
//
// Each node is met at most twice, so the cost is linear. A list that others hold too keeps its
// elements and only loses this reference.
void SExpression::DeleteNodes() {
  ZvDrops drops;
  Node* chain = std::exchange(first, nullptr);
  last = nullptr;
  while (chain != nullptr) {
    DExpression* value = chain->value;
    if (value->isList && value->refCount <= 1) {
      auto* list = static_cast<SExpression*>(value);
      if (list->last != nullptr) {
        list->last->next = chain;
        chain = std::exchange(list->first, nullptr);
        list->last = nullptr;
        continue;
      }
    }
    DeleteNode(std::exchange(chain, chain->next), drops);
    value->Free(drops);
  }
  ownUsed = 0;
}

// ---- Reading ----

DExpression* SExpression::First() const { return first != nullptr ? first->value : nullptr; }

DExpression* SExpression::Last() const { return last != nullptr ? last->value : nullptr; }

unsigned int SExpression::Count() const {
  unsigned int count = 0;
  for (Iterator it = Begin(); it; it.Next()) ++count;
  return count;
}

// Linear: each call makes a list of all that remains. A walk of a list goes by its iterator.
SExpression* SExpression::Rest() {
  Ref<SExpression> rest(TryNew<SExpression>(GetContext()));
  if (!rest || first == nullptr) return rest.Release();
  for (const Node* node = first->next; node != nullptr; node = node->next) {
    Ref<DExpression> shared = Ref<DExpression>::Share(node->value);
    if (rest->Insert(shared.get())) return nullptr;
    (void)shared.Release();  // the list's now
  }
  return rest.Release();
}

bool SExpression::Contains(SExpression* x) {
  if (x == nullptr) return false;
  for (Iterator it = Begin(); it; it.Next()) {
    if (x->IsEqual(it.Value())) return true;
  }
  return false;
}

DExpression* SExpression::Iterator::Value() const { return node_->value; }

void SExpression::Iterator::Next() { node_ = node_->next; }

bool SExpression::IsSExpression() const { return true; }
SExpression::Iterator SExpression::Begin() const { return Iterator(first); }
StorageType SExpression::GetStorageType() const { return storageType; }
const char* SExpression::GetFileName() const { return fileName; }

}  // namespace ZvVesk2
