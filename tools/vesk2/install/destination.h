// SPDX-License-Identifier: Apache-2.0
// destination.h: the name that is installed at. Killed at any moment, what stands there is what
// stood there before, or the whole installation.
#ifndef VESK2_TOOLS_DESTINATION_H
#define VESK2_TOOLS_DESTINATION_H

#include <string>

#include "tools/vesk2/files/descriptor.h"
#include "tools/vesk2/install/stage.h"
#include "tools/vesk2/options/options.h"

namespace vesk2_command {

struct DestinationOptions {
  bool replace = false;
  std::string keepOld;  // the name beside it that the old one gets
};
void AddDestinationOptions(OptionList& list, DestinationOptions& options);

class Destination {
 public:
  // Trouble when something is there that is not to be replaced, or is no directory.
  Destination(const std::string& path, const DestinationOptions& options);
  // Removes the old one, if that is still to be done.
  ~Destination();
  Destination(const Destination&) = delete;
  Destination& operator=(const Destination&) = delete;

  int parent() const { return parent_.get(); }
  // The path of the directory that it is in, empty for the current one.
  const std::string& above() const { return above_; }
  const std::string& name() const { return name_; }
  // What becomes of the old one: its path when it is kept, else empty.
  std::string KeptOld() const;

  // Put gives a finished stage the name, in one step. Trouble, with what was there as it was; or,
  // when the disk does not confirm it, with the installation in its place.
  void Put(Stage& stage);
  // Whether the name has been given.
  bool IsDone() const { return done_; }
  // RemoveOld removes what was there; notes what cannot be removed.
  void RemoveOld();

 private:
  [[noreturn]] void Fail(const std::string& name) const;
  void Exchange(Stage& stage);

  std::string above_;
  std::string name_;
  Descriptor parent_;
  Descriptor old_;  // not open: nothing was there
  const std::string keepOld_;
  std::string toRemove_;  // the name that the old one has now
  bool done_ = false;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_DESTINATION_H
