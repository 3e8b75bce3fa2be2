// SPDX-License-Identifier: Apache-2.0
// portable.cpp: what keeps a name from travelling: other systems refuse characters that ours takes,
// fold case, or cut blanks; archives and transports do so on the way.
#include "tools/vesk2/tree/portable.h"

#include <cctype>

#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

// A path this long leaves little room for the directory that it will be unpacked into.
constexpr size_t kLongPath = 3840;

bool HasControl(const std::string& name) {
  for (const char c : name) {
    if (static_cast<unsigned char>(c) < 0x20 || c == 0x7f) return true;
  }
  return false;
}

std::string Folded(std::string name) {
  for (char& c : name) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  return name;
}

const char* RemarkOn(const std::string& name) {
  if (HasControl(name)) return "control characters in the name";
  if (name.find('\\') != std::string::npos) return "a backslash in the name";
  if (Escape(name) != name) return "a name that is no plain UTF-8 text";
  if (name.find_first_of("<>:\"|?*") != std::string::npos) return "one of <>:\"|?* in the name";
  if (name.ends_with('.') || name.ends_with(' ')) return "a name that ends in a dot or blank";
  return nullptr;
}

}  // namespace

void RemarkOnNames(const std::string& directory, const std::vector<Name>& names, Remarks& remarks) {
  const std::string head = directory.empty() ? "" : directory + "/";
  std::map<std::string, std::string> folded;
  for (const auto& [name, maybeLink] : names) {
    const std::string path = head + name;
    if (const char* remark = RemarkOn(name)) remarks[remark].push_back(path);
    if (path.size() > kLongPath) remarks["a path so long that it hardly fits"].push_back(path);
    const auto [twin, fresh] = folded.emplace(Folded(name), path);
    if (fresh) continue;
    auto& twins = remarks["names that differ only in case"];
    twins.insert(twins.end(), {twin->second, path});
  }
}

void NoteRemarks(const Remarks& remarks) {
  constexpr size_t kShown = 5;
  for (const auto& [remark, paths] : remarks) {
    std::string text = "warning: " + remark + ":";
    for (size_t i = 0; i < paths.size() && i < kShown; ++i) {
      text += (i > 0 ? ", " : " ") + Escape(paths[i]);
    }
    if (paths.size() > kShown) text += " and " + std::to_string(paths.size() - kShown) + " more";
    Note(text);
    Json names = Json::array();
    for (const std::string& path : paths) names.push_back(Escape(path));
    Result()["warnings"].push_back({{"remark", remark}, {"paths", names}});
  }
}

}  // namespace vesk2_command
