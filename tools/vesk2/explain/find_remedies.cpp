// SPDX-License-Identifier: Apache-2.0
// find_remedies.cpp: searching for the smallest change that turns a refusal.
#include "tools/vesk2/explain/find_remedies.h"

#include <algorithm>
#include <numeric>

#include "tools/vesk2/explain/edits.h"
#include "tools/vesk2/explain/sign_again.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

using ZvVesk2::Cert;
using Reach = EditMaker::Reach;
using Choice = std::vector<const Edit*>;

// Bounds on the work: chains and stores are as long as their writers like.
constexpr size_t kMaxCerts = 16;
constexpr size_t kMaxEntries = 16;
constexpr unsigned kMaxTrials = 600;
constexpr unsigned kMaxRootTrials = 200;  // of them, kept for roots of trust
constexpr size_t kMaxAlternatives = 3;
constexpr size_t kMaxTogether = 3;

int CostOf(const Choice& choice) {
  return std::accumulate(choice.begin(), choice.end(), 0,
                         [](int sum, const Edit* edit) { return sum + edit->cost; });
}

bool OneTarget(const Choice& choice) {
  for (size_t i = 0; i < choice.size(); ++i) {
    for (size_t j = i + 1; j < choice.size(); ++j) {
      if (choice[i]->target == choice[j]->target) return true;
    }
  }
  return false;
}

bool HasNewRoot(const Choice& choice) {
  return std::any_of(choice.begin(), choice.end(), [](const Edit* edit) { return edit->newRoot; });
}

void AddOnce(std::vector<std::string>& words, const std::vector<std::string>& more) {
  for (const std::string& word : more) {
    if (std::find(words.begin(), words.end(), word) == words.end()) words.push_back(word);
  }
}

Remedy Together(const Choice& choice) {
  Remedy remedy{choice.size() == 1 ? choice[0]->remedy.kind : "several", ""};
  if (HasNewRoot(choice)) remedy.kind = "new-root";
  for (const Edit* edit : choice) {
    const Remedy& part = edit->remedy;
    remedy.text += (remedy.text.empty() ? "" : "; and ") + part.text;
    remedy.commands.insert(remedy.commands.end(), part.commands.begin(), part.commands.end());
    AddOnce(remedy.keys, part.keys);
    AddOnce(remedy.foreign, part.foreign);
  }
  return remedy;
}

// The commands are about the stores that the question was about.
void CarryStores(Remedy& remedy) {
  const StoreOptions& stores = GetStoreOptions();
  for (auto& command : remedy.commands) {
    if (!stores.global.empty()) command.insert(command.end(), {"--global", stores.global});
    if (!stores.home.empty()) command.insert(command.end(), {"--home", stores.home});
  }
}

class Finder {
 public:
  Finder(const Question& question, const Evidence& evidence)
      : question_(question), evidence_(evidence), maker_(question, evidence) {}

  std::vector<Remedy> Find() {
    // A root of trust is named when nothing else helps.
    for (const bool roots : {false, true}) {
      roots_ = roots;
      for (const Reach reach : {Reach::kAsItIs, Reach::kAsked, Reach::kWholePeriod}) {
        required_.clear();
        if (!Require(reach)) return {};
        MakeOptional();
        std::vector<Remedy> found = TryAll();
        if (!found.empty()) return found;
        if (required_.empty()) break;
      }
    }
    return {};
  }

 private:
  // The changes without which no other helps: a manifest leaves out certificates that are revoked
  // or about which nothing is known, a chain is refused for one. False when there is none, or what
  // was taken back would have to be given again.
  bool Require(Reach reach) {
    for (size_t i = 0; i < evidence_.certs.size(); ++i) {
      const bool needed = !question_.manifest || i == 0;
      const size_t count = required_.size();
      const bool revoked = State(i) == Cert::RevokedByCrl || State(i) == Cert::KeyRevoked;
      if (needed && revoked) return false;
      if (evidence_.certs[i].code != 0) {
        const size_t before = count;
        maker_.Renew(required_, i, reach);
        if (required_.size() == before) maker_.Renew(required_, i, Reach::kAsItIs);
        if (required_.size() == before) return false;
      }
      if (needed && State(i) == Cert::Undetermined && !Determine(required_, i)) return false;
    }
    return true;
  }

  int32_t State(size_t index) const { return evidence_.proved->GetRevocationStatus(index); }

  // One list serves all certificates of a source.
  bool Determine(std::vector<Edit>& edits, size_t index) const {
    const std::string source = ReadableTag(evidence_.certs[index].source.get());
    const bool served = std::any_of(edits.begin(), edits.end(),
                                    [&](const Edit& edit) { return edit.target == source; });
    if (served) return true;
    const size_t count = edits.size();
    maker_.FreshList(edits, index);
    return edits.size() > count;
  }

  void MakeOptional() {
    optional_.clear();
    const size_t certs = std::min(evidence_.certs.size(), kMaxCerts);
    for (size_t i = 0; i < certs; ++i) {
      if (roots_) maker_.NewRoot(optional_, i);
      if (IsRequired(i)) continue;
      const size_t count = optional_.size();
      maker_.Renew(optional_, i, Reach::kAsked);
      maker_.Renew(optional_, i, Reach::kWholePeriod);
      if (optional_.size() == count + 2 &&
          optional_[count].remedy.commands == optional_.back().remedy.commands) {
        optional_.pop_back();
      }
      if (!question_.manifest || i == 0) continue;
      if (State(i) == Cert::Undetermined) (void)Determine(optional_, i);
    }
    maker_.CoSign(optional_);
    size_t entries = 0;
    for (const EntryEvidence& each : evidence_.entries) {
      if (entries == kMaxEntries) break;
      if (!each.relevant) continue;
      ++entries;
      maker_.Widen(optional_, each);
    }
    std::stable_sort(optional_.begin(), optional_.end(),
                     [](const Edit& a, const Edit& b) { return a.cost < b.cost; });
  }

  bool IsRequired(size_t index) const {
    return std::any_of(required_.begin(), required_.end(),
                       [&](const Edit& edit) { return edit.cert && edit.index == index; });
  }

  bool Turns(const Choice& choice) {
    if (trials_++ >= kMaxTrials - (roots_ ? 0 : kMaxRootTrials)) return false;
    Hypothesis hypothesis;
    for (const Edit* edit : choice) Apply(*edit, hypothesis);
    return Judge(question_, evidence_, hypothesis) == 0;
  }

  // What is required with as few further changes as will do.
  std::vector<Remedy> TryAll() {
    Choice required;
    for (const Edit& edit : required_) required.push_back(&edit);
    if (!roots_ && !required.empty() && Turns(required)) return {Together(required)};
    for (size_t count = 1; count <= kMaxTogether; ++count) {
      std::vector<Remedy> found;
      for (const Choice& choice : Choices(count)) {
        Choice whole = required;
        whole.insert(whole.end(), choice.begin(), choice.end());
        if (HasNewRoot(whole) != roots_ || OneTarget(whole) || !Turns(whole)) continue;
        found.push_back(Together(whole));
        if (found.size() == (count == 1 ? kMaxAlternatives : 1)) return found;
      }
      if (!found.empty()) return found;
    }
    return Rebuild(required);
  }

  // Every choice of that many optional changes, the cheapest first.
  std::vector<Choice> Choices(size_t count) const {
    std::vector<Choice> choices = {{}};
    for (size_t taken = 0; taken < count; ++taken) {
      std::vector<Choice> longer;
      for (const Choice& choice : choices) {
        const size_t next =
            choice.empty() ? 0 : static_cast<size_t>(choice.back() - optional_.data()) + 1;
        for (size_t i = next; i < optional_.size() && longer.size() < kMaxTrials; ++i) {
          longer.push_back(choice);
          longer.back().push_back(&optional_[i]);
        }
      }
      choices = std::move(longer);
    }
    std::stable_sort(choices.begin(), choices.end(),
                     [](const Choice& a, const Choice& b) { return CostOf(a) < CostOf(b); });
    return choices;
  }

  // Every certificate renewed, and the root trusted if that may be.
  std::vector<Remedy> Rebuild(const Choice& required) {
    std::vector<Edit> renewals;
    for (size_t i = 0; i < std::min(evidence_.certs.size(), kMaxCerts); ++i) {
      if (IsRequired(i)) continue;
      const size_t count = renewals.size();
      maker_.Renew(renewals, i, Reach::kWholePeriod);
      if (renewals.size() == count) maker_.Renew(renewals, i, Reach::kAsked);
    }
    if (roots_) maker_.NewRoot(renewals, evidence_.certs.size() - 1);
    Choice whole = required;
    for (const Edit& edit : renewals) whole.push_back(&edit);
    std::vector<Remedy> found;
    if (Turns(whole)) found.push_back(Together(whole));
    return found;
  }

  const Question& question_;
  const Evidence& evidence_;
  EditMaker maker_;
  std::vector<Edit> required_;
  std::vector<Edit> optional_;
  bool roots_ = false;  // new ones are among the candidates
  unsigned trials_ = 0;
};

// Where the way back is not a command: a revoked key's holder has to begin anew, and whose lists
// count is decided by who keeps the store.
std::vector<Remedy> ByHand(const Evidence& evidence) {
  std::vector<Remedy> remedies;
  for (size_t i = 0; i < evidence.certs.size(); ++i) {
    const int32_t state = evidence.proved->GetRevocationStatus(i);
    const CertEvidence& each = evidence.certs[i];
    const std::string subject = SubjectText(*each.cert->GetSubject());
    Remedy remedy;
    if (state == Cert::KeyRevoked) {
      remedy = {"new-key",
                subject + " is revoked: its holder needs a new key, and certificates for it"};
    } else if (state == Cert::RevokedByCrl) {
      remedy = {"new-key", CertName(evidence, i) + " is revoked: " + subject +
                               " needs a new key, and a certificate for it"};
    } else if (state == Cert::Undetermined && Voucher(evidence, each.source.get()) == nullptr) {
      remedy = {"revocation-list",
                "find out who revokes for " + TagText(each.source.get()) +
                    ", grant that key this tag, and import its list: no ACL entry says whose lists "
                    "count"};
    } else {
      continue;
    }
    const bool named = std::any_of(remedies.begin(), remedies.end(),
                                   [&](const Remedy& other) { return other.text == remedy.text; });
    if (!named) remedies.push_back(remedy);
  }
  return remedies;
}

}  // namespace

std::vector<Remedy> MendTree(const Question& question, const Evidence& evidence) {
  std::vector<Remedy> remedies = {{"restore", "put back what is named above as it was signed"}};
  for (Remedy& again : SignAgain(question, evidence)) remedies.push_back(std::move(again));
  for (Remedy& remedy : remedies) CarryStores(remedy);
  return remedies;
}

std::vector<Remedy> FindRemedies(const Question& question, const Evidence& evidence, int code) {
  std::vector<Remedy> remedies;
  if (evidence.certs.empty()) return remedies;
  if (!evidence.contentSigned) {
    remedies = {{"restore", "get " + Escape(question.file) + " as it was signed"}};
    for (Remedy& again : SignAgain(question, evidence)) remedies.push_back(std::move(again));
  } else if (Judge(question, evidence) == code) {
    // What cannot be reproduced from what lies there now cannot be mended either.
    remedies = Finder(question, evidence).Find();
    if (remedies.empty()) remedies = SignAgain(question, evidence);
    if (remedies.empty()) remedies = ByHand(evidence);
  }
  for (Remedy& remedy : remedies) CarryStores(remedy);
  return remedies;
}

}  // namespace vesk2_command
