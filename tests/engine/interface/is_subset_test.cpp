// Tags within tags, and the text that goes in and out of the engine.
#include <gtest/gtest.h>

#include "src/engine/interface/interface.h"
#include "tests/support/test_object.h"
#include "tests/support/test_text.h"

namespace {

using namespace ZvVesk2;
using vesk2test::Parse;
using vesk2test::Tag;

TEST(IsSubset, Tags) {
  const struct {
    const char *tag, *other;
    bool within;
  } cases[] = {
      {"(ftp host)", "(ftp)", true},
      {"(ftp)", "(ftp host)", false},
      {"(ftp)", "(ftp)", true},
      {"(ftp)", "(*)", true},
      {"(*)", "(ftp)", false},
      {"(ftp)", "(http)", false},
      {"abc", "(* prefix ab)", true},
      {"a", "(* set a b)", true},
      {"c", "(* set a b)", false},
      // Sets are never within sets but for equal objects, nor is a single point within a range.
      {"(* set a b)", "(* set a b)", true},
      {"(* set a)", "(* set a b)", false},
      {"(* set a b)", "(* set b a)", false},
      {"(* range numeric (ge 5) (le 5))", "(* range numeric (ge 1))", false},
      {"(* range numeric (ge 5))", "(* range numeric (ge 1))", true},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(std::string(c.tag) + " in " + c.other);
    const Ref<SExpression> tag = Parse(Tag(c.tag));
    const Ref<SExpression> other = Parse(Tag(c.other));
    EXPECT_EQ(c.within, tag->IsSubset(other.get()));
  }
}

TEST(IsSubset, FailuresAreFalse) {
  const Ref<SExpression> tag = Parse(Tag("(ftp)"));
  const Ref<SExpression> unreadable = Parse("(3:tag0:)");
  EXPECT_FALSE(tag->IsSubset(nullptr));
  EXPECT_FALSE(tag->IsSubset(unreadable.get()));
  EXPECT_FALSE(unreadable->IsSubset(tag.get()));
  // Equal objects need no engine.
  EXPECT_TRUE(unreadable->IsSubset(unreadable.get()));
}

TEST(EngineCall, TextComesOutAsItWentIn) {
  const std::string text = "(3:tag(1:x[4:text]1:y20:" + std::string(20, '\0') + ")(7:unknown))";
  Engine::EngineCall call;
  ASSERT_EQ(0, call.Start(nullptr));
  const auto* bytes = reinterpret_cast<const unsigned char*>(text.data());
  Engine::spki_input input = {bytes, bytes, bytes + text.size()};
  Engine::spki_elem* list = nullptr;
  ASSERT_EQ(0, Engine::spki_parse_list(call.Engine(), &list, &input));
  ASSERT_EQ(text.size(), Engine::spki_canonical_length(list));
  std::string out(text.size(), ' ');
  auto* cursor = reinterpret_cast<unsigned char*>(out.data());
  Engine::spki_write_chain(list, &cursor);
  EXPECT_EQ(text, out);
  Engine::spki_elem_release(call.Engine(), list);
}

}  // namespace
