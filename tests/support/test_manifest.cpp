// SPDX-License-Identifier: Apache-2.0
// Manifest text for tests: string work over the other writers.
#include "tests/support/test_manifest.h"

#include <filesystem>
#include <fstream>
#include <iterator>
#include <set>

namespace vesk2test {
namespace {

namespace fs = std::filesystem;

std::string Contents(const fs::path& path) {
  std::ifstream in(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
}

std::string EntriesOf(const fs::path& directory) {
  const std::set<fs::path> paths{fs::directory_iterator(directory), fs::directory_iterator()};
  std::string entries;
  for (const fs::path& path : paths) {
    const std::string name = path.filename().string();
    entries +=
        fs::is_directory(path) ? DirEntry(name, EntriesOf(path)) : FileEntry(name, Contents(path));
  }
  return entries;
}

}  // namespace

std::string FileEntry(const std::string& name, const std::string& contents) {
  return List({Str("file"), Str(name), Str("-"), Str(Digest(contents))});
}

std::string DirEntry(const std::string& name, const std::string& entries) {
  return List({Str("dir"), Str(name), Str("-"), entries});
}

std::string Body(const std::string& entries) {
  return List({Str("body"), List({Str("random-token"), Str("tokn")}), entries});
}

std::string BodyOf(const std::string& directory) { return Body(EntriesOf(directory)); }

std::string Signed(const CertText& cert, const TestKey& issuer) {
  const std::string text = Cert(cert);
  return text + issuer.Sign(text);
}

std::string ManifestFile(ManifestText parts) {
  const std::string version = List({Str("version"), Str(parts.version), Str("text")});
  const std::string type = List({Str("type"), Str(parts.type)});
  const std::string time = List({Str("time-of-signing"), Str(parts.signingTime)});
  CertText& signer = parts.signer;
  if (signer.issuer.empty()) signer.issuer = parts.key->Public();
  if (signer.subject.empty()) {
    signer.subject = HashOf(version + type + time + parts.body, parts.hash);
  }
  const std::string block = time + Signed(signer, *parts.key) + parts.chain;
  return List({Str("manifest"), version, type, List({Str("signature-block"), block}),
               List({Str("crl"), parts.lists}), parts.body});
}

}  // namespace vesk2test
