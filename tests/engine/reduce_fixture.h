// Reductions written as text: keys are (public-key NAME), credentials lists of words. What comes
// out is compared as text, and every record must be back on its free list afterwards.
#ifndef VESK2_TESTS_ENGINE_REDUCE_FIXTURE_H
#define VESK2_TESTS_ENGINE_REDUCE_FIXTURE_H

#include "src/engine/reduce.h"
#include "src/engine/tuple.h"
#include "tests/engine/engine_fixture.h"

namespace ZvVesk2::Engine {

inline std::string Key(const std::string& name) { return "(public-key " + name + ")"; }
inline std::string Entry(const std::string& subject, const std::string& fields = "(tag x)") {
  return "(entry (subject " + subject + ")" + fields + ")";
}
inline std::string Cert(const std::string& issuer, const std::string& subject,
                        const std::string& fields = "(tag x)") {
  return "(cert (issuer " + issuer + ")(subject " + subject + ")" + fields + ")";
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
  std::string third = Key("R");
  std::string tag = "";
  std::string fifth = "";
};

class ReduceTest : public EngineTest {
 protected:
  ~ReduceTest() override {
    while (spki_tuple* tuple = engine_.free_tuples) {
      engine_.free_tuples = tuple->link;
      spki_free(&engine_, tuple);
    }
  }

  spki_status Run(const Input& input, std::string* text) {
    spki_elem* result = nullptr;
    const auto list = [this](const std::string& words) {
      return words.empty() ? nullptr : Chain(words);
    };
    const spki_status status = spki_reduce(
        &engine_, Chain("(acl " + input.acl + ")"), Chain("(sequence " + input.certs + ")"),
        list(input.third), list(input.tag), list(input.fifth), &result);
    if (result != nullptr) *text = Consume(result);
    EXPECT_TRUE(result == nullptr || status == 0);
    return status;
  }
  // The reduction grants exactly these entries.
  void Grants(const Input& input, const std::string& entries) {
    std::string text;
    EXPECT_EQ(0, Run(input, &text));
    EXPECT_EQ(Canonical("(acl " + entries + ")"), text);
  }
  void Fails(const Input& input, spki_status status) {
    std::string text;
    EXPECT_EQ(status, Run(input, &text));
  }
};

struct Case {
  const char* name;
  Input input;
  std::string granted;
};
struct BadCase {
  const char* name;
  Input input;
  spki_status status;
};

}  // namespace ZvVesk2::Engine

#endif  // VESK2_TESTS_ENGINE_REDUCE_FIXTURE_H
