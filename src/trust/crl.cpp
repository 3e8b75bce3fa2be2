// SPDX-License-Identifier: Apache-2.0
// Crl: reading one revocation list and writing its fields back as a list. The two lists are held
// beside the expression, so that it can be built anew from them after a change.
#include <vesk2/crl.h>

#include <vesk2/hash.h>

#include "src/trust/lists.h"

namespace ZvVesk2 {

Crl::Crl(Vesk2ContextStruct* ctx) : SExpression(ctx) {}

Crl::~Crl() {
  // The fields hold references of their own beside those of the list.
  for (SExpression* field : {list1, list2, issuerTag}) {
    if (field != nullptr) field->Free();
  }
}

namespace {

// (4:item HASH STAMP)
//
// The date is any byte string: what is no full stamp revokes always (item_index.h), as a list must
// not lose an item by a misprint.
[[nodiscard]] int ImportItem(SExpression* list, ZvBuffer* buffer) {
  VESK2_TRY(buffer->Expect("(4:item"));
  Ref<Hash> hash;
  VESK2_TRY(ImportNew(hash, buffer, list->GetContext()));
  Ref<TimeStamp> date;
  VESK2_TRY(ImportNew(date, buffer, list->GetContext()));
  Ref<SExpression> item;
  VESK2_TRY(SExpression::Create(item.Out(), "item", list->GetContext()));
  VESK2_TRY(Append(item.get(), std::move(hash)));
  VESK2_TRY(Append(item.get(), std::move(date)));
  VESK2_TRY(Append(list, std::move(item)));
  return buffer->Expect(")");
}

// (5:list1 ITEM...), or list2, as `opening` says.
//
// Both lists must be there, in this order, empty or not: one that was left out would revoke less
// than its issuer meant.
[[nodiscard]] int ImportItems(SExpression*& out, const char* opening, const char* keyword,
                              ZvBuffer* buffer, Vesk2ContextStruct* ctx) {
  VESK2_TRY(buffer->Expect(opening));
  Ref<SExpression> list;
  VESK2_TRY(SExpression::Create(list.Out(), keyword, ctx));
  while (buffer->Peek() == '(') VESK2_TRY(ImportItem(list.get(), buffer));
  VESK2_TRY(buffer->Expect(")"));
  out = list.Release();
  return 0;
}

}  // namespace

// (3:crl(7:version1:1)(5:list1 ITEM...)(5:list2 ITEM...))
//
// Another version is refused at its text: what it would mean nobody knows.
int Crl::Import(ZvBuffer* buffer) {
  VESK2_REQUIRE(buffer != nullptr && First() == nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(list1 == nullptr && list2 == nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_TRY(buffer->Expect("(3:crl"));
  VESK2_TRY(buffer->Expect("(7:version1:1)"));
  VESK2_TRY(ImportItems(list1, "(5:list1", "list1", buffer, GetContext()));
  VESK2_TRY(ImportItems(list2, "(5:list2", "list2", buffer, GetContext()));
  VESK2_TRY(buffer->Expect(")"));
  return BuildSExpression();
}

int Crl::BuildSExpression() {
  DeleteNodes();
  VESK2_REQUIRE(list1 != nullptr && list2 != nullptr, VESK2_ERR_PARAM_NULL);
  VESK2_TRY(Insert("crl"));
  Ref<SExpression> version;
  VESK2_TRY(SExpression::Create(version.Out(), "version", "1", GetContext()));
  VESK2_TRY(Append(this, std::move(version)));
  VESK2_TRY(AppendShared(this, list1));
  return AppendShared(this, list2);
}

SExpression* Crl::GetList1() const { return list1; }
SExpression* Crl::GetList2() const { return list2; }
SExpression* Crl::GetIssuerTag() const { return issuerTag; }

}  // namespace ZvVesk2
