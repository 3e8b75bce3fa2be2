// crl_compare.cpp: comparing revocation lists.
#include "tools/vesk2/stores/crl_compare.h"

#include <algorithm>
#include <unordered_map>

#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

using ZvVesk2::Crl;
using ZvVesk2::Hash;

// A date that the library can compare; empty for any other text, which counts from ever on. Empty
// is then also the earliest.
std::string Since(const SExpression& item) {
  constexpr std::string_view kForm = "####-##-##_##:##:##";
  const auto* date = dynamic_cast<ByteString*>(item.Last());
  const std::string_view text = date != nullptr ? BytesOf(*date) : std::string_view();
  const auto fits = [](char form, char c) {
    return form == '#' ? c >= '0' && c <= '9' : c == form;
  };
  const bool stamp = std::equal(kForm.begin(), kForm.end(), text.begin(), text.end(), fits);
  return stamp ? std::string(text) : "";
}

// The items of one of the two lists of a Crl; dates do not matter for keys.
std::vector<Revoked> Items(const SExpression* list, bool isKey) {
  std::vector<Revoked> items;
  if (list == nullptr) return items;
  for (auto at = list->Begin(); at; at.Next()) {
    const auto* item = dynamic_cast<SExpression*>(at.Value());
    if (item == nullptr) continue;
    auto part = item->Begin();
    if (part) part.Next();  // the keyword
    auto* named = part ? dynamic_cast<Hash*>(part.Value()) : nullptr;
    if (named == nullptr || named->GetDigest() == nullptr) continue;
    items.push_back({isKey, Ref<Hash>::Share(named), isKey ? "" : Since(*item)});
  }
  return items;
}

std::vector<Revoked> Items(const Crl& list) {
  std::vector<Revoked> items = Items(list.GetList1(), false);
  std::vector<Revoked> keys = Items(list.GetList2(), true);
  std::move(keys.begin(), keys.end(), std::back_inserter(items));
  return items;
}

std::string Identity(const Revoked& item) {
  return (item.isKey ? "k" : "c") + std::to_string(item.named->GetAlgorithm()) + ":" +
         std::string(BytesOf(*item.named->GetDigest()));
}

bool NamesNothing(const Revoked& item) {
  const std::string_view digest = BytesOf(*item.named->GetDigest());
  return digest.find_first_not_of('\0') == std::string_view::npos;
}

}  // namespace

std::string Revoked::Text() const {
  return (isKey ? "key " : "certificate ") + SubjectText(*named) +
         (since.empty() ? "" : ", revoked since " + Escape(since));
}

std::vector<Revoked> WhatIsLetGo(const Crl& before, const Crl& after) {
  std::unordered_map<std::string, std::string> kept;  // and since when
  for (const Revoked& item : Items(after)) {
    const auto [at, isNew] = kept.emplace(Identity(item), item.since);
    if (!isNew) at->second = std::min(at->second, item.since);
  }
  std::vector<Revoked> gone;
  for (Revoked& item : Items(before)) {
    if (NamesNothing(item)) continue;
    const auto at = kept.find(Identity(item));
    if (at == kept.end() || at->second > item.since) gone.push_back(std::move(item));
  }
  return gone;
}

}  // namespace vesk2_command
