// SPDX-License-Identifier: Apache-2.0
// What threads may do at the same time: verify different manifests against one store, into which
// another process writes meanwhile, and verify with one key. scripts/check-threads runs it, and the
// hashing on many threads, under the thread sanitizer; VESK2_ROUNDS is how often each thread asks.
#include <gtest/gtest.h>

#include <signal.h>
#include <sys/mman.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <map>
#include <string>
#include <thread>
#include <vector>

#include "tests/support/temp_dir.h"
#include "tests/support/test_manifest.h"
#include "tests/support/test_object.h"

#include <vesk2.h>
#include <vesk2.hpp>

namespace vesk2test {
namespace {

constexpr unsigned kThreads = 8;
constexpr const char* kSource = "app (revoke all)";
constexpr const char* kSourceElement = "(15:revocation-list3:app(6:revoke3:all))";
constexpr const char* kFrom = "2020-01-01_00:00:00";
constexpr const char* kTo = "2040-01-01_00:00:00";

const TestKey& Vendor() { return TestKey::Rsa(0); }
const TestKey& Revoker() { return TestKey::Rsa(1); }
const TestKey& Signer() { return TestKey::Rsa(2); }
const TestKey& RevokedSigner() { return TestKey::Rsa(3); }

int Rounds() {
  const char* const text = std::getenv("VESK2_ROUNDS");
  return text != nullptr ? std::atoi(text) : 12;
}

// On that many threads at the same time, each with its number.
void OnThreads(const std::function<void(unsigned)>& work) {
  std::atomic<unsigned> ready = 0;
  std::vector<std::thread> threads;
  for (unsigned i = 0; i < kThreads; ++i) {
    threads.emplace_back([&, i] {
      ++ready;
      while (ready < kThreads) std::this_thread::yield();
      work(i);
    });
  }
  for (std::thread& thread : threads) thread.join();
}

// A list that revokes the one signer, and `more` others.
std::string RevocationList(unsigned more) {
  const auto item = [](const std::string& object) {
    return List({Str("item"), HashOf(object), Str("2021-01-01_00:00:00")});
  };
  std::string keys = item(RevokedSigner().Public());
  for (unsigned i = 0; i < more; ++i) keys += item("(1:" + std::to_string(i % 10) + ")");
  const std::string crl = List({Str("crl"), List({Str("version"), Str("1")}),
                                List({Str("list1"), item("(1:x)")}), List({Str("list2"), keys})});
  const CertText voucher{.issuer = Revoker().Public(),
                         .subject = HashOf(crl),
                         .tag = Tag(kSource),
                         .notBefore = kFrom,
                         .notAfter = kTo};
  return List({Str("sequence"), crl, Signed(voucher, Revoker())});
}

// Where files are synced at once, if there is such a place.
bool UseMemory() { return access("/dev/shm", W_OK) != 0 || setenv("TMPDIR", "/dev/shm", 0) == 0; }

// One store, a tree and a manifest for each thread, and what another process imports.
class Threads : public testing::Test {
 protected:
  Threads() {
    ZvVesk2::VeskConf::SetHomeDirectory(dir_.File("home").c_str());
    ZvVesk2::VeskConf::SetGlobalDirectory(dir_.File("global").c_str());
    dir_.Write("global/acl/vendor.acl", AclEntryText(Vendor().Public(), Tag("(install)")));
    dir_.Write("global/acl/revoker.acl", AclEntryText(Revoker().Public(), Tag(kSource)));
    dir_.Write(kStored, RevocationList(0));
    for (unsigned i = 0; i < kThreads; ++i) {
      const std::string number = std::to_string(i);
      dir_.Write("tree" + number + "/sub/file", "contents of " + number);
      dir_.Write("manifest" + number, ManifestOf(i));
      if (IsChanged(i)) dir_.Write("tree" + number + "/sub/file", "Contents of " + number);
    }
  }

  static bool IsRevoked(unsigned i) { return i % 4 == 1; }
  static bool IsChanged(unsigned i) { return i % 4 == 2; }
  // Which verification stores.
  static bool CarriesList(unsigned i) { return i % 4 == 3; }
  static int Expected(unsigned i) {
    if (IsRevoked(i)) return VESK2_ERR_SIGNING_CERT_ORDER;
    return IsChanged(i) ? VESK2_ERR_HASH_MISMATCH : 0;
  }

  std::string ManifestOf(unsigned i) const {
    ManifestText text;
    text.key = IsRevoked(i) ? &RevokedSigner() : &Signer();
    text.chain = Signed({.issuer = Vendor().Public(),
                         .subject = text.key->Public(),
                         .tag = Tag("(install)"),
                         .propagate = true,
                         .notBefore = kFrom,
                         .notAfter = kTo,
                         .revocation = kSourceElement},
                        Vendor());
    if (CarriesList(i)) text.lists = RevocationList(i);
    text.body = BodyOf(dir_.File("tree" + std::to_string(i)));
    return ManifestFile(text);
  }

  int Ask(unsigned i) const {
    const std::string number = std::to_string(i);
    Manifest* manifest = nullptr;
    int code = CreateManifestContext(&manifest, dir_.File("tree" + number).c_str(),
                                     dir_.File("manifest" + number).c_str(), "(install)");
    if (code != 0) return code;
    code = VerifyManifest(manifest, 0, 0);
    DeleteManifestContext(manifest);
    return code;
  }

  // In a process of its own: imports one list after the other, and entries, until it is killed, or
  // the test is.
  [[noreturn]] void Import(std::atomic<int>& imports) const {
    prctl(PR_SET_PDEATHSIG, SIGKILL);
    for (unsigned i = 0;; ++i) {
      dir_.Write("new/list.crl", RevocationList(100 + i % 2 * 300));
      dir_.Write("new/more.acl",
                 AclEntryText(Vendor().Public(), Tag("(other " + std::to_string(i % 20) + ")")));
      const int code = Vesk2ImportCrls(dir_.File("new").c_str());
      const int installed = ZvVesk2::AclEntry::InstallAcls(dir_.File("new").c_str(), nullptr);
      if (code != 0 || installed != 0) _exit(1);
      ++imports;
    }
  }

  static constexpr const char* kStored = "global/cert/app (revoke all).crl";
  const bool quick_ = UseMemory();
  TempDir dir_;
};

TEST_F(Threads, VerifyWhileAnotherProcessImports) {
  void* const shared = mmap(nullptr, sizeof(std::atomic<int>), PROT_READ | PROT_WRITE,
                            MAP_SHARED | MAP_ANONYMOUS, -1, 0);
  ASSERT_NE(shared, MAP_FAILED);
  auto& imports = *new (shared) std::atomic<int>(0);
  const pid_t importer = fork();
  if (importer == 0) Import(imports);
  const int rounds = Rounds();
  std::atomic<bool> imported = true;
  std::map<int, int> answers[kThreads];
  OnThreads([&](unsigned i) {
    for (int round = 0; imported && (round < rounds || imports < rounds); ++round) {
      ++answers[i][Ask(i)];
      if (i == 0) imported = waitpid(importer, nullptr, WNOHANG) == 0;
    }
  });
  EXPECT_TRUE(imported) << "an import failed";
  if (imported) kill(importer, SIGKILL);
  waitpid(importer, nullptr, 0);
  int asked = 0;
  for (unsigned i = 0; i < kThreads; ++i) {
    for (const auto& [code, count] : answers[i]) {
      EXPECT_EQ(code, Expected(i)) << "thread " << i << ", " << count << " times";
      asked += count;
    }
  }
  EXPECT_GT(dir_.Read(kStored).size(), RevocationList(0).size());
  std::printf("%d answers during %d imports\n", asked, imports.load());
  munmap(shared, sizeof(std::atomic<int>));
}

TEST_F(Threads, VerifyWithOneKey) {
  using namespace ZvVesk2;
  const std::string object = Tag("(install)");
  for (const TestKey* test : {&TestKey::Rsa(0), &TestKey::Dsa(0)}) {
    const bool rsa = test == &TestKey::Rsa(0);
    const char* const algorithm = rsa ? "rsa-pss" : "dsa-sha1";
    const char* const hash = rsa ? "sha256" : "sha1";
    const std::string value = test->SignDigest(Digest(object, hash), algorithm, hash);
    const Ref<PublicKey> key(new PublicKey(static_cast<Vesk2ContextStruct*>(nullptr)));
    ASSERT_EQ(key->Import(Wrap(test->Public()).get()), 0);
    std::atomic<int> wrong = 0;
    OnThreads([&](unsigned i) {
      const Ref<SExpression> parts = Parse(List({Str(algorithm), Str(value)}));
      const Ref<SExpression> signedObject = Parse(i % 2 == 0 ? object : Tag("remove"));
      const Ref<Hash> digest(new Hash(static_cast<Vesk2ContextStruct*>(nullptr)));
      if (digest->Import(Wrap(HashOf(object, hash)).get()) != 0) ++wrong;
      auto* const name = dynamic_cast<ByteString*>(parts->First());
      auto* const bytes = dynamic_cast<ByteString*>(parts->Last());
      for (int round = 0; round < Rounds(); ++round) {
        const int code = key->Verify(name, bytes, digest.get(), signedObject.get());
        if (code != (i % 2 == 0 ? 0 : VESK2_ERR_HASH_MISMATCH)) ++wrong;
      }
    });
    EXPECT_EQ(wrong, 0) << algorithm;
  }
}

}  // namespace
}  // namespace vesk2test
