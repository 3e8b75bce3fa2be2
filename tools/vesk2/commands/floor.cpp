// SPDX-License-Identifier: Apache-2.0
// floor.cpp: vesk2 floor show, set and reset.
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/objects/shapes.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/floor.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string tag;
  std::string file;
  std::string time;
  bool force = false;
};

void Tell(const std::string& path, const Floor& floor) {
  Say(StampText(*floor.signedAt) + "  " + floor.tag + "  " + Escape(path));
  Result()["floors"].push_back({{"file", Escape(path)},
                                {"tag", floor.tag},
                                {"tag_digest", floor.digest},
                                {"signed_at", StampJson(floor.signedAt.get())}});
}

ExitCode NoFloor(const std::string& path) {
  return No("no-floor", Escape(path) + ": there is no floor");
}

// The floor that --floor or --tag names.
std::string PathOf(const Options& options, const Ref<SExpression>& tag) {
  if (!options.file.empty()) return options.file;
  if (!tag) throw Trouble("which floor? --tag or --floor names it", "usage");
  return FloorPath(*tag);
}

Ref<SExpression> TagOf(const Options& options) {
  return options.tag.empty() ? Ref<SExpression>() : ParseTypedTag(options.tag);
}

ExitCode Show(const Options& options) {
  Result()["floors"] = Json::array();
  const Ref<SExpression> tag = TagOf(options);
  if (tag || !options.file.empty()) {
    const std::string path = PathOf(options, tag);
    const std::optional<Floor> floor = ReadFloor(path, tag.get());
    if (!floor) return NoFloor(path);
    Tell(path, *floor);
    return kYes;
  }
  const std::string directory = FloorDirectory();
  const std::vector<std::string> paths = StoreFilesOf(directory, ".floor");
  for (const std::string& path : paths) {
    if (const std::optional<Floor> floor = ReadFloor(path, nullptr)) Tell(path, *floor);
  }
  if (paths.empty()) Note("no floor in " + Escape(directory));
  return kYes;
}

// Lowering it lets what is old pass again.
void RefuseLower(const Options& options, const std::string& path, SExpression& tag,
                 const TimeStamp& time) {
  if (options.force) return;
  const std::optional<Floor> floor = ReadFloor(path, &tag);
  if (!floor || !time.IsBefore(floor->signedAt.get())) return;
  throw FileTrouble(path, "the floor is " + StampText(*floor->signedAt) + "; --force lowers it",
                    "exists");
}

ExitCode Set(const Options& options) {
  const Ref<SExpression> tag = ParseTypedTag(options.tag);
  const Ref<TimeStamp> time = ParseTime(options.time, false);
  if (time->IsAfter(ParseTime("now", false).get())) {
    throw Trouble(StampText(*time) + " is yet to come: no floor lies past the present", "usage");
  }
  const std::string path = PathOf(options, tag);
  const FloorLock lock(path);
  RefuseLower(options, path, *tag, *time);
  WriteFloor(path, *tag, *time);
  return kYes;
}

ExitCode Reset(const Options& options) {
  const std::string path = PathOf(options, TagOf(options));
  if (access(path.c_str(), F_OK) != 0 && errno == ENOENT) return NoFloor(path);
  const FloorLock lock(path);
  if (unlink(path.c_str()) == 0) {
    Note("removed " + Escape(path));
    return kYes;
  }
  if (errno != ENOENT) throw FileTrouble(path, std::strerror(errno), "io");
  return NoFloor(path);
}

std::shared_ptr<Options> AddWhich(OptionList& list, bool tagRequired) {
  auto options = std::make_shared<Options>();
  list.Add("--tag", options->tag, "The tag, as it is asked for").Required(tagRequired);
  list.Add("--floor", options->file, "This file [the floor that --remember keeps]");
  return options;
}

}  // namespace

Action DefineFloorShow(OptionList& list) {
  const auto options = AddWhich(list, false);
  list.Footer("Without --tag and --floor all that --remember keeps.");
  return [options] { return Show(*options); };
}

Action DefineFloorSet(OptionList& list) {
  const auto options = AddWhich(list, true);
  list.Add("time", options->time, "What was signed before is refused; UTC, or \"now\"").Required();
  list.Add("-f,--force", options->force, "Lower it, or replace a file that is none");
  return [options] { return Set(*options); };
}

Action DefineFloorReset(OptionList& list) {
  const auto options = AddWhich(list, false);
  return [options] { return Reset(*options); };
}

}  // namespace vesk2_command
