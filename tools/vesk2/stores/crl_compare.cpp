// SPDX-License-Identifier: Apache-2.0
// crl_compare.cpp: comparing revocation lists, and letting go what one revokes.
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
using ZvVesk2::TimeStamp;

constexpr size_t kMostNotes = 20;  // of one kind: a screen

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

// The items of one of the two lists of a Crl, each (item HASH DATE); dates do not matter for keys.
void AddItems(std::vector<Revoked>& items, const SExpression* list, bool isKey) {
  if (list == nullptr) return;
  for (auto at = list->Begin(); at; at.Next()) {
    const auto* item = dynamic_cast<SExpression*>(at.Value());
    if (item == nullptr) continue;
    auto part = item->Begin();
    if (part) part.Next();  // the keyword
    auto* named = part ? dynamic_cast<Hash*>(part.Value()) : nullptr;
    if (named == nullptr || named->GetDigest() == nullptr) continue;
    items.push_back({isKey, Ref<Hash>::Share(named), isKey ? "" : Since(*item),
                     Ref<TimeStamp>::Share(dynamic_cast<TimeStamp*>(item->Last()))});
  }
}

std::vector<Revoked> Items(const Crl& list) {
  std::vector<Revoked> items;
  AddItems(items, list.GetList1(), false);
  AddItems(items, list.GetList2(), true);
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

Json TellLetGo(const std::vector<Revoked>& items, const std::string& what) {
  Json said = Json::array();
  for (const Revoked& item : items) {
    if (said.size() < kMostNotes) Note(what + " " + item.Text());
    said.push_back(
        {{"kind", item.isKey ? "key" : "certificate"}, {"digest", SubjectText(*item.named)}});
    if (!item.since.empty()) said.back()["from"] = item.since;
  }
  if (items.size() > kMostNotes) {
    Note(what + " " + std::to_string(items.size() - kMostNotes) + " more");
  }
  return said;
}

Drops::Drops(const std::vector<std::string>& arguments) {
  for (const std::string& argument : arguments) {
    if (argument == "all") {
      all_ = true;
    } else {
      digests_.insert(argument);
    }
  }
}

bool Drops::Name(const Revoked& item) const {
  return all_ || digests_.count(SubjectText(*item.named)) != 0;
}

void Drops::CarryOver(const Crl& before, Crl& list) const {
  for (const Revoked& item : Items(before)) {
    if (Name(item)) continue;
    Check(item.isKey ? list.RevokeKey(item.named.get(), item.date.get())
                     : list.RevokeCertificate(item.named.get(), item.date.get()),
          "building a revocation list");
  }
}

void Drops::Settle(const std::vector<const Crl*>& before, const Crl& after) const {
  std::set<std::string> revoked;
  std::vector<Revoked> gone;
  std::set<std::string> seen;
  for (const Crl* list : before) {
    for (const Revoked& item : Items(*list)) revoked.insert(SubjectText(*item.named));
    for (Revoked& item : WhatIsLetGo(*list, after)) {
      if (seen.insert(item.Text()).second) gone.push_back(std::move(item));
    }
  }
  for (const std::string& digest : digests_) {
    if (revoked.count(digest) != 0) continue;
    throw Trouble("--drop " + Escape(digest) + ": the list before this one does not revoke it",
                  "usage");
  }
  const auto unnamed = std::stable_partition(gone.begin(), gone.end(),
                                             [&](const Revoked& item) { return Name(item); });
  const std::vector<Revoked> missed(std::make_move_iterator(unnamed),
                                    std::make_move_iterator(gone.end()));
  gone.erase(unnamed, gone.end());
  if (!missed.empty()) {
    Result()["lets_go"] = TellLetGo(missed, "would let go:");
    throw Trouble(
        "the list before this one revokes what is named above (--items-of LIST revokes it "
        "again; --drop DIGEST, or --drop all, lets it go)",
        "lets-go");
  }
  if (!gone.empty()) Result()["lets_go"] = TellLetGo(gone, "lets go:");
}

}  // namespace vesk2_command
