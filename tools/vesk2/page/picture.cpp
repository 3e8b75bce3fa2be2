// SPDX-License-Identifier: Apache-2.0
// picture.cpp: boxes in rows. Nodes and edges take turns: every edge is a box of its own, with room
// for what it says, between those that it joins.
#include "tools/vesk2/page/picture.h"

#include <algorithm>
#include <numeric>

#include "tools/vesk2/page/letters.h"

namespace vesk2_command {
namespace {

constexpr int kWidth = 350;   // of a box
constexpr int kGap = 28;      // beside and below it
constexpr int kLine = 16;     // the height of a line
constexpr int kPadding = 10;  // around the text
constexpr size_t kColumns = 44;
constexpr size_t kMostLines = 6;  // of one text

struct BoxLine {
  std::string text;
  const char* style;
};

struct Box {
  std::string style;
  std::vector<BoxLine> lines = {};
  std::string whole = {};  // all that it says
  double wish = 0;         // where it would like to stand
  int x = 0;
  int y = 0;
  int height = 0;

  void Add(const std::string& text, const char* lineStyle) {
    whole += (whole.empty() ? "" : "; ") + text;
    for (std::string& line : Wrap(text, kColumns, kMostLines)) {
      lines.push_back({std::move(line), lineStyle});
    }
    height = static_cast<int>(lines.size()) * kLine + 2 * kPadding;
  }
  int Middle() const { return x + kWidth / 2; }
};

Box NodeBox(const GraphNode& node) {
  Box box{"node"};
  box.Add(node.kind, "kind");
  box.Add(node.name, "name");
  return box;
}

Box EdgeBox(const GraphEdge& edge) {
  Box box{edge.cuts.empty() ? edge.carries ? "edge carries" : "edge" : "edge cut"};
  box.Add(edge.name, "kind");
  for (const std::string& fact : edge.facts) box.Add(fact, "fact");
  for (const std::string& cut : edge.cuts) box.Add("CUT HERE: " + cut, "why");
  return box;
}

// How many steps a node lies below the top. Certificates may go around in circles: where every node
// that is left waits for another one, the first of them does not wait.
std::vector<size_t> Layers(const Graph& graph) {
  const size_t count = graph.nodes().size();
  std::vector<size_t> layers(count, 0);
  std::vector<size_t> waits(count, 0);
  std::vector<bool> done(count, false);
  for (const GraphEdge& edge : graph.edges()) waits[edge.to] += edge.from != edge.to ? 1 : 0;
  for (size_t placed = 0; placed < count; ++placed) {
    size_t next = count;
    for (size_t node = count; node-- > 0;) {
      if (done[node]) continue;
      if (next == count || waits[node] == 0 || waits[next] != 0) next = node;
    }
    done[next] = true;
    for (const GraphEdge& edge : graph.edges()) {
      if (edge.from != next || done[edge.to]) continue;
      layers[edge.to] = std::max(layers[edge.to], layers[next] + 1);
      --waits[edge.to];
    }
  }
  return layers;
}

class Picture {
 public:
  explicit Picture(const Graph& graph) : graph_(graph), layers_(Layers(graph)) {
    for (const GraphNode& node : graph.nodes()) boxes_.push_back(NodeBox(node));
    for (const GraphEdge& edge : graph.edges()) boxes_.push_back(EdgeBox(edge));
    const size_t last = *std::max_element(layers_.begin(), layers_.end());
    for (size_t layer = 0; layer <= last; ++layer) {
      Place(EdgesInto(layer));
      Place(NodesOf(layer));
    }
  }

  void Write(Markup& page) {
    const std::string size = "0 0 " + std::to_string(width_) + " " + std::to_string(height_);
    page.Open("svg", {{"xmlns", "http://www.w3.org/2000/svg"},
                      {"viewBox", size},
                      {"width", std::to_string(width_)},
                      {"role", "img"},
                      {"aria-labelledby", "graph-title graph-desc"}});
    page.Leaf("title", "The way of authority", {{"id", "graph-title"}});
    page.Leaf("desc",
              "From what this machine trusts, at the top, by entries and certificates down to the "
              "answer. The list below the picture says the same in words.",
              {{"id", "graph-desc"}});
    for (size_t i = 0; i < graph_.edges().size(); ++i) WriteLines(page, i);
    for (const Box& box : boxes_) WriteBox(page, box);
    page.Close();
  }

 private:
  Box& EdgeAt(size_t edge) { return boxes_[graph_.nodes().size() + edge]; }

  // Both wish to stand below what leads to them.
  std::vector<size_t> EdgesInto(size_t layer) {
    std::vector<size_t> row;
    for (size_t i = 0; i < graph_.edges().size(); ++i) {
      const GraphEdge& edge = graph_.edges()[i];
      if (layers_[edge.to] != layer) continue;
      const bool above = layers_[edge.from] < layer;
      EdgeAt(i).wish = above ? boxes_[edge.from].Middle() : width_;
      row.push_back(graph_.nodes().size() + i);
    }
    return row;
  }

  std::vector<size_t> NodesOf(size_t layer) {
    std::vector<size_t> row;
    for (size_t node = 0; node < layers_.size(); ++node) {
      if (layers_[node] != layer) continue;
      double sum = 0;
      size_t count = 0;
      for (size_t i = 0; i < graph_.edges().size(); ++i) {
        if (graph_.edges()[i].to != node) continue;
        sum += EdgeAt(i).Middle();
        ++count;
      }
      boxes_[node].wish = count != 0 ? sum / static_cast<double>(count) : 0;
      row.push_back(node);
    }
    return row;
  }

  // A row is as wide as the widest one may be, and stands around the middle below its wishes.
  void Place(std::vector<size_t> row) {
    if (row.empty()) return;
    std::stable_sort(row.begin(), row.end(),
                     [&](size_t a, size_t b) { return boxes_[a].wish < boxes_[b].wish; });
    int x = kGap;
    int height = 0;
    double shift = 0;
    for (const size_t index : row) {
      boxes_[index].x = x;
      boxes_[index].y = height_;
      shift += boxes_[index].wish - boxes_[index].Middle();
      x += kWidth + kGap;
      height = std::max(height, boxes_[index].height);
    }
    const int move = std::max(0, static_cast<int>(shift / static_cast<double>(row.size())));
    for (const size_t index : row) boxes_[index].x += move;
    width_ = std::max(width_, x + move);
    height_ += height + kGap;
  }

  // The end of a cut edge is not reached: its second line is broken.
  void WriteLines(Markup& page, size_t index) {
    const GraphEdge& edge = graph_.edges()[index];
    const Box& box = EdgeAt(index);
    const Box& from = boxes_[edge.from];
    const Box& to = boxes_[edge.to];
    const std::string style =
        edge.cuts.empty() ? edge.carries ? "line carries" : "line" : "line cut";
    WriteLine(page, edge.carries ? "line carries" : "line", from.Middle(), from.y + from.height,
              box.Middle(), box.y);
    WriteLine(page, style, box.Middle(), box.y + box.height, to.Middle(), to.y);
    if (edge.cuts.empty()) return;
    const int x = (box.Middle() + to.Middle()) / 2;
    const int y = (box.y + box.height + to.y) / 2;
    WriteLine(page, "cross", x - 7, y - 7, x + 7, y + 7);
    WriteLine(page, "cross", x - 7, y + 7, x + 7, y - 7);
  }

  static void WriteLine(Markup& page, const std::string& style, int x1, int y1, int x2, int y2) {
    page.Void("line", {{"class", style},
                       {"x1", std::to_string(x1)},
                       {"y1", std::to_string(y1)},
                       {"x2", std::to_string(x2)},
                       {"y2", std::to_string(y2)}});
  }

  static void WriteBox(Markup& page, const Box& box) {
    page.Open("g", {{"class", box.style}}).Leaf("title", box.whole);
    page.Void("rect", {{"x", std::to_string(box.x)},
                       {"y", std::to_string(box.y)},
                       {"width", std::to_string(kWidth)},
                       {"height", std::to_string(box.height)},
                       {"rx", box.style == "node" ? "14" : "3"}});
    int y = box.y + kPadding - 4;
    for (const BoxLine& line : box.lines) {
      y += kLine;
      page.Leaf("text", line.text,
                {{"class", line.style},
                 {"x", std::to_string(box.x + kPadding)},
                 {"y", std::to_string(y)}});
    }
    page.Close();
  }

  const Graph& graph_;
  const std::vector<size_t> layers_;
  std::vector<Box> boxes_;  // of the nodes, then of the edges
  int width_ = 0;
  int height_ = kGap / 2;
};

}  // namespace

void Draw(Markup& page, const Graph& graph) { Picture(graph).Write(page); }

}  // namespace vesk2_command
