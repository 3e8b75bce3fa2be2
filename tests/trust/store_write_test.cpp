// SPDX-License-Identifier: Apache-2.0
// What several writers, and a writer who keeps files to himself, leave in the stores for others.
#include <fcntl.h>
#include <pthread.h>  // for unshare
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <functional>
#include <set>
#include <vector>

#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

const std::string kTag = Tag("sym (revoke x)");
constexpr char kFile[] = "cert/sym (revoke x).crl";
std::string Root() { return AclEntryText(KeyText(0), kTag); }

// A list that revokes key 3, and `items` others.
std::string Sequence(int items, const std::string& name) {
  std::string keys = Item(HashOf(KeyText(3)));
  for (int i = 0; i < items; ++i) keys += Item(HashOf(name + std::to_string(i)));
  return CrlSequenceText(0, kTag, CrlText("", keys));
}

// Runs `task` in a new process, its status the number of what failed.
pid_t Start(const std::function<int()>& task) {
  const pid_t child = fork();
  if (child == 0) _exit(task());
  return child;
}
int StatusOf(pid_t child) {
  int status = -1;
  return waitpid(child, &status, 0) == child && WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

class StoreWrite : public TrustTest {
 protected:
  static int Offer(const std::string& text) {
    return Read<CrlSequence>(text)->UpdateStore(Acls({Root()}).get());
  }
  // 0 when the key on the list is found to be revoked.
  static int AskForKey() {
    const auto cert = Read<CertObject>(Cert({.issuer = KeyText(2), .subject = KeyText(3)}));
    bool revoked = false;
    return cert->IsRevoked(revoked) == 0 && revoked ? 0 : 1;
  }
};

// In containers that share a store, processes have the same numbers.
TEST_F(StoreWrite, WritersOfOneNumberDoNotMeet) {
  const std::string texts[] = {Sequence(400, "a"), Sequence(700, "b")};
  ASSERT_EQ(Offer(texts[0]), 0);
  const auto writeOften = [&](const std::string& text) {
    for (int i = 0; i < 60; ++i) Offer(text);
    return 0;
  };
  std::vector<pid_t> writers;
  for (const std::string& text : texts) {
    writers.push_back(Start([&] {
      if (unshare(CLONE_NEWPID) != 0) return 99;
      return StatusOf(Start([&] { return writeOften(text); }));
    }));
  }
  std::set<std::string> seen;
  std::set<int> states;
  for (const pid_t writer : writers) {
    int status = 0;
    while (waitpid(writer, &status, WNOHANG) == 0) seen.insert(global.Read(kFile));
    states.insert(WEXITSTATUS(status));
  }
  if (states.contains(99)) GTEST_SKIP() << "may not make a process number space";
  EXPECT_EQ(states, std::set{0});
  for (const std::string& text : seen) EXPECT_TRUE(text == texts[0] || text == texts[1]);
  EXPECT_EQ(Names("cert"), "<sym (revoke x).crl>");
}

// Who cannot read a list does not know what it revokes.
TEST_F(StoreWrite, TheGlobalStoreIsReadableByAll) {
  const Ref<AclEntry> entry = Read<AclEntry>(AclEntryText(KeyText(1), Tag("other")));
  other.Write("root.acl", Root());
  for (const mode_t mask : {0000U, 0077U}) {
    const mode_t old = umask(mask);
    EXPECT_EQ(AclEntry::InstallAcls(other.Path().c_str(), nullptr), 0);
    EXPECT_EQ(Offer(Sequence(1, "a")), 0);
    for (const StorageType type : {StorageGlobal, StorageHome}) {
      entry->SetStorageType(type);
      EXPECT_EQ(entry->Export("exported"), 0);
    }
    umask(old);
    const auto mode = [](const std::string& path) {
      return static_cast<unsigned>(std::filesystem::status(path).permissions());
    };
    for (const char* file : {"acl/root.acl", "acl/exported.acl", kFile}) {
      EXPECT_EQ(mode(global.File(file)), 0644U) << file << mask;
    }
    for (const char* made : {"acl", "cert"}) EXPECT_EQ(mode(global.File(made)), 0755U) << mask;
    EXPECT_EQ(mode(home.File("acl")), 0700U);
    if (mask == 0077 && geteuid() == 0) {  // another user finds the key revoked
      constexpr id_t kNobody = 65534;
      chmod(global.Path().c_str(), 0755);
      const pid_t child = Start([] {
        if (setgid(kNobody) != 0 || setuid(kNobody) != 0) return 2;
        return AskForKey();
      });
      EXPECT_EQ(StatusOf(child), 0);
    }
    for (const char* made : {"acl", "cert"}) std::filesystem::remove_all(global.File(made));
  }
}

}  // namespace
}  // namespace vesk2test
