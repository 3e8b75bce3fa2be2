// SPDX-License-Identifier: Apache-2.0
// Making and verifying trees.
#include "bench/tree.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#include <vesk2.h>
#include <vesk2/manifest.h>

#include <map>
#include <memory>
#include <thread>
#include <utility>

#include "tests/support/test_manifest.h"

namespace bench {
namespace {

constexpr size_t kFilesOfDirectory = 100;

std::string Numbered(char kind, size_t number) {
  std::string digits = std::to_string(number);
  digits.insert(0, 7 - digits.size(), '0');
  return kind + digits;
}

std::string Hex(const floor::Digest& digest) {
  std::string text;
  for (const unsigned byte : digest) {
    for (const unsigned half : {byte >> 4, byte & 15}) text += "0123456789abcdef"[half];
  }
  return text;
}

void WriteIn(int directory, const std::string& name, const std::string& contents) {
  const int fd = openat(directory, name.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0600);
  [[maybe_unused]] const ssize_t written = write(fd, contents.data(), contents.size());
  close(fd);
}

}  // namespace

Tree::Tree(size_t count, size_t size)
    : files(count),
      bytes(size),
      place(("tree-" + std::to_string(count) + "-" + std::to_string(bytes)).c_str()),
      root(place.Path() + "/tree") {
  mkdir(root.c_str(), 0700);
  floor::Sha256 hash;
  std::string contents(bytes, 'x');
  std::string body;
  for (size_t made = 0; made < files;) {
    const std::string name = Numbered('d', listed.size());
    listed.push_back({root + "/" + name, {}});
    mkdir(listed.back().path.c_str(), 0700);
    const int directory = open(listed.back().path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    std::string entries;
    for (size_t i = 0; i < kFilesOfDirectory && made < files; ++i, ++made) {
      const std::string file = Numbered('f', made);
      contents.replace(0, file.size(), file);
      WriteIn(directory, file, contents);
      hash.Start();
      hash.Add(contents.data(), contents.size());
      listed.back().files.push_back({file, hash.End()});
      entries += vesk2test::FileEntry(file, contents);
    }
    close(directory);
    body += vesk2test::DirEntry(name, entries);
  }
  vesk2test::ManifestText text;
  text.signer.tag = vesk2test::Tag("(install)");
  text.chain = vesk2test::Signed({.issuer = vesk2test::TestKey::Rsa(0).Public(),
                                  .subject = vesk2test::TestKey::Rsa(1).Public(),
                                  .tag = vesk2test::Tag("(install)"),
                                  .propagate = true},
                                 vesk2test::TestKey::Rsa(0));
  text.body = vesk2test::Body(body);
  manifest = place.Write("manifest", vesk2test::ManifestFile(text));
  mkdir((place.Path() + "/acl").c_str(), 0700);
  place.Write("acl/vendor.acl", vesk2test::AclEntryText(vesk2test::TestKey::Rsa(0).Public(),
                                                        vesk2test::Tag("(install)")));
}

namespace {

// As many threads as it is told, the caller's included.
void RunOnThreads(void* user, void (*task)(void*), void* work) {
  std::vector<std::thread> threads(*static_cast<unsigned*>(user) - 1);
  for (std::thread& thread : threads) thread = std::thread(task, work);
  task(work);
  for (std::thread& thread : threads) thread.join();
}

}  // namespace

bool Tree::Verify(unsigned jobs) const {
  Vesk2GlobalDirectory(place.Path().c_str());
  Manifest* made = nullptr;
  if (CreateManifestContext(&made, root.c_str(), manifest.c_str(), "(install)") != 0) return false;
  const std::unique_ptr<Manifest, void (*)(Manifest*)> owner(made, DeleteManifestContext);
  FailOnExtraEntries(made);
  const ZvVesk2::Vesk2TaskRunner runner = {&jobs, RunOnThreads};
  made->SetTaskRunner(jobs > 1 ? &runner : nullptr);
  return VerifyManifest(made, 0, 0) == 0;
}

std::vector<std::string> Tree::Command() const {
  // On one thread, as what it is compared with.
  return {VESK2_COMMAND, "manifest", "verify",   root,         manifest, "--tag",     "(install)",
          "--jobs",      "1",        "--global", place.Path(), "--home", place.Path()};
}

std::string Tree::SumList() const {
  std::string text;
  for (const floor::ListedDirectory& directory : listed) {
    for (const floor::ListedFile& file : directory.files) {
      text += Hex(file.digest) + "  " + directory.path + "/" + file.name + "\n";
    }
  }
  return place.Write("sums", text);
}

std::string Tree::MtreeList() const {
  std::string text = ". type=dir\n";
  for (const floor::ListedDirectory& directory : listed) {
    const std::string inside = "./" + directory.path.substr(root.size() + 1);
    text += inside + " type=dir\n";
    for (const floor::ListedFile& file : directory.files) {
      text += inside + "/" + file.name + " type=file size=" + std::to_string(bytes) +
              " sha256=" + Hex(file.digest) + "\n";
    }
  }
  return place.Write("mtree", text);
}

const Tree& TheTree(size_t files, size_t bytes) {
  static std::map<std::pair<size_t, size_t>, std::unique_ptr<Tree>> trees;
  std::unique_ptr<Tree>& tree = trees[{files, bytes}];
  if (tree == nullptr) tree = std::make_unique<Tree>(files, bytes);
  return *tree;
}

}  // namespace bench
