// crl_drop.cpp: letting go what was revoked.
#include "tools/vesk2/stores/crl_drop.h"

#include <algorithm>

#include "tools/vesk2/objects/texts.h"

namespace vesk2_command {
namespace {

using ZvVesk2::Crl;
using ZvVesk2::Hash;

constexpr size_t kMostNotes = 20;  // of one kind: a screen

// (item HASH DATE)
std::string DigestOf(const SExpression& item) {
  auto part = item.Begin();
  if (part) part.Next();  // the keyword
  auto* named = part ? dynamic_cast<Hash*>(part.Value()) : nullptr;
  return named != nullptr ? SubjectText(*named) : "";
}

void AddDigests(std::set<std::string>& digests, const SExpression* list) {
  for (auto it = list->Begin(); it; it.Next()) {
    if (const auto* item = dynamic_cast<SExpression*>(it.Value())) digests.insert(DigestOf(*item));
  }
}

}  // namespace

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

std::string Drops::ItemsOf(const SExpression& list) const {
  std::string items;
  for (auto it = list.Begin(); it && !all_; it.Next()) {
    auto* item = dynamic_cast<SExpression*>(it.Value());
    if (item != nullptr && digests_.count(DigestOf(*item)) == 0) items += Canonical(*item);
  }
  return items;
}

void Drops::Settle(const std::vector<const Crl*>& before, const Crl& after) const {
  std::set<std::string> revoked;
  std::vector<Revoked> gone;
  std::set<std::string> seen;
  for (const Crl* list : before) {
    AddDigests(revoked, list->GetList1());
    AddDigests(revoked, list->GetList2());
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
