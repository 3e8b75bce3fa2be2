// tree_findings.cpp: what a verification found in a tree.
#include "tools/vesk2/tree/tree_findings.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/objects/manifest_file.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/tree/tree.h"

namespace vesk2_command {
namespace {

// "missing" covers all that could not be opened; a look at the disk tells more.
std::string WhyMissing(const std::string& path) {
  const std::string why = WhyUnreadable(path);
  return why == std::strerror(ENOENT) || why == "cannot be read" ? "" : " (" + why + ")";
}

// Why entries that count as changed were not compared.
std::map<std::string, std::string> Reasons(const ZvVesk2::Manifest& manifest) {
  std::map<std::string, std::string> reasons;
  for (const FileItem* entry = manifest.GetInvalid(); entry != nullptr; entry = entry->next) {
    const int code = manifest.GetReason(entry);
    if (code == VESK2_ERR_FILE_OPEN) reasons[entry->name] = "held by another process";
    if (code == VESK2_ERR_READ_FILE) reasons[entry->name] = "unreadable, or changed while read";
    if (code == VESK2_ERR_FIND_DIR) reasons[entry->name] = "missing, or cannot be listed";
  }
  return reasons;
}

// The name under which the manifest itself lies in the top directory; empty when it does not.
std::string OwnName(const TreeQuestion& question) {
  const std::filesystem::path path(question.manifest);
  std::error_code error;
  const auto parent = std::filesystem::canonical(
      path.has_parent_path() ? path.parent_path() : std::filesystem::path("."), error);
  if (error || parent != std::filesystem::path(RealDirectory(question.directory))) return "";
  return path.filename().string();
}

}  // namespace

std::vector<Finding> FindInTree(const ZvVesk2::Manifest& manifest, const TreeQuestion& question) {
  const std::set<std::string> parents = FoundParents(manifest);
  TreeNotes notes = InspectTree(*manifest.GetListing(), question.ignored);
  if (question.allowLinks) notes.leaving.clear();
  std::vector<Finding> findings = {
      {"changed", FoundNames(manifest.GetInvalid(), parents), Reasons(manifest)},
      {"missing", FoundNames(manifest.GetMissing(), parents), {}},
      {"link out of the tree", notes.leaving, {}},
  };
  if (question.allowExtra) return findings;
  std::vector<std::string> unlisted = FoundNames(manifest.GetExtra(), parents);
  const std::string own = OwnName(question);
  const std::string root = question.directory + (question.directory.ends_with('/') ? "" : "/");
  for (const std::string& name : notes.unlisted) {
    if (name != own) unlisted.push_back(root + name);
  }
  std::sort(unlisted.begin(), unlisted.end());
  findings.push_back({kUnlisted, std::move(unlisted), {}});
  return findings;
}

void PrintFindings(const std::vector<Finding>& findings) {
  for (const Finding& finding : findings) {
    const bool unreadable = std::string(finding.kind) == "missing";
    for (const std::string& entry : finding.entries) {
      const auto reason = finding.reasons.find(entry);
      const std::string why =
          reason != finding.reasons.end() ? " (" + reason->second + ")" : std::string();
      Note(std::string(finding.kind) + ": " + Escape(entry) +
           (unreadable ? WhyMissing(entry) : why));
    }
  }
}

std::string Summary(const std::vector<Finding>& findings) {
  std::string text;
  for (const Finding& finding : findings) {
    if (finding.entries.empty()) continue;
    text +=
        (text.empty() ? "" : ", ") + std::to_string(finding.entries.size()) + " " + finding.kind;
  }
  return text;
}

bool Found(const std::vector<Finding>& findings, const std::string& kind) {
  return std::any_of(findings.begin(), findings.end(), [&](const Finding& finding) {
    return finding.kind == kind && !finding.entries.empty();
  });
}

}  // namespace vesk2_command
