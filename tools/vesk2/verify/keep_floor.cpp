// SPDX-License-Identifier: Apache-2.0
// keep_floor.cpp: comparing with a floor, and raising it.
#include "tools/vesk2/verify/keep_floor.h"

#include "tools/vesk2/objects/shapes.h"

namespace vesk2_command {

void AddFloorOptions(OptionList& list, FloorOptions& options) {
  Option& file = list.Add("--floor", options.file,
                          "Refuse what was signed before the time in this file; a yes raises it");
  list.Add("--remember", options.remember, "The same, with the floor kept for the tag in --home")
      .Excludes(file);
}

KeepFloor::KeepFloor(const FloorOptions& options, SExpression& tag, bool raises)
    : tag_(tag), path_(options.remember ? FloorPath(tag) : options.file), raises_(raises) {
  Result()["floor"] = Json();
}

std::optional<ExitCode> KeepFloor::Refuse(const TimeStamp& signedAt) {
  if (path_.empty()) return std::nullopt;
  const std::optional<Floor> floor = ReadFloor(path_, &tag_);
  const TimeStamp* const lowest = floor ? floor->signedAt.get() : nullptr;
  Result()["floor"] = {
      {"file", Escape(path_)}, {"signed_at", StampJson(lowest)}, {"raised_to", Json()}};
  if (lowest == nullptr || !signedAt.IsBefore(lowest)) return std::nullopt;
  return RefuseOlder(signedAt, *lowest);
}

std::optional<ExitCode> KeepFloor::Raise(const TimeStamp& signedAt,
                                         const std::function<void()>& accept) {
  if (path_.empty() || !raises_) {
    if (accept) accept();
    return std::nullopt;
  }
  // Bytes that are no time would be no floor.
  if (BytesOf(*ParseTime(StampText(signedAt), false)) != BytesOf(signedAt)) {
    throw Trouble("the manifest's time of signing is none: " + StampText(signedAt));
  }
  const FloorLock lock(path_);
  const std::optional<Floor> floor = ReadFloor(path_, &tag_);
  const TimeStamp* const lowest = floor ? floor->signedAt.get() : nullptr;
  if (lowest != nullptr && signedAt.IsBefore(lowest)) return RefuseOlder(signedAt, *lowest);
  if (accept) accept();
  if (lowest != nullptr && !signedAt.IsAfter(lowest)) return std::nullopt;
  WriteFloor(path_, tag_, signedAt);
  Result()["floor"]["raised_to"] = StampJson(ReadFloor(path_, &tag_)->signedAt.get());
  return std::nullopt;
}

ExitCode KeepFloor::RefuseOlder(const TimeStamp& signedAt, const TimeStamp& floor) const {
  return No("older-than-floor", "the manifest says it was signed at " + StampText(signedAt) +
                                    ", before " + StampText(floor) +
                                    ", which was accepted already (" + Escape(path_) + ")");
}

}  // namespace vesk2_command
