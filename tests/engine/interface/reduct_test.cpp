// The reductions over objects: which code a request gets, and what a chain is said to grant.
#include <gtest/gtest.h>

#include <vesk2/verify.h>

#include "tests/support/test_object.h"
#include "tests/support/test_text.h"

namespace {

using namespace ZvVesk2;
using vesk2test::AclEntryText;
using vesk2test::Cert;
using vesk2test::Parse;
using vesk2test::Tag;
using vesk2test::Valid;

std::string Key(const std::string& name) { return "(10:public-key1:" + name + ")"; }
std::string Acl(const std::string& entries) { return "(3:acl" + entries + ")"; }
std::string Sequence(const std::string& certs) { return "(8:sequence" + certs + ")"; }
std::string CertOf(const std::string& issuer, const std::string& tag) {
  return Cert({.issuer = Key(issuer), .subject = Key("R"), .tag = Tag(tag)});
}

int ReductA(const std::string& acl, const std::string& sequence, const std::string& third,
            const std::string& tag, const std::string& fifth = "") {
  Vesk2ContextStruct* ctx = nullptr;
  const Ref<SExpression> constraint = fifth.empty() ? Ref<SExpression>() : Parse(fifth);
  return Verify::ReductA(ctx, Parse(acl).get(), Parse(sequence).get(), Parse(third).get(),
                         Parse(tag).get(), constraint.get());
}

TEST(ReductA, Answers) {
  const std::string from = "2020-01-01_00:00:00", to = "2021-01-01_00:00:00",
                    late = "2022-01-01_00:00:00";
  const std::string root = AclEntryText(Key("A"), Tag("(ftp)"), true, from, to);
  const std::string bad = "(5:entry(7:subject" + Key("R") + ")(6:issuer" + Key("A") + "))";
  const std::string empty = AclEntryText(Key("B"), "(3:tag0:)");
  const struct {
    const char* name;
    std::string acl, certs, tag, fifth;
    int code;
  } cases[] = {
      {"the tag itself", root, CertOf("A", "(ftp)"), "(ftp)", "", 0},
      {"a narrower one", root, CertOf("A", "(ftp)"), "(ftp host)", "", 0},
      {"a wider one", root, CertOf("A", "(ftp host)"), "(ftp)", "", VESK2_ERR_PACKAGE_NOT_GRANTED},
      {"another", root, CertOf("A", "(ftp)"), "(http)", "", VESK2_ERR_NOT_AUTHORIZED},
      {"no chain", root, "", "(ftp)", "", VESK2_ERR_NOT_AUTHORIZED},
      {"in time", root, CertOf("A", "(ftp)"), "(ftp)", Valid(from, from), 0},
      {"too late", root, CertOf("A", "(ftp)"), "(ftp)", Valid(late, late),
       VESK2_ERR_NOT_AUTHORIZED},
      {"a fault", root + bad, CertOf("A", "(ftp)"), "(ftp)", "", SPKI_ERR_ACL_HAS_ISSUER},
      {"an odd entry stops everything", root + empty, CertOf("A", "(ftp)"), "(ftp)", "",
       SPKI_ERR_BAD_SEXP_FORMAT},
      {"the first entry decides, which is the newest",
       AclEntryText(Key("R"), Tag("(ftp)")) + AclEntryText(Key("R"), Tag("(ftp host)")), "",
       "(ftp)", "", VESK2_ERR_PACKAGE_NOT_GRANTED},
      {"the other way round",
       AclEntryText(Key("R"), Tag("(ftp host)")) + AclEntryText(Key("R"), Tag("(ftp)")), "",
       "(ftp)", "", 0},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    EXPECT_EQ(c.code, ReductA(Acl(c.acl), Sequence(c.certs), Key("R"), Tag(c.tag), c.fifth));
  }
}

// Every intersection of sets turns their order around, and sets in another order are not known to
// be the same. It only ever refuses; callers request single strings, lists, prefixes or ranges.
TEST(ReductA, Sets) {
  const std::string rw = "(* set read write)";
  const std::string wr = "(* set write read)";
  const struct {
    std::string entry, cert;
    int code;
  } cases[] = {
      {rw, "", VESK2_ERR_PACKAGE_NOT_GRANTED},    {rw, rw, 0},
      {wr, rw, VESK2_ERR_PACKAGE_NOT_GRANTED},    {"(*)", "", 0},
      {"(*)", rw, VESK2_ERR_PACKAGE_NOT_GRANTED},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.entry + " " + c.cert);
    const std::string acl = AclEntryText(Key(c.cert.empty() ? "R" : "A"), Tag(c.entry));
    const std::string certs = c.cert.empty() ? "" : CertOf("A", c.cert);
    EXPECT_EQ(c.code, ReductA(Acl(acl), Sequence(certs), Key("R"), Tag(rw)));
  }
}

TEST(ReductA, Arguments) {
  const Ref<SExpression> list = Parse(Acl(AclEntryText(Key("R"), Tag("x"))));
  for (int missing = 0; missing < 4; ++missing) {
    const auto given = [&](int i) { return i == missing ? nullptr : list.get(); };
    EXPECT_EQ(VESK2_ERR_INVALID_PARAM,
              Verify::ReductA(nullptr, given(0), given(1), given(2), given(3), nullptr));
  }
}

TEST(ReductB, Grants) {
  const std::string from = "2020-01-01_00:00:00", to = "2021-01-01_00:00:00";
  const struct {
    const char* name;
    std::string acl, tag, notBefore, notAfter;
  } cases[] = {
      {"all of it", AclEntryText(Key("R"), Tag("(ftp host)"), true, from, to), Tag("(ftp host)"),
       "(10:not-before19:" + from + ")", "(9:not-after19:" + to + ")"},
      {"without dates", AclEntryText(Key("R"), Tag("x"), false), Tag("x"), "", ""},
      {"nothing", AclEntryText(Key("A"), Tag("x")), "", "", ""},
  };
  const auto text = [](const Ref<SExpression>& list) {
    return list ? vesk2test::Canonical(list) : std::string();
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    Ref<SExpression> tag, from_list, to_list;
    EXPECT_EQ(0, Verify::ReductB(nullptr, Parse(Acl(c.acl)).get(), Parse(Sequence("")).get(),
                                 Parse(Key("R")).get(), tag.Out(), from_list.Out(), to_list.Out()));
    EXPECT_EQ(c.tag, text(tag));
    EXPECT_EQ(c.notBefore, text(from_list));
    EXPECT_EQ(c.notAfter, text(to_list));
  }
}

TEST(ReductB, Failures) {
  const Ref<SExpression> acl = Parse(Acl(""));
  const Ref<SExpression> key = Parse(Key("R"));
  Ref<SExpression> tag = Parse(Tag("x"));
  SExpression* used = tag.get();
  SExpression* from = nullptr;
  SExpression* to = nullptr;
  EXPECT_EQ(VESK2_ERR_PARAM_NOT_NULL,
            Verify::ReductB(nullptr, acl.get(), acl.get(), key.get(), used, from, to));
  used = nullptr;
  EXPECT_EQ(VESK2_ERR_INVALID_PARAM,
            Verify::ReductB(nullptr, acl.get(), nullptr, key.get(), used, from, to));
  const Ref<SExpression> bad = Parse(Acl("(5:entry)"));
  EXPECT_EQ(SPKI_ERR_SUBJECT_SYNTAX,
            Verify::ReductB(nullptr, bad.get(), acl.get(), key.get(), used, from, to));
  EXPECT_EQ(nullptr, used);
}

}  // namespace
