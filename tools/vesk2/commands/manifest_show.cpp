// SPDX-License-Identifier: Apache-2.0
// manifest_show.cpp: vesk2 manifest show.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"

namespace vesk2_command {
namespace {

using ZvVesk2::BodyDirectory;
using ZvVesk2::BodyFile;

struct Options {
  std::string file;
  bool entries = false;
};

void AddFile(Sheet& sheet, const std::string& path, const BodyFile& file) {
  const std::string digest =
      Hex({reinterpret_cast<const char*>(file.GetHash()), file.GetHashLength()});
  Sheet entry("file");
  entry.AddMember("path", path);
  entry.AddMember("digest", "sha256:" + digest);
  sheet.AddPart("entries", digest + "  " + path, std::move(entry));
}

// The entries below a directory, whose name is the path from the root; the root has none.
void AddEntries(Sheet& sheet, BodyDirectory& directory) {
  const std::string prefix =
      directory.GetName() != nullptr ? std::string(directory.GetName()) + "/" : "";
  auto& files = directory.GetFiles();
  for (uint32_t i = 0; i < files.GetCount(); ++i) {
    const auto& file = static_cast<BodyFile&>(*files.at(i));
    AddFile(sheet, Escape(prefix + file.GetName()), file);
  }
  auto& subdirectories = directory.GetSubdirectories();
  for (uint32_t i = 0; i < subdirectories.GetCount(); ++i) {
    auto& subdirectory = static_cast<BodyDirectory&>(*subdirectories.at(i));
    const std::string path = Escape(subdirectory.GetName());
    Sheet entry("directory");
    entry.AddMember("path", path);
    constexpr size_t kDigits = 64;
    sheet.AddPart("entries", std::string(kDigits, '-') + "  " + path + "/", std::move(entry));
    AddEntries(sheet, subdirectory);
  }
}

ExitCode Run(const Options& options) {
  const SignatureBlock block = ReadSignatureBlock(options.file);
  if (block.listing == nullptr) Malformed(options.file, block.position, "manifest", block.code);
  Sheet sheet = DescribeManifest(block, block.code);
  sheet.Add("size", block.position, std::to_string(block.position) + " bytes");
  if (options.entries) {
    sheet.StartList("entries");
    AddEntries(sheet, *block.listing);
  }
  Present(sheet);
  return kYes;
}

}  // namespace

Action DefineManifestShow(CLI::App& app) {
  auto options = std::make_shared<Options>();
  app.add_option("file", options->file, "A manifest file")->required();
  app.add_flag("--files", options->entries, "List the entries, files with their SHA-256");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
