// Laws of the algebra over random tags: what an intersection allows, both tags allow; and, without
// sets (which are judged more strictly than their members), what both allow, it allows. An oracle
// that knows nothing of the engine says what a tag allows.
#include <random>

#include "tests/engine/engine_fixture.h"

namespace ZvVesk2::Engine {
namespace {

// A word, or a list of trees.
struct Tree {
  std::string word;
  std::vector<Tree> items;
  bool list = false;

  std::string Text() const {
    if (!list) return word;
    std::string text = "(";
    for (const Tree& item : items) text += (text.size() > 1 ? " " : "") + item.Text();
    return text + ")";
  }
};

Tree Word(std::string word) { return {std::move(word), {}, false}; }
Tree List(std::vector<Tree> items) { return {{}, std::move(items), true}; }

bool BoundAllows(const Tree& bound, const std::string& word) {
  const std::string& op = bound.items[0].word;
  const int order = word.compare(bound.items[1].word);
  return op == "g" ? order > 0 : op == "ge" ? order >= 0 : op == "l" ? order < 0 : order <= 0;
}

bool Allows(const Tree& tag, const Tree& request) {
  if (!tag.list) return !request.list && tag.word == request.word;
  if (tag.items[0].word != "*") {
    if (!request.list || request.items.size() < tag.items.size()) return false;
    for (size_t i = 0; i < tag.items.size(); ++i) {
      if (!Allows(tag.items[i], request.items[i])) return false;
    }
    return true;
  }
  if (tag.items.size() == 1) return true;
  const std::string& form = tag.items[1].word;
  const auto arguments = std::vector<Tree>(tag.items.begin() + 2, tag.items.end());
  if (form == "set") {
    return std::any_of(arguments.begin(), arguments.end(),
                       [&](const Tree& member) { return Allows(member, request); });
  }
  if (request.list) return false;
  if (form == "prefix") return request.word.starts_with(arguments[0].word);
  return std::all_of(arguments.begin() + 1, arguments.end(),
                     [&](const Tree& bound) { return BoundAllows(bound, request.word); });
}

enum Forms { kAll, kNoSets, kNoRanges };  // the last is without sets too

class Generator {
 public:
  Tree Request(int depth) {
    if (depth == 0 || Below(3) == 0) return AnyWord();
    std::vector<Tree> items = {Word(Below(4) ? "x" : "y")};
    for (int i = Below(4); i > 0; --i) items.push_back(Request(depth - 1));
    return List(items);
  }

  Tree Tag(int depth, Forms forms) {
    const int kind = Below(depth == 0 ? 5 : 9);
    if (kind == 0) return List({Word("*")});
    if (kind == 1) return AnyWord();
    if (kind == 2) return List({Word("*"), Word("prefix"), AnyWord()});
    if (kind == 3 && forms != kNoRanges) return Range();
    if (kind == 4 && forms == kAll) return Set(depth);
    std::vector<Tree> items = {Word(Below(4) ? "x" : "y")};
    for (int i = depth == 0 ? 0 : Below(4); i > 0; --i) items.push_back(Tag(depth - 1, forms));
    return List(items);
  }

  int Below(int limit) { return static_cast<int>(random_() % static_cast<unsigned>(limit)); }

 private:
  Tree AnyWord() {
    std::string word;
    for (int i = 1 + Below(3); i > 0; --i) word += static_cast<char>('a' + Below(2));
    return Word(word);
  }
  Tree Range() {
    const char* operators[] = {"g", "ge", "l", "le"};
    std::vector<Tree> items = {Word("*"), Word("range"), Word("alpha")};
    for (int i = Below(3); i > 0; --i)
      items.push_back(List({Word(operators[Below(4)]), AnyWord()}));
    return List(items);
  }
  Tree Set(int depth) {
    std::vector<Tree> items = {Word("*"), Word("set")};
    for (int i = Below(4); i > 0; --i) items.push_back(Tag(std::max(depth - 1, 0), kAll));
    return List(items);
  }

  std::mt19937 random_{20240229};
};

class Laws : public EngineTest {
 protected:
  bool Within(const spki_elem* a, const spki_elem* b) {
    const spki_relation relation = spki_cmp_elem(&engine_, a, b);
    return relation == SPKI_REL_EQUAL || relation == SPKI_REL_NARROWER;
  }
  void Check(Forms forms);

  Generator generate_;
};

void Laws::Check(Forms forms) {
  int allowed = 0;
  for (int round = 0; round < 1000; ++round) {
    const Tree a = generate_.Tag(3, forms);
    const Tree b = generate_.Tag(3, forms);
    spki_elem* const a_elem = Elem(a.Text());
    spki_elem* const b_elem = Elem(b.Text());
    spki_elem* const both = spki_intersect_elem(&engine_, a_elem, b_elem);
    if (both != nullptr && forms == kNoRanges) {
      EXPECT_TRUE(Within(both, a_elem)) << a.Text() << ", " << b.Text();
      EXPECT_TRUE(Within(both, b_elem)) << a.Text() << ", " << b.Text();
    }
    for (int i = 0; i < 20; ++i) {
      const Tree request = generate_.Request(3);
      const spki_elem* const asked = Elem(request.Text());
      const bool by_a = Allows(a, request);
      const bool by_b = Allows(b, request);
      const bool by_both = both != nullptr && Within(asked, both);
      EXPECT_EQ(by_a, Within(asked, a_elem)) << request.Text() << " in " << a.Text();
      EXPECT_LE(by_both, by_a && by_b) << request.Text() << ", " << a.Text() << ", " << b.Text();
      if (forms != kAll) {
        EXPECT_EQ(by_both, by_a && by_b) << request.Text() << ", " << a.Text() << ", " << b.Text();
      }
      allowed += by_both;
    }
    spki_elem_release(&engine_, both);
    if (HasFailure()) return;
  }
  EXPECT_GT(allowed, 300) << "the law was hardly tried";
}

TEST_F(Laws, IntersectionsAllowWhatBothAllow) { Check(kNoSets); }
TEST_F(Laws, IntersectionsLieWithinBoth) { Check(kNoRanges); }
TEST_F(Laws, IntersectionsWithSetsAllowNoMore) { Check(kAll); }

}  // namespace
}  // namespace ZvVesk2::Engine
