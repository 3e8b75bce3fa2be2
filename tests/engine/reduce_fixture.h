// SPDX-License-Identifier: Apache-2.0
// Reductions written as text: keys are (public-key NAME), credentials lists of words. What comes
// out is compared as text.
#ifndef VESK2_TESTS_ENGINE_REDUCE_FIXTURE_H
#define VESK2_TESTS_ENGINE_REDUCE_FIXTURE_H

#include "src/engine/reduce.h"
#include "tests/engine/engine_fixture.h"

namespace ZvVesk2::Engine {

inline std::string Key(const std::string& name) { return "(public-key " + name + ")"; }
inline const std::string R = Key("R"), A = Key("A"), B = Key("B"), C = Key("C"), D = Key("D");
inline const std::string kProp = "(propagate)(tag x)";

inline std::string Entry(const std::string& subject, const std::string& fields = "(tag x)") {
  return "(entry (subject " + subject + ")" + fields + ")";
}
inline std::string Cert(const std::string& issuer, const std::string& subject,
                        const std::string& fields = "(tag x)") {
  return "(cert (issuer " + issuer + ")(subject " + subject + ")" + fields + ")";
}
inline std::string Name(const std::string& key, const std::string& names) {
  return "(name " + key + " " + names + ")";
}
inline std::string KOfN(char k, char n, const std::string& subjects) {
  return std::string("(k-of-n ") + k + " " + n + subjects + ")";
}
inline std::string Dates(const std::string& from, const std::string& to) {
  return "(valid" + (from.empty() ? "" : "(not-before " + from + ")") +
         (to.empty() ? "" : "(not-after " + to + ")") + ")";
}

// Words; what is empty is left out.
struct Input {
  std::string acl = "";
  std::string certs = "";
  std::string third = R;
  std::string tag = "";
  std::string fifth = "";
};
struct ReduceEngine : TestEngine {
  spki_status Reduce(const Input& input, std::string* text) {
    const std::string words[] = {"(acl " + input.acl + ")", "(sequence " + input.certs + ")",
                                 input.third, input.tag, input.fifth};
    spki_elem* lists[5] = {};
    for (int i = 0; i < 5; ++i) {
      if (words[i].empty()) continue;
      if (const spki_status status = TryParse(Canonical(words[i]), &lists[i])) return status;
    }
    spki_elem* result = nullptr;
    const spki_status status =
        spki_reduce(&engine_, lists[0], lists[1], lists[2], lists[3], lists[4], &result);
    EXPECT_EQ(status == 0, result != nullptr);
    if (result != nullptr) *text = Consume(result);
    return status;
  }
};

class ReduceTest : public testing::Test, protected ReduceEngine {
 protected:
  // What is granted is exactly these entries.
  void Grants(const std::string& entries, const Input& input) {
    std::string text;
    EXPECT_EQ(0, Reduce(input, &text)) << input.acl << " by " << input.certs;
    EXPECT_EQ(Canonical("(acl " + entries + ")"), text) << input.acl << " by " << input.certs;
  }
  void Fails(spki_status status, const Input& input) {
    std::string text;
    EXPECT_EQ(status, Reduce(input, &text)) << input.acl << " by " << input.certs;
  }
  // The same for lists of entries and certificates together; each reader takes its own.
  void EachGrants(const std::string& entries, const std::vector<std::string>& credentials) {
    for (const std::string& text : credentials) Grants(entries, {text, text});
  }
  void EachFails(spki_status status, const std::vector<std::string>& credentials) {
    for (const std::string& text : credentials) Fails(status, {text, text});
  }
};

}  // namespace ZvVesk2::Engine

#endif  // VESK2_TESTS_ENGINE_REDUCE_FIXTURE_H
