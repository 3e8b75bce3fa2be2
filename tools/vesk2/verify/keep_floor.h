// SPDX-License-Identifier: Apache-2.0
// keep_floor.h: never an older manifest than the last one that was accepted.
//
// The time of signing is the signer's word: who may sign can also write any time that is not yet to
// come. A floor keeps old releases out that were genuine once, whoever brings them.
#ifndef VESK2_TOOLS_KEEP_FLOOR_H
#define VESK2_TOOLS_KEEP_FLOOR_H

#include <functional>
#include <optional>
#include <string>

#include "tools/vesk2/options/options.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/floor.h"

namespace vesk2_command {

struct FloorOptions {
  std::string file;
  bool remember = false;
};
void AddFloorOptions(OptionList& list, FloorOptions& options);

class KeepFloor {
 public:
  // A floor for `tag`; `raises` unless the question is about another moment than now.
  KeepFloor(const FloorOptions& options, SExpression& tag, bool raises);

  // The no for a manifest that is older than the floor; nothing for one that is not, and where no
  // floor was asked for.
  std::optional<ExitCode> Refuse(const TimeStamp& signedAt);
  // Raises the floor to what is about to be accepted. It is a no where somebody has raised it
  // further since. `accept` is what there is to do about it, between the two: of all who accept
  // something at once under one floor, the newest is the last.
  std::optional<ExitCode> Raise(const TimeStamp& signedAt,
                                const std::function<void()>& accept = nullptr);

 private:
  ExitCode RefuseOlder(const TimeStamp& signedAt, const TimeStamp& floor) const;

  SExpression& tag_;
  std::string path_;  // empty: no floor is asked for
  bool raises_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_KEEP_FLOOR_H
