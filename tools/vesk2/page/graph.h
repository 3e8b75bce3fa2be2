// SPDX-License-Identifier: Apache-2.0
// graph.h: an answer about authority as a graph: what this machine trusts at its head, the keys,
// what each certifies to the next, and at its end the answer. Read from the answer for machines:
// nothing is judged here, and what is cut is cut where "lost" says so.
#ifndef VESK2_TOOLS_GRAPH_H
#define VESK2_TOOLS_GRAPH_H

#include <map>
#include <string>
#include <vector>

#include "tools/vesk2/say/report.h"

namespace vesk2_command {

struct GraphNode {
  std::string kind;  // "key", "the signer", ...
  std::string name;
};

// What leads from one node to another: an entry, a certificate, a place among several keys.
struct GraphEdge {
  size_t from = 0;
  size_t to = 0;
  std::string name;
  std::vector<std::string> facts = {};
  std::vector<std::string> cuts = {};  // why nothing passes here
  bool carries = false;                // the answer rests on it
};

class Graph {
 public:
  // `answer` is what MakeAnswer returns.
  explicit Graph(const Json& answer);

  const std::vector<GraphNode>& nodes() const { return nodes_; }
  const std::vector<GraphEdge>& edges() const { return edges_; }
  // Whether there is more in it than the answer itself.
  bool IsWorthDrawing() const { return edges_.size() > 1; }

 private:
  size_t Node(const std::string& name, const std::string& kind);
  GraphEdge& Edge(size_t from, size_t to, const std::string& name);
  size_t SubjectNode(const Json& grant);
  void AddMembers(const Json& grant, size_t node);
  void AddEntry(const Json& entry);
  void AddCertificate(const Json& certificate, const std::string& name);
  void AddSigner(const Json& signer);
  void AddWay(const Json& way, size_t signer);
  void AddAnswer(const Json& answer);
  void Cut(const Json& reason);
  void CutAtHead(const std::string& text);
  void MarkPath(const Json& authority);

  std::vector<GraphNode> nodes_;
  std::vector<GraphEdge> edges_;
  std::map<std::string, size_t> known_;    // nodes by their names
  std::map<std::string, size_t> entries_;  // edges by the entry's file
  std::map<size_t, size_t> certificates_;  // and by the certificate's number
  std::map<std::string, std::map<std::string, std::string>> approvals_;  // entry, key, what of it
  std::map<std::pair<bool, std::string>, size_t> steps_;  // edges: whether of an entry, its place
  std::vector<GraphEdge> signing_;                        // of those who may sign, to the answer
  size_t answer_ = 0;                                     // the first edge that leads to the answer
};

// A member, or null where there is none, whatever the value is.
const Json& Member(const Json& value, const char* name);
// A text, and every other value as people read it; empty for null.
std::string ValueText(const Json& value);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_GRAPH_H
