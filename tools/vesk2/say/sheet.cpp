// SPDX-License-Identifier: Apache-2.0
// sheet.cpp: laying out what is said of an object.
#include "tools/vesk2/say/sheet.h"

#include <algorithm>

namespace vesk2_command {

void Sheet::Add(const std::string& name, Json value, const std::string& text) {
  AddRow(name, text);
  std::string member = name;
  std::replace(member.begin(), member.end(), ' ', '_');
  AddMember(member, std::move(value));
}

void Sheet::AddRow(const std::string& name, const std::string& text) {
  constexpr size_t kColumn = 12;
  const std::string gap(name.size() < kColumn ? kColumn - name.size() : 0, ' ');
  AddLine(name + gap + " " + text);
}

void Sheet::AddPart(const std::string& name, const std::string& heading, Sheet part) {
  AddLine(heading);
  for (const std::string& row : part.rows_) AddLine("  " + row);
  members_[name].push_back(std::move(part.members_));
}

void Sheet::AddPart(const std::string& name, const std::string& heading, size_t index, size_t count,
                    Sheet part) {
  AddPart(name, heading + " " + std::to_string(index + 1) + " of " + std::to_string(count),
          std::move(part));
}

}  // namespace vesk2_command
