// SPDX-License-Identifier: Apache-2.0
// findings.h: what is wrong with the stores, or will be, collected before any of it is told.
//
// A finding's word is for machines and stays as it is; docs/json.md says what to do about each.
#ifndef VESK2_TOOLS_FINDINGS_H
#define VESK2_TOOLS_FINDINGS_H

#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/objects/times.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {

struct StoreFinding {
  std::string word;
  std::string path;
  std::string text;          // escaped
  size_t certificate = 0;    // its number in the file; 0: the finding is about no single one
  Ref<TimeStamp> when = {};  // when it came, or will come, to be so
};

class Findings {
 public:
  // Something that ends by `soon` is told before it has.
  Findings(Ref<TimeStamp> now, Ref<TimeStamp> soon);

  // Adds a finding and returns it, for what else is known of it.
  StoreFinding& Add(const std::string& word, const std::string& path, const std::string& text);
  // The period of what `what` names has passed, or will soon. Whether it has is told.
  bool AddEnd(const std::string& path, const std::string& what, const TimeStamp* end,
              size_t certificate = 0);
  // Calls what reads a file or a directory. What cannot be read is a finding, but for a directory:
  // with that the question is not answered. Returns whether it was read.
  bool Read(const std::string& path, const std::function<void()>& read);
  void ReadDirectory(const std::function<void()>& read);

  TimeStamp* now() const { return now_.get(); }
  TimeStamp* soon() const { return soon_.get(); }
  bool empty() const { return found_.empty(); }
  size_t size() const { return found_.size(); }

  // Says them by file, and adds "findings" to the result. Throws the Trouble of a directory that
  // could not be read.
  void Tell();

 private:
  Ref<TimeStamp> now_;
  Ref<TimeStamp> soon_;
  std::vector<StoreFinding> found_;
  std::optional<Trouble> trouble_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_FINDINGS_H
