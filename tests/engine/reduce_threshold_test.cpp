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
  const std::string issued = Entry(A, kProp);  // to the issuer of a threshold certificate
  const auto threshold = [](const std::string& subject) { return Cert(A, subject, kProp); };
  const std::string nested = KOfN(2, 2, B + KOfN(1, 2, C + D));
  const Case cases[] = {
      {"two members", {kTwoOfThree, Cert(A, R) + Cert(C, R)}, Entry(R)},
      {"all members", {kTwoOfThree, Cert(A, R) + Cert(B, R) + Cert(C, R)}, Entry(R)},
      {"one member", {kTwoOfThree, Cert(B, R)}, ""},
      {"one member twice", {kTwoOfThree, Cert(B, R) + Cert(B, R) + Cert(B, R, kProp)}, ""},
      {"one member by two ways",
       {kTwoOfThree, Cert(A, R) + Cert(A, D, kProp) + Cert(D, R, "(tag x)" + Dates("1", ""))},
       ""},
      {"to different principals", {kTwoOfThree, Cert(A, R) + Cert(B, D)}, ""},
      {"one member each for different grants",
       {Entry(KOfN(2, 3, A + B + C), "(propagate)(tag (*))"), Cert(A, R) + Cert(B, R, "(tag y)")},
       ""},
      {"valid at different times",
       {kTwoOfThree,
        Cert(A, R, "(tag x)" + Dates("", "1")) + Cert(B, R, "(tag x)" + Dates("2", ""))},
       ""},
      {"the members must be allowed to delegate",
       {Entry(KOfN(2, 2, A + B)), Cert(A, R) + Cert(B, R)},
       ""},
      {"members pass it on",
       {kTwoOfThree, Cert(A, D, kProp) + Cert(B, D, kProp) + Cert(D, R)},
       Entry(R)},
      {"one of them passes it on",
       {kTwoOfThree, Cert(A, D, kProp) + Cert(B, R) + Cert(D, R)},
       Entry(R)},
      {"one member passes it on", {kTwoOfThree, Cert(A, D, kProp) + Cert(D, R)}, ""},
      {"all of them let it be delegated",
       {kTwoOfThree, Cert(A, R, kProp) + Cert(B, R, kProp)},
       Entry(R, kProp)},
      {"one of them does not", {kTwoOfThree, Cert(A, R, kProp) + Cert(B, R)}, Entry(R)},
      {"the requester is a member", {kTwoOfThree, Cert(C, A), A}, Entry(A)},
      {"the requester is a member, alone", {kTwoOfThree, "", A}, ""},
      {"listed twice, it has two votes", {Entry(KOfN(2, 3, R + R + A)), ""}, Entry(R)},
      {"one of one is a plain grant", {Entry(KOfN(1, 1, R)), ""}, Entry(R)},
      {"the tag and the period of all",
       {Entry(KOfN(2, 2, A + B), "(propagate)(tag (*))"),
        Cert(A, R, "(tag (* prefix a))" + Dates("1", "3")) +
            Cert(B, R, "(tag abc)" + Dates("2", "4"))},
       Entry(R, "(tag abc)" + Dates("2", "3"))},
      {"a later pair agrees",
       {Entry(KOfN(2, 3, A + B + C), "(propagate)(tag (*))"),
        Cert(A, R, "(tag y)") + Cert(B, R) + Cert(C, R)},
       Entry(R)},
      {"by certificate",
       {issued, threshold(KOfN(2, 2, B + C)) + Cert(B, R) + Cert(C, R)},
       Entry(R)},
      {"by certificate, one member", {issued, threshold(KOfN(2, 2, B + C)) + Cert(B, R)}, ""},
      {"by certificate, a member is the requester", {issued, threshold(KOfN(2, 2, R + C))}, ""},
      {"by certificate, last of all",
       {issued, Cert(B, R) + Cert(C, R) + threshold(KOfN(2, 2, B + C))},
       Entry(R)},
      {"nested", {issued, threshold(nested) + Cert(B, R) + Cert(D, R)}, Entry(R)},
      {"nested, the inner one alone", {issued, threshold(nested) + Cert(C, R) + Cert(D, R)}, ""},
      {"nested, without the inner one", {issued, threshold(nested) + Cert(B, R)}, ""},
      {"nested in the ACL", {Entry(nested, kProp), Cert(C, R) + Cert(B, R)}, Entry(R)},
      {"a member by its name",
       {Entry(KOfN(2, 2, "(name " + A + " n)" + B), kProp),
        Cert(D, R) + Cert(B, R) + Cert("(name " + A + " n)", D, "")},
       Entry(R)},
      {"a name for k of n is nobody's",
       {Entry("(name " + A + " n)", kProp), Cert("(name " + A + " n)", KOfN(2, 2, R + B), "")},
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
