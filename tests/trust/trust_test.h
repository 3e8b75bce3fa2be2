// What the tests of the trust store share: stores in a temporary directory, and revocation lists.
#ifndef VESK2_TESTS_TRUST_TRUST_TEST_H
#define VESK2_TESTS_TRUST_TRUST_TEST_H

#include <gtest/gtest.h>
#include <vesk2/acl_entry.h>
#include <vesk2/context.h>
#include <vesk2/crl.h>

#include <string>

#include "tests/support/temp_dir.h"
#include "tests/support/test_key.h"
#include "tests/support/test_object.h"
#include "tests/support/test_text.h"

namespace vesk2test {

using namespace ZvVesk2;

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
  ~TrustTest() override {
    VeskConf::SetHomeDirectory("");
    VeskConf::SetGlobalDirectory("");
  }
  void WriteAcl(const std::string& name, const std::string& entry) const {
    global.Write("acl/" + name + ".acl", entry);
  }
  // The names in a directory of the global store, each in "<>".
  std::string Names(const std::string& store) const {
    std::string names;
    std::filesystem::path path(global.File(store));
    for (const auto& file : std::filesystem::directory_iterator(path)) {
      names += "<" + file.path().filename().string() + ">";
    }
    return names;
  }

  TempDir home, global, other;
};

// Reads an object with its Import; the first form expects that it can be read.
template <typename T>
Ref<T> Read(const std::string& text, int& code) {
  Ref<T> object(new T(nullptr));
  code = object->Import(Wrap(text).get());
  return object;
}
template <typename T>
Ref<T> Read(const std::string& text) {
  int code = 0;
  Ref<T> object = Read<T>(text, code);
  EXPECT_EQ(code, 0) << text;
  return object;
}

// Null for the empty text.
inline Ref<TimeStamp> Stamp(const std::string& text) {
  return text.empty() ? Ref<TimeStamp>() : Read<TimeStamp>(Str(text));
}
inline Ref<Subject> ReadSubject(const std::string& text) {
  Ref<Subject> subject;
  EXPECT_EQ(Subject::Import(subject.Out(), Wrap(text).get(), nullptr), 0);
  return subject;
}

inline std::string KeyText(unsigned index) { return TestKey::Rsa(index).Public(); }
inline std::string Item(const std::string& hash, const std::string& date = kMiddle) {
  return List({Str("item"), hash, Str(date)});
}
inline std::string CrlText(const std::string& certs, const std::string& keys) {
  return List(
      {Str("crl"), "(7:version1:1)", List({Str("list1"), certs}), List({Str("list2"), keys})});
}
// A revocation list with the certificate that vouches for it, signed by RSA key `key`.
inline std::string CrlSequenceText(unsigned key, const std::string& tag, const std::string& crl,
                                   const std::string& notBefore = kPast,
                                   const std::string& notAfter = kFuture) {
  CertText parts;
  parts.issuer = KeyText(key);
  parts.subject = HashOf(crl);
  parts.tag = tag;
  parts.notBefore = notBefore;
  parts.notAfter = notAfter;
  const std::string cert = Cert(parts);
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
