// SPDX-License-Identifier: Apache-2.0
// Canonical text for tests: plain string work, and digests by libcrypto.
#include "tests/support/test_text.h"

#include <openssl/evp.h>

#include <stdexcept>

namespace vesk2test {

std::string Str(std::string_view bytes) {
  return std::to_string(bytes.size()) + ":" + std::string(bytes);
}

std::string List(std::initializer_list<std::string> items) {
  std::string text = "(";
  for (const std::string& item : items) text += item;
  return text + ")";
}

std::string Tag(std::string_view advanced) {
  std::string text = "(3:tag";
  std::string word;
  for (const char c : std::string(advanced) + " ") {
    const bool paren = c == '(' || c == ')';
    if (!paren && c != ' ') {
      word += c;
      continue;
    }
    if (!word.empty()) text += Str(word);
    word.clear();
    if (paren) text += c;
  }
  return text + ")";
}

std::string Digest(std::string_view bytes, const char* name) {
  const std::string_view wanted = name;
  const EVP_MD* type = wanted == "sha1"     ? EVP_sha1()
                       : wanted == "sha256" ? EVP_sha256()
                       : wanted == "rmd160" ? EVP_ripemd160()
                                            : nullptr;
  unsigned char out[EVP_MAX_MD_SIZE];
  unsigned int length = 0;
  if (type == nullptr || EVP_Digest(bytes.data(), bytes.size(), out, &length, type, nullptr) != 1) {
    throw std::runtime_error("no digest " + std::string(wanted));
  }
  return {reinterpret_cast<char*>(out), length};
}

std::string HashOf(std::string_view canonical, const char* name) {
  return List({Str("hash"), Str(name), Str(Digest(canonical, name))});
}

std::string Valid(const std::string& notBefore, const std::string& notAfter) {
  std::string text = "(5:valid";
  if (!notBefore.empty()) text += List({Str("not-before"), Str(notBefore)});
  if (!notAfter.empty()) text += List({Str("not-after"), Str(notAfter)});
  return text + ")";
}

namespace {

std::string Optional(bool wanted, const std::string& text) { return wanted ? text : ""; }

std::string OptionalValid(const std::string& notBefore, const std::string& notAfter) {
  return Optional(!notBefore.empty() || !notAfter.empty(), Valid(notBefore, notAfter));
}

}  // namespace

std::string Cert(const CertText& parts) {
  return List({Str("cert"), Optional(parts.version, "(7:version1:1)"),
               List({Str("issuer"), parts.issuer}), List({Str("subject"), parts.subject}),
               Optional(parts.propagate, "(9:propagate)"), parts.tag,
               OptionalValid(parts.notBefore, parts.notAfter),
               Optional(!parts.comment.empty(), List({Str("comment"), Str(parts.comment)})),
               parts.revocation});
}

std::string AclEntryText(const std::string& subject, const std::string& tag, bool propagate,
                         const std::string& notBefore, const std::string& notAfter) {
  return List({Str("entry"), List({Str("subject"), subject}), Optional(propagate, "(9:propagate)"),
               tag, OptionalValid(notBefore, notAfter)});
}

}  // namespace vesk2test
