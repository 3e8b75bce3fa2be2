// SPDX-License-Identifier: Apache-2.0
// manifest_show.cpp: vesk2 manifest show.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"
#include "tools/vesk2/commands/signer_chains.h"
#include "tools/vesk2/explain/approvals.h"

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
    std::string row(kDigits, '-');
    row += "  " + path + "/";
    sheet.AddPart("entries", row, std::move(entry));
    AddEntries(sheet, subdirectory);
  }
}

// Has the stores of this machine looked at too; false where nothing is trusted.
bool LoadStores(ZvVesk2::Evidence& evidence) {
  Ref<SExpression> entries;
  const int code = ZvVesk2::AclEntry::Import(entries.Out(), nullptr, nullptr);
  if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
  if (code != 0) return false;
  evidence.SetEntries(entries.get());
  const Ref<SExpression> carried = Ref<SExpression>::Share(evidence.GetCarriedLists());
  Ref<SExpression> stored;
  Check(ZvVesk2::CrlSequence::ImportStore(stored.Out(), entries.get(), nullptr),
        "the store of revocation lists");
  evidence.SetLists(stored.get(), carried.get());
  evidence.SetRevocationTime(ParseTime("now", false).get());
  Check(evidence.MarkRevoked(), "judging revocation");
  return true;
}

void AddKeys(Sheet& part, const std::string& row, const std::vector<std::string>& keys) {
  for (const std::string& key : keys) part.AddRow(row, key);
}

// Who certifies the content, and for the entries of this machine that want several keys which of
// them have approved.
void AddApprovals(Sheet& sheet, const std::string& path, const SignatureBlock& block) {
  Json approvers = Json::array();
  for (const SignedCert& each : block.certs) {
    if (!IsForContent(block, *each.cert)) continue;
    approvers.push_back(SubjectText(*each.cert->GetIssuer()));
    sheet.AddRow(approvers.size() == 1 ? "signed by" : "approved by", approvers.back());
  }
  sheet.AddMember("approved_by", approvers);
  if (!LoadStores(*block.proved)) return sheet.AddMember("approvals", Json());
  sheet.StartList("approvals");
  Question question;
  question.file = path;
  question.manifest = true;
  question.proved = block.proved.get();
  const Evidence evidence = GatherEvidence(question);
  for (const Approvals& each : FindApprovals(question, evidence)) {
    Sheet part("approvals");
    part.SetMembers(ApprovalsJson(each));
    AddKeys(part, "approved", each.approved);
    AddKeys(part, "would count", each.awaited);
    AddKeys(part, "revoked", each.revoked);
    sheet.AddPart("approvals",
                  EntryName(*each.entry) + " wants " + std::to_string(each.k) + " of " +
                      Plural(each.n, "key") + " for " + TagText(each.entry->entry->GetTag()) +
                      (each.Missing() > 0 ? ", missing: " + std::to_string(each.Missing()) : ""),
                  std::move(part));
  }
}

ExitCode Run(const Options& options) {
  const SignatureBlock block = ReadSignatureBlock(options.file);
  if (block.listing == nullptr) Malformed(options.file, block.position, "manifest", block.code);
  Sheet sheet = DescribeManifest(block, block.code);
  if (block.code == 0) AddApprovals(sheet, options.file, block);
  sheet.Add("size", block.position, std::to_string(block.position) + " bytes");
  if (options.entries) {
    sheet.StartList("entries");
    AddEntries(sheet, *block.listing);
  }
  Present(sheet);
  return kYes;
}

}  // namespace

Action DefineManifestShow(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("file", options->file, "A manifest file").Required();
  list.Add("--files", options->entries, "List the entries, files with their SHA-256");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
