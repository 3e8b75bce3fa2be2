// SPDX-License-Identifier: Apache-2.0
// Inputs that ask for as much work as files of their size can: for tests that count it, and for
// benchmarks that take the time.
#ifndef VESK2_TESTS_SUPPORT_TEST_LOAD_H
#define VESK2_TESTS_SUPPORT_TEST_LOAD_H

#include <string>

namespace vesk2test {

struct RevocationLoad {
  size_t certificates = 0;  // each by a key without any authority, with a source to be asked
  size_t items = 0;         // of each list
  size_t lists = 1;
  bool keys = false;     // the items name keys, else certificates
  bool genuine = false;  // else the lists' signatures are wrong, and only they
};

// The trust root whose source the lists and certificates name.
std::string LoadRoot();
// Certificate and list `number`, each different.
std::string LoadCert(size_t number);
std::string LoadList(const RevocationLoad& load, size_t number);
// A manifest with all of them.
std::string LoadManifest(const RevocationLoad& load);

}  // namespace vesk2test

#endif  // VESK2_TESTS_SUPPORT_TEST_LOAD_H
