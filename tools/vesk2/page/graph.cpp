// SPDX-License-Identifier: Apache-2.0
// graph.cpp: from the members of an answer to nodes and edges.
#include "tools/vesk2/page/graph.h"

#include <algorithm>

namespace vesk2_command {
namespace {

constexpr size_t kStore = 0;  // the node of what this machine trusts

std::string PeriodOf(const Json& grant) {
  const std::string first = ValueText(Member(grant, "not_before"));
  const std::string last = ValueText(Member(grant, "not_after"));
  if (first.empty() && last.empty()) return "always";
  if (first == last) return "at " + first;
  return (first.empty() ? "" : "from " + first + (last.empty() ? "" : " ")) +
         (last.empty() ? "" : "until " + last);
}

std::string KeysText(const Json& threshold) {
  const std::string n = ValueText(Member(threshold, "n"));
  return ValueText(Member(threshold, "k")) + " of " + n + (n == "1" ? " key" : " keys");
}

// What an entry and a certificate both say.
std::vector<std::string> GrantFacts(const Json& grant) {
  const Json& tag = Member(grant, "tag");
  std::vector<std::string> facts = {"tag: " + (tag.is_null() ? "no limit" : ValueText(tag)),
                                    "period: " + PeriodOf(grant)};
  const Json& threshold = Member(grant, "threshold");
  if (!threshold.is_null()) {
    facts.push_back(KeysText(threshold) + " must agree");
  }
  facts.emplace_back(Member(grant, "propagate") == true ? "may be passed on"
                                                        : "may not be passed on");
  const std::string comment = ValueText(Member(grant, "comment"));
  if (!comment.empty()) facts.push_back("comment: " + comment);
  return facts;
}

std::string RevocationFact(const Json& revocation) {
  const std::string source = ValueText(Member(revocation, "source"));
  const std::string since = ValueText(Member(revocation, "since"));
  std::string state = ValueText(Member(revocation, "state"));
  for (char& c : state) c = c == '-' ? ' ' : c;
  return (state.empty() ? "revocation not asked" : state) +
         (since.empty() ? "" : " since " + since) + (source.empty() ? "" : " by " + source);
}

void TakeApprovals(const Json& list,
                   std::map<std::string, std::map<std::string, std::string>>& to) {
  for (const Json& each : list) {
    auto& keys = to[ValueText(Member(each, "entry"))];
    for (const auto& [member, words] : {std::pair("approved", "has approved"),
                                        std::pair("would_count", "its approval would count"),
                                        std::pair("revoked", "revoked: nobody should ask it")}) {
      for (const Json& key : Member(each, member)) keys[ValueText(key)] = words;
    }
  }
}

// Which nodes can be come to.
class Reach {
 public:
  explicit Reach(size_t count) : next_(count), target_(count, false), has_(count, false) {}

  void Join(size_t from, size_t to) {
    next_[from].push_back(to);
    target_[to] = true;
  }
  void From(size_t start) {
    std::vector<size_t> left = {start};
    while (!left.empty()) {
      const size_t node = left.back();
      left.pop_back();
      if (has_[node]) continue;
      has_[node] = true;
      left.insert(left.end(), next_[node].begin(), next_[node].end());
    }
  }
  bool IsTarget(size_t node) const { return target_[node]; }
  bool Has(size_t node) const { return has_[node]; }

 private:
  std::vector<std::vector<size_t>> next_;
  std::vector<bool> target_;
  std::vector<bool> has_;
};

}  // namespace

const Json& Member(const Json& value, const char* name) {
  static const Json none;
  const auto found = value.is_object() ? value.find(name) : value.end();
  return value.is_object() && found != value.end() ? *found : none;
}

std::string ValueText(const Json& value) {
  if (value.is_null()) return "";
  if (value.is_boolean()) return value.get<bool>() ? "yes" : "no";
  return value.is_string() ? value.get<std::string>() : value.dump();
}

Graph::Graph(const Json& answer) {
  const Json& result = Member(answer, "result");
  Node("", "trusted by this machine");
  nodes_[kStore].name = "its ACL store";
  const std::string signer = ValueText(Member(result, "signer"));
  if (!signer.empty()) Node(signer, "the signer");
  TakeApprovals(Member(result, "approvals"), approvals_);
  for (const Json& entry : Member(result, "acl")) AddEntry(entry);
  const Json& chain = Member(result, "chain");  // its end first
  for (size_t i = chain.size(); i-- > 0;) {
    AddCertificate(chain[i], ValueText(Member(chain[i], "certificate")));
  }
  for (const char* signers : {"may_sign", "groups"}) {
    for (const Json& each : Member(result, signers)) AddSigner(each);
  }
  AddAnswer(answer);
  bool cut = !edges_[answer_].cuts.empty();
  for (const Json& reason : Member(result, "lost")) {
    Cut(reason);
    cut = true;
  }
  MarkPath(Member(result, "authority"));
  if (Member(answer, "verdict") == "yes")
    edges_[answer_].carries = true;
  else if (!cut)
    edges_[answer_].cuts.push_back(ValueText(Member(answer, "message")));
}

size_t Graph::Node(const std::string& name, const std::string& kind) {
  const auto [place, isNew] = known_.try_emplace(name, nodes_.size());
  if (isNew) nodes_.push_back({kind, name});
  return place->second;
}

GraphEdge& Graph::Edge(size_t from, size_t to, const std::string& name) {
  edges_.push_back({from, to, name});
  return edges_.back();
}

// A key that is named by its digest is the same node: both are told by the same fingerprint.
size_t Graph::SubjectNode(const Json& grant) {
  const size_t node =
      Node(ValueText(Member(grant, "subject")), ValueText(Member(grant, "subject_kind")));
  const Json& threshold = Member(grant, "threshold");
  if (!threshold.is_null()) {
    nodes_[node].name = "any " + KeysText(threshold);
  }
  return node;
}

void Graph::AddMembers(const Json& grant, size_t node) {
  const auto states = approvals_.find(ValueText(Member(grant, "entry")));
  for (const Json& member : Member(Member(grant, "threshold"), "members")) {
    const std::string key = ValueText(member);
    GraphEdge& edge = Edge(node, Node(key, "key"), "one of them");
    if (states == approvals_.end() || states->second.count(key) == 0) continue;
    edge.facts.push_back(states->second.at(key));
  }
}

void Graph::AddEntry(const Json& entry) {
  const std::string file = ValueText(Member(entry, "entry"));
  const size_t subject = SubjectNode(entry);
  entries_[file] = edges_.size();
  Edge(kStore, subject, "ACL entry " + file).facts = GrantFacts(entry);
  AddMembers(entry, subject);
}

void Graph::AddCertificate(const Json& certificate, const std::string& name) {
  const size_t issuer = Node(ValueText(Member(certificate, "issuer")), "key");
  const size_t subject = SubjectNode(certificate);
  const Json& number = Member(certificate, "certificate");
  if (number.is_number_unsigned()) certificates_[number.get<size_t>()] = edges_.size();
  std::vector<std::string> facts = GrantFacts(certificate);
  const Json& signature = Member(certificate, "signature");
  if (!signature.is_null()) {
    facts.push_back(Member(signature, "holds") == true
                        ? "signature holds"
                        : "signature: " + ValueText(Member(signature, "reason")));
  }
  facts.push_back(RevocationFact(Member(certificate, "revocation")));
  Edge(issuer, subject, "certificate " + name).facts = std::move(facts);
  AddMembers(certificate, subject);
}

// Of an answer about who may sign: a key, or several together, and what leads to them.
void Graph::AddSigner(const Json& signer) {
  const bool several = !Member(signer, "members").is_null();
  const size_t node = several ? Node(Member(signer, "members").dump(), "may sign together")
                              : Node(ValueText(Member(signer, "key")), "key");
  if (several) nodes_[node].name = "any " + ValueText(Member(signer, "k")) + " keys of these";
  nodes_[node].kind = several ? "may sign together" : "may sign";
  for (const Json& way : Member(signer, "ways")) AddWay(way, node);
  for (const Json& member : Member(signer, "members")) {
    Edge(Node(ValueText(member), "key"), node, "with the others").carries = true;
  }
  const std::string until = ValueText(Member(signer, "until"));
  signing_.push_back({node, 0, several ? "they may sign" : "it may sign"});
  signing_.back().facts = {until.empty() ? "it does not end by itself" : "until " + until};
}

// Ways share steps: each is drawn once.
void Graph::AddWay(const Json& way, size_t signer) {
  const Json& path = Member(way, "path");
  const Json& steps = Member(way, "steps");
  for (size_t i = 0; i < std::min(path.size(), steps.size()); ++i) {
    const std::string place = ValueText(path[i]);
    const bool entry = Member(steps[i], "kind") == "acl-entry";
    const auto [known, isNew] = steps_.try_emplace({entry, place}, edges_.size());
    if (isNew && entry) AddEntry(steps[i]);
    if (isNew && !entry) AddCertificate(steps[i], place);
    edges_[known->second].carries = true;
  }
  // A digest of another kind than that which a key is told by.
  const Json& last = steps.empty() ? steps : steps.back();
  if (Member(last, "subject_kind") != "hash" || SubjectNode(last) == signer) return;
  Edge(SubjectNode(last), signer, "the digest of").carries = true;
}

// The last step: the tree as it is, or the question about who stands at the end of the chain.
void Graph::AddAnswer(const Json& answer) {
  const Json& result = Member(answer, "result");
  const Json& about = Member(result, "about");
  const Json& chain = Member(result, "chain");
  const size_t from = chain.is_array() && !chain.empty() ? SubjectNode(chain[0]) : kStore;
  const std::string directory = ValueText(Member(about, "directory"));
  const Json& counts = Member(result, "counts");
  if (!directory.empty() && from != kStore) nodes_[from].kind = "the signed content";
  answer_ = edges_.size();
  nodes_.push_back({"the answer: " + ValueText(Member(answer, "verdict")),
                    ValueText(Member(answer, "message"))});
  const std::string asked = "asked tag: " + ValueText(Member(result, "tag"));
  for (GraphEdge& edge : signing_) {
    edge.to = nodes_.size() - 1;
    edge.facts.push_back(asked);
    edge.carries = true;
    edges_.push_back(std::move(edge));
  }
  if (!signing_.empty()) return;
  GraphEdge& edge =
      Edge(from, nodes_.size() - 1, directory.empty() ? "the question" : "the tree " + directory);
  edge.facts = {asked};
  if (counts.is_null()) return;
  edge.facts.push_back(ValueText(Member(counts, "listed")) + " listed, " +
                       ValueText(Member(counts, "valid")) + " as signed");
  for (const auto& [member, words] :
       {std::pair("changed", " changed"), std::pair("missing", " missing"),
        std::pair("links_out", " leading out of the tree"), std::pair("unlisted", " not listed")}) {
    const Json& count = Member(counts, member);
    if (!count.is_null() && count != 0) edge.cuts.push_back(ValueText(count) + words);
  }
}

void Graph::Cut(const Json& reason) {
  const std::string text = ValueText(Member(reason, "text"));
  const Json& number = Member(reason, "certificate");
  const auto certificate =
      certificates_.find(number.is_number_unsigned() ? number.get<size_t>() : 0);
  const auto entry = entries_.find(ValueText(Member(reason, "entry")));
  if (certificate != certificates_.end()) {
    edges_[certificate->second].cuts.push_back(text);
  } else if (entry != entries_.end()) {
    edges_[entry->second].cuts.push_back(text);
  } else if (Member(reason, "kind") == "no-entry") {
    CutAtHead(text);
  } else {
    edges_[answer_].cuts.push_back(text);
  }
}

// The store vouches for none of the keys that nobody else certifies, nor for those that certify
// each other.
void Graph::CutAtHead(const std::string& text) {
  Reach reach(nodes_.size());
  for (const GraphEdge& edge : edges_) reach.Join(edge.from, edge.to);
  reach.From(kStore);
  bool cut = false;
  for (const bool circles : {false, true}) {
    for (size_t node = kStore + 1; node < nodes_.size(); ++node) {
      if (reach.Has(node) || (reach.IsTarget(node) && !circles)) continue;
      Edge(kStore, node, "no ACL entry").cuts.push_back(text);
      reach.From(node);
      cut = true;
    }
  }
  if (!cut) edges_[answer_].cuts.push_back(text);
}

void Graph::MarkPath(const Json& authority) {
  for (const Json& step : Member(authority, "path")) {
    if (step.is_string()) {
      const auto entry = entries_.find(step.get<std::string>());
      if (entry != entries_.end()) edges_[entry->second].carries = true;
    } else if (step.is_number_unsigned()) {
      const auto certificate = certificates_.find(step.get<size_t>());
      if (certificate != certificates_.end()) edges_[certificate->second].carries = true;
    }
  }
}

}  // namespace vesk2_command
