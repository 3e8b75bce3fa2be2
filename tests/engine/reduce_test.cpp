// SPDX-License-Identifier: Apache-2.0
// Chains of grants: what reaches the requester, with which tag, for how long and in which order;
// and names, which certificates say what they stand for.
#include "tests/engine/reduce_fixture.h"
#include "tests/support/test_text.h"

namespace ZvVesk2::Engine {
namespace {

const std::string kAny = "(propagate)(tag (*))";

TEST_F(ReduceTest, Chains) {
  const std::string r = Entry(R), a = Entry(A, kProp), b = Entry(B, kProp), rest = Cert(A, B);
  const std::string aR = Cert(A, R), aB = Cert(A, B, kProp), bR = Cert(B, R);
  EachGrants(r, {r, r + r, "(acl " + r + ")", a + aR, a + aB + bR, a + bR + aB,
                 a + "(sequence " + aR + ")", a + b + aR + bR, a + Entry(A) + aR,
                 Entry(R, "(x y)(tag x)")});
  EachGrants(Entry(R, kProp), {a + Cert(A, R, kProp), Entry(R, kProp) + Cert(R, R, kProp)});
  // Not to another, nor without permission to delegate, in any order; other lists say nothing.
  EachGrants("", {Entry(A), a + aB, Entry(A) + aR, a + rest + bR, a + bR + rest, "(x " + r + ")(x)",
                  "(sequence " + r + ")", a + "(acl " + aR + ")"});
  // An entry in a sequence is no trust root, a certificate in an ACL is not signed.
  Grants("", {Entry(A), r + "(acl" + r + ")"});
  Grants("", {a + aR + "(sequence " + aR + ")"});
}

// What a certificate makes of older entries is newer than all of them.
TEST_F(ReduceTest, TheNewestComesFirst) {
  const std::string ra = Entry(R, "(tag a)"), rb = Entry(R, "(tag b)"), rc = Entry(R, "(tag c)");
  const std::string bRa = Cert(B, R, "(tag a)"), bRb = Cert(B, R, "(tag b)");
  const std::string x = "(tag x)", g1 = Entry(R), g2 = Entry(R, kProp);
  const std::string g3 = Entry(R, x + Dates("1", "3")), g4 = Entry(R, x + Dates("2", "3"));
  const std::string g5 = Entry(R, x + Dates("2", "4"));
  EachGrants(g5 + g4 + g3 + g2 + g1, {g1 + g2 + g3 + g4 + g5});
  Grants(Entry(B) + Entry(A), {Entry(A) + Entry(B), "", ""});
  EachGrants(rb + rc + ra, {ra + Entry(A, kAny) + rc + Cert(A, R, "(tag b)")});
  // The last certificate meets what B issued from the newest on, and makes the older one last.
  EachGrants(ra + rb, {Entry(A, kAny) + bRa + bRb + Cert(A, B, kAny)});
}

TEST_F(ReduceTest, Tags) {
  const std::string y = "(tag y)", set = "(propagate)(tag (* set a b c))";
  const std::string a = Entry(A, kProp), any = Entry(A, kAny), untagged = Entry(R, "");
  EachGrants(Entry(R), {any + Cert(A, R), a + Cert(A, R, "")});
  // Nothing in common; no tag and no request is no grant.
  EachGrants("", {a + Cert(A, R, y), untagged + Entry(A, "(propagate)") + Cert(A, R, "")});
  // Each intersection turns a set around.
  EachGrants(Entry(R, "(tag (* set b a))"), {Entry(A, set) + Cert(A, R, "(tag (* set a b d))")});
  // All must grant what is requested; no tag takes the request.
  Grants(Entry(R, y), {Entry(R, "(tag (*))"), "", R, y});
  Grants(Entry(R, y), {untagged, "", R, y});
  Grants("", {any, Cert(A, R), R, y});
  // What has nothing to do with the request is dropped before it is looked at any closer.
  Grants(Entry(R), {Entry(R), "(cert (subject " + R + ")(tag y))", R, "(tag x)"});
}

TEST_F(ReduceTest, Dates) {
  const std::string from = "2020-01-01", mid = "2021-01-01", to = "2022-01-01";
  const auto before = [](const std::string& date) { return "(not-before " + date + ")"; };
  const auto after = [](const std::string& date) { return "(not-after " + date + ")"; };
  // What the entry and the certificate say, the constraint, and what is left.
  const struct {
    const char* name;
    std::string entry, cert, fifth;
    std::string left = "never";
  } cases[] = {
      {"passed on", Dates(from, to), "", "", Dates(from, to)},
      {"one end only", "", Dates("", to), "", Dates("", to)},
      {"later beginning, earlier end", Dates(from, mid), Dates(from, to), "", Dates(from, mid)},
      {"outside of (valid)", "", before(from), "", Dates(from, "")},
      {"an instant", Dates(from, mid), Dates(mid, to), "", Dates(mid, mid)},
      {"nothing left", Dates(from, from), Dates(mid, to), ""},
      {"a later date replaces an earlier one, even by a wider period", before(to) + before(from),
       "(valid " + after(from) + after(mid) + ")", "", Dates(from, mid)},
      {"constrained", "", "", Dates(from, to), Dates(from, to)},
      {"constrained from one side", Dates(from, to), "", before(mid), Dates(mid, to)},
      {"constrained from the other", Dates(from, to), "", after(mid), Dates(from, mid)},
      {"constrained to nothing", Dates("", from), "", Dates(mid, to)},
      {"at an instant", Dates(from, to), "", "(valid " + mid + ")", Dates(mid, mid)},
      {"at an instant outside", Dates(mid, to), "", "(valid " + from + ")"},
      {"a nested constraint", "", "", "(valid (valid " + mid + "))", Dates(mid, mid)},
      {"another constraint is none", "", "", "(x " + mid + ")", ""},
  };
  for (const auto& c : cases) {
    const std::string left = c.left == "never" ? "" : Entry(R, "(tag x)" + c.left);
    SCOPED_TRACE(c.name);
    Grants(left, {Entry(A, kProp + c.entry), Cert(A, R, "(tag x)" + c.cert), R, "", c.fifth});
  }
}

TEST_F(ReduceTest, CirclesEnd) {
  for (const std::string& tag : {kProp, std::string("(propagate)(tag (* set a b c))")}) {
    const std::string circle = Cert(A, B, tag) + Cert(B, C, tag) + Cert(C, A, tag);
    std::string text;
    EXPECT_EQ(0, Reduce({Entry(A, tag), circle + Cert(C, R, tag)}, &text));
    EXPECT_NE("(3:acl)", text);
  }
}

// What is emitted is the key when it is known.
TEST_F(ReduceTest, KeysAndTheirHashesAreOne) {
  const std::string a = Entry(A, kProp), sha1 = vesk2test::Digest(Canonical(R), "sha1");
  // A SHA-1 is kept like a SHA-256 that ends in zeros, and either names the key.
  const std::string hashes[] = {"sha1" + Raw(sha1), "sha256" + Raw(sha1 + std::string(12, '\0')),
                                "sha256" + Raw(vesk2test::Digest(Canonical(R)))};
  for (const std::string& value : hashes) {
    const std::string hash = "(hash " + value + ")";
    Grants(Entry(R), {a, Cert(A, hash), R});
    Grants(Entry(R), {Entry(hash), "", R});
    Grants(Entry(R), {a, Cert(A, R), hash});
    Grants(Entry(hash), {a, Cert(A, hash), hash});
    Grants(Entry(R), {a, Cert(A, hash) + "(foo " + R + ")", hash});
  }
}

TEST_F(ReduceTest, FaultsStopEverything) {
  const std::string h20(20, 'h'), h32(32, 'h'), one = KOfN(1, 1, R);
  const auto hash = [](const std::string& of) { return Entry("(hash " + of + ")"); };
  EachFails(SPKI_ERR_ACL_HAS_ISSUER, {"(entry (issuer " + A + "))"});
  EachFails(SPKI_ERR_NEED_ISSUER, {"(cert (subject " + R + ")(tag x))"});
  EachFails(SPKI_ERR_TOO_MANY_PROPAGATE, {Entry(R, "(propagate)(propagate)")});
  EachFails(SPKI_ERR_TOO_MANY_TAGS, {Entry(R, "(tag x)(tag x)")});
  EachFails(SPKI_ERR_TOO_MANY_ISSUERS, {Cert(A, R, "(issuer " + A + ")")});
  EachFails(SPKI_ERR_TOO_MANY_SUBJECTS,
            {Entry(R + ")(subject " + R), Entry(one + ")(subject " + one)});
  EachFails(SPKI_ERR_ISSUER_SYNTAX, {Cert("A", R), Cert("(key A)", R), Cert("(name n)", R, ""),
                                     Cert(Name(A, "n n"), R, "")});
  EachFails(SPKI_ERR_SUBJECT_SYNTAX,
            {"(entry (tag x))", Entry("R"), Entry("(object R)"), Entry("(name n)"),
             Entry(Name(A, "")), Entry(R) + Entry("R")});
  EachFails(SPKI_ERR_KEY_OR_HASH_EXPECTED, {Entry(Name("(key A)", "n"))});
  EachFails(SPKI_ERR_BAD_SEXP, {Entry(R, "(valid (not-after))")});
  EachFails(SPKI_ERR_UNKNOWN_HASH_ALG, {hash("md5 " + h20), hash("rmd160 " + h20)});
  EachFails(SPKI_ERR_BAD_HASH_FORMAT, {hash("sha1"), hash("*")});
  EachFails(SPKI_ERR_HASH_LTH_DIFFER, {hash("sha1 " + h32), hash("sha256 " + h20)});
  Fails(SPKI_ERR_BAD_SEXP, {Entry(R), "", R, "", "(not-after)"});
  Fails(SPKI_ERR_KEY_OR_HASH_EXPECTED, {Entry(R), "", "(k-of-n)"});
}

// A list whose first element is a list stands for that one.
TEST_F(ReduceTest, WrappedListsAndNoAcl) {
  spki_elem* acl = Chain("(acl " + Entry(R) + ")");
  spki_elem wrapped = {};
  wrapped.kind = SPKI_ELEM_LIST;
  wrapped.value.list = acl;
  spki_elem* out = nullptr;
  EXPECT_EQ(0, spki_reduce(&engine_, &wrapped, nullptr, nullptr, nullptr, nullptr, &out));
  EXPECT_EQ(Text(acl), Text(Keep(out)));
  EXPECT_EQ(SPKI_ERR_NO_ACL, spki_reduce(&engine_, nullptr, acl, nullptr, nullptr, nullptr, &out));
  EXPECT_EQ(nullptr, out);
}

TEST_F(ReduceTest, Names) {
  const auto define = [](const char* name, const std::string& subject, const std::string& key = A) {
    return Cert(Name(key, name), subject, "");
  };
  const std::string n = Name(A, "n"), to_n = Entry(n), nR = define("n", R), nB = define("n", B);
  const std::string b = Entry(B, kProp), bN = Cert(B, n), bm = define("m", R, B);
  // A name is defined once or more, before or after it is issued, relative or not, and stands for a
  // key, another name or more of itself.
  EachGrants(Entry(R), {to_n + nR, to_n + nB + nR, Entry(n, kProp) + nB + Cert(B, R), b + nR + bN,
                        b + bN + nR, Entry(A, kProp) + Cert(A, "(name n)") + nR,
                        Entry(Name(A, "n m")) + bm + nB, to_n + define("n", Name(B, "m")) + bm,
                        to_n + define("n", Name(A, "n n")) + nR});
  Grants(Entry(R), {to_n + Entry(C, "(propagate)(tag y)"), nR, R, "(tag x)"});
  // Other names, a hint among them; a name for itself; a definition is no grant.
  EachGrants("", {to_n + define("m", R) + define("n", R, B), Entry(Name(A, "[h]n")) + nR,
                  to_n + define("n", n)});
  Grants("", {Entry(A, kProp), nR, R, "(tag x)"});
  // The first definition of a subject counts, whatever its period is.
  const std::string early = Entry(n, "(tag x)" + Dates("1", "2")),
                    late = Cert(n, R, Dates("3", "4"));
  EachGrants("", {early + late, early + late + nR});
  EachGrants(Entry(R, "(tag x)" + Dates("2", "2")), {early + Cert(n, R, Dates("2", "4"))});
  // A malformed rest is seen only when it is needed.
  std::string many = "n";
  for (uint32_t i = 0; i < Limits::kMaxNameRest; ++i) many += " n";
  EachGrants("", {Entry(Name(A, many)), Entry(Name(A, "n (m)"))});
  EachFails(SPKI_ERR_BAD_NAME_SYNTAX, {Entry(Name(A, many + " n")), Entry(Name(A, "n (m)")) + nR});
  EachFails(SPKI_ERR_ISSUER_NAME_AND_AUTH, {Cert(n, R, "(tag x)")});
}

}  // namespace
}  // namespace ZvVesk2::Engine
