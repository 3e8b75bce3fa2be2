// SPDX-License-Identifier: Apache-2.0
// Revocation lists through the flat functions, and the roads from a list to a refused chain.
#include "tests/frame/flat/chain_text.h"

namespace vesk2test {
namespace {

constexpr char kSource[] = "sym (revoke x)";
const std::string kElement = "(10:revocation3:sym(6:revoke1:x))";
const std::string kDummy = Item(HashOf("dummy"));

// Key 0 grants, key 5 revokes. The middle certificate of the chain names the source.
class RevocationLists : public TrustTest {
 protected:
  RevocationLists() {
    WriteAcl("root", AclEntryText(KeyText(0), Tag("(install)")));
    WriteAcl("revoker", AclEntryText(KeyText(5), Tag(kSource)));
    chain = other.Write("chain.cert", Chain(kElement));
  }
  int VerifyChain() const { return Vesk2CertVerifyFile(chain.c_str(), "(install)", 0, 0); }
  static std::string ListText(const std::string& certs, const std::string& keys = "",
                              const std::string& end = kFuture, unsigned key = 5) {
    return CrlSequenceText(key, Tag(kSource), CrlText(certs, keys), kPast, end);
  }
  // Imports a folder that holds this list alone.
  int Import(const std::string& list) const {
    other.Write("in/a.crl", list);
    return Vesk2ImportCrls(other.File("in").c_str());
  }
  // Finds the stored list of a source, and what it says.
  static std::string Stored(int code = 0, const char* source = kSource) {
    Vesk2CrlInfoStruct* record = nullptr;
    EXPECT_EQ(Vesk2CrlFindA(&record, source, nullptr), code);
    EXPECT_EQ(record == nullptr, code != 0);
    const std::string text = record != nullptr ? Canonical(*record->crl) : "";
    EXPECT_EQ(Vesk2CrlFree(record), 0);
    return text;
  }

  const std::string revokedCert = Item(HashOf(Link(1, kElement)));
  const std::string revokedKey = Item(HashOf(KeyText(1)), kFuture);
  std::string chain;
};

TEST_F(RevocationLists, FromAFolderToARefusedChain) {
  EXPECT_EQ(VerifyChain(), VESK2_ERR_CRL_NOT_FOUND);
  for (const auto& list : {ListText(revokedCert), ListText(kDummy, revokedKey)}) {
    ASSERT_EQ(Import(ListText(kDummy)), 0);
    EXPECT_EQ(VerifyChain(), 0);
    ASSERT_EQ(Import(list), 0);
    EXPECT_EQ(Stored(), list);
    EXPECT_EQ(VerifyChain(), VESK2_ERR_CERT_REVOKED);
  }
  // A revoked key needs no certificate that names a source.
  other.Write("chain.cert", Chain());
  EXPECT_EQ(VerifyChain(), VESK2_ERR_CERT_REVOKED);
  // Through the other doors.
  const std::string in = other.File("in");
  Vesk2ContextStruct context{};
  for (int door = 0; door < 3; ++door) {
    std::filesystem::remove_all(global.File("cert"));
    EXPECT_EQ(door == 0   ? Vesk2ImportCrlsA(in.c_str())
              : door == 1 ? Vesk2CrlImport(in.c_str(), &context)
                          : Vesk2CrlImportA(in.c_str(), &context),
              0);
    EXPECT_EQ(VerifyChain(), VESK2_ERR_CERT_REVOKED);
  }
  EXPECT_EQ(Vesk2ImportCrlsA(nullptr), VESK2_ERR_FILE_NOT_FOUND);
}

TEST_F(RevocationLists, NewerReplacesOlderAndTheUnvouchedIsNeverStored) {
  const std::string stored = ListText(revokedCert, "", kFuture);
  const std::string newer = ListText(kDummy, "", kFarFuture);
  ASSERT_EQ(Import(ListText(revokedCert, "", kFarFuture, 6)), 0);  // a stranger's
  EXPECT_FALSE(std::filesystem::exists(global.File("cert"))) << "nothing was stored";
  EXPECT_EQ(VerifyChain(), VESK2_ERR_CRL_NOT_FOUND);
  const std::tuple<std::string, std::string, int> steps[] = {
      {stored, stored, VESK2_ERR_CERT_REVOKED},
      {ListText(kDummy, "", kMiddle), stored, VESK2_ERR_CERT_REVOKED},
      {ListText(kDummy, "", kFarFuture, 6), stored, VESK2_ERR_CERT_REVOKED},
      {newer, newer, 0},
      {stored, newer, 0},
  };
  for (const auto& [offered, kept, code] : steps) {
    EXPECT_EQ(Import(offered), 0);
    EXPECT_EQ(Stored(), kept);
    EXPECT_EQ(VerifyChain(), code);
  }
}

TEST_F(RevocationLists, CarriedByAManifest) {
  other.Write("tree/a", "a");
  ManifestText parts;
  parts.key = &TestKey::Rsa(1);
  parts.body = BodyOf(other.File("tree"));
  parts.chain = Link(0) + TestKey::Rsa(0).Sign(Link(0));
  const auto verify = [&] {
    const std::string file = other.Write("m", ManifestFile(parts));
    Manifest* manifest = nullptr;
    EXPECT_EQ(
        CreateManifestContext(&manifest, other.File("tree").c_str(), file.c_str(), "(install)"), 0);
    const int code = VerifyManifest(manifest, 0, 0);
    DeleteManifestContext(manifest);
    return code;
  };
  other.Write("chain.cert", Chain());
  EXPECT_EQ(verify(), 0);
  EXPECT_EQ(VerifyChain(), 0);
  parts.lists = ListText(kDummy, revokedKey);
  EXPECT_NE(verify(), 0);  // at once
  EXPECT_EQ(Stored(), parts.lists);
  EXPECT_EQ(VerifyChain(), VESK2_ERR_CERT_REVOKED);
  parts.lists = "";
  EXPECT_NE(verify(), 0);
}

TEST_F(RevocationLists, ReadAndFind) {
  const std::string noTag = Cert({.issuer = KeyText(5), .subject = HashOf(CrlText("", ""))});
  other.Write("plain.crl",
              List({Str("sequence"), CrlText("", ""), noTag, TestKey::Rsa(5).Sign(noTag)}));
  other.Write("list.crl", ListText(kDummy));
  other.Write("damaged.crl", "(8:sequence(3:crl");
  const std::string list = other.File("list"), plain = other.File("plain.crl");
  const std::string damaged = other.File("damaged");
  const std::tuple<const char*, int, time_t, const char*> cases[] = {
      {list.c_str(), 0, 978307200, kSource},
      {plain.c_str(), 0, 0, nullptr},
      {damaged.c_str(), VESK2_ERR_PARSE_FILE, 0, nullptr},
      {"/nonexistent", VESK2_ERR_FILE_NOT_FOUND, 0, nullptr},
      {other.Path().c_str(), VESK2_ERR_FILE_NOT_FOUND, 0, nullptr},
      {nullptr, VESK2_ERR_FILE_NOT_FOUND, 0, nullptr},
  };
  for (const auto& [path, code, begin, tag] : cases) {
    for (const auto read : {Vesk2CrlRead, Vesk2CrlReadA}) {
      Vesk2CrlInfoStruct left{};
      Vesk2CrlInfoStruct* record = &left;
      EXPECT_EQ(read(&record, path, nullptr), code) << path;
      EXPECT_EQ(record == nullptr, code != 0);
      if (record == nullptr) continue;
      EXPECT_EQ(record->size, 20U);
      EXPECT_EQ(record->notBefore, begin);
      EXPECT_STREQ(record->tag, tag);
      EXPECT_EQ(Vesk2CrlFree(record), 0);
    }
  }
  EXPECT_EQ(Vesk2CrlFree(nullptr), 0);
  Stored(VESK2_ERR_FIND_DIR);
  std::filesystem::create_directory(global.File("cert"));
  Stored(VESK2_ERR_CRL_NOT_FOUND);
  ASSERT_EQ(Import(ListText(kDummy)), 0);
  Stored(VESK2_ERR_ACL_ENTRY_NOT_FOUND, "sym (revoke y)");
  Stored(VESK2_ERR_INVALID_S_EXPRESSION, "(sym");
  Stored(VESK2_ERR_INVALID_PARAM, nullptr);
}

TEST_F(RevocationLists, Verify) {
  constexpr time_t kStart = 978307200;  // of kPast
  constexpr time_t kEnd = 1293840000;   // of kMiddle
  const auto text = [](const std::string& tag, unsigned key = 5) {
    return CrlSequenceText(key, tag, CrlText(kDummy, ""), kPast, kMiddle);
  };
  const std::string zero("(3:tag5:sym\0x)", 14);  // as a C string its body is "sym"
  WriteAcl("zero", AclEntryText(KeyText(5), zero));
  WriteAcl("none", AclEntryText(KeyText(5), "(3:any1:x)"));
  const std::string good = text(Tag(kSource));
  const std::tuple<std::string, const char*, time_t, time_t, int> cases[] = {
      {good, nullptr, 0, 0, 0},
      {good, kSource, 0, 0, 0},
      {good, "sym  (revoke x)", 0, 0, VESK2_ERR_NOT_AUTHORIZED},  // the text, not its meaning
      {text(zero), "sym", 0, 0, VESK2_ERR_NOT_AUTHORIZED},
      {text(zero), nullptr, 0, 0, 0},
      {text("(3:any1:x)"), "x", 0, 0, VESK2_ERR_AUTH_TAG_MISSING},
      {text("(3:any1:x)"), nullptr, 0, 0, 0},
      {text(""), "", 0, 0, VESK2_ERR_AUTH_TAG_MISSING},
      {text(""), nullptr, 0, 0, VESK2_ERR_ACL_ENTRY_NOT_FOUND},
      {text(Tag(kSource), 6), nullptr, 0, 0, VESK2_ERR_ACL_ENTRY_NOT_FOUND},
      // The period of the list: the names of the codes are crossed.
      {good, nullptr, kEnd, kStart, 0},
      {good, nullptr, kStart - 9, kStart - 1, VESK2_ERR_NOT_AFTER},
      {good, nullptr, -9, -1, VESK2_ERR_NOT_AFTER},
      {good, nullptr, kEnd + 1, kEnd + 9, VESK2_ERR_NOT_BEFORE},
      {good, nullptr, 0, kStart - 1, 0},
      {good, nullptr, kEnd + 1, 0, 0},
  };
  for (const auto& [list, tag, from, to, code] : cases) {
    const std::string file = other.Write("list.crl", list);
    for (const auto verify : {Vesk2CrlVerifyFile, Vesk2CrlVerifyFileA}) {
      EXPECT_EQ(verify(file.c_str(), tag, from, to, nullptr), code) << list << from;
    }
  }
  EXPECT_EQ(Vesk2CrlVerify(nullptr, nullptr, 0, 0), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(Vesk2CrlVerifyFileA(nullptr, nullptr, 0, 0, nullptr), VESK2_ERR_FILE_NOT_FOUND);
  std::filesystem::remove_all(global.File("acl"));
  EXPECT_EQ(Vesk2CrlVerifyFile(other.File("list").c_str(), nullptr, 0, 0, nullptr),
            VESK2_ERR_FILE_NOT_FOUND);
}

}  // namespace
}  // namespace vesk2test
