// SPDX-License-Identifier: Apache-2.0
// sheet.h: what is said of one object, collected once for both readers: rows for people, members
// for machines. The two cannot tell different stories.
#ifndef VESK2_TOOLS_SHEET_H
#define VESK2_TOOLS_SHEET_H

#include <string>
#include <vector>

#include "tools/vesk2/say/report.h"

namespace vesk2_command {

class Sheet {
 public:
  explicit Sheet(const std::string& kind) : members_({{"kind", kind}}) {}

  // A fact: the row "name  text" and the member of that name, with "_" for each blank.
  void Add(const std::string& name, const std::string& text) { Add(name, text, text); }
  void Add(const std::string& name, Json value, const std::string& text);
  // A fact that one of the two readers is told in another way.
  void AddMember(const std::string& name, Json value) { members_[name] = std::move(value); }
  void SetMembers(Json members) { members_ = std::move(members); }
  void AddRow(const std::string& name, const std::string& text);
  void AddLine(const std::string& line) { rows_.push_back(line); }

  // A part of the object: its rows, indented below a heading, and its members at the end of the
  // list `name`, which StartList makes so that it is there when no part is.
  void StartList(const std::string& name) { members_[name] = Json::array(); }
  void AddPart(const std::string& name, const std::string& heading, Sheet part);
  // The same below "HEADING 1 of 3", from an index that counts from 0.
  void AddPart(const std::string& name, const std::string& heading, size_t index, size_t count,
               Sheet part);

  const Json& members() const { return members_; }
  const std::vector<std::string>& rows() const { return rows_; }

 private:
  Json members_;
  std::vector<std::string> rows_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_SHEET_H
