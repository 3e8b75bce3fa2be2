// remedy.cpp: searching for the smallest change that turns a refusal.
#include "tools/vesk2/remedy.h"

#include <algorithm>
#include <numeric>

#include "tools/vesk2/edits.h"
#include "tools/vesk2/inspect.h"
#include "tools/vesk2/report.h"

namespace vesk2_command {
namespace {

using ZvVesk2::Cert;
using Reach = EditMaker::Reach;
using Choice = std::vector<const Edit*>;

// Bounds on the work: chains and stores are as long as their writers like.
constexpr size_t kMaxCerts = 16;
constexpr size_t kMaxEntries = 16;
constexpr unsigned kMaxTrials = 600;
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

Remedy Together(const Choice& choice) {
  Remedy remedy{choice.size() == 1 ? choice[0]->remedy.kind : "several", ""};
  for (const Edit* edit : choice) {
    const Remedy& part = edit->remedy;
    remedy.text += (remedy.text.empty() ? "" : "; and ") + part.text;
    remedy.commands.insert(remedy.commands.end(), part.commands.begin(), part.commands.end());
    for (const std::string& key : part.keys) {
      if (std::find(remedy.keys.begin(), remedy.keys.end(), key) == remedy.keys.end()) {
        remedy.keys.push_back(key);
      }
    }
  }
  return remedy;
}

class Finder {
 public:
  Finder(const Question& question, const Evidence& evidence)
      : question_(question), evidence_(evidence), maker_(question, evidence) {
    states_ = RevocationStates(evidence);
  }

  std::vector<Remedy> Find() {
    for (const Reach reach : {Reach::kAsItIs, Reach::kAsked, Reach::kWholePeriod}) {
      required_.clear();
      if (!Require(reach)) return {};
      MakeOptional();
      std::vector<Remedy> found = TryAll();
      if (!found.empty() || required_.empty()) return found;
    }
    return {};
  }

 private:
  // The changes without which no other helps: a manifest leaves out certificates that are revoked
  // or about which nothing is known, a chain is refused for one. False when there is none.
  bool Require(Reach reach) {
    for (size_t i = 0; i < evidence_.certs.size(); ++i) {
      const bool needed = !question_.manifest || i == 0;
      const size_t count = required_.size();
      const bool listed = needed && states_[i] == Cert::RevokedByCrl;
      if (needed && states_[i] == Cert::KeyRevoked) return false;
      if (evidence_.certs[i].code != 0 || listed) {
        const size_t before = count;
        maker_.Renew(required_, i, reach);
        if (required_.size() == before) maker_.Renew(required_, i, Reach::kAsItIs);
        if (required_.size() == before) return false;
      }
      if (needed && states_[i] == Cert::Undetermined && !Determine(required_, i)) return false;
    }
    return true;
  }

  // One list serves all certificates of a source.
  bool Determine(std::vector<Edit>& edits, size_t index) const {
    const std::string source = ReadableTag(evidence_.certs[index].source.get());
    const bool served = std::any_of(edits.begin(), edits.end(),
                                    [&](const Edit& edit) { return edit.target == source; });
    if (served) return true;
    const size_t count = edits.size();
    maker_.TrustList(edits, index);
    if (edits.size() > count && Determines(edits.back(), index)) return true;
    edits.erase(edits.begin() + static_cast<std::ptrdiff_t>(count), edits.end());
    maker_.FreshList(edits, index);
    return edits.size() > count;
  }

  bool Determines(const Edit& edit, size_t index) const {
    Hypothesis hypothesis;
    Apply(edit, hypothesis);
    return RevocationStates(evidence_, hypothesis)[index] == Cert::NotRevoked;
  }

  void MakeOptional() {
    optional_.clear();
    const size_t certs = std::min(evidence_.certs.size(), kMaxCerts);
    for (size_t i = 0; i < certs; ++i) {
      maker_.GrantIssuer(optional_, i);
      if (IsRequired(i)) continue;
      const size_t count = optional_.size();
      maker_.Renew(optional_, i, Reach::kAsked);
      maker_.Renew(optional_, i, Reach::kWholePeriod);
      if (optional_.size() == count + 2 &&
          optional_[count].remedy.commands == optional_.back().remedy.commands) {
        optional_.pop_back();
      }
      if (!question_.manifest || i == 0) continue;
      if (states_[i] == Cert::RevokedByCrl) maker_.Renew(optional_, i, Reach::kAsItIs);
      if (states_[i] == Cert::Undetermined) (void)Determine(optional_, i);
    }
    maker_.GrantSubject(optional_);
    size_t entries = 0;
    for (const EntryEvidence& each : evidence_.entries) {
      if (entries == kMaxEntries) break;
      if (!IsRelevant(each, evidence_)) continue;
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
    if (trials_++ >= kMaxTrials) return false;
    Hypothesis hypothesis;
    for (const Edit* edit : choice) Apply(*edit, hypothesis);
    return Judge(question_, evidence_, hypothesis) == 0;
  }

  // What is required with as few further changes as will do.
  std::vector<Remedy> TryAll() {
    Choice required;
    for (const Edit& edit : required_) required.push_back(&edit);
    if (!required.empty() && Turns(required)) return {Together(required)};
    for (size_t count = 1; count <= kMaxTogether; ++count) {
      std::vector<Remedy> found;
      for (const Choice& choice : Choices(count)) {
        Choice whole = required;
        whole.insert(whole.end(), choice.begin(), choice.end());
        if (OneTarget(whole) || !Turns(whole)) continue;
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

  // Every certificate renewed, and the root trusted.
  std::vector<Remedy> Rebuild(const Choice& required) {
    std::vector<Edit> renewals;
    for (size_t i = 0; i < std::min(evidence_.certs.size(), kMaxCerts); ++i) {
      if (IsRequired(i)) continue;
      const size_t count = renewals.size();
      maker_.Renew(renewals, i, Reach::kWholePeriod);
      if (renewals.size() == count) maker_.Renew(renewals, i, Reach::kAsked);
    }
    if (!evidence_.certs.empty()) maker_.GrantIssuer(renewals, evidence_.certs.size() - 1);
    Choice whole = required;
    for (const Edit& edit : renewals) whole.push_back(&edit);
    std::vector<Remedy> found;
    if (Turns(whole)) found.push_back(Together(whole));
    return found;
  }

  const Question& question_;
  const Evidence& evidence_;
  EditMaker maker_;
  std::vector<int32_t> states_;
  std::vector<Edit> required_;
  std::vector<Edit> optional_;
  unsigned trials_ = 0;
};

// A certificate as `manifest sign` writes it, for a hypothesis.
Ref<Cert> Unlimited(PublicKey& issuer, ZvVesk2::Subject& subject, bool propagate) {
  Ref<Cert> cert(new Cert(nullptr));
  Check(cert->Set(&issuer, &subject, propagate, nullptr, nullptr, nullptr, nullptr, nullptr),
        "building a certificate");
  return cert;
}

// For a revoked key there is no command line: its holder has to begin anew.
std::vector<Remedy> NewKeys(const Evidence& evidence) {
  const std::vector<int32_t> states = RevocationStates(evidence);
  std::vector<Remedy> remedies;
  for (size_t i = 0; i < states.size(); ++i) {
    if (states[i] != Cert::KeyRevoked) continue;
    const std::string text = SubjectText(*evidence.certs[i].cert->GetSubject()) +
                             " is revoked: its holder needs a new key, and certificates for it";
    const bool named = std::any_of(remedies.begin(), remedies.end(),
                                   [&](const Remedy& each) { return each.text == text; });
    if (!named) remedies.push_back({"new-key", text});
  }
  return remedies;
}

}  // namespace

std::vector<Remedy> SignAgain(const Question& question, const Evidence& evidence) {
  if (evidence.certs.empty() || question.signing.empty()) return {};
  ZvVesk2::Subject* content = evidence.certs[0].cert->GetSubject();
  auto* signer = dynamic_cast<PublicKey*>(evidence.certs[0].cert->GetIssuer());
  if (signer == nullptr || !content->IsHash()) return {};
  const Ref<Cert> first = Unlimited(*signer, *content, false);
  const Ref<Cert> own = Unlimited(*signer, *signer, true);
  const Ref<TimeStamp> now = ParseTime("now", false);
  Hypothesis again;
  again.signedAgain = {first.get(), own.get()};
  again.at = now.get();

  Remedy remedy{"sign-again", "have " + Fingerprint(*signer) + " sign the manifest again"};
  std::vector<Edit> grants;
  if (Judge(question, evidence, again) != 0) {
    // The certificates of another key's manifest are not at hand: its own trust has to be.
    EditMaker(question, evidence).GrantIssuer(grants, 0);
    if (grants.empty()) return {};
    Apply(grants[0], again);
    if (Judge(question, evidence, again) != 0) return {};
    remedy.commands = grants[0].remedy.commands;
    remedy.text += ", and trust it for " + TagText(question.request->tag.get());
  }
  std::vector<std::string> command = {"vesk2", "manifest", "sign"};
  command.insert(command.end(), question.signing.begin(), question.signing.end());
  for (const std::string& word : {std::string("--key"), KeyWord(*signer), std::string("-o"),
                                  question.file, std::string("--force")}) {
    command.push_back(word);
  }
  remedy.commands.push_back(command);
  remedy.keys = {Fingerprint(*signer)};
  return {remedy};
}

std::vector<Remedy> FindRemedies(const Question& question, const Evidence& evidence, int code) {
  if (evidence.certs.empty()) return {};
  if (!evidence.contentSigned) return SignAgain(question, evidence);
  // What cannot be reproduced from what lies there now cannot be mended either.
  if (Judge(question, evidence) != code) return {};
  std::vector<Remedy> remedies = Finder(question, evidence).Find();
  if (remedies.empty()) remedies = SignAgain(question, evidence);
  if (remedies.empty()) remedies = NewKeys(evidence);
  return remedies;
}

}  // namespace vesk2_command
