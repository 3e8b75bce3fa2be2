// SPDX-License-Identifier: Apache-2.0
// What was not read is not absent: files that another process holds, and descriptors that ran out,
// end every search with a code of their own. With a list that reads as absent goes what it revokes.
#include <vesk2/cert_sequence.h>

#include <functional>

#include "tests/support/held_file.h"
#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

struct Operation {
  const char* name;
  std::function<int()> run;
};

// A store with a root, a revocation source and its list, a chain, and another directory of roots.
class Absence : public TrustTest {
 protected:
  Absence() {
    const std::string root = AclEntryText(KeyText(0), Tag("(ftp)"));
    root_ = global.Write("acl/root.acl", root);
    other.Write("other.acl", AclEntryText(KeyText(2), Tag("(web)")));
    WriteAcl("source", AclEntryText(KeyText(0), source_));
    list_ = global.Write("cert/x (revoke y).crl", CrlSequenceText(0, source_, CrlText("", "")));
    const std::string cert =
        Cert({.issuer = KeyText(0), .subject = KeyText(1), .tag = Tag("(ftp)")});
    const std::string triple = cert + TestKey::Rsa(0).Sign(cert) + "(5:owner2:me)";
    chain_ = home.Write("cert/chain.cert", List({Str("sequence"), triple}));
    EXPECT_EQ(CertSequence::Import(sequence_.Out(), chain_.c_str(), true, nullptr), 0);
    EXPECT_EQ(AclEntry::Import(acls_.Out(), nullptr, nullptr), 0);
  }

  // All that reads root_, list_ or chain_.
  std::vector<Operation> Operations() {
    return {
        {"load",
         [this] {
           Ref<SExpression> list;
           return AclEntry::Import(list.Out(), nullptr, other.Path().c_str());
         }},
        {"one entry", [] { return Ref(new AclEntry(nullptr))->Import("root"); }},
        {"find",
         [this] {
           unsigned k = 0;
           return AclEntry::Find(nullptr, tag_.get(), nullptr, nullptr, k);
         }},
        {"find k of n",
         [this] {
           unsigned k = 0;
           const auto key = Read<PublicKey>(KeyText(0));
           return AclEntry::FindThresholdEntry(key.get(), nullptr, tag_.get(), nullptr, nullptr, k);
         }},
        {"find by tag", [this] { return AclEntry::Find(tag_.get()); }},
        {"find a larger", [this] { return AclEntry::FindSuperSet(tag_.get(), false); }},
        {"lists",
         [this] {
           Ref<SExpression> store;
           return CrlSequence::ImportStore(store.Out(), acls_.get(), nullptr);
         }},
        {"lists of a directory",
         [this] {
           Ref<SExpression> lists;
           return CrlSequence::ImportDir(lists.Out(), global.File("cert").c_str(), StoragePath,
                                         nullptr);
         }},
        {"find a list",
         [this] {
           Ref<CrlSequence> found;
           return CrlSequence::Find(found.Out(), tag_.get());
         }},
        {"find a chain",
         [this] {
           char* name = nullptr;
           const int code = CertSequence::Find(name, tag_.get());
           delete[] name;
           return code;
         }},
        {"find chains",
         [this] {
           Ref<SExpression> names;
           return CertSequence::Find(names.Out(), tag_.get());
         }},
        {"verify", [this] { return sequence_->Verify(nullptr, tag_.get(), nullptr, nullptr); }},
        {"verify 2",
         [this] {
           Ref<SExpression> a, b, c;
           return sequence_->Verify2(a.Out(), b.Out(), c.Out());
         }},
    };
  }

  const std::string source_ = Tag("x (revoke y)");
  const Ref<SExpression> tag_ = Parse(Tag("(ftp)"));
  std::string root_, list_, chain_;
  Ref<CertSequence> sequence_;
  Ref<SExpression> acls_;
};

TEST_F(Absence, NoDescriptors) {
#ifdef __SANITIZE_ADDRESS__
  GTEST_SKIP() << "the sanitizers need descriptors themselves, to look at objects";
#endif
  for (const Operation& operation : Operations()) {
    int code = 0;
    {
      const NoDescriptors none;
      code = operation.run();
    }
    EXPECT_EQ(code, VESK2_ERR_MEM_ALLOC) << operation.name;
  }
}

TEST_F(Absence, HeldFiles) {
  const HeldFiles held({root_, list_, chain_});
  for (const Operation& operation : Operations()) {
    ZVsysutil::ZvCall call;
    EXPECT_EQ(operation.run(), VESK2_ERR_READ_FILE) << operation.name;
    EXPECT_EQ(call.Waited(), HeldFiles::kWait) << operation.name;
  }
}

// A list that cannot be looked at now is not replaced, though the new one would be.
TEST_F(Absence, KeepsAListThatIsHeld) {
  const std::string before = global.Read("cert/x (revoke y).crl");
  const auto fresh =
      Read<CrlSequence>(CrlSequenceText(0, source_, CrlText("", ""), kPast, kFarFuture));
  {
    const HeldFiles held({list_});
    EXPECT_EQ(fresh->UpdateStore(acls_.get()), 0);
  }
  EXPECT_TRUE(global.Read("cert/x (revoke y).crl") == before);
  EXPECT_EQ(fresh->UpdateStore(acls_.get()), 0);
  EXPECT_FALSE(global.Read("cert/x (revoke y).crl") == before);
}

// Looking at stores and names makes nothing, and says what is wrong with a name.
TEST_F(Absence, NamesAndDirectories) {
  std::filesystem::remove_all(global.File("cert"));
  std::filesystem::remove_all(home.File("cert"));
  for (const Operation& operation : Operations()) static_cast<void>(operation.run());
  EXPECT_FALSE(std::filesystem::exists(global.File("cert")));
  EXPECT_FALSE(std::filesystem::exists(home.File("cert")));

  const std::string longest(5000, 'x');
  Ref<CertObject> cert;
  Ref<Signature> signature;
  Ref<SExpression> rest;
  EXPECT_EQ(CertRequest::Import(cert.Out(), signature.Out(), rest.Out(), longest.c_str(), nullptr),
            VESK2_ERR_FILE_OPEN);
  EXPECT_EQ(Ref(new CertRequest(nullptr))->Export(longest.c_str()), VESK2_ERR_FILE_OPEN);
  unsigned k = 7;
  EXPECT_EQ(AclEntry::FindThresholdEntry(nullptr, nullptr, tag_.get(), nullptr, nullptr, k),
            VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(k, 7u);
  VeskConf::SetGlobalDirectory("");
  EXPECT_EQ(Ref(new AclEntry(nullptr))->Import("root"), VESK2_ERR_FILE_OPEN);
  VeskConf::SetGlobalDirectory(longest.c_str());
  EXPECT_EQ(AclEntry::Find(tag_.get()), VESK2_ERR_FIND_DIR);
}

}  // namespace
}  // namespace vesk2test
