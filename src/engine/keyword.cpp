// SPDX-License-Identifier: Apache-2.0
// Keywords and their numbers. The table prints every number that tags and credentials have ever
// used; the recogniser knows fewer words, and all others stay ordinary strings.
#include <array>
#include <cstring>
#include <string_view>

#include "src/engine/model.h"

namespace ZvVesk2::Engine {
namespace {

// A name that has no room for its final 0 does not compile.
template <size_t Size>
consteval spki_keyword_entry Row(const char (&name)[Size]) {
  static_assert(Size <= sizeof(spki_keyword_entry::name));
  spki_keyword_entry row = {Size - 1, {}};
  for (size_t i = 0; i < Size; ++i) row.name[i] = name[i];
  return row;
}

// The row's index is the keyword's id; the four rows behind the sorted ones have ids of their own.
constexpr spki_keyword_entry spki_keyword_table[] = {
    Row("???"),
    Row("*"),
    Row("a"),
    Row("acl"),
    Row("alpha"),
    Row("b"),
    Row("ber"),
    Row("binary"),
    Row("biometric"),
    Row("c"),
    Row("canceled"),
    Row("cert"),
    Row("comment"),
    Row("crl"),
    Row("custom"),
    Row("d"),
    Row("date"),
    Row("db-delete"),
    Row("db-exec-stored-query"),
    Row("db-insert"),
    Row("db-modify"),
    Row("db-read"),
    Row("dbs-create"),
    Row("dbs-delete"),
    Row("decrypt"),
    Row("delete"),
    Row("delta-crl"),
    Row("der"),
    Row("derive"),
    Row("display"),
    Row("do"),
    Row("dsa"),
    Row("dsa-sha1"),
    Row("e"),
    Row("elgamal"),
    Row("encrypt"),
    Row("entry"),
    Row("export-clear"),
    Row("export-wrapped"),
    Row("g"),
    Row("ge"),
    Row("genkey"),
    Row("hash"),
    Row("haval"),
    Row("ibchash"),
    Row("import-clear"),
    Row("import-wrapped"),
    Row("intel"),
    Row("issuer"),
    Row("issuer-info"),
    Row("k-of-n"),
    Row("kea"),
    Row("keyholder"),
    Row("l"),
    Row("le"),
    Row("login"),
    Row("login-name"),
    Row("mac"),
    Row("md2"),
    Row("md2withrsa"),
    Row("md4"),
    Row("md5"),
    Row("md5withrsa"),
    Row("n"),
    Row("name"),
    Row("ndr"),
    Row("nhash"),
    Row("not-after"),
    Row("not-before"),
    Row("null"),
    Row("numeric"),
    Row("object-hash"),
    Row("one-time"),
    Row("online"),
    Row("owner"),
    Row("p"),
    Row("pam-name"),
    Row("password"),
    Row("pgp"),
    Row("prefix"),
    Row("private-key"),
    Row("prompted-password"),
    Row("propagate"),
    Row("protected-biometric"),
    Row("protected-password"),
    Row("protected-pin"),
    Row("public-key"),
    Row("public-key-from-cert"),
    Row("q"),
    Row("range"),
    Row("reval"),
    Row("ripemac"),
    Row("ripemd"),
    Row("ripemd160"),
    Row("rsa"),
    Row("rsa-iso9796"),
    Row("rsa-pkcs"),
    Row("rsa-pkcs-md5"),
    Row("rsa-pkcs-sha1"),
    Row("rsa-pkcs1"),
    Row("rsa-pkcs1-md5"),
    Row("rsa-pkcs1-sha1"),
    Row("rsa-pkcs1-sig"),
    Row("rsa-raw"),
    Row("sdsiv1"),
    Row("sequence"),
    Row("set"),
    Row("sexpr"),
    Row("sha1"),
    Row("sha1withdsa"),
    Row("sha1withecdsa"),
    Row("sha1withrsa"),
    Row("sign"),
    Row("signature"),
    Row("signed-nonce"),
    Row("signed-secret"),
    Row("spki"),
    Row("subject"),
    Row("subject-info"),
    Row("tag"),
    Row("threshold"),
    Row("time"),
    Row("uri"),
    Row("version"),
    Row("x509-attribute"),
    Row("x509v1"),
    Row("x509v2"),
    Row("x509v3"),
    Row("x9-attribute"),
    Row("and"),
    Row("hashed-password"),
    Row("prompted-biometric"),
    Row("valid"),
};
constexpr int32_t kSortedRows = 128;
constexpr int32_t kAddedId = 0x10000;
constexpr int32_t kAddedRows = 4;
static_assert(std::size(spki_keyword_table) == 1 + kSortedRows + kAddedRows);

struct KnownWord {
  const char* text;
  int32_t id;
};

// "sha256" came when the table was closed: it has a number and no row.
consteval int32_t IdOf(std::string_view name) {
  if (name == "sha256") return SPKI_KW_SHA256;
  int32_t row = 1;
  while (name != spki_keyword_table[row].name) ++row;
  return row <= kSortedRows ? row : kAddedId + row - kSortedRows - 1;
}

template <size_t Size>
consteval KnownWord Word(const char (&name)[Size]) {
  return {name, IdOf(name)};
}

// In ascending order of bytes, which the search rests on; it starts in the middle, at "name".
constexpr KnownWord kWords[] = {
    Word("*"),
    Word("a"),
    Word("acl"),
    Word("alpha"),
    Word("and"),
    Word("b"),
    Word("binary"),
    Word("c"),
    Word("canceled"),
    Word("cert"),
    Word("comment"),
    Word("crl"),
    Word("d"),
    Word("date"),
    Word("delta-crl"),
    Word("display"),
    Word("do"),
    Word("dsa-sha1"),
    Word("e"),
    Word("entry"),
    Word("g"),
    Word("ge"),
    Word("hash"),
    Word("issuer"),
    Word("issuer-info"),
    Word("k-of-n"),
    Word("keyholder"),
    Word("l"),
    Word("le"),
    Word("md5"),
    Word("n"),
    Word("name"),
    Word("not-after"),
    Word("not-before"),
    Word("null"),
    Word("numeric"),
    Word("object-hash"),
    Word("one-time"),
    Word("online"),
    Word("p"),
    Word("prefix"),
    Word("private-key"),
    Word("propagate"),
    Word("public-key"),
    Word("q"),
    Word("range"),
    Word("reval"),
    Word("rsa-pkcs1"),
    Word("rsa-pkcs1-md5"),
    Word("rsa-pkcs1-sha1"),
    Word("rsa-pkcs1-sig"),
    Word("sequence"),
    Word("set"),
    Word("sha1"),
    Word("sha256"),
    Word("signature"),
    Word("subject"),
    Word("subject-info"),
    Word("tag"),
    Word("time"),
    Word("uri"),
    Word("valid"),
    Word("version"),
};
static_assert(std::string_view(kWords[std::size(kWords) / 2].text) == "name");

}  // namespace

int32_t spki_keyword_id(const unsigned char* data, size_t length) {
  size_t low = 0;
  size_t high = std::size(kWords);
  while (low < high) {
    const size_t middle = (low + high) / 2;
    switch (spki_cmp_cstr(data, length, kWords[middle].text)) {
      case SPKI_ORDER_EQUAL:
        return kWords[middle].id;
      case SPKI_ORDER_LESS:
        high = middle;
        break;
      case SPKI_ORDER_GREATER:
        low = middle + 1;
        break;
      default:
        return -1;
    }
  }
  return -1;
}

// The last sorted row is out of reach, as it always was; no list is headed by it.
const spki_keyword_entry* spki_keyword_row(int32_t id) {
  if (id >= 1 && id < kSortedRows) return &spki_keyword_table[id];
  if (id >= kAddedId && id < kAddedId + kAddedRows) {
    return &spki_keyword_table[1 + kSortedRows + id - kAddedId];
  }
  return &spki_keyword_table[0];
}

}  // namespace ZvVesk2::Engine
