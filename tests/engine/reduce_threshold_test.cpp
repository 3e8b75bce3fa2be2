// SPDX-License-Identifier: Apache-2.0
// k-of-n subjects: nothing is granted before k positions agree on the same principal.
#include "tests/engine/reduce_fixture.h"

namespace ZvVesk2::Engine {
namespace {

TEST_F(ReduceTest, Thresholds) {
  const std::string two = Entry(KOfN(2, 3, A + B + C), kProp);
  const std::string any = Entry(KOfN(2, 3, A + B + C), "(propagate)(tag (*))");
  const std::string aR = Cert(A, R), bR = Cert(B, R), cR = Cert(C, R), dR = Cert(D, R);
  const std::string aD = Cert(A, D, kProp), bD = Cert(B, D, kProp);
  const std::string aProp = Cert(A, R, kProp), bProp = Cert(B, R, kProp);
  const std::string aRy = Cert(A, R, "(tag y)"), bRz = Cert(B, R, "(tag z)"),
                    cRy = Cert(C, R, "(tag y)"), cRz = Cert(C, R, "(tag z)");
  const std::string issued = Entry(A, kProp);  // to the issuer of a threshold certificate
  const std::string both = Cert(A, KOfN(2, 2, B + C), kProp);
  const std::string inner = KOfN(2, 2, B + KOfN(1, 2, C + D)), nested = Cert(A, inner, kProp);
  const std::string n = Name(A, "n"), nD = Cert(n, D, "");
  const auto in = [](const std::string& issuer, const char* from, const char* to) {
    return Cert(issuer, R, "(tag x)" + Dates(from, to));
  };
  // Any two, however the members pass it on; who is listed twice has two votes.
  EachGrants(Entry(R), {two + aR + cR, two + aR + bR + cR, two + aD + bD + dR, two + aD + bR + dR,
                        two + aR + bProp, two + aProp + bR, any + aRy + bR + cR,
                        Entry(KOfN(2, 3, R + R + A)), Entry(KOfN(1, 1, R))});
  EachGrants(Entry(R, kProp), {two + aProp + bProp});
  EachGrants(Entry(R, "(tag x)" + Dates("2", "3")), {two + in(A, "1", "3") + in(B, "2", "4")});
  // One pair after another, the newest first.
  const std::string all = aRy + Cert(A, R) + bR + cRy + cRz + bRz;
  EachGrants(Entry(R, "(tag z)") + Entry(R, "(tag y)") + Entry(R), {any + all});
  // Not one member by any ways, nor members that disagree, nor without permission to delegate.
  EachGrants("", {two + bR, two + bR + bR + bProp, two + aR + aD + in(D, "1", ""), two + aD + dR,
                  any + aRy + bR, two + in(A, "", "1") + in(B, "2", ""),
                  Entry(KOfN(2, 2, A + B)) + aR + bR});
  // The requester may be a member, but not the only one; nobody may be the requester.
  Grants(Entry(A), {two, Cert(C, A), A});
  Grants("", {two, "", A});
  Grants("", {two, aD + Cert(D, A, kProp), ""});
  // By certificate, nested, and with a name among the members.
  EachGrants(Entry(R),
             {issued + both + bR + cR, issued + bR + cR + both, issued + nested + bR + dR,
              Entry(inner, kProp) + cR + bR, Entry(KOfN(2, 2, n + B), kProp) + dR + bR + nD});
  EachGrants("", {issued + both + bR, issued + Cert(A, KOfN(2, 2, R + C), kProp),
                  issued + nested + cR + dR, issued + nested + bR,
                  issued + bR + cR + Cert(A, KOfN(2, 2, B + C))});
  // A name for k of n is nobody's.
  EachGrants("", {Entry(n, kProp) + Cert(n, KOfN(2, 2, R + B), "")});
}

TEST_F(ReduceTest, ThresholdSyntax) {
  const auto entry = [](const std::string& text) { return Entry("(k-of-n " + text + ")"); };
  const std::string zero = Raw({"\0", 1}), wide = Raw({"\1\0\1", 3});  // the latter 1 in 16 bits
  EachFails(
      SPKI_ERR_KOFN_SYNTAX,
      {entry(""), entry("\x01"), Entry(KOfN(3, 2, A + B)), Entry(KOfN(2, 3, A + B)),
       Entry(KOfN(1, 1, A + B)), Entry(KOfN(2, 2, A + " B")), Entry(KOfN(1, '2', A)),
       entry("(x) \x01 " + A), entry("[x]\x01 \x01 " + A), entry("\x01\x01\x01\x01 \x01 " + A),
       entry(zero + "\x01" + A), entry(wide + "\x01" + A)});
  EachFails(SPKI_ERR_SUBJECT_SYNTAX, {Entry(KOfN(1, 1, "(key A)"))});
}

// No choice of 25 agrees, and there are C(49, 24) of them.
TEST_F(ReduceTest, ThresholdSearchIsBounded) {
  std::string members, certs;
  for (int i = 0; i < 50; ++i) {
    const std::string member = Key("M" + std::to_string(i));
    members += member;
    certs += Cert(member, R, i % 2 == 0 ? "(tag a)" : "(tag b)");
  }
  certs += Cert(Key("M0"), R, "(tag (* set c d))");
  EachFails(SPKI_ERR_THRESHOLD, {Entry(KOfN(26, 50, members), "(propagate)(tag (*))") + certs});
}

}  // namespace
}  // namespace ZvVesk2::Engine
