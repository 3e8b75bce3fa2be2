// SPDX-License-Identifier: Apache-2.0
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

constexpr size_t kTold = 20;  // notes of a kind, for a person at a terminal

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
  if (question.manifest == kStandard) return "";  // a file of that name is another one
  const std::filesystem::path path(question.manifest);
  std::error_code error;
  const auto parent = std::filesystem::canonical(
      path.has_parent_path() ? path.parent_path() : std::filesystem::path("."), error);
  if (error || parent != std::filesystem::path(RealDirectory(question.directory))) return "";
  return path.filename().string();
}

// Why an entry was not compared; empty for one that was, or is simply not there. "missing" covers
// all that could not be opened: a look at the disk tells more.
std::string Why(const Finding& finding, const std::string& entry) {
  const auto reason = finding.reasons.find(entry);
  if (reason != finding.reasons.end()) return reason->second;
  if (std::string_view(finding.member) != "missing") return "";
  const std::string why = WhyUnreadable(entry);
  return why == std::strerror(ENOENT) || why == "cannot be read" ? "" : why;
}

size_t CountListed(ZvVesk2::BodyDirectory& directory) {
  size_t count = directory.GetFiles().GetCount();
  auto& below = directory.GetSubdirectories();
  for (uint32_t i = 0; i < below.GetCount(); ++i) {
    count += CountListed(static_cast<ZvVesk2::BodyDirectory&>(*below.at(i)));
  }
  return count;
}

// The outermost directory above an entry that is not there; empty when all are.
class GoneDirectories {
 public:
  std::string Above(const std::string& entry) {
    for (size_t at = entry.find('/', 1); at != std::string::npos; at = entry.find('/', at + 1)) {
      const std::string directory = entry.substr(0, at);
      const auto [known, isNew] = gone_.try_emplace(directory, false);
      std::error_code error;
      if (isNew) {
        known->second = std::filesystem::symlink_status(directory, error).type() ==
                        std::filesystem::file_type::not_found;
      }
      if (known->second) return directory;
    }
    return "";
  }

 private:
  std::map<std::string, bool> gone_;
};

// What is told of: the missing entries, those of one missing directory together.
struct Told {
  std::string path;
  std::vector<std::string> entries;
};
std::vector<Told> Group(const Finding& finding) {
  std::vector<Told> groups;
  std::map<std::string, size_t> places;
  GoneDirectories gone;
  const bool missing = std::string_view(finding.member) == "missing";
  for (const std::string& entry : finding.entries) {
    const std::string above = missing ? gone.Above(entry) : "";
    const auto [place, isNew] = places.try_emplace(above.empty() ? entry : above, groups.size());
    if (isNew) groups.push_back({place->first, {}});
    groups[place->second].entries.push_back(entry);
  }
  return groups;
}

void Print(const Finding& finding, size_t limit) {
  const std::vector<Told> groups = Group(finding);
  for (size_t i = 0; i < std::min(groups.size(), limit); ++i) {
    const size_t count = groups[i].entries.size();
    const std::string& entry = groups[i].entries[0];
    const std::string why = Why(finding, entry);
    Note(std::string(finding.kind) + ": " +
         (count > 1 ? Escape(groups[i].path) + ", with all its " + Plural(count, "entry")
                    : Escape(entry) + (why.empty() ? "" : " (" + why + ")")));
  }
  if (groups.size() > limit) {
    Note("and " + std::to_string(groups.size() - limit) + " more " + finding.kind + " (--all)");
  }
}

}  // namespace

std::vector<Finding> FindInTree(const ZvVesk2::Manifest& manifest, const TreeQuestion& question) {
  const std::set<std::string> parents = FoundParents(manifest);
  TreeNotes notes = InspectTree(*manifest.GetListing(), question.ignored);
  if (question.allowLinks) notes.leaving.clear();
  std::vector<Finding> findings = {
      {"changed", "changed", FoundNames(manifest.GetInvalid(), parents), Reasons(manifest)},
      {"missing", "missing", FoundNames(manifest.GetMissing(), parents), {}},
      {"link out of the tree", "links_out", notes.leaving, {}},
  };
  if (question.allowExtra) {
    findings.push_back({kUnlisted, "unlisted", {}, {}});
    return findings;
  }
  std::vector<std::string> unlisted = FoundNames(manifest.GetExtra(), parents);
  const std::string own = OwnName(question);
  const std::string root = question.directory + (question.directory.ends_with('/') ? "" : "/");
  for (const std::string& name : notes.unlisted) {
    if (name != own) unlisted.push_back(root + name);
  }
  std::sort(unlisted.begin(), unlisted.end());
  findings.push_back({kUnlisted, "unlisted", std::move(unlisted), {}});
  return findings;
}

void TellFindings(const std::vector<Finding>& findings, const TreeQuestion& question,
                  const ZvVesk2::Manifest& manifest) {
  Json& result = Result();
  Json counts = {{"listed", CountListed(*manifest.GetListing())},
                 {"valid", CountFiles(manifest.GetValid())}};
  for (const Finding& finding : findings) {
    counts[finding.member] = finding.entries.size();
    Json& told = result[finding.member] = Json::array();
    for (const std::string& entry : finding.entries) {
      told.push_back({{"path", Escape(entry)}, {"why", OrNull(Why(finding, entry))}});
    }
    const bool brief = GetStyle().brief && !question.all;
    if (!GetStyle().json) Print(finding, brief ? kTold : finding.entries.size());
  }
  counts["ignored"] = question.ignored.size();
  result["ignored"] = IgnoredJson(question.ignored);
  result["counts"] = counts;
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
