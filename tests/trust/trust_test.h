// SPDX-License-Identifier: Apache-2.0
// What the tests of the trust store share: stores in a temporary directory, and revocation lists.
#ifndef VESK2_TESTS_TRUST_TRUST_TEST_H
#define VESK2_TESTS_TRUST_TRUST_TEST_H

#include <gtest/gtest.h>
#include <vesk2/acl_entry.h>
#include <vesk2/context.h>
#include <vesk2/crl.h>
#include <vesk2/public_key.h>

#include <string>
#include <tuple>

#include "tests/support/temp_dir.h"
#include "tests/support/test_key.h"
#include "tests/support/test_read.h"
#include "tests/support/test_text.h"

namespace vesk2test {

using namespace ZvVesk2;
using CertObject = ZvVesk2::Cert;  // Cert alone is its text

// Codes that many rows name.
constexpr int kBad = VESK2_ERR_PARSE_FILE;
constexpr int kInvalid = VESK2_ERR_INVALID_PARAM;
constexpr int kNoFile = VESK2_ERR_FILE_NOT_FOUND;
constexpr int kNoEntry = VESK2_ERR_ACL_ENTRY_NOT_FOUND;
constexpr int kNoCrl = VESK2_ERR_CRL_NOT_FOUND;

inline constexpr char kPast[] = "2001-01-01_00:00:00";
inline constexpr char kMiddle[] = "2011-01-01_00:00:00";
inline constexpr char kFuture[] = "3001-01-01_00:00:00";
inline constexpr char kFarFuture[] = "3002-01-01_00:00:00";

// The roots are process-wide: both lie in directories that go with the test.
class TrustTest : public testing::Test {
 protected:
  TrustTest() {
    VeskConf::SetHomeDirectory(home.Path().c_str());
    VeskConf::SetGlobalDirectory(global.Path().c_str());
  }
  void WriteAcl(const std::string& name, const std::string& entry) const {
    global.Write("acl/" + name + ".acl", entry);
  }
  // The names in a directory of the global store, each in "<>".
  std::string Names(const std::string& store) const {
    std::string names;
    for (const auto& file : std::filesystem::directory_iterator(global.File(store))) {
      names += "<" + file.path().filename().string() + ">";
    }
    return names;
  }

  TempDir home, global, other;
};

// Null for the empty text.
inline Ref<TimeStamp> Stamp(const std::string& text) {
  return text.empty() ? Ref<TimeStamp>() : Read<TimeStamp>(Str(text));
}
inline std::string KeyText(unsigned index) { return TestKey::Rsa(index).Public(); }
inline std::string Item(const std::string& hash, const std::string& date = kMiddle) {
  return List({Str("item"), hash, Str(date)});
}
inline std::string CrlText(const std::string& certs, const std::string& keys) {
  const std::string lists = List({Str("list1"), certs}) + List({Str("list2"), keys});
  return List({Str("crl"), "(7:version1:1)", lists});
}
// A revocation list with the certificate that vouches for it, signed by RSA key `key`.
inline std::string CrlSequenceText(unsigned key, const std::string& tag, const std::string& crl,
                                   const std::string& notBefore = kPast,
                                   const std::string& notAfter = kFuture) {
  const std::string cert = Cert({.issuer = KeyText(key),
                                 .subject = HashOf(crl),
                                 .tag = tag,
                                 .notBefore = notBefore,
                                 .notAfter = notAfter});
  return List({Str("sequence"), crl, cert, TestKey::Rsa(key).Sign(cert)});
}

// The list (acl <entry>...) of entries given as text.
inline Ref<SExpression> Acls(std::initializer_list<std::string> entries) {
  Ref<SExpression> list;
  EXPECT_EQ(SExpression::Create(list.Out(), "acl", nullptr), 0);
  for (const std::string& entry : entries) {
    EXPECT_EQ(list->Insert(Read<AclEntry>(entry).Release()), 0);
  }
  return list;
}

}  // namespace vesk2test

#endif  // VESK2_TESTS_TRUST_TRUST_TEST_H
