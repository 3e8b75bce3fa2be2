// SPDX-License-Identifier: Apache-2.0
// key_names.cpp: the file of the pet names.
#include "tools/vesk2/stores/key_names.h"

#include <sys/stat.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <set>

#include "tools/vesk2/files/descriptor.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/file_lock.h"

namespace vesk2_command {
namespace {

constexpr std::string_view kHead = "vesk2-names 1\n";
constexpr size_t kFingerprint = 71;  // "sha256:" and 64 digits
constexpr size_t kLongestFile = 4 << 20;
constexpr size_t kLongestName = 64;

[[noreturn]] void Broken(const std::string& path, const std::string& why) {
  throw FileTrouble(path, "the names of keys: " + why, "malformed");
}

KeyNames Parse(const std::string& path, const std::string& text) {
  if (!text.starts_with(kHead) || !text.ends_with('\n')) Broken(path, "not in the expected form");
  KeyNames names;
  std::set<std::string> seen;
  for (size_t at = kHead.size(); at < text.size();) {
    const std::string line = text.substr(at, text.find('\n', at) - at);
    at += line.size() + 1;
    const std::string name = line.size() > kFingerprint ? line.substr(kFingerprint + 1) : "";
    const std::string fingerprint = line.substr(0, kFingerprint);
    if (!IsFingerprint(fingerprint) || line[kFingerprint] != ' ' || !WhyNoName(name).empty()) {
      Broken(path, "not a fingerprint and a name: " + Escape(line));
    }
    if (!seen.insert(name).second || !names.emplace(fingerprint, name).second) {
      Broken(path, "one key, or one name, twice: " + Escape(line));
    }
  }
  return names;
}

std::string TextOf(const KeyNames& names) {
  std::string text(kHead);
  for (const auto& [fingerprint, name] : names) text += fingerprint + " " + name + "\n";
  return text;
}

// A long row of hexadecimal digits looks like a part of a fingerprint.
bool HasManyDigits(const std::string& text) {
  constexpr size_t kMany = 16;
  size_t digits = 0;
  for (const char c : text) {
    digits = std::isxdigit(static_cast<unsigned char>(c)) != 0 ? digits + 1 : 0;
    if (digits == kMany) return true;
  }
  return false;
}

}  // namespace

std::string WhyNoName(const std::string& text) {
  if (text.empty()) return "a name has at least one character";
  if (text.size() > kLongestName) return "a name has at most 64 bytes";
  if (Escape(text) != text) return "a name has no control characters and no backslash";
  if (text.front() == ' ' || text.back() == ' ') return "a name does not begin or end with a blank";
  if (text.find("sha256:") != std::string::npos || HasManyDigits(text)) {
    return "it could be taken for a fingerprint";
  }
  return "";
}

std::string NamesPath() {
  const std::string home = HomeRoot(GetStoreOptions()).path;
  return home.empty() ? "" : home + "/names";
}

KeyNames ReadNames() {
  const std::string path = NamesPath();
  struct stat status = {};
  if (path.empty() || (lstat(path.c_str(), &status) != 0 && IsNothing(errno))) return {};
  return Parse(path, ReadFile(path, kLongestFile));
}

void ChangeNames(const std::function<void(KeyNames&)>& change) {
  const std::string path = NamesPath();
  if (path.empty()) {
    throw Trouble("there is no home store to keep names in: --home names one", "no-home-store");
  }
  std::error_code error;  // what fails is told by the next step
  std::filesystem::create_directories(std::filesystem::path(path).parent_path(), error);
  const FileLock lock(path);
  KeyNames names = ReadNames();
  change(names);
  WriteFile(path, TextOf(names), {{.force = true}, [&](const std::string& written) {
                                    (void)Parse(path, ReadFile(written, kLongestFile));
                                  }});
}

}  // namespace vesk2_command
