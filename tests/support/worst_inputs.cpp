// SPDX-License-Identifier: Apache-2.0
#include "tests/support/worst_inputs.h"

#include <algorithm>
#include <functional>

#include "tests/support/test_text.h"

namespace vesk2test {
namespace {

constexpr size_t kLong = 8191;  // of one string

std::string Key(const std::string& name) { return "(10:public-key" + Str(name) + ")"; }
std::string Key(size_t i) { return Key(std::to_string(i)); }
const std::string kR = Key("R"), kA = Key("A"), kB = Key("B"), kC = Key("C");

std::string Named(const std::string& name, const std::string& items) {
  return "(" + Str(name) + items + ")";
}
std::string Form(const std::string& form, const std::string& items) {
  return "(1:*" + Str(form) + items + ")";
}
std::string TagOf(const std::string& item) { return Named("tag", item); }
std::string Entry(const std::string& subject, const std::string& tag,
                  const std::string& more = "(9:propagate)") {
  return Named("entry", Named("subject", subject) + more + tag);
}
std::string Link(const std::string& issuer, const std::string& subject, const std::string& tag,
                 const std::string& more = "(9:propagate)") {
  return Named("cert", Named("issuer", issuer) + Named("subject", subject) + more + tag);
}
std::string Name(const std::string& key, const std::string& name) {
  return Named("name", key + Str(name));
}
const std::string kAny = TagOf("(1:*)"), kX = TagOf("1:x");

// Items until they have `bytes`.
template <typename Item>
std::string Fill(size_t bytes, const Item& item) {
  std::string text;
  for (size_t i = 0; text.size() < bytes; ++i) {
    if constexpr (std::is_invocable_v<Item, size_t>) {
      text += item(i);
    } else {
      text += item;
    }
  }
  return text;
}
std::string Number(size_t i) { return Str(std::to_string(i)); }

// What is asked of one and granted by the other, inside a list that lets sets in.
WorstLists Subset(const std::string& asked, const std::string& granted) {
  return {.acl = TagOf("(1:x" + granted + ")"), .tag = TagOf("(1:x" + asked + ")")};
}
// What grants to the requester.
WorstLists Reduction(const std::string& entries, const std::string& certs,
                     const std::string& request = kX) {
  return {Named("acl", entries), Named("sequence", certs), kR, request};
}

// ---- Comparing ----

WorstLists RangesAgainstBounds(size_t bytes) {
  const WorstTags tags = TagsThatTakeLong(bytes);
  return Subset(tags.first, tags.second);
}

WorstLists LongNumbers(size_t bytes) {
  const std::string bound = Named("le", Str(std::string(kLong, '9')));
  return Subset(Form("set", Fill(bytes / 2, "1:5")),
                Form("range", Str("numeric") + Fill(bytes / 2, bound)));
}

WorstLists LongPrefixes(size_t bytes) {
  const std::string prefix = Form("prefix", Str(std::string(kLong, '\xff')));
  return Subset(Form("set", Fill(bytes / 2, prefix)),
                Form("set", Fill(bytes / 2, Form("range", Str("alpha")))));
}

WorstLists PrefixesAgainstBounds(size_t bytes) {
  return Subset(Form("set", Fill(bytes / 2, Form("prefix", "1:a"))),
                Form("range", Str("alpha") + Fill(bytes / 2, "(2:ge1:a)")));
}

WorstLists LongStrings(size_t bytes) {
  const auto string = [](size_t i) { return Str(std::string(kLong - 6, 'a') + std::to_string(i)); };
  return Subset(Form("set", Fill(bytes / 2, string)),
                Form("set", Fill(bytes / 2, [&](size_t i) { return string(i + 100'000); })));
}

WorstLists ManyMembers(size_t bytes) {
  return Subset(Form("set", Fill(bytes / 2, "1:a")), Form("set", Fill(bytes / 2, "1:b")));
}

WorstLists ManyListsAsMembers(size_t bytes) {
  return Subset(Form("set", Fill(bytes / 2, "(1:a)")), Form("set", Fill(bytes / 2, "(1:b)")));
}

WorstLists SetsOfLists(size_t bytes) {
  const auto list = [](const std::string& end) {
    return "(1:x" + Fill(300, "(1:y)") + Str(end) + ")";
  };
  return Subset(Form("set", Fill(bytes / 2, list("a"))), Form("set", Fill(bytes / 2, list("b"))));
}

// Each level doubles what the level above has to look at.
WorstLists SetsInSets(size_t bytes) {
  std::string left = Fill(bytes / 2, "1:a"), right = Fill(bytes / 2, "(1:*)");
  for (int i = 0; i < 100; ++i) {
    left = Form("set", left) + Form("set", "(1:*)");
    right = Form("set", right);
  }
  return Subset(Form("set", left), right);
}

// What is left of both lists is compared again at each element.
WorstLists OverlappingLists(size_t bytes) {
  return {.acl = Named("tag", Fill(bytes / 2, "1:a(1:*)")),
          .tag = Named("tag", Fill(bytes / 2, "(1:*)1:a"))};
}

// And at each level.
WorstLists DeepLists(size_t bytes) {
  std::string left = "1:a(1:*)", right = "(1:*)1:a";
  const std::string items = Fill(bytes / 500, "1:a");
  for (int i = 0; i < 240; ++i) {
    left = "(1:x" + items + left + ")";
    right = "(1:x" + items + right + ")";
  }
  return {.acl = TagOf(left), .tag = TagOf(right)};
}

// ---- Keys and hashes ----

WorstLists NestedKeys(size_t bytes) {
  std::string key = Key(std::string(std::min(kLong, bytes), 'k'));
  key = "(10:public-key" + Fill(bytes, key) + ")";
  for (int i = 0; i < 245; ++i) key = Named("public-key", key);
  return Reduction(Entry("(4:hash4:sha1" + Str(std::string(20, 'h')) + ")", kX), Named("x", key));
}

// Names of keys that lie one behind the other in any table by their first bytes.
WorstLists CrowdedHashes(size_t bytes) {
  return Reduction(Entry(kR, kX), Fill(bytes, [](size_t i) {
                     std::string digest = "hhhhhhhhhhhh" + std::to_string(10'000'000 + i);
                     return Link("(4:hash4:sha1" + Str(digest) + ")", kA, kX, "");
                   }));
}

// ---- Tuples ----

// One entry grants what the request asks for, and the others the same to others.
WorstLists ManyEntries(size_t bytes) {
  return Reduction(Fill(bytes, [](size_t i) { return Entry(Key(i), kX); }) + Entry(kR, kX), "");
}

WorstLists ManyCertificates(size_t bytes) {
  return Reduction(Entry(kA, kX),
                   Fill(bytes, [](size_t i) { return Link(kA, Key(i), kX); }) + Link(kA, kR, kX));
}

WorstLists LongChain(size_t bytes) {
  size_t last = 0;
  const std::string links = Fill(bytes, [&last](size_t i) {
    last = i + 1;
    return Link(Key(i), Key(i + 1), kX);
  });
  return Reduction(Entry(Key(size_t{0}), kX), links + Link(Key(last), kR, kX));
}

// The newest certificate waits for the chain behind it.
WorstLists ChainFromTheEnd(size_t bytes) {
  std::string links;
  size_t i = 0;
  for (; links.size() < bytes; ++i) links += Link(Key(i + 1), i == 0 ? kR : Key(i), kX);
  return Reduction(Entry(Key(i), kX), links);
}

// Each grant of one crowd meets each of the other, and no two are the same.
WorstLists CrossedGrants(size_t bytes) {
  const auto left = [](size_t i) { return Link(kA, kB, TagOf("(1:x" + Number(i) + "(1:*))")); };
  const auto right = [](size_t i) { return Link(kB, kR, TagOf("(1:x(1:*)" + Number(i) + ")")); };
  return Reduction(Entry(kA, kAny), Fill(bytes / 2, left) + Fill(bytes / 2, right), TagOf("(1:x)"));
}

// Each certificate leaves out one word: every subset of words is a grant of its own.
WorstLists MultiplyingTuples(size_t bytes) {
  const size_t words = 20 + bytes / 8'000;
  std::string certs = Link(kB, kA, kAny);
  for (size_t i = 0; i < words; ++i) {
    std::string set;
    for (size_t j = 0; j < words; ++j) set += j == i ? "" : Number(j);
    certs += Link(kA, kB, TagOf(Form("set", set)));
  }
  return {Named("acl", Entry(kR, kAny)), Named("sequence", certs), kA, kAny};
}

// Each certificate grants twice what the one behind it does, by sharing it.
WorstLists MultiplyingTags(size_t bytes) {
  const size_t depth = std::min<size_t>(120, bytes / 1200);
  const auto nested = [](std::string inner, size_t levels) {
    for (size_t i = 0; i < levels; ++i) inner = "(1:x1:c" + inner + ")";
    return inner;
  };
  std::string certs = Link(Key(depth), kR, TagOf(nested("1:z", depth + 2)));
  for (size_t i = depth; i-- > 0;) {
    const std::string tag = nested("(1:x1:c(1:*3:set(1:x1:c(1:*))(1:x1:c(1:*)1:q1:e))1:q)", i);
    certs = Link(Key(i), Key(i + 1), TagOf(tag)) + certs;
  }
  return Reduction(Entry(Key(size_t{0}), kAny), certs, kAny);
}

// Nothing that the issuer issued leads to the requester, and every new grant to it asks.
WorstLists DeadEnds(size_t bytes) {
  return Reduction(Entry(kR, kX),
                   Fill(bytes / 2, [](size_t i) { return Link(kA, Key(i), kX, ""); }) +
                       Fill(bytes / 2, [](size_t i) {
                         return Link(kB, kA, kX, "(9:propagate)" + Named("not-after", Number(i)));
                       }));
}

// Grants through three keys, in as many ways as there are dates, each of them long.
WorstLists LongDates(size_t bytes) {
  const std::string same(kLong - 3, '2');
  const auto dated = [&same](const std::string& from, const std::string& to) {
    return [&same, from, to](size_t i) {
      const std::string date = Named("not-after", Str(same + std::to_string(100 + i)));
      return Link(from, to, kX, "(9:propagate)" + date);
    };
  };
  const std::string begin = "(9:propagate)" + Named("not-before", Str(same + "000"));
  return Reduction(Entry(kA, kX, begin), Fill(bytes / 3, dated(kA, kB)) +
                                             Fill(bytes / 3, dated(kB, kC)) +
                                             Fill(bytes / 3, dated(kC, kR)));
}

// ---- Names and thresholds ----

WorstLists ManyDefinitions(size_t bytes) {
  return Reduction(Entry(Name(kA, "n"), kX), Fill(bytes, [](size_t i) {
                                               return Link(Name(kA, "n"), Key(i), "", "");
                                             }) + Link(Name(kA, "n"), kR, "", ""));
}

WorstLists CrossedNames(size_t bytes) {
  return Reduction(Entry(Name(kA, "n"), kX),
                   Fill(bytes / 2, [](size_t i) { return Link(Name(kA, "n"), Key(i), "", ""); }) +
                       Fill(bytes / 2, [](size_t i) { return Link(Key(i), Name(kA, "n"), kX); }));
}

// Names that stand for ever more of themselves.
WorstLists GrowingNames(size_t bytes) {
  const std::string more = Named("name", kA + "1:n1:n"), n = Name(kA, "n");
  return Reduction(Entry(n, kX), Link(n, more, "", "") + Fill(bytes, [&](size_t i) {
                                   return Link(n, Key(i), "", "") +
                                          Link(Name(Key(i), "n"), kA, "", "");
                                 }));
}

std::string Count(size_t n) {
  const char bytes[] = {static_cast<char>(n >> 16), static_cast<char>(n >> 8),
                        static_cast<char>(n)};
  return Str({bytes, sizeof bytes});
}
// All that the same key is a member of grants to it only when the last member is there.
WorstLists ManyMembersOfThreshold(size_t bytes) {
  const size_t n = bytes / kR.size();
  std::string members;
  for (size_t i = 0; i < n; ++i) members += kR;
  return Reduction(Entry(Named("k-of-n", Count(n) + Count(n) + members), kX), "");
}
// Of as many others as of the one key, none is needed before the last.
WorstLists DisagreeingMembers(size_t bytes) {
  const size_t n = std::min<size_t>(bytes / 130, 2'000);
  std::string members, certs;
  for (size_t i = 0; i < n; ++i) {
    members += Key(i);
    certs += Link(Key(i), kR, TagOf(i % 2 == 0 ? "1:a" : "1:b"));
  }
  const std::string subject = Named("k-of-n", Count(n / 2 + 1) + Count(n) + members);
  return Reduction(Entry(subject, kAny), certs, kAny);
}

// ---- Results ----

// Many grants that share one long tag.
WorstLists Shared(size_t bytes, const std::string& word) {
  const auto grant = [](size_t i) {
    return Link(kA, kB, TagOf("(1:x)"), "(9:propagate)" + Named("not-after", Number(i)));
  };
  const std::string tag = TagOf("(1:x" + Fill(bytes / 3, word) + ")");
  return Reduction(Entry(kA, kAny), Fill(bytes - bytes / 3, grant) + Link(kB, kR, tag),
                   TagOf("(1:x)"));
}
WorstLists SharedTag(size_t bytes) { return Shared(bytes, Str(std::string(1'000, 'w'))); }
WorstLists SharedWords(size_t bytes) { return Shared(bytes, "1:w"); }

constexpr WorstCall kSubset = WorstCall::Subset, kReductA = WorstCall::ReductA,
                    kReductB = WorstCall::ReductB;
constexpr WorstInput kInputs[] = {
    {"ranges against bounds", kSubset, RangesAgainstBounds, 3000},
    {"long numbers", kSubset, LongNumbers, 1716},
    {"long prefixes against ranges", kSubset, LongPrefixes, 608},
    {"prefixes against bounds", kSubset, PrefixesAgainstBounds, 697},
    {"long strings", kSubset, LongStrings, 1},
    {"many members", kSubset, ManyMembers, 470},
    {"many lists as members", kSubset, ManyListsAsMembers, 3000},
    {"sets of lists", kSubset, SetsOfLists, 134},
    {"sets in sets", kSubset, SetsInSets, 4},
    {"overlapping lists", kSubset, OverlappingLists, 3000},
    {"deep lists", kSubset, DeepLists, 3000},
    {"nested keys", kReductA, NestedKeys, 1867},
    {"crowded hashes", kReductA, CrowdedHashes, 72, true},
    {"many entries", kReductA, ManyEntries, 109, true},
    {"many certificates of one issuer", kReductA, ManyCertificates, 96, true},
    {"long chain", kReductA, LongChain, 117, true},
    {"long chain from the end", kReductA, ChainFromTheEnd, 117},
    {"crossed grants", kReductA, CrossedGrants, 3000},
    {"multiplying tuples", kReductB, MultiplyingTuples, 3000},
    {"multiplying tags", kReductB, MultiplyingTags, 3000},
    {"dead ends", kReductA, DeadEnds, 109},
    {"long dates", kReductA, LongDates, 11},
    {"many definitions of a name", kReductA, ManyDefinitions, 114, true},
    {"crossed names", kReductA, CrossedNames, 2240},
    {"growing names", kReductA, GrowingNames, 169},
    {"many members of a threshold", kReductA, ManyMembersOfThreshold, 2047},
    {"disagreeing members", kReductA, DisagreeingMembers, 3000},
    {"shared tag", kReductB, SharedTag, 77},
    {"shared words", kReductB, SharedWords, 81},
};

}  // namespace

std::span<const WorstInput> WorstInputs() { return kInputs; }

WorstTags TagsThatTakeLong(size_t bytes) {
  const std::string padded = Named("ge", Str(std::string(kLong - 1, '\0') + '\1'));
  const std::string range = Form("range", Str("binary"));
  return {Form("set", Fill(bytes / 2, range)),
          Form("range", Str("binary") + padded + Fill(bytes / 2, "(2:ge1:\1)"))};
}

}  // namespace vesk2test
