// Chains of grants: what reaches the requester, with which tag, for how long and in which order.
#include "tests/engine/reduce_fixture.h"
#include "tests/support/test_text.h"

namespace ZvVesk2::Engine {
namespace {

const std::string R = Key("R");
const std::string A = Key("A");
const std::string B = Key("B");
const std::string kProp = "(propagate)(tag x)";
const std::string kOneOfOne = KOfN(1, 1, R);

TEST_F(ReduceTest, Chains) {
  const Case cases[] = {
      {"an entry for the requester", {Entry(R), ""}, Entry(R)},
      {"an entry for another", {Entry(A), ""}, ""},
      {"no requester, the newest first", {Entry(A) + Entry(B), "", ""}, Entry(B) + Entry(A)},
      {"one certificate", {Entry(A, kProp), Cert(A, R)}, Entry(R)},
      {"the grantee may not delegate", {Entry(A), Cert(A, R)}, ""},
      {"it may on", {Entry(A, kProp), Cert(A, R, kProp)}, Entry(R, kProp)},
      {"a chain that ends elsewhere", {Entry(A, kProp), Cert(A, B)}, ""},
      {"two certificates", {Entry(A, kProp), Cert(A, B, kProp) + Cert(B, R)}, Entry(R)},
      {"in any order", {Entry(A, kProp), Cert(B, R) + Cert(A, B, kProp)}, Entry(R)},
      {"the middle may not delegate", {Entry(A, kProp), Cert(A, B) + Cert(B, R)}, ""},
      {"the middle may not delegate, in any order", {Entry(A, kProp), Cert(B, R) + Cert(A, B)}, ""},
      {"certificates nest", {Entry(A, kProp), "(sequence " + Cert(A, R) + ")"}, Entry(R)},
      {"entries nest", {"(acl " + Entry(R) + ")", ""}, Entry(R)},
      {"other lists say nothing", {"(x " + Entry(R) + ")", "(foo)"}, ""},
      {"no trust root in a sequence", {Entry(A), Entry(R) + "(acl" + Entry(R) + ")"}, ""},
      {"a certificate in the ACL is not signed",
       {Entry(A, kProp) + Cert(A, R) + "(sequence " + Cert(A, R) + ")", ""},
       ""},
      {"a diamond", {Entry(A, kProp) + Entry(B, kProp), Cert(A, R) + Cert(B, R)}, Entry(R)},
      {"a diamond of different grants",
       {Entry(A, "(propagate)(tag y)") + Entry(B, kProp), Cert(A, R, "(tag y)") + Cert(B, R)},
       Entry(R) + Entry(R, "(tag y)")},
      {"the same credential twice", {Entry(R) + Entry(R), ""}, Entry(R)},
      {"the same but for its end",
       {Entry(R, "(tag x)" + Dates("", "1")) + Entry(R, "(tag x)" + Dates("", "2")), ""},
       Entry(R, "(tag x)" + Dates("", "2")) + Entry(R, "(tag x)" + Dates("", "1"))},
      {"a grant to oneself", {Entry(R, kProp), Cert(R, R, kProp)}, Entry(R, kProp)},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    Grants(c.input, c.granted);
  }
}

TEST_F(ReduceTest, NewestFirst) {
  // What a certificate makes of older entries is newer than all of them.
  Grants({Entry(R, "(tag a)") + Entry(A, "(propagate)(tag b)") + Entry(R, "(tag c)"),
          Cert(A, R, "(tag b)")},
         Entry(R, "(tag b)") + Entry(R, "(tag c)") + Entry(R, "(tag a)"));
  // The last certificate meets what B issued from the newest on, and makes the older one last.
  Grants({Entry(A, "(propagate)(tag (*))"),
          Cert(B, R, "(tag 1)") + Cert(B, R, "(tag 2)") + Cert(A, B, "(propagate)(tag (*))")},
         Entry(R, "(tag 1)") + Entry(R, "(tag 2)"));
}

TEST_F(ReduceTest, Tags) {
  const std::string any = "(propagate)(tag (*))";
  const Case cases[] = {
      {"the narrower of the two", {Entry(A, any), Cert(A, R)}, Entry(R)},
      {"nothing in common", {Entry(A, kProp), Cert(A, R, "(tag y)")}, ""},
      {"what is requested", {Entry(R, "(tag (*))"), "", R, "(tag y)"}, Entry(R, "(tag y)")},
      {"what is requested of each", {Entry(A, any), Cert(A, R), R, "(tag y)"}, ""},
      {"no tag takes the request", {Entry(R, ""), "", R, "(tag y)"}, Entry(R, "(tag y)")},
      {"no tag and no request is no grant",
       {Entry(R, "") + Entry(A, "(propagate)"), Cert(A, R, "")},
       ""},
      {"no tag in the middle", {Entry(A, kProp), Cert(A, R, "")}, Entry(R)},
      {"each intersection turns a set around",
       {Entry(A, "(propagate)(tag (* set a b c))"), Cert(A, R, "(tag (* set a b d))")},
       Entry(R, "(tag (* set b a))")},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    Grants(c.input, c.granted);
  }
}

TEST_F(ReduceTest, Dates) {
  const std::string from = "2020-01-01_00:00:00", mid = "2021-01-01_00:00:00",
                    to = "2022-01-01_00:00:00";
  const auto granted = [](const std::string& a, const std::string& b) {
    return Entry(R, "(tag x)" + Dates(a, b));
  };
  const auto chain = [](const std::string& entry, const std::string& cert,
                        const std::string& fifth = "") {
    return Input{Entry(A, kProp + entry), Cert(A, R, "(tag x)" + cert), R, "", fifth};
  };
  const Case cases[] = {
      {"passed on", chain(Dates(from, to), ""), granted(from, to)},
      {"one end only", chain("", Dates("", to)), granted("", to)},
      {"the later beginning and the earlier end", chain(Dates(from, mid), Dates(from, to)),
       granted(from, mid)},
      {"outside of (valid)", chain("", "(not-before " + from + ")"), granted(from, "")},
      {"an instant", chain(Dates(from, mid), Dates(mid, to)), granted(mid, mid)},
      {"nothing left", chain(Dates(from, from), Dates(mid, to)), ""},
      {"a later date replaces an earlier one, even by a wider period",
       chain("(not-before " + to + ")(not-before " + from + ")",
             "(valid (not-after " + from + ")(not-after " + mid + "))"),
       granted(from, mid)},
      {"constrained", chain("", "", Dates(from, to)), granted(from, to)},
      {"constrained from one side", chain(Dates(from, to), "", "(not-before " + mid + ")"),
       granted(mid, to)},
      {"constrained from the other", chain(Dates(from, to), "", "(not-after " + mid + ")"),
       granted(from, mid)},
      {"constrained to nothing", chain(Dates("", from), "", Dates(mid, to)), ""},
      {"at an instant", chain(Dates(from, to), "", "(valid " + mid + ")"), granted(mid, mid)},
      {"at an instant outside", chain(Dates(mid, to), "", "(valid " + from + ")"), ""},
      {"a nested constraint", chain("", "", "(valid (valid " + mid + "))"), granted(mid, mid)},
      {"another constraint is none", chain("", "", "(x " + mid + ")"), Entry(R)},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    Grants(c.input, c.granted);
  }
}

TEST_F(ReduceTest, CirclesEnd) {
  const std::string tags[] = {"(propagate)(tag x)", "(propagate)(tag (* set a b c))"};
  for (const std::string& tag : tags) {
    std::string text;
    EXPECT_EQ(0, Run({Entry(A, tag), Cert(A, B, tag) + Cert(B, Key("C"), tag) +
                                         Cert(Key("C"), A, tag) + Cert(Key("C"), R, tag)},
                     &text));
    EXPECT_NE("(3:acl)", text);
  }
}

TEST_F(ReduceTest, KeysAndTheirHashesAreOne) {
  using vesk2test::HashOf;
  const std::string key = Canonical(R);
  const std::string cert = "(4:cert" + Canonical("(issuer " + A + ")") + "(7:subject";
  for (const char* algorithm : {"sha1", "sha256"}) {
    SCOPED_TRACE(algorithm);
    const std::string hash = HashOf(key, algorithm);
    const spki_elem* acl = Chain("(acl " + Entry(A, kProp) + ")");
    const struct {
      std::string sequence, third;
      std::string subject;  // as it is emitted: the key when it is known
    } cases[] = {
        {"(8:sequence" + cert + hash + ")(3:tag1:x)))", key, key},
        {"(8:sequence" + cert + key + ")(3:tag1:x)))", hash, key},
        {"(8:sequence" + cert + hash + ")(3:tag1:x)))", hash, hash},
        {"(8:sequence" + cert + hash + ")(3:tag1:x))" + "(3:foo" + key + "))", hash, key},
    };
    for (const auto& c : cases) {
      spki_elem* result = nullptr;
      EXPECT_EQ(0, spki_reduce(&engine_, const_cast<spki_elem*>(acl), Parse(c.sequence),
                               Parse(c.third), nullptr, nullptr, &result));
      EXPECT_EQ("(3:acl(5:entry(7:subject" + c.subject + ")(3:tag1:x)))", Consume(result));
    }
  }
}

TEST_F(ReduceTest, FaultsStopEverything) {
  const std::string h20(20, 'h');
  const std::string h32(32, 'h');
  const BadCase cases[] = {
      {"issuer in an entry", {"(entry (issuer " + A + "))"}, SPKI_ERR_ACL_HAS_ISSUER},
      {"no issuer", {"", "(cert (subject " + R + ")(tag x))"}, SPKI_ERR_NEED_ISSUER},
      {"no subject", {"(entry (tag x))"}, SPKI_ERR_SUBJECT_SYNTAX},
      {"two propagates", {Entry(R, "(propagate)(propagate)")}, SPKI_ERR_TOO_MANY_PROPAGATE},
      {"two tags", {Entry(R, "(tag x)(tag x)")}, SPKI_ERR_TOO_MANY_TAGS},
      {"two issuers", {"", Cert(A, R, "(issuer " + A + ")")}, SPKI_ERR_TOO_MANY_ISSUERS},
      {"two subjects", {Entry(R, "(subject " + R + ")")}, SPKI_ERR_TOO_MANY_SUBJECTS},
      {"two k-of-n subjects",
       {Entry(kOneOfOne, "(subject " + kOneOfOne + ")")},
       SPKI_ERR_TOO_MANY_SUBJECTS},
      {"issuer without a list", {"", Cert("A", R)}, SPKI_ERR_ISSUER_SYNTAX},
      {"issuer of another kind", {"", Cert("(key A)", R)}, SPKI_ERR_ISSUER_SYNTAX},
      {"issuer with two names", {"", Cert("(name " + A + " n n)", R, "")}, SPKI_ERR_ISSUER_SYNTAX},
      {"issuer without a key", {"", Cert("(name n)", R, "")}, SPKI_ERR_ISSUER_SYNTAX},
      {"subject without a list", {Entry("R")}, SPKI_ERR_SUBJECT_SYNTAX},
      {"subject of another kind", {Entry("(object R)")}, SPKI_ERR_SUBJECT_SYNTAX},
      {"relative name in an entry", {Entry("(name n)")}, SPKI_ERR_SUBJECT_SYNTAX},
      {"name without a name", {Entry("(name " + A + ")")}, SPKI_ERR_SUBJECT_SYNTAX},
      {"name of no key", {Entry("(name (key A) n)")}, SPKI_ERR_KEY_OR_HASH_EXPECTED},
      {"date without a date", {Entry(R, "(valid (not-after))")}, SPKI_ERR_BAD_SEXP},
      {"constraint without a date", {Entry(R), "", R, "", "(not-after)"}, SPKI_ERR_BAD_SEXP},
      {"requester of another kind", {Entry(R), "", "(k-of-n)"}, SPKI_ERR_KEY_OR_HASH_EXPECTED},
      {"unknown hash", {Entry("(hash md5 " + h20 + ")")}, SPKI_ERR_UNKNOWN_HASH_ALG},
      {"unheard-of hash", {Entry("(hash rmd160 " + h20 + ")")}, SPKI_ERR_UNKNOWN_HASH_ALG},
      {"hash without a value", {Entry("(hash sha1)")}, SPKI_ERR_BAD_HASH_FORMAT},
      {"sha1 of 32 bytes", {Entry("(hash sha1 " + h32 + ")")}, SPKI_ERR_HASH_LTH_DIFFER},
      {"sha256 of 20 bytes", {Entry("(hash sha256 " + h20 + ")")}, SPKI_ERR_HASH_LTH_DIFFER},
      {"a fault behind a grant", {Entry(R) + Entry("R")}, SPKI_ERR_SUBJECT_SYNTAX},
  };
  for (const BadCase& c : cases) {
    SCOPED_TRACE(c.name);
    Fails(c.input, c.status);
  }
  // What has nothing to do with the request is dropped before it is looked at any closer.
  Grants({Entry(R), "(cert (subject " + R + ")(tag y))", R, "(tag x)"}, Entry(R));
}

TEST_F(ReduceTest, Arguments) {
  spki_elem* result = Chain("(x)");
  spki_elem* acl = Chain("(acl " + Entry(R) + ")");
  EXPECT_EQ(SPKI_ERR_NULL_PARAM,
            spki_reduce(&engine_, acl, nullptr, nullptr, nullptr, nullptr, nullptr));
  EXPECT_EQ(SPKI_ERR_NO_ACL,
            spki_reduce(&engine_, nullptr, acl, nullptr, nullptr, nullptr, &result));
  EXPECT_EQ(nullptr, result);
  // A list whose first element is a list stands for that one.
  spki_elem wrapped = {};
  wrapped.kind = SPKI_ELEM_LIST;
  wrapped.value.list = acl;
  EXPECT_EQ(0, spki_reduce(&engine_, &wrapped, nullptr, nullptr, nullptr, nullptr, &result));
  EXPECT_EQ(Canonical("(acl " + Entry(R) + ")"), Consume(result));
}

}  // namespace
}  // namespace ZvVesk2::Engine
