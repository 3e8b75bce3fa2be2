// SPDX-License-Identifier: Apache-2.0
// See scenes.h. Files are written without the library; the stores of a scene are below its
// directory:
//   global/acl, global/cert, home/cert, extra
#include "tests/sweep/scenes.h"

#include <filesystem>
#include <initializer_list>

#include "tests/support/test_key.h"
#include "tests/support/test_manifest.h"
#include "tests/support/test_text.h"

#include <vesk2.h>
#include <vesk2.hpp>

namespace vesk2test {
namespace {

namespace fs = std::filesystem;

constexpr const char* kAsked = "(install (app calc))";
constexpr const char* kGranted = "(install)";
constexpr const char* kSource = "app (revoke all)";
constexpr const char* kFrom = "2020-01-01_00:00:00";
constexpr const char* kTo = "2040-01-01_00:00:00";
constexpr const char* kLater = "2041-01-01_00:00:00";

const TestKey& Vendor() { return TestKey::Rsa(0); }
const TestKey& Signer() { return TestKey::Rsa(1); }
const TestKey& Revoker() { return TestKey::Rsa(2); }
const TestKey& Second() { return TestKey::Rsa(3); }
const TestKey& Third() { return TestKey::Rsa(4); }

std::string Entry(const TestKey& key, const char* tag) {
  return AclEntryText(key.Public(), Tag(tag));
}

// The signer's certificate, and its signature.
CertText Link(const TestKey& issuer) {
  return {.issuer = issuer.Public(),
          .subject = Signer().Public(),
          .tag = Tag(kGranted),
          .propagate = true,
          .notBefore = kFrom,
          .notAfter = kTo};
}
CertText RevocableLink() {
  CertText link = Link(Vendor());
  link.revocation = "(15:revocation-list3:app(6:revoke3:all))";
  return link;
}

// A list of the revoker's that names certificates, and keys.
std::string RevocationList(std::initializer_list<std::string> certificates,
                           std::initializer_list<std::string> keys, const char* end = kTo) {
  const auto items = [](std::initializer_list<std::string> objects) {
    std::string text;
    for (const std::string& object : objects) {
      text += List({Str("item"), HashOf(object), Str("2021-01-01_00:00:00")});
    }
    return text;
  };
  const std::string crl =
      List({Str("crl"), List({Str("version"), Str("1")}), List({Str("list1"), items(certificates)}),
            List({Str("list2"), items(keys)})});
  const CertText voucher{.issuer = Revoker().Public(),
                         .subject = HashOf(crl),
                         .tag = Tag(kSource),
                         .notBefore = kFrom,
                         .notAfter = end};
  return List({Str("sequence"), crl, Signed(voucher, Revoker())});
}
std::string RevokesNobody() { return RevocationList({"(1:x)"}, {"(1:x)"}); }
std::string RevokesSigner() { return RevocationList({"(1:x)"}, {Signer().Public()}); }

// Paths made before a call can fail: what is asked makes no strings.
struct Paths {
  explicit Paths(const Scene& scene) {
    for (const char* file : {"home", "global", "tree", "tree.manifest", "extra", "new"}) {
      paths[file] = scene.File(file);
    }
  }
  const char* operator[](std::string_view file) const { return paths.find(file)->second.c_str(); }
  void UseStores() const {
    ZvVesk2::VeskConf::SetHomeDirectory((*this)["home"]);
    ZvVesk2::VeskConf::SetGlobalDirectory((*this)["global"]);
  }

  std::map<std::string, std::string, std::less<>> paths;
};

int AskAboutTree(const Paths& paths) {
  paths.UseStores();
  Manifest* manifest = nullptr;
  int code = CreateManifestContext(&manifest, paths["tree"], paths["tree.manifest"], kAsked);
  if (code != 0) return code;
  FailOnExtraEntries(manifest);
  SetExtraAclDirectory(manifest, paths["extra"]);
  code = VerifyManifest(manifest, 0, 0);
  DeleteManifestContext(manifest);
  return code;
}

int AskAboutChain(const Paths& paths) {
  paths.UseStores();
  ZvVesk2::Ref<ZvVesk2::SExpression> tag;
  const int code = ZvVesk2::SExpression::ParseTagAdvanced(tag.Out(), kGranted, "tag", nullptr);
  if (code != 0) return code;
  return ZvVesk2::CertSequence::Verify(nullptr, tag.get(), nullptr, nullptr, "chain", false,
                                       nullptr);
}

// ---- The machines ------------------------------------------------------------------------------

// A tree, signed; the vendor's entry is in the extra directory, the revoker's in the store with a
// list that revokes nobody.
std::unique_ptr<Scene> Tree(const char* name, int code, const std::string& chain = {},
                            const std::string& lists = {}) {
  auto scene = std::make_unique<Scene>(name);
  scene->Write("tree/one", "one\n");
  scene->Write("tree/sub/two", "two\n");
  scene->Write("extra/vendor.acl", Entry(Vendor(), kGranted));
  scene->Write("global/acl/revoker.acl", Entry(Revoker(), kSource));
  scene->Write("global/cert/app (revoke all).crl", RevokesNobody());
  ManifestText text;
  text.chain = chain.empty() ? Signed(Link(Vendor()), Vendor()) : chain;
  text.lists = lists;
  text.body = BodyOf(scene->File("tree"));
  scene->Write("tree.manifest", ManifestFile(text));
  scene->ask = [paths = Paths(*scene)] { return AskAboutTree(paths); };
  scene->code = code;
  scene->words = {"manifest",
                  "verify",
                  scene->File("tree"),
                  scene->File("tree.manifest"),
                  "--tag",
                  kAsked,
                  "--acl-dir",
                  scene->File("extra"),
                  "--global",
                  scene->File("global"),
                  "--home",
                  scene->File("home")};
  scene->exit = code == 0 ? 0 : 1;
  return scene;
}

void AddRevoked(Scenes& scenes) {
  scenes.push_back(Tree("a revoked key", VESK2_ERR_SIGNING_CERT_ORDER));
  scenes.back()->Write("global/cert/app (revoke all).crl", RevokesSigner());

  // The one entry that leads to the list is in the extra directory.
  scenes.push_back(Tree("a source of the extra directory", VESK2_ERR_SIGNING_CERT_ORDER));
  scenes.back()->Write("global/cert/app (revoke all).crl", RevokesSigner());
  fs::rename(scenes.back()->File("extra/vendor.acl"), scenes.back()->File("global/acl/vendor.acl"));
  fs::rename(scenes.back()->File("global/acl/revoker.acl"),
             scenes.back()->File("extra/revoker.acl"));

  scenes.push_back(Tree("a carried list", VESK2_ERR_SIGNING_CERT_ORDER, "", RevokesSigner()));
  fs::remove(scenes.back()->File("global/cert/app (revoke all).crl"));
  scenes.back()->stores = true;

  // The store's list must neither go unseen nor give way to the one that is carried.
  scenes.push_back(
      Tree("an older carried list", VESK2_ERR_SIGNING_CERT_ORDER, "", RevokesNobody()));
  scenes.back()->Write("global/cert/app (revoke all).crl",
                       RevocationList({"(1:x)"}, {Signer().Public()}, kLater));

  const std::string chain = Signed(RevocableLink(), Vendor());
  scenes.push_back(Tree("a revoked certificate", VESK2_ERR_SIGNING_CERT_ORDER, chain));
  scenes.back()->Write("global/cert/app (revoke all).crl",
                       RevocationList({Cert(RevocableLink())}, {"(1:x)"}));

  scenes.push_back(Tree("no list", VESK2_ERR_SIGNING_CERT_ORDER, chain));
  fs::remove(scenes.back()->File("global/cert/app (revoke all).crl"));
}

std::string TwoOfThree() {
  return AclEntryText(List({Str("k-of-n"), Str("\x02"), Str("\x03"),
                            Vendor().Public() + Second().Public() + Third().Public()}),
                      Tag(kGranted));
}

void AddThresholds(Scenes& scenes) {
  scenes.push_back(Tree("one of three", VESK2_ERR_NOT_AUTHORIZED));
  scenes.back()->Write("extra/vendor.acl", TwoOfThree());

  CertText other = Link(Second());
  other.revocation = RevocableLink().revocation;
  scenes.push_back(Tree("two of three, one revoked", VESK2_ERR_NOT_AUTHORIZED,
                        Signed(Link(Vendor()), Vendor()) + Signed(other, Second())));
  scenes.back()->Write("extra/vendor.acl", TwoOfThree());
  scenes.back()->Write("global/cert/app (revoke all).crl",
                       RevocationList({Cert(other)}, {"(1:x)"}));
}

void AddTrees(Scenes& scenes) {
  scenes.push_back(Tree("a changed file", VESK2_ERR_HASH_MISMATCH));
  scenes.back()->Write("tree/sub/two", "tWo\n");
  scenes.push_back(Tree("a missing file", VESK2_ERR_FILE_NOT_FOUND));
  fs::remove(scenes.back()->File("tree/one"));
  scenes.push_back(Tree("an unlisted file", VESK2_ERR_EXTRA_FILES));
  scenes.back()->Write("tree/sub/three", "three\n");
  // Which the library does not ask about.
  scenes.push_back(Tree("a link out of the tree", 0));
  scenes.back()->exit = 1;
  scenes.back()->Write("elsewhere/two", "two\n");
  fs::remove(scenes.back()->File("tree/sub/two"));
  fs::create_symlink("../../elsewhere/two", scenes.back()->File("tree/sub/two"));
}

// A chain of the home store; the vendor's entry is in the global one.
std::unique_ptr<Scene> Chain(const char* name, int code, const std::string& list) {
  auto scene = std::make_unique<Scene>(name);
  scene->Write("home/cert/chain.cert",
               List({Str("sequence"), Signed(RevocableLink(), Vendor()), "(1:x)"}));
  scene->Write("global/acl/vendor.acl", Entry(Vendor(), kGranted));
  scene->Write("global/acl/revoker.acl", Entry(Revoker(), kSource));
  scene->Write("global/cert/app (revoke all).crl", list);
  scene->ask = [paths = Paths(*scene)] { return AskAboutChain(paths); };
  scene->code = code;
  scene->words = {"cert",
                  "verify",
                  scene->File("home/cert/chain.cert"),
                  "--tag",
                  kGranted,
                  "--global",
                  scene->File("global"),
                  "--home",
                  scene->File("home")};
  scene->exit = code == 0 ? 0 : 1;
  return scene;
}

// Writing to a store that has all that is offered, in whatever words.
void AddStores(Scenes& scenes) {
  scenes.push_back(Chain("installing what is stored", 0, RevokesNobody()));
  Scene* const install = scenes.back().get();
  install->Write("new/again.acl", Entry(Second(), kGranted));
  install->Write("new/vendor.acl", Entry(Second(), "(other)"));
  install->ask = [paths = Paths(*install)] {
    paths.UseStores();
    return ZvVesk2::AclEntry::InstallAcls(paths["new"], nullptr);
  };
  install->words.clear();

  scenes.push_back(
      Chain("importing an older list", 0, RevocationList({"(1:x)"}, {"(1:y)"}, kLater)));
  Scene* const import = scenes.back().get();
  import->Write("new/list.crl", RevokesNobody());
  import->ask = [paths = Paths(*import)] { paths.UseStores();
  return Vesk2ImportCrls(paths["new"]);
};
import->words.clear();
}  // namespace

}  // namespace vesk2test

std::map<std::string, std::string> Scene::Stored() const {
  std::map<std::string, std::string> stored;
  for (const auto& file : fs::recursive_directory_iterator(File("global"))) {
    const std::string path = fs::relative(file.path(), dir_.Path());
    if (file.is_regular_file()) stored[path] = dir_.Read(path);
  }
  return stored;
}

void Scene::Restore(const std::map<std::string, std::string>& stored) const {
  fs::remove_all(File("global"));
  for (const auto& [path, bytes] : stored) Write(path, bytes);
}

Scenes MakeScenes() {
  Scenes scenes;
  scenes.push_back(Tree("all is well", 0));
  AddRevoked(scenes);
  AddThresholds(scenes);
  AddTrees(scenes);
  scenes.push_back(Chain("a chain", 0, RevokesNobody()));
  scenes.push_back(Chain("a chain to a revoked key", VESK2_ERR_CERT_REVOKED, RevokesSigner()));
  scenes.push_back(Chain("a revoked chain", VESK2_ERR_CERT_REVOKED,
                         RevocationList({Cert(RevocableLink())}, {"(1:x)"})));
  AddStores(scenes);
  return scenes;
}

}  // namespace vesk2test
