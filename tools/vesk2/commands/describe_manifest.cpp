// SPDX-License-Identifier: Apache-2.0
// describe_manifest.cpp: what a manifest says, but for its single entries.
#include "tools/vesk2/commands/describe.h"

namespace vesk2_command {
namespace {

using ZvVesk2::BodyDirectory;

struct Counts {
  uint64_t files = 0;
  uint64_t directories = 0;
};

void Count(BodyDirectory& directory, Counts& counts) {
  auto& subdirectories = directory.GetSubdirectories();
  counts.files += directory.GetFiles().GetCount();
  counts.directories += subdirectories.GetCount();
  for (uint32_t i = 0; i < subdirectories.GetCount(); ++i) {
    Count(static_cast<BodyDirectory&>(*subdirectories.at(i)), counts);
  }
}

}  // namespace

Sheet DescribeManifest(const SignatureBlock& block, int code) {
  Sheet sheet("manifest");
  sheet.Add("version", Escape(BytesOf(*block.version)));
  sheet.Add("made by", Escape(BytesOf(*block.creator)));
  sheet.Add("type", Escape(BytesOf(*block.type)));
  sheet.Add("signed at", StampText(*block.signedAt));
  sheet.StartList("certificates");
  for (size_t i = 0; i < block.certs.size(); ++i) {
    Sheet part = DescribeCert(*block.certs[i].cert, block.certs[i].signature.get());
    part.AddMember("certificate", i + 1);
    sheet.AddPart("certificates", "certificate", i, block.certs.size(), std::move(part));
  }
  sheet.StartList("revocation_lists");
  for (size_t i = 0; i < block.crls.size(); ++i) {
    sheet.AddPart("revocation_lists", "revocation list", i, block.crls.size(),
                  DescribeCrl(*block.crls[i]));
  }
  Counts counts;
  Count(*block.listing, counts);
  sheet.Add("files", counts.files, std::to_string(counts.files));
  sheet.Add("directories", counts.directories, std::to_string(counts.directories));
  AddSignature(sheet, code);
  return sheet;
}

}  // namespace vesk2_command
