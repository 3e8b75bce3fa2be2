// SPDX-License-Identifier: Apache-2.0
// page.cpp: the parts of the page in their order.
#include "tools/vesk2/page/page.h"

#include "tools/vesk2/page/facts.h"
#include "tools/vesk2/page/graph.h"
#include "tools/vesk2/page/markup.h"
#include "tools/vesk2/page/picture.h"

namespace vesk2_command {
namespace {

// Without script, frames, forms and anything from elsewhere, what a stranger might get into the
// page could do nothing.
constexpr const char* kPolicy =
    "default-src 'none'; style-src 'unsafe-inline'; base-uri 'none'; form-action 'none'";

constexpr const char* kStyle = R"(
:root { color-scheme: light dark; --back: #fff; --text: #1b1f24; --soft: #59636e; --line: #8c959f;
  --box: #f6f8fa; --good: #1a7f37; --bad: #b3001b; --badback: #fff0f0; }
@media (prefers-color-scheme: dark) { :root { --back: #0d1117; --text: #e6edf3; --soft: #9ba7b4;
  --line: #6e7681; --box: #161b22; --good: #56d364; --bad: #ff8a80; --badback: #3a1214; } }
@media print { :root { --back: #fff; --text: #000; --soft: #333; --line: #555; --box: #fff;
  --good: #0b5a22; --bad: #b3001b; --badback: #fff; } section, figure { break-inside: avoid-page; } }
body { margin: 0 auto; max-width: 75rem; padding: 1rem 1.5rem; background: var(--back);
  color: var(--text); font: 1rem/1.5 system-ui, sans-serif; overflow-wrap: anywhere; }
h1 { font-size: 1.5rem; border-left: .5rem solid var(--bad); padding-left: .75rem; }
h1.yes { border-color: var(--good); }
h2 { font-size: 1.15rem; margin: 2rem 0 .5rem; }
dl { display: grid; grid-template-columns: minmax(8rem, max-content) 1fr; gap: .15rem 1rem; margin: 0; }
dt { color: var(--soft); }
dd { margin: 0; unicode-bidi: isolate; }
table { border-collapse: collapse; width: 100%; }
th { overflow-wrap: normal; }
th, td { border-bottom: 1px solid var(--line); padding: .25rem .5rem; text-align: left;
  vertical-align: top; unicode-bidi: isolate; }
li { margin: .4rem 0; }
pre { background: var(--box); border: 1px solid var(--line); padding: .5rem; margin: .25rem 0;
  white-space: pre-wrap; }
.aside { color: var(--soft); margin: .1rem 0; }
.why { color: var(--bad); }
figure { margin: 1rem 0; overflow-x: auto; }
svg { max-width: 100%; height: auto; font: 12px ui-monospace, monospace; }
svg text { fill: var(--text); unicode-bidi: isolate; }
svg text.kind { fill: var(--soft); font-weight: bold; }
svg text.why { fill: var(--bad); font-weight: bold; }
svg rect { fill: var(--box); stroke: var(--line); }
svg .node rect { fill: var(--back); stroke-width: 2; }
svg .carries rect { stroke: var(--good); stroke-width: 2; }
svg .cut rect { fill: var(--badback); stroke: var(--bad); stroke-width: 3; }
svg line { stroke: var(--line); stroke-width: 1.5; }
svg line.carries { stroke: var(--good); stroke-width: 3; }
svg line.cut { stroke: var(--bad); stroke-width: 2; stroke-dasharray: 5 5; }
svg line.cross { stroke: var(--bad); stroke-width: 3; }
)";

void AddHead(Markup& page, const std::string& title) {
  page.Open("head").Void("meta", {{"charset", "utf-8"}});
  page.Void("meta", {{"http-equiv", "Content-Security-Policy"}, {"content", kPolicy}});
  page.Void("meta", {{"name", "viewport"}, {"content", "width=device-width, initial-scale=1"}});
  page.Void("meta", {{"name", "color-scheme"}, {"content", "light dark"}});
  page.Void("meta", {{"name", "referrer"}, {"content", "no-referrer"}});
  page.Leaf("title", title).Style(kStyle).Close();
}

void AddRow(Markup& page, const std::string& name, const Json& value) {
  if (value.is_structured() || value.is_null()) return;
  page.Leaf("dt", Heading(name)).Leaf("dd", ValueText(value));
}

// The verdict, what was asked about, and every member of the result that is one text or number.
void AddVerdict(Markup& page, const Json& answer) {
  const std::string verdict = ValueText(Member(answer, "verdict"));
  page.Open("header").Leaf("h1", verdict + ": " + ValueText(Member(answer, "message")),
                           {{"class", verdict}});
  page.Open("dl");
  const Json& result = Member(answer, "result");
  for (const Json* part : {&Member(result, "about"), &result}) {
    for (const auto& [name, value] : part->items()) AddRow(page, name, value);
  }
  AddRow(page, "reason", Member(answer, "reason"));
  page.Close().Close();
}

void AddForPrograms(Markup& page, const Json& answer) {
  page.Open("section").Leaf("h2", "For programs").Open("dl");
  for (const auto& [name, value] : answer.items()) AddRow(page, name, value);
  page.Close().Close();
}

void AddStep(Markup& page, const Graph& graph, const GraphEdge& edge) {
  const GraphNode& from = graph.nodes()[edge.from];
  const GraphNode& to = graph.nodes()[edge.to];
  page.Open("li").Text(edge.name + ": " + from.name + " to " + to.name + " (" + to.kind + ")");
  if (edge.carries) page.Text("; the answer rests on it");
  for (const std::string& fact : edge.facts) page.Text("; " + fact);
  for (const std::string& cut : edge.cuts)
    page.Leaf("strong", " Cut here: " + cut, {{"class", "why"}});
  page.Close();
}

void AddGraph(Markup& page, const Json& answer) {
  const Graph graph(answer);
  if (!graph.IsWorthDrawing()) return;
  page.Open("section").Leaf("h2", "The way of authority");
  if (graph.edges().size() <= kMostDrawn) {
    page.Open("figure");
    Draw(page, graph);
    page.Close();
  } else {
    page.Leaf("p", std::to_string(graph.edges().size()) + " steps are too many to be drawn.");
  }
  page.Leaf("h3", "The same, step by step").Open("ol");
  for (const GraphEdge& edge : graph.edges()) AddStep(page, graph, edge);
  page.Close().Close();
}

}  // namespace

std::string MakePage(const Json& answer) {
  Markup page;
  page.Open("html", {{"xmlns", "http://www.w3.org/1999/xhtml"}, {"lang", "en"}});
  const std::string command = ValueText(Member(answer, "command"));
  AddHead(page, ValueText(Member(answer, "verdict")) + ": vesk2 " + command);
  page.Open("body").Open("main");
  AddVerdict(page, answer);
  AddGraph(page, answer);
  const Json& result = Member(answer, "result");
  // What a reader of a no looks for first.
  AddSection(page, "lost", Member(result, "lost"));
  AddRemedies(page, Member(result, "remedies"));
  for (const auto& [name, value] : result.items()) {
    const bool isNew = name != "about" && name != "lost" && name != "remedies";
    if (value.is_structured() && isNew) AddSection(page, name, value);
  }
  AddSection(page, "notes", Member(answer, "notes"));
  AddForPrograms(page, answer);
  return page.Take();
}

}  // namespace vesk2_command
