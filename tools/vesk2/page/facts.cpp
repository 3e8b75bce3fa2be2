// SPDX-License-Identifier: Apache-2.0
// facts.cpp: values of an answer as HTML.
#include "tools/vesk2/page/facts.h"

#include <algorithm>
#include <cctype>

#include "tools/vesk2/page/graph.h"
#include "tools/vesk2/say/shell_words.h"

namespace vesk2_command {
namespace {

bool IsPlain(const Json& value) { return !value.is_structured(); }

bool IsTable(const Json& list) {
  return std::all_of(list.begin(), list.end(), [](const Json& item) {
    return item.is_object() && std::all_of(item.begin(), item.end(), IsPlain);
  });
}

void AddTable(Markup& page, const Json& list) {
  std::vector<std::string> columns;
  for (const auto& [name, value] : list[0].items()) {
    const bool told = std::any_of(list.begin(), list.end(), [&name = name](const Json& item) {
      return !Member(item, name.c_str()).is_null();
    });
    if (told) columns.push_back(name);
  }
  page.Open("table").Open("thead").Open("tr");
  for (const std::string& name : columns) page.Leaf("th", Heading(name), {{"scope", "col"}});
  page.Close().Close().Open("tbody");
  const size_t count = std::min(list.size(), kMostListed);
  for (size_t i = 0; i < count; ++i) {
    page.Open("tr");
    for (const std::string& name : columns) {
      page.Leaf("td", ValueText(Member(list[i], name.c_str())));
    }
    page.Close();
  }
  page.Close().Close();
}

void AddObject(Markup& page, const Json& object) {
  page.Open("dl");
  for (const auto& [name, value] : object.items()) {
    if (value.is_null()) continue;
    page.Leaf("dt", Heading(name)).Open("dd");
    AddFacts(page, value);
    page.Close();
  }
  page.Close();
}

void AddList(Markup& page, const Json& list) {
  page.Open("ol");
  const size_t count = std::min(list.size(), kMostListed);
  for (size_t i = 0; i < count; ++i) {
    page.Open("li");
    AddFacts(page, list[i]);
    page.Close();
  }
  page.Close();
}

std::string WordOf(const Json& word) {
  if (word.is_string()) return word.get<std::string>();
  const std::string digits = ValueText(Member(word, "hex"));
  std::string bytes;
  for (size_t i = 0; i + 1 < digits.size(); i += 2) {
    bytes += static_cast<char>(std::stoi(digits.substr(i, 2), nullptr, 16));
  }
  return bytes;
}

std::string LineOf(const Json& words) {
  std::vector<std::string> line;
  for (const Json& word : words) line.push_back(WordOf(word));
  return ShellLine(line);
}

}  // namespace

std::string Heading(const std::string& member) {
  constexpr struct {
    const char* member;
    const char* heading;
  } kHeadings[] = {{"acl", "Entries of the store that matter"},
                   {"approvals", "Approvals"},
                   {"about", "What was asked about"},
                   {"authority", "What the yes rests on"},
                   {"chain", "Certificates"},
                   {"counts", "The tree in numbers"},
                   {"ignored_nothing", "Ignored, and about nothing"},
                   {"links_out", "Links out of the tree"},
                   {"lost", "Where authority was lost"},
                   {"not_after", "until"},
                   {"not_before", "from"},
                   {"path", "path"},
                   {"signed_at", "signed at, by the signer's word"},
                   {"why", "why"}};
  for (const auto& row : kHeadings) {
    if (member == row.member) return row.heading;
  }
  std::string text = member;
  std::replace(text.begin(), text.end(), '_', ' ');
  return text;
}

void AddFacts(Markup& page, const Json& value) {
  if (IsPlain(value)) {
    page.Text(ValueText(value));
    return;
  }
  if (value.empty()) {
    page.Text("none");
  } else if (value.is_object()) {
    AddObject(page, value);
  } else if (IsTable(value)) {
    AddTable(page, value);
  } else {
    AddList(page, value);
  }
  if (value.is_array() && value.size() > kMostListed) {
    page.Leaf("p", std::to_string(kMostListed) + " of " + std::to_string(value.size()) +
                       " are listed here; --json tells them all");
  }
}

void AddSection(Markup& page, const std::string& member, const Json& value) {
  if (value.is_null() || (value.is_array() && value.empty())) return;
  page.Open("section").Leaf("h2", Heading(member));
  AddFacts(page, value);
  page.Close();
}

void AddRemedies(Markup& page, const Json& remedies) {
  if (!remedies.is_array() || remedies.empty()) return;
  page.Open("section").Leaf("h2", "What would make it a yes").Open("ol");
  for (const Json& remedy : remedies) {
    page.Open("li").Leaf("p", ValueText(Member(remedy, "text")));
    page.Leaf("p", "kind: " + ValueText(Member(remedy, "kind")), {{"class", "aside"}});
    for (const Json& words : Member(remedy, "commands")) {
      page.Open("pre").Leaf("code", LineOf(words)).Close();
    }
    for (const Json& key : Member(remedy, "keys")) {
      page.Leaf("p", "needs the key " + ValueText(key), {{"class", "aside"}});
    }
    page.Close();
  }
  page.Close().Close();
}

}  // namespace vesk2_command
