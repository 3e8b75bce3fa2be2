// SPDX-License-Identifier: Apache-2.0
// What the lists of one call say, against an oracle that asks them one by one; how much work a
// stranger's certificates and lists make; and a store that changes while they are proved.
#include <vesk2/cert_sequence.h>

#include <functional>
#include <random>
#include <vector>

#include "src/platform/crypto.h"
#include "src/trust/revocation_lists.h"
#include "tests/support/test_load.h"
#include "tests/trust/trust_test.h"

// The linker leads the library's calls here (--wrap).
static size_t proofs = 0, digests = 0;
static std::function<void()> onProof = [] {};
extern "C" {
decltype(zvclm_HashStart) __real_zvclm_HashStart, __wrap_zvclm_HashStart;
decltype(zvclm_PublicKeyVerifySignature) __real_zvclm_PublicKeyVerifySignature,
    __wrap_zvclm_PublicKeyVerifySignature;
int __wrap_zvclm_HashStart(ZVCLMHashContextData* context, ZvclmHashID id, uint32_t handle) {
  ++digests;
  return __real_zvclm_HashStart(context, id, handle);
}
int __wrap_zvclm_PublicKeyVerifySignature(const ZVCLMPublicKeyData* key, int scheme,
                                          const void* parameters, const unsigned char* digest,
                                          uint32_t digestLength, const unsigned char* signature,
                                          uint32_t signatureLength, int* valid, uint32_t handle) {
  ++proofs;
  onProof();
  return __real_zvclm_PublicKeyVerifySignature(key, scheme, parameters, digest, digestLength,
                                               signature, signatureLength, valid, handle);
}
}

namespace vesk2test {
namespace {

const std::string kSources[] = {"a (revoke)", "b (revoke)"};

struct ItemModel {
  int object;  // which certificate, or key, is named
  std::string date;
};
struct ListModel {
  int source = 0;
  bool proved = false;
  std::string end;
  std::vector<ItemModel> certs, keys;
};
struct CertModel {
  int source = -1;  // none
  int key = 0;
};

std::string TextOf(const CertModel& cert, int number) {
  CertText text{.issuer = KeyText(2), .subject = HashOf(std::to_string(cert.key))};
  text.comment = std::to_string(number);
  if (cert.source >= 0) {
    text.revocation = Tag(kSources[cert.source]).replace(0, 6, "(10:revocation");
  }
  return Cert(text);
}

// The answer by the rules, list after list.
int32_t Expected(const std::vector<ListModel>& lists, const CertModel& cert, int number,
                 const std::string& from) {
  for (const ListModel& list : lists) {
    for (const ItemModel& item : list.keys) {
      if (list.proved && item.object == cert.key) return CertObject::KeyRevoked;
    }
  }
  if (cert.source < 0) return CertObject::NotRevoked;
  std::string latest;
  for (const ListModel& list : lists) {
    if (!list.proved || list.source != cert.source || list.certs.empty()) continue;
    for (const ItemModel& item : list.certs) {
      const bool dated = item.date.size() == 19 && !from.empty();
      if (item.object == number && (!dated || item.date <= from)) return CertObject::RevokedByCrl;
    }
    latest = std::max(latest, list.end);
  }
  const bool known = !latest.empty() && (from.empty() || latest >= from);
  return known ? CertObject::NotRevoked : CertObject::Undetermined;
}

// Lists of every kind: proved or not, without items, end or tag, with objects named several times.
class Lists {
 public:
  explicit Lists(const std::vector<CertModel>& certs) : certs_(certs) {
    while (models.size() < 48) Make();
  }
  std::vector<ListModel> models;
  std::vector<std::string> texts;

 private:
  size_t Below(size_t bound) { return random_() % bound; }

  void Make() {
    constexpr const char* kDates[] = {kPast, kMiddle, kFuture, "3001"};
    constexpr const char* kAlgorithms[] = {"sha256", "sha1", "rmd160"};
    constexpr const char* kEnds[] = {kMiddle, kFuture, ""};
    ListModel list;
    list.source = int(Below(2));
    list.end = kEnds[Below(3)];
    std::string items[2];
    for (const bool keys : {false, true}) {
      for (size_t count = Below(3); count > 0; --count) {
        const size_t object = Below(keys ? 4 : certs_.size());
        const ItemModel item{int(object), kDates[Below(4)]};
        const std::string text =
            keys ? HashOf(std::to_string(object)) : TextOf(certs_[object], int(object));
        // A key is named by its hash; the name of a hash is also the hash of the name.
        const bool asItStands = keys && Below(2) == 0;
        const std::string hash = asItStands ? text : HashOf(text, kAlgorithms[Below(3)]);
        items[keys] += Item(hash, item.date);
        (keys ? list.keys : list.certs).push_back(item);
      }
    }
    const size_t kind = Below(6);  // forged in three ways, or true
    std::string text = CrlSequenceText(kind == 0, kind == 1 ? "" : Tag(kSources[list.source]),
                                       CrlText(items[0], items[1]), kPast, list.end);
    if (kind == 2) text[text.size() - 5] ^= 1;
    list.proved = kind > 2;
    models.push_back(list);
    texts.push_back(text);
  }

  const std::vector<CertModel>& certs_;
  std::mt19937 random_{7};
};

TEST(RevocationLists, AnswerAsOneByOne) {
  std::vector<CertModel> certs;
  for (const int source : {-1, 0, 1, 0, 1}) certs.push_back({source, int(certs.size()) % 4});
  const Lists lists(certs);
  const Ref<SExpression> acls = Acls(
      {AclEntryText(KeyText(0), Tag("other")), AclEntryText(KeyText(1), Tag(kSources[0])),
       AclEntryText(KeyText(0), Tag(kSources[0])), AclEntryText(KeyText(0), Tag(kSources[1]))});
  Ref<SExpression> objects;
  ASSERT_EQ(SExpression::Create(objects.Out(), "sequence", nullptr), 0);
  for (size_t i = 0; i < certs.size(); ++i) {
    ASSERT_EQ(objects->Insert(Read<CertObject>(TextOf(certs[i], int(i))).Release()), 0);
  }
  std::mt19937 random(8);
  int counts[4] = {};
  for (int round = 0; round < 200; ++round) {
    const Ref<SExpression> store(new SExpression(nullptr));
    std::vector<ListModel> chosen;
    for (size_t count = random() % 6; count > 0; --count) {
      const size_t index = random() % lists.models.size();
      chosen.push_back(lists.models[index]);
      ASSERT_EQ(store->Insert(Read<CrlSequence>(lists.texts[index]).Release()), 0);
    }
    constexpr const char* kFrom[] = {"", kPast, kMiddle, kFuture};
    const std::string from = kFrom[random() % 4];
    const Ref<TimeStamp> stamp = Stamp(from);
    ASSERT_EQ(
        CrlSequence::MarkRevoked(objects.get(), acls.get(), store.get(), stamp.get(), nullptr), 0);
    int number = 0;
    for (auto it = objects->Begin(); it; it.Next()) {
      auto* const cert = dynamic_cast<CertObject*>(it.Value());
      if (cert == nullptr) continue;
      const int32_t status = cert->GetRevocationStatus();
      const CertModel& model = certs[static_cast<size_t>(number)];
      EXPECT_EQ(status, Expected(chosen, model, number, from)) << round << "/" << number;
      bool revoked = false;  // alone it is told the same
      const int code = cert->IsRevoked(revoked, acls.get(), store.get(), stamp.get(), nullptr);
      EXPECT_EQ(cert->GetRevocationStatus(), status);
      EXPECT_EQ(code == 0, status != CertObject::Undetermined);
      ++counts[status];
      ++number;
    }
  }
  for (const int count : counts) EXPECT_GT(count, 20);  // each answer was given
  EXPECT_EQ(CrlSequence::MarkRevoked(nullptr, acls.get(), nullptr, nullptr, nullptr),
            VESK2_ERR_PARAM_NULL);
}

// The proofs and digests that marking takes, over a store with roots for other sources.
std::pair<size_t, size_t> Work(const RevocationLoad& load) {
  const Ref<SExpression> acls = Acls({AclEntryText(KeyText(0), Tag("x")), LoadRoot()});
  const Ref<SExpression> certs(new SExpression(nullptr)), store(new SExpression(nullptr));
  for (size_t i = 0; i < load.certificates; ++i) {
    EXPECT_EQ(certs->Insert(Read<CertObject>(LoadCert(i)).Release()), 0);
  }
  for (size_t i = 0; i < load.lists; ++i) {
    EXPECT_EQ(store->Insert(Read<CrlSequence>(LoadList(load, i)).Release()), 0);
  }
  proofs = digests = 0;
  EXPECT_EQ(CrlSequence::MarkRevoked(certs.get(), acls.get(), store.get(), nullptr, nullptr), 0);
  return {proofs, digests};
}

TEST(RevocationLists, EachIsProvedOnce) {
  for (const bool keys : {false, true}) {
    for (const bool genuine : {false, true}) {
      const auto work = [&](size_t certificates, size_t lists) {
        return Work({certificates, 3, lists, keys, genuine});
      };
      const auto [oneProof, oneDigest] = work(1, 1);
      EXPECT_EQ(oneProof, 1U);
      // Each certificate adds the same, however many lists there are, and the other way round.
      EXPECT_EQ(work(1, 9).first, 9U);
      EXPECT_EQ(work(9, 9).first, 9U);
      const size_t perCert = (work(9, 1).second - oneDigest) / 8;
      const size_t perList = (work(1, 9).second - oneDigest) / 8;
      EXPECT_LE(perCert, 3U);  // the source, and the object in two forms
      EXPECT_EQ(work(9, 9).second, oneDigest + 8 * (perCert + perList));
    }
  }
}

// Carried lists leave in the store what offering each of them in turn leaves.
TEST(RevocationLists, StoredAsOneByOne) {
  const std::string source = Tag(kSources[0]);
  const auto list = [&](const char* name, const std::string& begin, const std::string& end,
                        unsigned key = 0) {
    return CrlSequenceText(key, source, CrlText(Item(HashOf(name)), ""), begin, end);
  };
  const std::string texts[] = {
      list("a", kPast, kFuture),       list("b", kPast, kFuture),
      list("earlier", kPast, kMiddle), list("x", kFuture, kFarFuture),
      list("y", kFuture, kFarFuture),  list("forged", kPast, kFarFuture, 1)};
  const Ref<SExpression> acls = Acls({AclEntryText(KeyText(0), source)});
  std::mt19937 random(9);
  for (int round = 0; round < 60; ++round) {
    const Ref<SExpression> carried(new SExpression(nullptr));
    std::string stored[2];
    for (const bool together : {false, true}) {
      const TempDir store;
      VeskConf::SetGlobalDirectory(store.Path().c_str());
      if (!together) {
        for (size_t count = random() % 6; count > 0; --count) {
          const std::string& text = texts[random() % std::size(texts)];
          EXPECT_EQ(carried->Insert(Read<CrlSequence>(text).Release()), 0);
          EXPECT_EQ(Read<CrlSequence>(text)->UpdateStore(acls.get()), 0);
        }
      } else {
        EXPECT_EQ(RevocationLists(acls.get(), carried.get()).Store(carried.get()), 0);
      }
      const std::string file = "cert/" + kSources[0] + ".crl";
      if (std::filesystem::exists(store.File(file))) stored[together] = store.Read(file);
    }
    EXPECT_EQ(stored[0], stored[1]) << round;
  }
}

// The stages of one verification read the entries one after the other. What is gone or spoiled at
// the second counts as such, whatever the first had read.
class ChangingStore : public TrustTest {
 protected:
  int VerifyWhile(const std::function<void()>& change) {
    std::filesystem::remove_all(global.File("acl"));
    WriteAcl("a", AclEntryText(KeyText(5), Tag("(web)")));
    WriteAcl("root", AclEntryText(KeyText(0), Tag("(ftp)")));
    WriteAcl("source", AclEntryText(KeyText(4), source_));
    proofs = 0;
    // The chain has one signature, which is looked at before any entry is read.
    onProof = [&] { proofs == 2 ? change() : void(); };
    const Ref<SExpression> tag = Parse(Tag("(ftp)"));
    const int code = chain_->Verify(nullptr, tag.get(), nullptr, nullptr);
    onProof = [] {};
    EXPECT_EQ(proofs, 2u);
    return code;
  }
  void SetUp() override {
    const std::string list = CrlSequenceText(4, source_, CrlText(Item(HashOf("x")), ""));
    global.Write("cert/" + kSources[0] + ".crl", list);
    CertText text{.issuer = KeyText(0), .subject = KeyText(1), .tag = Tag("(ftp)")};
    text.revocation = Tag(kSources[0]).replace(0, 6, "(10:revocation");
    const std::string cert = Cert(text);
    const auto buffer =
        Wrap(List({Str("sequence"), cert + TestKey::Rsa(0).Sign(cert) + "(5:owner2:me)"}));
    ASSERT_EQ(CertSequence::Import(chain_.Out(), buffer.get(), nullptr), 0);
  }

  const std::string source_ = Tag(kSources[0]);
  Ref<CertSequence> chain_;
};

TEST_F(ChangingStore, IsReadAfreshByEachStage) {
  constexpr int kNone = VESK2_ERR_NOT_AUTHORIZED;
  const std::string root = AclEntryText(KeyText(0), Tag("(ftp)"));
  const auto remove = [&](const char* name) {
    std::filesystem::remove(global.File(std::string("acl/") + name + ".acl"));
  };
  const std::tuple<const char*, std::function<void()>, int> cases[] = {
      {"nothing", [] {}, 0},
      {"another tag", [&] { WriteAcl("root", AclEntryText(KeyText(0), Tag("(ftq)"))); }, kNone},
      {"another key", [&] { WriteAcl("root", AclEntryText(KeyText(3), Tag("(ftp)"))); }, kNone},
      {"a longer file", [&] { WriteAcl("root", root + " "); }, 0},
      {"a spoiled file", [&] { WriteAcl("root", root.substr(0, 40)); }, kNone},
      {"a spoiled last file", [&] { WriteAcl("source", "("); }, kNoEntry},
      {"another name", [&] { remove("root"), WriteAcl("z", root); }, 0},
      {"contents that changed places",
       [&] {
         const std::string a = global.Read("acl/a.acl");
         WriteAcl("a", root), WriteAcl("root", a);
       },
       0},
      {"no root", [&] { remove("root"); }, kNone},
      {"one less before it", [&] { remove("a"); }, 0},
      {"one more before it", [&] { WriteAcl("b", AclEntryText(KeyText(3), Tag("(ftp)"))); }, 0},
      {"no store", [&] { std::filesystem::remove_all(global.File("acl")); }, kNoEntry},
  };
  for (const auto& [name, change, code] : cases) EXPECT_EQ(VerifyWhile(change), code) << name;
}

TEST(AclStoreWork, InstallingHashesEachTagOnce) {
  TempDir global, fresh;
  VeskConf::SetGlobalDirectory(global.Path().c_str());
  const auto work = [&](int stored, int added) {
    for (const auto& [dir, prefix, count] :
         {std::tuple(&global, "acl/s", stored), std::tuple(&fresh, "f", added)}) {
      for (int i = 0; i < count; ++i) {
        const std::string name = prefix + std::to_string(i);
        dir->Write(name + ".acl", AclEntryText(HashOf("x"), Tag("t" + name)));
      }
    }
    digests = 0;
    EXPECT_EQ(AclEntry::InstallAcls(fresh.Path().c_str(), nullptr), 0);
    const size_t installed = digests;
    std::filesystem::remove_all(global.File("acl"));
    return installed;
  };
  EXPECT_EQ(work(10, 10), 20U);
  EXPECT_EQ(work(30, 10), 40U);
}

}  // namespace
}  // namespace vesk2test
