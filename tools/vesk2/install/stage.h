// SPDX-License-Identifier: Apache-2.0
// stage.h: the private directory beside the place of an installation in which it is made ready.
//
// Its name is "<name>.tmp-<32 hexadecimal digits>", drawn at random, and its maker holds its lock
// (flock) for as long as he lives: whoever gets the lock knows that nobody is at work in it.
#ifndef VESK2_TOOLS_STAGE_H
#define VESK2_TOOLS_STAGE_H

#include <functional>
#include <string>

#include "tools/vesk2/files/descriptor.h"
#include "tools/vesk2/install/wanted.h"

namespace vesk2_command {

// A new directory that only we can enter, removed with all that is in it unless it is given away.
class DrawnDirectory {
 public:
  // In the open directory `parent`, whose path is `above`, for messages; `name` is what its own
  // begins with.
  DrawnDirectory(int parent, const std::string& above, const std::string& name);
  ~DrawnDirectory();
  DrawnDirectory(const DrawnDirectory&) = delete;
  DrawnDirectory& operator=(const DrawnDirectory&) = delete;

  int file() const { return file_.get(); }
  const std::string& name() const { return name_; }
  // Rename says that it has another name now; an empty one that it is not ours any more.
  void Rename(std::string name) { name_ = std::move(name); }

 private:
  int Draw(const std::string& stem);

  const int parent_;
  std::string name_;
  Descriptor file_;  // which the lock hangs on
};

// RemoveLeftovers removes from an open directory what the dead left of installations as `name`.
void RemoveLeftovers(int parent, const std::string& name);
// RemoveDrawn removes the directory `name` with all in it if it is still the one that is open;
// whether nothing is left.
bool RemoveDrawn(int parent, const std::string& name, int file);

class Stage {
 public:
  // Trouble where the file system cannot exchange two directories in one step: it would have to be
  // done in several, between which there would be none.
  Stage(int parent, const std::string& above, const std::string& name);

  // A path under which it can be looked at, whatever its name.
  std::string Path() const { return "/proc/self/fd/" + std::to_string(directory_.file()); }
  DrawnDirectory& directory() { return directory_; }

  void MakeDirectories(const Wanted& wanted);
  // WriteFile writes a new file, onto the disk; `next` gives its bytes piece by piece, none at the
  // end. Files are 0644 or, if they can be run, 0755, less the umask but for their owner.
  void WriteFile(const std::string& path, bool executable,
                 const std::function<std::string_view()>& next);
  // Finish opens the directories to others by the same rule, and has them on the disk.
  void Finish(const Wanted& wanted);

 private:
  [[noreturn]] void Fail(const std::string& path) const;
  mode_t Mode(mode_t usual) const;

  const std::string above_;
  const mode_t umask_;
  DrawnDirectory directory_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_STAGE_H
