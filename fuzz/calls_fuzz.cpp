// SPDX-License-Identifier: Apache-2.0
// Sequences of calls on a few values that share their elements, beside plain trees on which the
// same is done: afterwards every value must be written as its tree is. Then objects are built of
// the values, and what is written of them must read back.
#include <algorithm>
#include <array>
#include <vector>

#include "fuzz/round_trip.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

namespace {

// What a value is expected to be.
struct Tree {
  bool list = false;
  std::string bytes;
  std::vector<std::shared_ptr<Tree>> items;

  std::string Canonical() const {
    if (!list) return Token(bytes);
    std::string out = "(";
    for (const auto& item : items) out += item->Canonical();
    return out + ")";
  }
  size_t Size() const {
    size_t size = 1 + bytes.size();
    for (const auto& item : items) size += item->Size();
    return size;
  }
};

class Calls {
 public:
  explicit Calls(Choices& choices) : choices_(choices) {}
  void Run();

 private:
  static constexpr size_t kMaxSize = 400;  // lists in lists double quickly
  struct Value {
    Ref<DExpression> value;
    std::shared_ptr<Tree> tree = std::make_shared<Tree>();
    unsigned number = 0;  // a list takes in what was made before it, so that none holds itself
    SExpression* List() const {
      return tree->list ? static_cast<SExpression*>(value.get()) : nullptr;
    }
  };

  Value& Any() { return values_[choices_.Below(kValues)]; }
  void Make(Value& to);
  void Insert(Value& list, const Value& item);
  void Remove(Value& list, const Value& item);
  void TakeRest(Value& to, const Value& list);
  void Set(Value& string);
  void CheckPair(const Value& a, const Value& b);
  void CheckText(const Value& value);
  void Build();

  static constexpr unsigned kValues = 5;
  Choices& choices_;
  std::array<Value, kValues> values_;
  unsigned made_ = 0;
};

void Calls::Make(Value& to) {
  to = {};
  to.number = ++made_;
  to.tree->list = choices_.Chance(2);
  if (!to.tree->list) {
    to.value.Reset(new ByteString(nullptr));
    return Set(to);
  }
  SExpression* list = nullptr;
  FUZZ_CHECK(SExpression::Create(list, "tag", nullptr) == 0);
  to.value.Reset(list);
  to.tree->items.push_back(std::make_shared<Tree>(Tree{false, "tag", {}}));
}

void Calls::Set(Value& string) {
  if (!string.value || string.tree->list) return;
  auto* const value = static_cast<ByteString*>(string.value.get());
  const std::string_view bytes = choices_.Take(choices_.Below(4) * 9);
  const auto hint = static_cast<ByteString::BsType>(choices_.Below(4));
  const int code = value->Set(reinterpret_cast<const unsigned char*>(bytes.data()),
                              static_cast<unsigned>(bytes.size()), hint);
  FUZZ_CHECK((code == 0) == !bytes.empty());
  if (code == 0) string.tree->bytes = bytes;
}

void Calls::Insert(Value& list, const Value& item) {
  if (list.List() == nullptr || !item.value || item.number >= list.number) return;
  for (const Value& value : values_) {
    if (value.tree->Size() + item.tree->Size() > kMaxSize) return;
  }
  auto shared = Ref<DExpression>::Share(item.value.get());
  FUZZ_CHECK(list.List()->Insert(shared.get()) == 0);
  static_cast<void>(shared.Release());
  list.tree->items.push_back(item.tree);
}

void Calls::Remove(Value& list, const Value& item) {
  if (list.List() == nullptr || !item.value) return;
  auto& items = list.tree->items;
  const auto found = std::find(items.begin(), items.end(), item.tree);
  const int code = list.List()->Remove(item.value.get());
  FUZZ_CHECK(code == (found == items.end() ? VESK2_ERR_NOT_IN_LIST : 0));
  if (code != 0) return;
  item.value->Free();
  items.erase(found);
}

void Calls::TakeRest(Value& to, const Value& list) {
  if (list.List() == nullptr) return;
  Value rest;
  rest.value.Reset(list.List()->Rest());
  rest.number = list.number;
  *rest.tree = *list.tree;
  if (!rest.tree->items.empty()) rest.tree->items.erase(rest.tree->items.begin());
  FUZZ_CHECK(rest.value);
  to = std::move(rest);
}

void Calls::CheckPair(const Value& a, const Value& b) {
  if (!a.value || !b.value) return;
  const bool same = a.tree->Canonical() == b.tree->Canonical();
  FUZZ_CHECK(a.value->IsEqual(b.value.get()) == same && b.value->IsEqual(a.value.get()) == same);
  if (a.List() == nullptr || b.List() == nullptr) return;
  FUZZ_CHECK(!same || a.List()->IsSubset(b.List()));
  bool held = false;
  for (const auto& item : a.tree->items) held = held || item->Canonical() == b.tree->Canonical();
  FUZZ_CHECK(a.List()->Contains(b.List()) == held);
}

void Calls::CheckText(const Value& value) {
  if (!value.value) return;
  const std::string text = value.tree->Canonical();
  FUZZ_CHECK(value.value->CanonicalLength() == text.size());
  if (value.List() == nullptr) return;
  FUZZ_CHECK(ExportOf(value.List()) == text);
  FUZZ_CHECK(value.List()->Count() == value.tree->items.size());
  const std::string printed = Print(value.value.get());
  Ref<SExpression> read;
  FUZZ_CHECK(SExpression::Import(read.Out(), Wrap(printed).get(), nullptr) == 0);
  FUZZ_CHECK(Print(read.get()) == printed && ExportOf(read.get()) == text);
  const Text told(value.List()->ExportTag("tag"));
  const Text words(Wording::OfTag(value.List()));
}

// An entry, a certificate and a revocation list, of the first list that there is.
void Calls::Build() {
  const Value* tag = nullptr;
  for (const Value& value : values_) tag = value.List() != nullptr ? &value : tag;
  if (tag == nullptr) return;
  Ref<Hash> key(new Hash(nullptr));
  FUZZ_CHECK(key->Init(choices_.Chance(2) ? ZVCLM_HASH_SHA1 : ZVCLM_HASH_SHA256) == 0);
  FUZZ_CHECK(key->Update(tag->value.get()) == 0 && key->Finalize() == 0);
  Ref<TimeStamp> stamp(new TimeStamp(nullptr));
  FUZZ_CHECK(stamp->Set(static_cast<long>(choices_.Below(256)) << choices_.Below(24)) == 0);
  Ref<Cert> cert(new Cert(nullptr));
  const bool dated = choices_.Chance(2);
  FUZZ_CHECK(cert->Set(key.get(), key.get(), choices_.Chance(2), tag->List(),
                       dated ? stamp.get() : nullptr, nullptr, nullptr, nullptr) == 0);
  // Readers take a tag for one by its head, of three letters.
  const bool is_tag = tag->tree->Canonical().starts_with("(3:");
  FUZZ_CHECK(!is_tag || RoundTrip<Cert>(Print(cert.get())));
  Ref<Crl> list;
  FUZZ_CHECK(Crl::Create(list.Out(), nullptr) == 0);
  for (unsigned n = choices_.Below(3); n > 0; --n) {
    FUZZ_CHECK(list->RevokeKey(key.get(), stamp.get()) == 0);
    FUZZ_CHECK(list->RevokeCertificate(key.get(), stamp.get()) == 0);
  }
  RoundTrip<Crl>(Print(list.get()));
  Ref<SExpression> acl;
  FUZZ_CHECK(SExpression::Create(acl.Out(), "acl", nullptr) == 0);
  Evidence evidence(nullptr);
  evidence.SetEntries(acl.get());
  FUZZ_CHECK(evidence.AddCert(cert.get(), nullptr, 0) == 0);
  FUZZ_CHECK(evidence.Judge(tag->List()) != 0);  // nobody grants anything
}

void Calls::Run() {
  for (int i = 0; i < 40 && !choices_.Empty(); ++i) {
    switch (choices_.Below(6)) {
      case 0:
        Make(Any());
        break;
      case 1:
      case 2: {
        Value& list = Any();
        Insert(list, Any());
        break;
      }
      case 3: {
        Value& list = Any();
        Remove(list, Any());
        break;
      }
      case 4: {
        Value& to = Any();
        TakeRest(to, Any());
        break;
      }
      default:
        Set(Any());
    }
  }
  for (const Value& a : values_) {
    CheckText(a);
    for (const Value& b : values_) CheckPair(a, b);
  }
  Build();
}

}  // namespace

FUZZ_TARGET(calls) {
  Choices choices(input);
  Calls(choices).Run();
}
