// SPDX-License-Identifier: Apache-2.0
// A clock that cannot be read: what depends on now is refused, whatever moment stands in its place.
#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/wait.h>

#include <cerrno>
#include <cstdlib>
#include <functional>
#include <string>

#include "tests/support/temp_dir.h"
#include "tests/support/test_key.h"
#include "tests/support/test_read.h"
#include "tests/support/test_text.h"
#include "tests/sweep/failing_calls.h"

#include <vesk2.h>
#include <vesk2.hpp>

namespace vesk2test {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::SExpression;

constexpr char kPast[] = "2001-01-01_00:00:00";
constexpr char kFuture[] = "3001-01-01_00:00:00";
constexpr char kLater[] = "3002-01-01_00:00:00";
constexpr char kTag[] = "(ftp host)";

std::string KeyText(unsigned index) { return TestKey::Rsa(index).Public(); }

std::string Revocations(const std::string& from, const std::string& to) {
  const std::string crl = "(3:crl(7:version1:1)(5:list1)(5:list2))";
  const CertText voucher{.issuer = KeyText(0),
                         .subject = HashOf(crl),
                         .tag = Tag("app (revoke all)"),
                         .notBefore = from,
                         .notAfter = to};
  const std::string cert = Cert(voucher);
  return List({Str("sequence"), crl, cert, TestKey::Rsa(0).Sign(cert)});
}

void LoseClock() {
  static const int null = open("/dev/null", O_WRONLY | O_CLOEXEC);
  FailCalls(kClock, 0, EPERM, true, null, false);
}

// The answers with the clock, and without.
void ExpectWithoutClock(const char* about, int with, int without, const std::function<int()>& ask) {
  EXPECT_EQ(ask(), with) << about;
  LoseClock();
  const int code = ask();
  LetCallsBe();
  EXPECT_EQ(code, without) << about;
}

class ClockSweep : public testing::Test {
 protected:
  ClockSweep() {
    ZvVesk2::VeskConf::SetHomeDirectory(stores_.File("home").c_str());
    ZvVesk2::VeskConf::SetGlobalDirectory(stores_.File("global").c_str());
  }
  void WriteEntry(const std::string& subject, const std::string& tag, const char* end) const {
    stores_.Write("global/acl/a.acl", AclEntryText(subject, tag, true, {}, end));
  }
  TempDir stores_;
};

TEST_F(ClockSweep, TheLibraryGrantsNothing) {
  const auto key = Read<ZvVesk2::PublicKey>(KeyText(1));
  const auto tag = Parse(Tag(kTag));
  const std::string oneOfTwo =
      List({Str("k-of-n"), Str("\x01"), Str("\x02"), KeyText(1) + KeyText(2)});
  unsigned int k = 0;
  const auto find = [&] { return AclEntry::Find(key.get(), tag.get(), nullptr, nullptr, k); };
  const auto findMember = [&] {
    return AclEntry::FindThresholdEntry(key.get(), nullptr, tag.get(), nullptr, nullptr, k);
  };
  const std::pair<const char*, int> ends[] = {{kPast, VESK2_ERR_ACL_ENTRY_NOT_FOUND},
                                              {kFuture, VESK2_ERR_AUTH_TAGS_ARE_EQUAL}};
  for (const auto& [end, code] : ends) {
    WriteEntry(KeyText(1), Tag(kTag), end);
    ExpectWithoutClock("an entry", code, VESK2_ERR_TIME_STAMP, find);
    WriteEntry(oneOfTwo, Tag(kTag), end);
    ExpectWithoutClock("an entry of many", code, VESK2_ERR_TIME_STAMP, findMember);
  }
  const auto cert = Read<ZvVesk2::Cert>(Cert({.issuer = KeyText(0), .subject = KeyText(1)}));
  ExpectWithoutClock("revocation", 0, VESK2_ERR_TIME_STAMP, [&] {
    bool revoked = false;
    return cert->IsRevoked(revoked);
  });
}

// Which of two lists holds is asked of the moment.
TEST_F(ClockSweep, AStoredListStays) {
  WriteEntry(KeyText(0), Tag("app (revoke all)"), "");
  const std::string stored = Revocations("", kFuture), newer = Revocations("", kLater);
  stores_.Write("global/cert/app (revoke all).crl", stored);
  stores_.Write("new/app.crl", newer);
  LoseClock();
  (void)Vesk2ImportCrls(stores_.File("new").c_str());
  LetCallsBe();
  EXPECT_TRUE(stores_.Read("global/cert/app (revoke all).crl") == stored);
  EXPECT_EQ(Vesk2ImportCrls(stores_.File("new").c_str()), 0);
  EXPECT_TRUE(stores_.Read("global/cert/app (revoke all).crl") == newer);
}

TEST_F(ClockSweep, TheCommandRefuses) {
  WriteEntry(KeyText(0), Tag(kTag), "");
  const std::string call = " " VESK2_COMMAND " cert verify " + stores_.File("chain.cert") +
                           " --tag '" + kTag + "' --at now --home " + stores_.File("home") +
                           " --global " + stores_.File("global") + " >/dev/null 2>&1";
  const std::string plan = VESK2_FAIL_CALLS "='" + std::to_string(kClock) + " 0 1 1 2 0' ";
  for (const auto& [end, exit] : {std::pair(kPast, 1), {kFuture, 0}}) {
    const std::string cert = Cert({.issuer = KeyText(0),
                                   .subject = KeyText(1),
                                   .tag = Tag(kTag),
                                   .propagate = true,
                                   .notAfter = end});
    stores_.Write("chain.cert", List({Str("sequence"), cert, TestKey::Rsa(0).Sign(cert), "(1:x)"}));
    const int normal = std::system(call.c_str());
    EXPECT_EQ(WEXITSTATUS(normal), exit) << end;
    const std::string failing = plan + "LD_PRELOAD=" VESK2_FAILING_CALLS_LIBRARY + call;
    const int status = std::system(failing.c_str());
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 2) << end << status;
  }
}

}  // namespace
}  // namespace vesk2test
