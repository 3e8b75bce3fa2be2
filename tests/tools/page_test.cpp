// SPDX-License-Identifier: Apache-2.0
// page_test.cpp: pages of answers that no command would give: any bytes, any graph.
#include <gtest/gtest.h>

#include <random>
#include <string_view>

#include "tools/vesk2/page/markup.h"
#include "tools/vesk2/page/page.h"

namespace vesk2_command {
namespace {

// Printable ASCII, no "<", ">" or quote, and "&" only where an escape begins.
bool IsData(std::string_view text) {
  while (!text.empty()) {
    const size_t end = text[0] == '&' ? text.find(';') : 0;
    const std::string_view name = text.substr(0, end + 1);
    if (text[0] < ' ' || text[0] > '~' || end == std::string_view::npos) return false;
    if (name == "<" || name == ">" || name == "'" || name == "\"") return false;
    const bool known = name == "&amp;" || name == "&lt;" || name == "&gt;" || name == "&quot;";
    if (end != 0 && !known && !name.starts_with("&#")) return false;
    text.remove_prefix(name.size());
  }
  return true;
}

TEST(Page, NoTextIsMarkup) {
  const struct {
    std::string text, written;
  } kRows[] = {
      {"<b a='1' c=\"2\">&amp;]]>", "&lt;b a=&#39;1&#39; c=&quot;2&quot;&gt;&amp;amp;]]&gt;"},
      {std::string("a\0b\x1b\r\n", 6), "a\\x00b\\x1b\\x0d\\x0a"},
      {"\\x1b\\\\", "\\x1b\\\\"},  // was through Escape before
      {"\xff\xc0\xaf\xed\xa0\x80", "\\xff\\xc0\\xaf\\xed\\xa0\\x80"},
      {"\xef\xbf\xbe\xd8\x9c\xe2\x80\xae", "\\xef\\xbf\\xbe\\xd8\\x9c\\xe2\\x80\\xae"},
      {"\xc3\xa4\xf0\x9f\x94\x91", "&#228;&#128273;"},
  };
  for (const auto& row : kRows) EXPECT_EQ(MarkupText(row.text), row.written);
  std::mt19937 random(1);
  for (int i = 0; i < 20000; ++i) {
    std::string text(random() % 8, '\0');
    for (char& c : text)
      c = random() % 2 ? static_cast<char>(random()) : "<>&\"'\\;#x0"[random() % 10];
    EXPECT_TRUE(IsData(MarkupText(text))) << Hex(text);
  }
}

// Certificates that go around in circles, to themselves, and to nobody; numbers that are not there.
TEST(Page, AnyGraphIsDrawn) {
  std::mt19937 random(2);
  const auto key = [&] { return "sha256:" + std::to_string(random() % 6); };
  for (int i = 0; i < 300; ++i) {
    Json result = {{"chain", Json::array()}, {"acl", Json::array()}, {"lost", Json::array()}};
    for (size_t cert = random() % 12; cert > 0; --cert) {
      result["chain"].push_back({{"certificate", cert}, {"issuer", key()}, {"subject", key()}});
    }
    for (size_t entry = random() % 4; entry > 0; --entry) {
      result["acl"].push_back({{"entry", std::to_string(entry)},
                               {"subject", "2 of"},
                               {"threshold", {{"k", 2}, {"n", 3}, {"members", {key(), key()}}}}});
    }
    for (size_t signer = random() % 3; signer > 0; --signer) {
      Json way = {{"path", {"1", key()}}, {"steps", Json::array()}};
      for (size_t step = random() % 4; step > 0; --step) {
        way["steps"].push_back({{"kind", random() % 2 ? "acl-entry" : "certificate"},
                                {"issuer", key()},
                                {"subject", key()},
                                {"subject_kind", random() % 2 ? "hash" : "key"}});
      }
      result["may_sign"].push_back({{"key", key()}, {"ways", {way}}});
    }
    result["lost"].push_back({{"kind", random() % 2 ? "no-entry" : "tag"},
                              {"text", "the reason"},
                              {"certificate", random() % 14},
                              {"entry", random() % 2 ? Json("1") : Json()}});
    const std::string page = MakePage({{"verdict", "no"}, {"message", ""}, {"result", result}});
    const bool drawn = page.find("</svg>") != std::string::npos;
    EXPECT_EQ(drawn, page.find("CUT HERE: the reason") != std::string::npos) << result;
  }
}

TEST(Page, LongListsAreCutAndSaySo) {
  Json result = {{"unlisted", Json::array()}};
  for (int i = 0; i < 20000; ++i) result["unlisted"].push_back({{"path", "p" + std::to_string(i)}});
  const std::string page = MakePage({{"verdict", "no"}, {"result", result}});
  EXPECT_NE(page.find(" of 20000 are listed here"), std::string::npos);
  EXPECT_EQ(page.find("p19999"), std::string::npos);
}

}  // namespace
}  // namespace vesk2_command
