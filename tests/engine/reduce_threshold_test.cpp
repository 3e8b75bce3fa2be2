// k-of-n subjects: nothing is granted before k positions agree on the same principal.
#include "tests/engine/reduce_fixture.h"

namespace ZvVesk2::Engine {
namespace {

const std::string R = Key("R");
const std::string A = Key("A");
const std::string B = Key("B");
const std::string C = Key("C");
const std::string D = Key("D");
const std::string kProp = "(propagate)(tag x)";
const std::string kTwoOfThree = Entry(KOfN(2, 3, A + B + C), kProp);

TEST_F(ReduceTest, Thresholds) {
  const std::string any = Entry(KOfN(2, 3, A + B + C), "(propagate)(tag (*))");
  const std::string aR = Cert(A, R), bR = Cert(B, R), cR = Cert(C, R), dR = Cert(D, R);
  const std::string aD = Cert(A, D, kProp), bD = Cert(B, D, kProp);
  const std::string aRy = Cert(A, R, "(tag y)"), bRz = Cert(B, R, "(tag z)"),
                    cRy = Cert(C, R, "(tag y)"), cRz = Cert(C, R, "(tag z)");
  const std::string issued = Entry(A, kProp);  // to the issuer of a threshold certificate
  const std::string both = Cert(A, KOfN(2, 2, B + C), kProp);
  const std::string inner = KOfN(2, 2, B + KOfN(1, 2, C + D));
  const std::string nested = Cert(A, inner, kProp);
  const std::string name = "(name " + A + " n)";
  const auto in = [](const std::string& issuer, const char* from, const char* to) {
    return Cert(issuer, R, "(tag x)" + Dates(from, to));
  };
  const Case cases[] = {
      {"two members", {kTwoOfThree, aR + cR}, Entry(R)},
      {"all members", {kTwoOfThree, aR + bR + cR}, Entry(R)},
      {"one member", {kTwoOfThree, bR}, ""},
      {"one member, repeatedly", {kTwoOfThree, bR + bR + Cert(B, R, kProp)}, ""},
      {"one member by two ways", {kTwoOfThree, aR + aD + in(D, "1", "")}, ""},
      {"for different grants", {any, aRy + bR}, ""},
      {"valid at different times", {kTwoOfThree, in(A, "", "1") + in(B, "2", "")}, ""},
      {"not for delegation", {Entry(KOfN(2, 2, A + B)), aR + bR}, ""},
      {"members pass it on", {kTwoOfThree, aD + bD + dR}, Entry(R)},
      {"one of them passes it on", {kTwoOfThree, aD + bR + dR}, Entry(R)},
      {"one member passes it on", {kTwoOfThree, aD + dR}, ""},
      {"in a circle", {kTwoOfThree, aD + Cert(D, A, kProp), ""}, ""},
      {"all allow delegation",
       {kTwoOfThree, Cert(A, R, kProp) + Cert(B, R, kProp)},
       Entry(R, kProp)},
      {"the first does not", {kTwoOfThree, aR + Cert(B, R, kProp)}, Entry(R)},
      {"the last does not", {kTwoOfThree, Cert(A, R, kProp) + bR}, Entry(R)},
      {"the requester is a member", {kTwoOfThree, Cert(C, A), A}, Entry(A)},
      {"the requester is a member, alone", {kTwoOfThree, "", A}, ""},
      {"listed twice, it has two votes", {Entry(KOfN(2, 3, R + R + A)), ""}, Entry(R)},
      {"one of one is a plain grant", {Entry(KOfN(1, 1, R)), ""}, Entry(R)},
      {"the period of all",
       {kTwoOfThree, in(A, "1", "3") + in(B, "2", "4")},
       Entry(R, "(tag x)" + Dates("2", "3"))},
      {"a later pair agrees", {any, aRy + bR + cR}, Entry(R)},
      {"one pair after another, the newest first",
       {any, aRy + aR + bR + cRy + cRz + bRz},
       Entry(R, "(tag z)") + Entry(R, "(tag y)") + Entry(R)},
      {"by certificate", {issued, both + bR + cR}, Entry(R)},
      {"by certificate, one member", {issued, both + bR}, ""},
      {"by certificate, to the requester", {issued, Cert(A, KOfN(2, 2, R + C), kProp)}, ""},
      {"by certificate, last of all", {issued, bR + cR + both}, Entry(R)},
      {"not for delegation either", {issued, bR + cR + Cert(A, KOfN(2, 2, B + C))}, ""},
      {"nested", {issued, nested + bR + dR}, Entry(R)},
      {"nested, the inner one alone", {issued, nested + cR + dR}, ""},
      {"nested, without the inner one", {issued, nested + bR}, ""},
      {"nested in the ACL", {Entry(inner, kProp), cR + bR}, Entry(R)},
      {"a member by its name",
       {Entry(KOfN(2, 2, name + B), kProp), dR + bR + Cert(name, D, "")},
       Entry(R)},
      {"a name for k of n is nobody's",
       {Entry(name, kProp), Cert(name, KOfN(2, 2, R + B), "")},
       ""},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    Grants(c.input, c.granted);
  }
}

TEST_F(ReduceTest, ThresholdSyntax) {
  const std::string subjects[] = {
      "(k-of-n)",
      "(k-of-n \x01)",
      KOfN(3, 2, A + B),            // k above n
      KOfN(2, 3, A + B),            // too few
      KOfN(1, 1, A + B),            // too many
      KOfN(2, 2, A + " B"),         // no list
      "(k-of-n \x01 2 " + A + ")",  // n is the number 50
      "(k-of-n \x01\x01\x01\x01 \x01 " + A + ")",
      "(k-of-n [x]\x01 \x01 " + A + ")",
      "(k-of-n (x) \x01 " + A + ")",
  };
  for (const std::string& subject : subjects) {
    SCOPED_TRACE(subject);
    Fails({Entry(subject)}, SPKI_ERR_KOFN_SYNTAX);
  }
  Fails({"(entry (subject " + KOfN(1, 1, "(key A)") + "))"}, SPKI_ERR_SUBJECT_SYNTAX);
  // k = 0, and a number that 16 bits would cut to 1. Canonical text, for the 0 bytes.
  for (const std::string& k : {std::string("1:\0", 3), std::string("3:\1\0\1", 5)}) {
    spki_elem* result = nullptr;
    spki_elem* acl =
        Parse("(3:acl(5:entry(7:subject(6:k-of-n" + k + "1:\x01" + Canonical(R) + "))(3:tag1:x)))");
    EXPECT_EQ(SPKI_ERR_KOFN_SYNTAX,
              spki_reduce(&engine_, acl, nullptr, Chain(R), nullptr, nullptr, &result));
  }
}

// No choice of 25 agrees, and there are C(49, 24) of them.
TEST_F(ReduceTest, ThresholdSearchIsBounded) {
  std::string members;
  std::string certs;
  for (int i = 0; i < 50; ++i) {
    const std::string member = Key("M" + std::to_string(i));
    members += member;
    certs += Cert(member, R, i % 2 == 0 ? "(tag a)" : "(tag b)");
  }
  certs += Cert(Key("M0"), R, "(tag (* set c d))");
  Fails({Entry(KOfN(26, 50, members), "(propagate)(tag (*))"), certs}, SPKI_ERR_THRESHOLD);
}

}  // namespace
}  // namespace ZvVesk2::Engine
