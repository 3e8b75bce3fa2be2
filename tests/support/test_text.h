// SPDX-License-Identifier: Apache-2.0
// Canonical text for tests, written independently of the library: what a reader accepts is compared
// with text that the library's own writers had no hand in.
#ifndef VESK2_TESTS_SUPPORT_TEST_TEXT_H
#define VESK2_TESTS_SUPPORT_TEST_TEXT_H

#include <initializer_list>
#include <string>
#include <string_view>

namespace vesk2test {

// Str("abc") is "3:abc".
std::string Str(std::string_view bytes);
// The list of items that are canonical already.
std::string List(std::initializer_list<std::string> items);

// Tag("(ftp host)") is "(3:tag(3:ftp4:host))": words and parentheses between blanks, no quoting.
std::string Tag(std::string_view advanced);

// The digest of `bytes` by "sha1", "sha256" or "rmd160", and the list (hash name digest).
std::string Digest(std::string_view bytes, const char* name = "sha256");
std::string HashOf(std::string_view canonical, const char* name = "sha256");

// A certificate. Subjects, tag and revocation are canonical text; the others are bytes. Empty
// members are left out.
struct CertText {
  std::string issuer = {}, subject = {}, tag = {};
  bool propagate = false;
  std::string notBefore = {}, notAfter = {}, comment = {}, revocation = {};
  bool version = false;
};
std::string Cert(const CertText& parts);

// The list (valid ...) of the stamps that are not empty.
std::string Valid(const std::string& notBefore, const std::string& notAfter);
// One ACL entry; empty dates are left out.
std::string AclEntryText(const std::string& subject, const std::string& tag, bool propagate = true,
                         const std::string& notBefore = {}, const std::string& notAfter = {});

}  // namespace vesk2test

#endif  // VESK2_TESTS_SUPPORT_TEST_TEXT_H
