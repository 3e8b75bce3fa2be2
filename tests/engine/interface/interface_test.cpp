// SPDX-License-Identifier: Apache-2.0
// The engine seen from the objects: tags within tags, which code a request gets, and what a chain
// is said to grant.
#include <gtest/gtest.h>

#include <vesk2/verify.h>

#include "tests/support/test_object.h"
#include "tests/support/test_text.h"
#include "tests/support/worst_inputs.h"

namespace {

using namespace ZvVesk2;
using vesk2test::Parse;
using vesk2test::Tag;

TEST(IsSubset, Tags) {
  const struct {
    bool within;
    const char *tag, *other;
  } cases[] = {
      {true, "(ftp host)", "(ftp)"},
      {true, "a", "(* set a b)"},
      {true, "(* range numeric (ge 5))", "(* range numeric (ge 1))"},
      {false, "(ftp)", "(ftp host)"},
      {false, "(ftp)", "(http)"},
      // Sets are never within sets but for equal objects, nor is a single point within a range.
      {true, "(* set a b)", "(* set a b)"},
      {false, "(* set a)", "(* set a b)"},
      {false, "(* set a b)", "(* set b a)"},
      {false, "(* range numeric (ge 5) (le 5))", "(* range numeric (ge 1))"},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(c.within, Parse(Tag(c.tag))->IsSubset(Parse(Tag(c.other)).get())) << c.tag;
  }
  const Ref<SExpression> tag = Parse(Tag("(ftp)")), unreadable = Parse("(3:tag0:)");
  EXPECT_FALSE(tag->IsSubset(nullptr));
  EXPECT_FALSE(tag->IsSubset(unreadable.get()));
  EXPECT_FALSE(unreadable->IsSubset(tag.get()));
  EXPECT_TRUE(unreadable->IsSubset(unreadable.get())) << "equal objects need no engine";
}

std::string Key(const std::string& name) { return "(10:public-key1:" + name + ")"; }
std::string Entry(const char* subject, const std::string& tag) {
  return vesk2test::AclEntryText(Key(subject), Tag(tag));
}
std::string Text(const Ref<SExpression>& list) { return list ? vesk2test::Canonical(list) : ""; }
std::string Acl(const std::string& entries) { return "(3:acl" + entries + ")"; }
// A certificate of A for R.
std::string Cert(const std::string& tag) {
  return vesk2test::Cert({.issuer = Key("A"), .subject = Key("R"), .tag = Tag(tag)});
}
const std::string kFrom = "2020-01-01_00:00:00", kTo = "2021-01-01_00:00:00";

TEST(ReductA, Answers) {
  const std::string root = vesk2test::AclEntryText(Key("A"), Tag("(ftp)"), true, kFrom, kTo);
  const std::string ftp = Cert("(ftp)"), rw = "(* set read write)", wr = "(* set write read)";
  const std::string in = vesk2test::Valid(kFrom, kFrom), late = vesk2test::Valid("2022", "2022");
  const std::string bad = "(5:entry(7:subject" + Key("R") + ")(6:issuer" + Key("A") + "))";
  const std::string odd = vesk2test::AclEntryText(Key("B"), "(3:tag0:)");
  const std::string wide = Entry("R", "(ftp)"), narrow = Entry("R", "(ftp host)");
  const int refused = VESK2_ERR_NOT_AUTHORIZED, wider = VESK2_ERR_PACKAGE_NOT_GRANTED;
  const struct {
    const char* name;
    int code;
    std::string acl, certs, tag = "(ftp)", fifth = "(5:valid)";
  } cases[] = {
      {"the tag itself", 0, root, ftp},
      {"a narrower one", 0, root, ftp, "(ftp host)"},
      {"a wider one", wider, root, Cert("(ftp host)")},
      {"another", refused, root, ftp, "(http)"},
      {"no chain", refused, root, ""},
      {"in time", 0, root, ftp, "(ftp)", in},
      {"too late", refused, root, ftp, "(ftp)", late},
      {"a fault", SPKI_ERR_ACL_HAS_ISSUER, root + bad, ftp},
      {"an odd entry stops everything", SPKI_ERR_BAD_SEXP_FORMAT, root + odd, ftp},
      {"the first entry decides, which is the newest", wider, wide + narrow, ""},
      {"the other way round", 0, narrow + wide, ""},
      // Every intersection of sets turns their order around, and sets in another order are not
      // known to be the same. It only ever refuses; callers request strings, lists or ranges.
      {"a set", wider, Entry("R", rw), "", rw},
      {"a set twice", 0, Entry("A", rw), Cert(rw), rw},
      {"another order", wider, Entry("A", wr), Cert(rw), rw},
      {"a set of everything", 0, Entry("R", "(*)"), "", rw},
      {"a set of a set of everything", wider, Entry("A", "(*)"), Cert(rw), rw},
  };
  const Ref<SExpression> key = Parse(Key("R"));
  for (const auto& c : cases) {
    const Ref<SExpression> acl = Parse(Acl(c.acl)), certs = Parse("(8:sequence" + c.certs + ")");
    const Ref<SExpression> tag = Parse(Tag(c.tag)), fifth = Parse(c.fifth);
    EXPECT_EQ(c.code,
              Verify::ReductA(nullptr, acl.get(), certs.get(), key.get(), tag.get(), fifth.get()))
        << c.name;
  }
  for (int missing = 0; missing < 4; ++missing) {
    const auto given = [&](int i) { return i == missing ? nullptr : key.get(); };
    EXPECT_EQ(VESK2_ERR_INVALID_PARAM,
              Verify::ReductA(nullptr, given(0), given(1), given(2), given(3), nullptr));
  }
}

// Some hundred MB of grants in 600 KB of certificates: ReductA asks for the first one only.
TEST(Reductions, GrantsHaveALimit) {
  for (const vesk2test::WorstInput& input : vesk2test::WorstInputs()) {
    if (std::string(input.name) != "shared tag") continue;
    const vesk2test::WorstLists text = input.make(600'000);
    const Ref<SExpression> acl = Parse(text.acl), sequence = Parse(text.sequence);
    const Ref<SExpression> key = Parse(text.third), asked = Parse(text.tag);
    Ref<SExpression> tag, from, to;
    EXPECT_EQ(SPKI_ERR_NO_MEM, Verify::ReductB(nullptr, acl.get(), sequence.get(), key.get(),
                                               tag.Out(), from.Out(), to.Out()));
    EXPECT_FALSE(tag || from || to);
    EXPECT_EQ(VESK2_ERR_PACKAGE_NOT_GRANTED,
              Verify::ReductA(nullptr, acl.get(), sequence.get(), key.get(), asked.get(), nullptr));
  }
}

TEST(ReductB, GrantsAndFailures) {
  const struct {
    int code;
    std::string acl, tag = "", from = "", to = "";
  } cases[] = {
      {0, vesk2test::AclEntryText(Key("R"), Tag("(ftp host)"), true, kFrom, kTo), Tag("(ftp host)"),
       "(10:not-before19:" + kFrom + ")", "(9:not-after19:" + kTo + ")"},
      {0, Entry("R", "x"), Tag("x")},
      {0, Entry("A", "x")},  // nothing granted is no error
      {SPKI_ERR_SUBJECT_SYNTAX, "(5:entry)"},
  };
  const Ref<SExpression> sequence = Parse("(8:sequence)"), key = Parse(Key("R"));
  for (const auto& c : cases) {
    Ref<SExpression> tag, from, to;
    EXPECT_EQ(c.code, Verify::ReductB(nullptr, Parse(Acl(c.acl)).get(), sequence.get(), key.get(),
                                      tag.Out(), from.Out(), to.Out()));
    EXPECT_EQ(c.tag + c.from + c.to, Text(tag) + Text(from) + Text(to));
  }
  SExpression* used = key.get();
  SExpression* unused = nullptr;
  EXPECT_EQ(VESK2_ERR_PARAM_NOT_NULL,
            Verify::ReductB(nullptr, key.get(), sequence.get(), key.get(), used, unused, unused));
  EXPECT_EQ(VESK2_ERR_INVALID_PARAM,
            Verify::ReductB(nullptr, key.get(), nullptr, key.get(), unused, unused, unused));
}

}  // namespace
