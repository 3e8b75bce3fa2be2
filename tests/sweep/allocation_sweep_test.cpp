// SPDX-License-Identifier: Apache-2.0
// The n-th allocation of every public operation fails, for n = 0, 1, 2 ... until none is reached:
// it alone, and it with all that follow; libcrypto's allocations too. Each run must leave its
// outputs null and leak nothing (the asan preset looks). It answers what it answers with all the
// memory it wants, or that memory was lacking: never "no" instead of "yes" or the reverse.
#include <gtest/gtest.h>
#include <openssl/err.h>

#include <vesk2/platform.h>
#include <algorithm>
#include <functional>
#include <iterator>
#include <memory>
#include <string>
#include <vector>
#include <vesk2.hpp>

#include "tests/support/temp_dir.h"
#include "tests/support/test_key.h"
#include "tests/support/test_manifest.h"
#include "tests/support/test_object.h"
#include "tests/support/test_text.h"
#include "tests/sweep/failing_memory.h"
#include "tests/sweep/scenes.h"

using namespace ZvVesk2;
using namespace vesk2test;

namespace {

using vesk2test::List;
using CertObject = ZvVesk2::Cert;
constexpr const char* kFrom = "2020-01-01_00:00:00";
constexpr const char* kTo = "2040-01-01_00:00:00";

// A machine with a store, a vendor (key 0) trusted to install and to revoke, a signer (key 1), a
// revoked key (key 2) and a signed tree.
struct World {
  World() {
    VeskConf::SetHomeDirectory(dir.File("home").c_str());
    VeskConf::SetGlobalDirectory(dir.File("global").c_str());
    dir.Write("global/acl/install.acl", AclEntryText(vendor, Tag("install")));
    dir.Write("global/acl/revoke.acl", AclEntryText(vendor, revokeTag));
    dir.Write("new/more.acl", AclEntryText(signer, Tag("other")));
    dir.Write("lists/list.crl", list);
    dir.Write("tree/sub/file", "contents");
    dir.Write("chain.cert", sequence);
    dir.Write("chain.req", sequence);
    ManifestText text;
    text.chain = Signed(link, TestKey::Rsa(0));
    text.lists = list;
    text.body = BodyOf(dir.File("tree"));
    dir.Write("tree.manifest", ManifestFile(text));
    EXPECT_EQ(AclEntry::Import(acls.Out(), nullptr, nullptr), 0);
    EXPECT_EQ(CrlSequence::ImportDirAndStore(File("lists"), nullptr), 0);
    EXPECT_EQ(CrlSequence::ImportStore(store.Out(), acls.get(), nullptr), 0);
  }

  std::string RevocationList() const {
    const auto item = [](const std::string& text) {
      return List({Str("item"), HashOf(text), Str("2021-01-01_00:00:00")});
    };
    const std::string crl =
        List({Str("crl"), List({Str("version"), Str("1")}), List({Str("list1"), item("(1:x)")}),
              List({Str("list2"), item("(1:x)"), item(revokedKey)})});
    const CertText voucher{.issuer = vendor,
                           .subject = HashOf(crl),
                           .tag = revokeTag,
                           .notBefore = kFrom,
                           .notAfter = kTo};
    return List({Str("sequence"), crl, Signed(voucher, TestKey::Rsa(0))});
  }
  const char* File(const char* name) { return (path = dir.File(name)).c_str(); }

  TempDir dir;
  std::string path;
  std::string revokeTag = Tag("app (revoke all)");
  std::string vendor = TestKey::Rsa(0).Public();
  std::string signer = TestKey::Rsa(1).Public();
  std::string revokedKey = TestKey::Rsa(2).Public();
  CertText link{.issuer = vendor,
                .subject = signer,
                .tag = Tag("install (app calc)"),
                .propagate = true,
                .notBefore = kFrom,
                .notAfter = kTo,
                .comment = "c"};
  std::string cert = vesk2test::Cert(link);
  std::string sequence =
      List({Str("sequence"), Signed(link, TestKey::Rsa(0)), List({Str("owner"), Str("me")})});
  std::string list = RevocationList();
  Ref<SExpression> acls;
  Ref<SExpression> store;
};

World& W() {
  static World world;
  return world;
}

// What an operation did: its code, and whether its outputs are as they must be for that code.
struct Outcome {
  // Of an operation whose answer is `verdict` with all the memory that it wants: that counts as 0,
  // and a 0 for another verdict as the fault that it is.
  static Outcome Of(int code, int verdict) {
    return {code == verdict ? 0 : code, code != 0 || verdict == 0};
  }

  int code;
  bool outputsFit = true;
};
using Operation = std::function<Outcome()>;

// `prepare` runs with good memory and returns the operation to sweep. An operation that `manages`
// may succeed all the same: it has another way to the same answer, or reports success whatever it
// could not do, by its contract.
struct Case {
  const char* name;
  std::function<Operation()> prepare;
  bool manages = false;
};

// A case without preparation.
Case Plain(const char* name, Operation operation, bool manages = false) {
  return {name, [operation] { return operation; }, manages};
}

// The same, of an operation that never names the crypto layer's lack of memory.
Case InOwnWords(Case row) {
  row.prepare = [prepare = std::move(row.prepare)]() -> Operation {
    return [operation = prepare()] {
      Outcome outcome = operation();
      outcome.outputsFit = outcome.outputsFit && outcome.code != ZVCLM_ERR_NO_MEM;
      return outcome;
    };
  };
  return row;
}

// A factory of values; `whole` judges what it made.
template <typename T, typename Make>
Operation Makes(Make make, std::function<bool(T*)> whole = nullptr) {
  return [make, whole] {
    T* out = nullptr;
    const int code = make(out);
    const bool fits = (out != nullptr) == (code == 0) && (!whole || out == nullptr || whole(out));
    if (out != nullptr) out->Free();
    return Outcome{code, fits};
  };
}

// A new array; null stands for a failure.
Operation MakesText(std::function<char*()> make) {
  return [make] {
    char* const text = make();
    Vesk2Free(text);
    return Outcome{text != nullptr ? 0 : VESK2_ERR_MEM_ALLOC};
  };
}

template <typename T>
std::shared_ptr<T> Keep(Ref<T> value) {
  return {value.Release(), [](T* kept) { kept->Free(); }};
}
std::shared_ptr<SExpression> Kept(const std::string& text) { return Keep(Parse(text)); }
template <typename T>
std::shared_ptr<T> KeptAs(const std::string& text) {
  Ref<T> object(new T(static_cast<Vesk2ContextStruct*>(nullptr)));
  EXPECT_EQ(object->Import(Wrap(text).get()), 0);
  return Keep(std::move(object));
}

template <typename T>
Case Imports(const char* name, const std::string& text) {
  return Plain(name, [text] {
    const BufferPtr buffer = Wrap(text);
    if (!buffer) return Outcome{VESK2_ERR_MEM_ALLOC};
    Ref<T> object(new T(static_cast<Vesk2ContextStruct*>(nullptr)));
    return Outcome{object->Import(buffer.get())};
  });
}

unsigned char* Bytes(std::string& text) { return reinterpret_cast<unsigned char*>(text.data()); }
unsigned Size(const std::string& text) { return static_cast<unsigned>(text.size()); }

std::vector<Case> ExpressionCases() {
  return {
      Plain("Import", Makes<SExpression>([](SExpression*& out) {
              return SExpression::Import(out, W().File("global/acl/revoke.acl"), nullptr);
            })),
      Plain("ParseCanonical", Makes<DExpression>([](DExpression*& out) {
              unsigned pos = 0;
              return SExpression::ParseCanonical(out, Bytes(W().cert), Size(W().cert), pos,
                                                 nullptr);
            })),
      // A search that lost an element would hand out another list than the one that was written.
      Plain("FindSubExpression",
            Makes<SExpression>(
                [](SExpression*& out) {
                  return SExpression::FindSubExpression(out, Bytes(W().cert), Size(W().cert), "tag",
                                                        nullptr);
                },
                [](SExpression* found) { return Canonical(*found) == W().link.tag; })),
      Plain("ParseTagAdvanced", Makes<SExpression>([](SExpression*& out) {
              return SExpression::ParseTagAdvanced(out, "(a (b c)) d", "tag", nullptr);
            })),
      Plain("Create", Makes<SExpression>([](SExpression*& out) {
              return SExpression::Create(out, "a", "b", nullptr);
            })),
      {"Export",
       [] {
         return [list = Kept(W().cert)] {
           unsigned char* out = nullptr;
           unsigned length = 0;
           const int code = list->Export(out, length);
           const bool fits = (out != nullptr) == (code == 0);
           Vesk2Free(out);
           return Outcome{code, fits};
         };
       }},
      {"IsEqual",
       [] {
         return [list = Kept(W().cert)] {
           return Outcome{list->IsEqual(list.get()) ? 0 : VESK2_ERR_MEM_ALLOC};
         };
       }},
      {"ExportTagW",
       [] { return MakesText([list = Kept(W().revokeTag)] { return list->ExportTagW("tag"); }); }},
      Plain("CalcPath", MakesText([] { return AclEntry::CalcPath("x", StorageGlobal); })),
      {"Export to a file",
       [] {
         const auto list = Kept(W().cert);
         list->SetStorageType(StoragePath);
         return [list] { return Outcome{list->SExpression::Export(W().File("out"))}; };
       }},
      Plain("TimeStamp::Set",
            [] {
              Ref<TimeStamp> stamp(new TimeStamp(nullptr));
              return Outcome{stamp->Set("2020", true)};
            }),
  };
}

// A signature of `object` that states `key` and was made with `maker`.
std::string SignatureOf(const TestKey& key, const char* algorithm, const std::string& object,
                        const TestKey& maker) {
  const char* const hash = algorithm == std::string("dsa-sha1") ? "sha1" : "sha256";
  const std::string value = maker.SignDigest(Digest(object, hash), algorithm, hash);
  return List(
      {Str("signature"), HashOf(object, hash), key.Public(), List({Str(algorithm), Str(value)})});
}

// What the signature of W().cert is: good (0), or not.
Case Verifies(const char* name, const std::string& signature, int verdict) {
  return InOwnWords({name, [signature, verdict] {
                       return [read = KeptAs<Signature>(signature),
                               cert = KeptAs<CertObject>(W().cert), verdict] {
                         SExpression* const object = cert.get();
                         return Outcome::Of(read->Verify(object), verdict);
                       };
                     }});
}

std::vector<Case> ObjectCases() {
  const std::string signature = TestKey::Rsa(0).Sign(W().cert);
  const std::string members = W().vendor + W().signer;
  return {
      Imports<Hash>("Hash::Import", HashOf("x")),
      Imports<PublicKey>("PublicKey::Import", W().vendor),
      Imports<ThresholdSubject>("ThresholdSubject::Import",
                                List({Str("k-of-n"), Str("\x01"), Str("\x02"), members})),
      Imports<Signature>("Signature::Import", signature),
      Imports<CertObject>("Cert::Import", W().cert),
      Imports<AclEntry>("AclEntry::Import", AclEntryText(W().vendor, W().revokeTag)),
      Imports<CrlSequence>("CrlSequence::Import", W().list),
      // Without its large block it hashes in smaller ones.
      Plain(
          "HashFile",
          [] {
            unsigned char digest[32];
            unsigned length = sizeof digest;
            const int code = Hash::HashFile(W().File("chain.cert"), digest, &length, nullptr);
            return Outcome{code, length == (code == 0 ? 32u : 0u)};
          },
          true),
      Verifies("Signature::Verify", signature, 0),
      Verifies("Signature::Verify with PSS",
               SignatureOf(TestKey::Rsa(0), "rsa-pss", W().cert, TestKey::Rsa(0)), 0),
      Verifies("Signature::Verify with DSA",
               SignatureOf(TestKey::Dsa(0), "dsa-sha1", W().cert, TestKey::Dsa(0)), 0),
      Verifies("Signature::Verify of another's",
               SignatureOf(TestKey::Rsa(0), "rsa-1.5", W().cert, TestKey::Rsa(1)),
               VESK2_ERR_SIGNATURE),
      Verifies("Signature::Verify of another's with PSS",
               SignatureOf(TestKey::Rsa(0), "rsa-pss", W().cert, TestKey::Rsa(1)),
               VESK2_ERR_SIGNATURE),
      Verifies("Signature::Verify of another's with DSA",
               SignatureOf(TestKey::Dsa(0), "dsa-sha1", W().cert, TestKey::Dsa(1)),
               VESK2_ERR_SIGNATURE),
      {"Signature::Create",
       [] {
         return [hash = KeptAs<Hash>(HashOf("x")), key = KeptAs<PublicKey>(W().vendor)] {
           Ref<Signature> made;
           unsigned char value[] = {1};
           const int code =
               Signature::Create(made.Out(), hash.get(), key.get(), "rsa-1.5", value, 1, nullptr);
           if (code == 0) {  // the references were taken over
             hash->IncrementRefCount();
             key->IncrementRefCount();
           }
           return Outcome{code};
         };
       }},
      {"X509Export",
       [] {
         return [key = KeptAs<PublicKey>(W().vendor)] {
           unsigned char* out = nullptr;
           unsigned length = 0;
           const int code = key->X509Export(out, length);
           Vesk2Free(out);
           return Outcome{code};
         };
       }},
      {"Cert::Clone",
       [] {
         return [cert = KeptAs<CertObject>(W().cert)] {
           Ref<CertObject> clone(new CertObject(nullptr));
           return Outcome{clone->Clone(cert.get())};
         };
       }},
      // The key is on a stored list: short of memory the answer may not be that it is not.
      {"Cert::IsRevoked",
       [] {
         const CertText text{
             .issuer = W().vendor, .subject = W().revokedKey, .tag = Tag("install")};
         return [cert = KeptAs<CertObject>(vesk2test::Cert(text))] {
           bool revoked = false;
           const int code = cert->IsRevoked(revoked);
           return Outcome{code, code != 0 || revoked};
         };
       },
       true},
  };
}

std::vector<Case> TrustCases() {
  const std::string text = List({Str("acl"), List({Str("entry"), List({Str("subject"), W().vendor}),
                                                   List({Str("propagate")}), W().revokeTag})});
  const auto loaded = [](unsigned count) {
    return [count](SExpression* list) { return list->Count() == count; };
  };
  return {
      // Directories are sorted in place when they must be.
      Plain(
          "AclEntry::Import of the store",
          Makes<SExpression>(
              [](SExpression*& out) { return AclEntry::Import(out, nullptr, nullptr); }, loaded(3)),
          true),
      // A file that could not be read is passed over.
      {"AclEntry::Find",
       [] {
         return [key = KeptAs<PublicKey>(W().vendor), tag = Kept(Tag("install (app calc)"))] {
           unsigned k = 0;
           return Outcome{AclEntry::Find(key.get(), tag.get(), nullptr, nullptr, k)};
         };
       },
       true},
      {"AclEntry::FindRevocationEntry",
       [] {
         return [tag = Kept(Tag("install (revoke all)"))] {
           return Outcome{AclEntry::FindRevocationEntry(tag.get())};
         };
       },
       true},
      Plain(
          "AclEntry::InstallAcls",
          [] { return Outcome{AclEntry::InstallAcls(W().File("new"), nullptr)}; }, true),
      Plain("ParseTagCanonical", Makes<SExpression>([text](SExpression*& out) {
              std::string copy = text;
              return AclEntry::ParseTagCanonical(out, Bytes(copy), Size(copy), nullptr);
            })),
      Plain("CrlSequence::ImportStore", Makes<SExpression>(
                                            [](SExpression*& out) {
                                              return CrlSequence::ImportStore(out, W().acls.get(),
                                                                              nullptr);
                                            },
                                            loaded(1))),
      Plain("CrlSequence::ImportDir", Makes<SExpression>(
                                          [](SExpression*& out) {
                                            return CrlSequence::ImportDir(out, W().File("lists"),
                                                                          StorageGlobal, nullptr);
                                          },
                                          loaded(1))),
      {"CrlSequence::VerifySelf",
       [] {
         return [list = KeptAs<CrlSequence>(W().list)] {
           return Outcome{list->VerifySelf(W().acls.get())};
         };
       }},
      {"CrlSequence::UpdateStore",
       [] {
         return [list = KeptAs<CrlSequence>(W().list)] {
           return Outcome{list->UpdateStore(W().acls.get())};
         };
       },
       true},
      {"CrlSequence::CheckStatusCritical",
       [] {
         return [object = Kept("(1:x)")] {
           const int code = CrlSequence::CheckStatusCritical(W().acls.get(), W().store.get(),
                                                             nullptr, object.get());
           return Outcome::Of(code, VESK2_ERR_KEY_REVOKED);
         };
       }},
      Plain("CertSequence::Import", Makes<CertSequence>([](CertSequence*& out) {
              return CertSequence::Import(out, W().File("chain"), true, nullptr);
            })),
      Plain("CertRequest::Import",
            [] {
              Ref<CertObject> cert;
              Ref<Signature> signature;
              Ref<SExpression> extra;
              const int code = CertRequest::Import(cert.Out(), signature.Out(), extra.Out(),
                                                   W().File("chain"), nullptr);
              const bool made = bool(cert) && bool(signature) && bool(extra);
              return Outcome{code, code == 0 ? made : !cert && !signature && !extra};
            }),
      // Its key is revoked: the answer is never a yes.
      {"CertSequence::Verify of a revoked chain",
       [] {
         const CertText leaf{
             .issuer = W().vendor, .subject = W().revokedKey, .tag = Tag("install")};
         W().dir.Write("revoked.cert",
                       List({Str("sequence"), Signed(leaf, TestKey::Rsa(0)), "(1:x)"}));
         return [tag = Kept(Tag("install"))] {
           const int code = CertSequence::Verify(nullptr, tag.get(), nullptr, nullptr,
                                                 W().File("revoked"), true, nullptr);
           return Outcome::Of(code, VESK2_ERR_CERT_REVOKED);
         };
       },
       true},
      // Nor is it another no when what was found is kept.
      {"CertSequence::Verify with evidence of a revoked chain",
       [] {
         Ref<CertSequence> chain;
         EXPECT_EQ(CertSequence::Import(chain.Out(), W().File("revoked"), true, nullptr), 0);
         return [chain = Keep(std::move(chain)), tag = Kept(Tag("install"))] {
           Evidence evidence(nullptr);
           return Outcome::Of(chain->Verify(nullptr, tag.get(), nullptr, nullptr, evidence),
                              VESK2_ERR_CERT_REVOKED);
         };
       },
       true},
      // The revoked certificate is left out, and none remains.
      {"CertSequence::Verify2 of a revoked chain",
       [] {
         const CertText leaf{
             .issuer = W().vendor, .subject = W().revokedKey, .tag = Tag("install")};
         W().dir.Write("revoked.cert",
                       List({Str("sequence"), Signed(leaf, TestKey::Rsa(0)), "(1:x)"}));
         Ref<CertSequence> chain;
         EXPECT_EQ(CertSequence::Import(chain.Out(), W().File("revoked"), true, nullptr), 0);
         return [chain = Keep(std::move(chain))] {
           Ref<SExpression> out[3];
           return Outcome::Of(chain->Verify2(out[0].Out(), out[1].Out(), out[2].Out()),
                              VESK2_ERR_INVALID_SEQUENCE);
         };
       },
       true},
      {"CertSequence::Verify",
       [] {
         return [tag = Kept(Tag("install (app calc)"))] {
           return Outcome{CertSequence::Verify(nullptr, tag.get(), nullptr, nullptr,
                                               W().File("chain"), true, nullptr)};
         };
       },
       true},
      {"IsSubset",
       [] {
         return [narrow = Kept(Tag("install (app calc)")), wide = Kept(Tag("install"))] {
           return Outcome{narrow->IsSubset(wide.get()) ? 0 : VESK2_ERR_MEM_ALLOC};
         };
       }},
      // Tags that could not be hashed are compared by the engine.
      {"ReductA",
       [] {
         return [chain = Kept(List({Str("sequence"), W().cert})), third = Kept(W().signer),
                 tag = Kept(Tag("install (app calc)"))] {
           return Outcome{Verify::ReductA(nullptr, W().acls.get(), chain.get(), third.get(),
                                          tag.get(), nullptr)};
         };
       },
       true},
      // The tag is looked up by FindSubExpression.
      {"ReductB",
       [] {
         return [chain = Kept(List({Str("sequence"), W().cert})), third = Kept(W().signer)] {
           Ref<SExpression> out[3];
           const int code = Verify::ReductB(nullptr, W().acls.get(), chain.get(), third.get(),
                                            out[0].Out(), out[1].Out(), out[2].Out());
           const bool whole = out[0] && Canonical(out[0]) == W().link.tag && out[1] && out[2];
           return Outcome{code, code == 0 ? whole : !out[0] && !out[1] && !out[2]};
         };
       },
       true},
  };
}

std::vector<Case> FlatCases() {
  const auto make = [] {
    Manifest* manifest = nullptr;
    const std::string tree = W().dir.File("tree");
    EXPECT_EQ(CreateManifestContext(&manifest, tree.c_str(), W().File("tree.manifest"),
                                    "install (app calc)"),
              0);
    return std::shared_ptr<Manifest>(manifest, DeleteManifestContext);
  };
  return {
      Plain("Vesk2Init",
            [] {
              Vesk2ContextStruct* context = nullptr;
              const int code = Vesk2Init(&context, 1);
              const bool fits = (context != nullptr) == (code == 0);
              Vesk2FreeContext(context);
              return Outcome{code, fits};
            }),
      Plain("Vesk2AsciiToWide", MakesText([] { return Vesk2AsciiToWide("abc", 3, nullptr); })),
      Plain("CreateManifestContextA",
            [] {
              Manifest* manifest = nullptr;
              const int code = CreateManifestContextA(&manifest, "dir", "file", "(install)");
              const bool fits = (manifest != nullptr) == (code == 0);
              DeleteManifestContext(manifest);
              return Outcome{code, fits};
            }),
      Plain("Vesk2CertRead",
            [] {
              Vesk2CertInfoStruct* chain = nullptr;
              const int code = Vesk2CertRead(&chain, W().File("chain"));
              const bool fits = (chain != nullptr) == (code == 0);
              if (chain != nullptr) (void)Vesk2CertFree(chain);
              return Outcome{code, fits};
            }),
      Plain("Vesk2CrlReadA",
            [] {
              Vesk2CrlInfoStruct* record = nullptr;
              const int code = Vesk2CrlReadA(&record, W().File("lists/list"), nullptr);
              const bool fits = (record != nullptr) == (code == 0);
              (void)Vesk2CrlFree(record);
              return Outcome{code, fits};
            }),
      Plain(
          "Vesk2CertVerifyFile",
          [] {
            return Outcome{Vesk2CertVerifyFile(W().File("chain"), "install (app calc)", 0, 0)};
          },
          true),
      // Without memory for the explanation the answer stands.
      Plain(
          "Vesk2CertVerifyFileExplained",
          [] {
            Vesk2ExplanationStruct* why = nullptr;
            const int code =
                Vesk2CertVerifyFileExplained(W().File("chain"), "install (app mail)", 0, 0, &why);
            const bool fits = why == nullptr || why->code == code;
            Vesk2FreeExplanation(why);
            Outcome outcome = Outcome::Of(code, VESK2_ERR_NOT_AUTHORIZED);
            outcome.outputsFit &= fits;
            return outcome;
          },
          true),
      Plain(
          "Vesk2CrlVerifyFile",
          [] {
            return Outcome{Vesk2CrlVerifyFile(W().File("lists/list"), nullptr, 0, 0, nullptr)};
          },
          true),
      // A list that could not be stored does not make the tree any worse.
      {"VerifyManifest",
       [make] {
         return [manifest = make()] {
           const int code = VerifyManifest(manifest.get(), 0, 0);
           return Outcome{code, code != 0 || GetValidEntries(manifest.get()) != nullptr};
         };
       },
       true},
      {"VerifyManifestExplained",
       [make] {
         return [manifest = make()] {
           Vesk2ExplanationStruct* why = nullptr;
           const int code = VerifyManifestExplained(manifest.get(), 0, 0, &why);
           const bool fits =
               why == nullptr ||
               (why->code == code &&
                (code != 0 || (why->valid == 1 && (why->entry != nullptr || !why->isComplete))));
           Vesk2FreeExplanation(why);
           return Outcome{code, fits && (code != 0 || manifest->GetListing() != nullptr)};
         };
       },
       true},
      {"CompareManifestA",
       [make] {
         return [manifest = make()] {
           return Outcome{CompareManifestA(manifest.get(), W().File("tree.manifest"))};
         };
       }},
  };
}

// A whole manifest, written to nowhere: every step's code counts, the constructor's by the first.
int WriteManifest(CertObject* cert, Signature* signature, CrlSequence* list, TimeStamp* time,
                  FILE* stream) {
  constexpr unsigned char kBytes[32] = {};
  constexpr unsigned char kToken[4] = {};
  ManifestWriter writer(nullptr);
  int code = writer.SetHead("creator", time);
  if (code == 0) code = writer.BeginBody(kToken);
  for (int i = 0; i < 20 && code == 0; ++i) code = writer.AddFile("a file", kBytes);
  if (code == 0) code = writer.OpenDirectory("a directory");
  if (code == 0) code = writer.CloseDirectory();
  if (code == 0) code = writer.EndBody();
  Ref<Hash> digest;
  if (code == 0) code = writer.SignedDigest(digest.Out(), ZVCLM_HASH_SHA256);
  if (bool(digest) != (code == 0)) return -1;
  for (int i = 0; i < 2 && code == 0; ++i) code = writer.AddCertificate(cert, signature);
  if (code == 0) code = writer.AddList(list);
  return code != 0 ? code : writer.Write(stream);
}

// Manifests as they are written, compared and explained.
std::vector<Case> ManifestCases() {
  ManifestText text;
  text.chain = Signed(W().link, TestKey::Rsa(0));
  text.body = Body(FileEntry("one", "1") + DirEntry("gone", DirEntry("deep", FileEntry("f", ""))));
  W().dir.Write("left.manifest", ManifestFile(text));
  text.body = Body(FileEntry("one", "1") + DirEntry("new", DirEntry("deep", FileEntry("f", ""))));
  W().dir.Write("right.manifest", ManifestFile(text));
  std::string changed = ManifestFile(text);
  changed.replace(changed.find("3:one"), 5, "3:oNe");
  W().dir.Write("changed.manifest", changed);
  const auto make = [](const char* file) {
    Manifest* manifest = nullptr;
    const std::string tree = W().dir.File("tree");
    EXPECT_EQ(CreateManifestContext(&manifest, tree.c_str(), W().File(file), "install (app calc)"),
              0);
    return std::shared_ptr<Manifest>(manifest, DeleteManifestContext);
  };
  return {
      {"ManifestWriter",
       [] {
         const auto null = std::shared_ptr<FILE>(std::fopen("/dev/null", "w"), std::fclose);
         return [cert = KeptAs<CertObject>(W().cert), list = KeptAs<CrlSequence>(W().list),
                 signature = KeptAs<Signature>(TestKey::Rsa(0).Sign(W().cert)),
                 time = KeptAs<TimeStamp>(Str(kFrom)), null] {
           return Outcome{
               WriteManifest(cert.get(), signature.get(), list.get(), time.get(), null.get())};
         };
       }},
      // Each call says by itself that the writer was not made.
      {"ManifestWriter::SetHead",
       [] {
         return [time = KeptAs<TimeStamp>(Str(kFrom))] {
           ManifestWriter writer(nullptr);
           return Outcome{writer.SetHead("creator", time.get())};
         };
       }},
      Plain("ManifestWriter::SignedDigest of nothing",
            [] {
              ManifestWriter writer(nullptr);
              Ref<Hash> digest;
              const int code = writer.SignedDigest(digest.Out(), ZVCLM_HASH_SHA256);
              return Outcome::Of(code, VESK2_ERR_INVALID_PARAM);
            }),
      // Whole directories on either side: none is passed over.
      {"CompareManifest of what differs",
       [make] {
         return [manifest = make("left.manifest")] {
           const int code = CompareManifest(manifest.get(), W().File("right.manifest"));
           return Outcome::Of(code, VESK2_ERR_FILE_NOT_FOUND);
         };
       }},
      // That it is another listing than the signed one stands, with what is known of it or without.
      {"VerifyManifestExplained of another listing",
       [make] {
         return [manifest = make("changed.manifest")] {
           Vesk2ExplanationStruct* why = nullptr;
           const int code = VerifyManifestExplained(manifest.get(), 0, 0, &why);
           const bool fits = why == nullptr || (why->code == code && why->valid == 0);
           Vesk2FreeExplanation(why);
           Outcome outcome = Outcome::Of(code, VESK2_ERR_HASH_MATCH);
           outcome.outputsFit &= fits;
           return outcome;
         };
       },
       true},
      // More certificates than there is room for at first, kept as evidence.
      {"CertSequence::Verify with evidence of a long chain",
       [] {
         const std::string pair = Signed(W().link, TestKey::Rsa(0)) + List({Str("owner")});
         std::string pairs;
         for (int i = 0; i < 5; ++i) pairs += pair;
         W().dir.Write("long.cert", List({Str("sequence"), pairs}));
         Ref<CertSequence> chain;
         EXPECT_EQ(CertSequence::Import(chain.Out(), W().File("long"), true, nullptr), 0);
         return [chain = Keep(std::move(chain)), tag = Kept(Tag("install (app calc)"))] {
           Evidence evidence(nullptr);
           const int code = chain->Verify(nullptr, tag.get(), nullptr, nullptr, evidence);
           return Outcome{code, code != 0 || evidence.CountCerts() == 5};
         };
       },
       true},
  };
}

// The machines of scenes.h: extra directory, home store, carried lists, and stores that are not to
// be written. `scenes` outlives the rows.
std::vector<Case> SceneCases(const Scenes& scenes) {
  std::vector<Case> cases;
  for (const auto& each : scenes) {
    const auto ask = [scene = each.get(), before = each->Stored()] {
      const int code = scene->ask();
      const bool wrote = scene->Stored() != before;
      if (wrote) scene->Restore(before);
      Outcome outcome = Outcome::Of(code, scene->code);
      outcome.outputsFit &= !wrote || scene->stores;
      return outcome;
    };
    cases.push_back(Plain(each->Name(), ask, true));
  }
  return cases;
}

// Whether a code can tell of a lack of memory: in the words of the library, the crypto layer and
// the engine, or as a store or a file that was not got at. Of the verdicts it is only that a grant
// does not cover the request: IsSubset has no other word for tags that it could not compare.
bool TellsOfShortage(int code) {
  constexpr int kEngineStart = 16386;
  const int codes[] = {VESK2_ERR_MEM_ALLOC,
                       ZVCLM_ERR_NO_MEM,
                       SPKI_ERR_NO_MEM,
                       kEngineStart,
                       VESK2_ERR_FIND_DIR,
                       VESK2_ERR_FILE_NOT_FOUND,
                       VESK2_ERR_FILE_OPEN,
                       VESK2_ERR_ACL_ENTRY_NOT_FOUND,
                       VESK2_ERR_PACKAGE_NOT_GRANTED};
  return std::ranges::find(codes, code) != std::end(codes);
}

// Fails one allocation of the row after the other. A lasting shortage ends most rows soon after its
// start; the later starts are sampled.
void Sweep(const Case& row, Shortage shortage) {
  constexpr long kMost = 200'000;
  Fired fired = Fired::kLibrary;
  const long sparse = shortage == Shortage::kLasting ? 10 : kMost;
  for (long n = 0; fired != Fired::kNot && n < kMost; n += 1 + n / sparse) {
    const Operation operation = row.prepare();
    constexpr int kCallers = 8;
    ERR_raise(ERR_LIB_USER, kCallers);
    Arm(n, shortage);
    const Outcome outcome = operation();
    fired = Disarm();
    SCOPED_TRACE("allocation " + std::to_string(n) + ", code " + std::to_string(outcome.code));
    EXPECT_TRUE(outcome.outputsFit);
    // What libcrypto told the library stays inside it.
    EXPECT_EQ(ERR_GET_REASON(ERR_get_error()), kCallers);
    EXPECT_EQ(ERR_get_error(), 0u);
    // libcrypto has another way to the same answer here and there.
    const bool mayPass = fired != Fired::kLibrary || row.manages;
    EXPECT_TRUE(outcome.code == 0 ? mayPass : TellsOfShortage(outcome.code));
  }
  EXPECT_EQ(fired, Fired::kNot) << "no end of allocations";
}

// The runs before and after make libcrypto ready, which it must still be.
void Sweep(const std::vector<Case>& cases) {
  for (const Case& row : cases) {
    SCOPED_TRACE(row.name);
    EXPECT_EQ(row.prepare()().code, 0) << "with all the memory it wants";
    for (const Shortage shortage : {Shortage::kOnce, Shortage::kLasting}) {
      Sweep(row, shortage);
      EXPECT_EQ(row.prepare()().code, 0) << "with memory again";
    }
  }
}

TEST(AllocationSweep, Scenes) {
  const Scenes scenes = MakeScenes();
  Sweep(SceneCases(scenes));
}
TEST(AllocationSweep, Expressions) { Sweep(ExpressionCases()); }
TEST(AllocationSweep, Objects) { Sweep(ObjectCases()); }
TEST(AllocationSweep, TrustAndReduction) { Sweep(TrustCases()); }
TEST(AllocationSweep, Manifests) { Sweep(ManifestCases()); }
TEST(AllocationSweep, FlatFunctions) {
  std::vector<Case> cases = FlatCases();
  for (Case& row : cases) row = InOwnWords(std::move(row));
  Sweep(cases);
}

}  // namespace
