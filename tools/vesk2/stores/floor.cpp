// SPDX-License-Identifier: Apache-2.0
// floor.cpp: floor files.
#include "tools/vesk2/stores/floor.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <filesystem>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/hash.h>

namespace vesk2_command {
namespace {

constexpr std::string_view kHead = "vesk2-floor 1\ntag ";
constexpr std::string_view kTime = "\nsigned-at ";
constexpr size_t kDigest = 71;  // "sha256:" and 64 digits
constexpr size_t kStamp = 19;
constexpr size_t kLongest = 64 << 10;

[[noreturn]] void Broken(const std::string& path, const std::string& why) {
  throw FileTrouble(path, "the floor: " + why, "broken-floor");
}

// Whether nothing is at a path: a link that leads nowhere is something.
bool IsFree(const std::string& path) {
  struct stat status = {};
  if (lstat(path.c_str(), &status) == 0) return false;
  if (errno != ENOENT) Broken(path, std::strerror(errno));
  return true;
}

Ref<TimeStamp> StampOf(const std::string& path, const std::string& text) {
  Ref<TimeStamp> stamp(new TimeStamp(nullptr));
  if (text.size() != kStamp || stamp->Set(text.c_str(), false) != 0 || BytesOf(*stamp) != text) {
    Broken(path, "not a time: " + Escape(text));
  }
  return stamp;
}

std::string ReadText(const std::string& path) {
  try {
    return ReadFile(path, kLongest);
  } catch (const Trouble& trouble) {
    throw FileTrouble(path, std::string("the floor cannot be read: ") + trouble.what(),
                      "broken-floor");
  }
}

Floor Parse(const std::string& path, const std::string& text) {
  const size_t lineEnd = text.find('\n', kHead.size());
  const bool form = text.starts_with(kHead) && lineEnd != std::string::npos &&
                    lineEnd > kHead.size() + kDigest && text.find(kTime, lineEnd) == lineEnd &&
                    text.ends_with('\n') && text.size() == lineEnd + kTime.size() + kStamp + 1;
  if (!form) Broken(path, "not in the expected form; vesk2 floor set makes it anew");
  const std::string tag = text.substr(kHead.size(), lineEnd - kHead.size());
  if (!tag.starts_with("sha256:") || tag[kDigest] != ' ') Broken(path, "not about a tag");
  return {Escape(tag.substr(0, kDigest)), Escape(tag.substr(kDigest + 1)),
          StampOf(path, text.substr(lineEnd + kTime.size(), kStamp))};
}

}  // namespace

std::string FloorDirectory() {
  const StoreRoot root = HomeRoot(GetStoreOptions());
  if (root.path.empty()) {
    throw Trouble("there is no home store to remember a floor in: --home names one, or --floor",
                  "no-home-store");
  }
  return root.path + "/floor";
}

std::string FloorPath(SExpression& tag) {
  const std::string digest = Fingerprint(tag);
  return FloorDirectory() + "/" + digest.substr(digest.find(':') + 1) + ".floor";
}

std::optional<Floor> ReadFloor(const std::string& path, SExpression* tag) {
  if (IsFree(path)) return std::nullopt;
  Floor floor = Parse(path, ReadText(path));
  if (tag != nullptr && floor.digest != Fingerprint(*tag)) {
    Broken(path, "it is about another tag, " + floor.tag);
  }
  return floor;
}

FloorLock::FloorLock(const std::string& path) {
  const std::filesystem::path parent = std::filesystem::path(path).parent_path();
  const std::string home = HomeRoot(GetStoreOptions()).path;
  std::error_code error;
  if (!home.empty() && parent == std::filesystem::path(home + "/floor")) {
    std::filesystem::create_directories(parent, error);  // what fails is told by the next step
  }
  lock_.emplace(path);
}

void WriteFloor(const std::string& path, SExpression& tag, const TimeStamp& signedAt) {
  const Ref<TimeStamp> now = ParseTime("now", false);
  const std::string stamp(BytesOf(signedAt.IsAfter(now.get()) ? *now : signedAt));
  std::string text(kHead);
  text += Fingerprint(tag) + " " + TagText(&tag) + std::string(kTime) + stamp + "\n";
  WriteFile(path, text,
            {{.force = true},
             [&](const std::string& written) { (void)Parse(path, ReadText(written)); },
             ": the floor is " + stamp + " now"});
}

}  // namespace vesk2_command
