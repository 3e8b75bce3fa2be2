// Names: what a certificate says a name stands for, and grants to names.
#include "tests/engine/reduce_fixture.h"

namespace ZvVesk2::Engine {
namespace {

const std::string R = Key("R");
const std::string A = Key("A");
const std::string B = Key("B");
const std::string C = Key("C");

std::string Name(const std::string& key, const std::string& names) {
  return "(name " + key + " " + names + ")";
}
std::string Define(const std::string& key, const std::string& name, const std::string& subject,
                   const std::string& fields = "") {
  return Cert(Name(key, name), subject, fields);
}

TEST_F(ReduceTest, Names) {
  const std::string to_n = Entry(Name(A, "n"));
  const std::string prop = Entry(Name(A, "n"), "(propagate)(tag x)");
  const Case cases[] = {
      {"an entry to a name", {to_n, Define(A, "n", R)}, Entry(R)},
      {"not defined", {to_n, Define(A, "m", R) + Define(B, "n", R)}, ""},
      {"defined twice", {to_n, Define(A, "n", B) + Define(A, "n", R)}, Entry(R)},
      {"a hint makes another name", {Entry(Name(A, "[h]n")), Define(A, "n", R)}, ""},
      {"the requester's grant",
       {to_n + Entry(C, "(propagate)(tag y)"), Define(A, "n", R), R, "(tag x)"},
       Entry(R)},
      {"the name's key delegates", {prop, Define(A, "n", B) + Cert(B, R)}, Entry(R)},
      {"a name in a certificate, defined before",
       {Entry(B, "(propagate)(tag x)"), Define(A, "n", R) + Cert(B, Name(A, "n"))},
       Entry(R)},
      {"a name in a certificate, defined after",
       {Entry(B, "(propagate)(tag x)"), Cert(B, Name(A, "n")) + Define(A, "n", R)},
       Entry(R)},
      {"the issuer's own name",
       {Entry(A, "(propagate)(tag x)"), Cert(A, "(name n)") + Define(A, "n", R)},
       Entry(R)},
      {"names behind names",
       {Entry(Name(A, "n m")), Define(B, "m", R) + Define(A, "n", B)},
       Entry(R)},
      {"a name that stands for a name",
       {to_n, Define(A, "n", Name(B, "m")) + Define(B, "m", R)},
       Entry(R)},
      {"a name that stands for itself", {to_n, Define(A, "n", Name(A, "n"))}, ""},
      {"a name that stands for more of itself",
       {to_n, Define(A, "n", Name(A, "n n")) + Define(A, "n", R)},
       Entry(R)},
      {"the period of both",
       {Entry(Name(A, "n"), "(tag x)" + Dates("1", "3")), Define(A, "n", R, Dates("2", "4"))},
       Entry(R, "(tag x)" + Dates("2", "3"))},
      {"never valid together",
       {Entry(Name(A, "n"), "(tag x)" + Dates("1", "2")), Define(A, "n", R, Dates("3", "4"))},
       ""},
      {"the first definition of a subject counts",
       {Entry(Name(A, "n"), "(tag x)" + Dates("1", "2")),
        Define(A, "n", R, Dates("3", "4")) + Define(A, "n", R)},
       ""},
      {"a definition is no grant",
       {Entry(A, "(propagate)(tag x)"), Define(A, "n", R), R, "(tag x)"},
       ""},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    Grants(c.input, c.granted);
  }
}

TEST_F(ReduceTest, NameFaults) {
  std::string names = "n";
  for (uint32_t i = 0; i < Limits::kMaxNameRest; ++i) names += " n";
  const BadCase cases[] = {
      {"a definition with a tag",
       {"", Define(A, "n", R, "(tag x)")},
       SPKI_ERR_ISSUER_NAME_AND_AUTH},
      {"a rest that is no name",
       {Entry(Name(A, "n (m)")), Define(A, "n", R)},
       SPKI_ERR_BAD_NAME_SYNTAX},
      {"names without end", {Entry(Name(A, names + " n"))}, SPKI_ERR_BAD_NAME_SYNTAX},
  };
  for (const BadCase& c : cases) {
    SCOPED_TRACE(c.name);
    Fails(c.input, c.status);
  }
  Grants({Entry(Name(A, names))}, "");
  // A malformed rest is seen only when it is needed.
  Grants({Entry(Name(A, "n (m)"))}, "");
}

}  // namespace
}  // namespace ZvVesk2::Engine
