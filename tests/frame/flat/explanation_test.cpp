// SPDX-License-Identifier: Apache-2.0
// Explanations through the flat functions: their records, and what they hand out when there is
// nothing to explain.
#include <vesk2/manifest.h>

#include <memory>

#include "tests/frame/flat/chain_text.h"

namespace vesk2test {
namespace {

struct Free {
  void operator()(Vesk2ExplanationStruct* record) const { Vesk2FreeExplanation(record); }
};
using Explanation = std::unique_ptr<Vesk2ExplanationStruct, Free>;

// "KIND CERTIFICATE/OTHER ENTRY SOURCE" of each reason, as far as given.
std::string Told(const Vesk2ExplanationStruct& why) {
  std::string told;
  for (const auto* each = why.reasons; each != nullptr; each = each->next) {
    told += (told.empty() ? "" : ", ") + std::string(each->kind);
    if (each->certificate != 0) told += " " + std::to_string(each->certificate);
    if (each->otherCertificate != 0) told += "/" + std::to_string(each->otherCertificate);
    if (each->entry != nullptr) told += std::string(" ") + each->entry;
    if (each->source != nullptr) told += std::string(" ") + each->source;
    EXPECT_NE(each->text, nullptr);
  }
  return told;
}

// "ENTRY NUMBERS until TIME by WHAT NUMBER".
std::string Rests(const Vesk2ExplanationStruct& why) {
  if (why.entry == nullptr) return "";
  std::string text = why.entry;
  for (uint32_t i = 0; i < why.certificateCount; ++i) {
    text += " " + std::to_string(why.certificates[i]);
  }
  if (why.endedBy == nullptr) return text;
  return text + " until " + std::to_string(why.holdsUntil) + " by " + why.endedBy + " " +
         std::to_string(why.endCertificate);
}

std::string Hex(const std::string& bytes) {
  std::string digits;
  for (const char byte : bytes) {
    for (const int shift : {4, 0}) digits += "0123456789abcdef"[(byte >> shift) & 15];
  }
  return digits;
}

class Explained : public TrustTest {};

TEST_F(Explained, Chains) {
  WriteAcl("\x1b[2J", AclEntryText(KeyText(0), Tag("(install)"), true, kPast, kFuture));
  other.Write("yes.cert", Chain());
  other.Write("undetermined.cert", Chain("(10:revocation3:sym(6:revoke1:x))"));
  constexpr int kNone = VESK2_ERR_NOT_AUTHORIZED;
  const std::tuple<const char*, const char*, time_t, int, std::string, std::string> cases[] = {
      {"yes", "(install)", 1'000'000'000, 0, "", "\\x1b[2J.acl 3 2 1 until 32535216000 by entry 0"},
      {"undetermined", "(install)", 0, VESK2_ERR_CRL_NOT_FOUND, "undetermined 2 sym (revoke x)",
       ""},
      {"yes", "(install)", 1, kNone,
       "period 1, period 2, period 3, period \\x1b[2J.acl, combination", ""},
      {"yes", "(web)", 0, kNone, "tag 1, tag 2, tag 3, tag \\x1b[2J.acl, combination", ""},
  };
  for (const auto& [name, tag, at, code, reasons, rests] : cases) {
    const std::string path = other.File(name);
    Vesk2ExplanationStruct* out = nullptr;
    EXPECT_EQ(Vesk2CertVerifyFileExplainedA(path.c_str(), tag, at, at, &out), code) << reasons;
    const Explanation why(out);
    ASSERT_NE(why, nullptr);
    EXPECT_EQ(Told(*why), reasons);
    EXPECT_EQ(Rests(*why), rests);
    EXPECT_TRUE(why->size == sizeof *why && why->code == code && why->isComplete == 1);
    EXPECT_EQ(why->signer, nullptr);
    // The same of a chain that was read before.
    Vesk2CertInfoStruct* chain = nullptr;
    ASSERT_EQ(Vesk2CertRead(&chain, path.c_str()), 0);
    EXPECT_EQ(Vesk2CertVerifyExplained(chain, tag, at, at, &out), code);
    const Explanation again(out);
    EXPECT_EQ(Told(*again), reasons);
    EXPECT_EQ(Vesk2CertFree(chain), 0);
  }
}

TEST_F(Explained, NothingToExplain) {
  other.Write("damaged.cert", "(");
  Vesk2ExplanationStruct* out = nullptr;
  const std::string absent = other.File("absent"), damaged = other.File("damaged");
  EXPECT_EQ(Vesk2CertVerifyExplained(nullptr, "a", 0, 0, &out), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(Vesk2CertVerifyFileExplained(nullptr, "a", 0, 0, &out), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(Vesk2CertVerifyFileExplained(absent.c_str(), "a", 0, 0, nullptr), VESK2_ERR_PARAM_NULL);
  const std::pair<std::string, int> cases[] = {{absent, VESK2_ERR_FILE_OPEN},
                                               {damaged, VESK2_ERR_PARSE_FILE}};
  for (const auto& [path, code] : cases) {
    Vesk2ExplanationStruct unset{};
    out = &unset;
    EXPECT_EQ(Vesk2CertVerifyFileExplained(path.c_str(), "a", 0, 0, &out), code);
    EXPECT_EQ(out, nullptr);
  }
  Vesk2FreeExplanation(nullptr);
}

TEST_F(Explained, Manifests) {
  for (const char* name : {"a", "b", "c", "gone/d", "sub/f"})
    other.Write(std::string("tree/") + name, name);
  ManifestText parts;
  parts.body = BodyOf(other.File("tree"));
  parts.chain =
      Signed({.issuer = KeyText(0), .subject = KeyText(1), .notAfter = kFuture}, TestKey::Rsa(0));
  const std::string good = other.Write("good", ManifestFile(parts));
  std::string text = ManifestFile(parts);
  text.back() = '(';
  text[text.size() - 3] ^= 1;
  const std::string bad = other.Write("bad", text);
  other.Write("tree/b", "changed");
  other.Write("tree/sub/x", "");
  std::filesystem::create_directory(other.File("tree/sub/new"));
  std::filesystem::remove(other.File("tree/c"));
  std::filesystem::remove_all(other.File("tree/gone"));
  WriteAcl("root", AclEntryText(KeyText(0), Tag("(install)")));

  const auto verify = [&](const std::string& path, const char* tag, int code) {
    Manifest* manifest = nullptr;
    EXPECT_EQ(CreateManifestContext(&manifest, other.File("tree").c_str(), path.c_str(), tag), 0);
    Vesk2ExplanationStruct* out = nullptr;
    EXPECT_EQ(VerifyManifestExplained(manifest, 0, 0, &out), code);
    EXPECT_EQ(VerifyManifestExplained(manifest, 0, 0, nullptr), VESK2_ERR_PARAM_NULL);
    EXPECT_EQ(VerifyManifest(manifest, 0, 0), code);
    DeleteManifestContext(manifest);
    EXPECT_NE(out, nullptr);
    return Explanation(out);
  };
  Explanation why = verify(good, "(install)", VESK2_ERR_HASH_MISMATCH);
  EXPECT_EQ(Told(*why), "") << "authority is not what it lacks";
  EXPECT_EQ(Rests(*why), "root.acl 2 1 until 32535216000 by certificate 2");
  EXPECT_EQ(why->signer, "sha256:" + Hex(Digest(KeyText(1))));
  EXPECT_EQ(why->signedAt, 1714564800);
  const uint64_t counts[] = {why->listed, why->valid, why->changed, why->missing, why->extra};
  EXPECT_EQ((std::vector<uint64_t>{std::begin(counts), std::end(counts)}),
            (std::vector<uint64_t>{5, 2, 2, 2, 2}));

  why = verify(good, "(web)", VESK2_ERR_NOT_AUTHORIZED);
  EXPECT_EQ(Told(*why), "tag root.acl");
  EXPECT_EQ(why->listed + why->valid, 0U);
  why = verify(bad, "(install)", VESK2_ERR_HASH_MATCH);
  EXPECT_EQ(Told(*why).substr(0, 7), "content");
  why = verify(other.File("absent"), "(install)", VESK2_ERR_OPEN_MANIFEST_FILE);
  EXPECT_TRUE(why->reasons == nullptr && why->signer == nullptr && why->signedAt == 0);
}

TEST(FlatErrors, InWords) {
  const std::tuple<int, const char*, const char*> cases[] = {
      {0, "VESK2_SUCCESS", "Success"},
      {VESK2_ERR_NOT_AUTHORIZED, "VESK2_ERR_NOT_AUTHORIZED", "nothing is granted"},
      {VESK2_ERR_WRITE_FILE, "VESK2_ERR_WRITE_FILE", "VESK2_ERR_WRITE_FILE"},
      {SPKI_ERR_KOFN_SYNTAX, "SPKI_ERR_KOFN_SYNTAX", "Bad k-of-n syntax"},
      {SPKI_ERR_BAD_SEXP, "SPKI_ERR_BAD_SEXP",
       "an ACL entry or certificate that the reduction cannot read"},
      {SPKI_ERR_NO_MEM, "SPKI_ERR_NO_MEM", "the reduction ran out of memory or of its work budget"},
      {-1, "VESK_UNKNOWN_ERROR", "VESK_UNKNOWN_ERROR"},
  };
  for (const auto& [code, name, words] : cases) {
    EXPECT_STREQ(Vesk2ErrorName(code), name);
    EXPECT_STREQ(Vesk2ErrorWords(code), words);
  }
}

}  // namespace
}  // namespace vesk2test
