// SPDX-License-Identifier: Apache-2.0
// options.cpp: options, told in words.
#include "tools/vesk2/options/options.h"

#include <algorithm>
#include <sstream>
#include <stdexcept>
#include <string_view>

namespace vesk2_command {
namespace {

// What the value of an option is, and what the command does with it; an option means the same
// wherever it is taken.
constexpr struct {
  const char* value;
  Access access;
  const char* options;  // and operands
} kValues[] = {
    {"COMMAND", Access::kNone, " sign-with "},
    {"DEST", Access::kWrites, " dest "},
    {"DURATION", Access::kNone, " within "},
    {"DIR", Access::kReads, " acl-dir global home tree "},
    {"FILE", Access::kReads,
     " cert chain crl ignore-from items-of key passphrase-file request revoke-key subject "},
    {"FILE", Access::kWrites, " floor output report "},
    {"FILE[:N]", Access::kReads, " if-revoked issuer-of revoke-cert subject-of "},
    {"N", Access::kNone, " bits jobs passphrase-fd threshold "},
    {"NAME", Access::kNone, " if-without keep-old name names remove "},
    {"PATH", Access::kReads, " ignore "},
    {"PATH", Access::kNone, " below "},
    {"PATTERN", Access::kNone, " ignore-pattern "},
    {"SIZE", Access::kNone, " max-bytes "},
    {"TAG", Access::kNone, " asked grant granted revocation tag "},
    {"TIME", Access::kNone, " at date if-at not-after not-before time "},
    {"", Access::kAnywhere, " allow-links "},
};

struct Value {
  std::string name;
  Access access;
};

// An operand that the table does not know is a file.
Value ValueOf(const Option& option) {
  const std::string name =
      option.IsOperand() ? option.names() : option.LongName().substr(std::string_view("--").size());
  for (const auto& row : kValues) {
    if (std::string(row.options).find(" " + name + " ") == std::string::npos) continue;
    return {row.value, row.access};
  }
  if (option.IsFlag()) return {"", Access::kNone};
  if (!option.choices().empty()) return {Join(option.choices(), "|"), Access::kNone};
  if (!option.IsOperand()) return {"TEXT", Access::kNone};
  std::string upper = name;
  std::ranges::transform(upper, upper.begin(), ::toupper);
  return {upper, Access::kReads};
}

}  // namespace

Option& Option::Required(bool required) {
  required_ = required;
  return *this;
}

Option& Option::Once() {
  once_ = true;
  return *this;
}

Option& Option::Several() {
  several_ = true;
  return *this;
}

Option& Option::Choices(std::vector<std::string> choices) {
  choices_ = std::move(choices);
  return *this;
}

Option& Option::Range(int lowest, int highest) {
  lowest_ = lowest;
  highest_ = highest;
  return *this;
}

Option& Option::Preset(std::string preset) {
  preset_ = std::move(preset);
  return *this;
}

Option& Option::ShowPreset() {
  if (auto* const* number = std::get_if<int*>(&target_)) return Preset(std::to_string(**number));
  return Preset(*std::get<std::string*>(target_));
}

Option& Option::Excludes(const std::string& other) {
  excluded_.push_back(other);
  return *this;
}

std::vector<std::string> Option::Names() const {
  std::vector<std::string> names;
  if (IsOperand()) return names;
  std::istringstream words(names_);
  for (std::string word; std::getline(words, word, ',');) names.push_back(word);
  return names;
}

std::string Option::LongName() const { return IsOperand() ? names_ : Names().back(); }

std::string Option::ValueName() const { return ValueOf(*this).name; }

Access Option::Opens() const { return ValueOf(*this).access; }

std::string Option::Synopsis() const {
  std::string text = IsOperand() ? "" : LongName();
  if (!IsFlag()) text += (text.empty() ? "" : " ") + ValueName();
  if (!required_) text = "[" + text + "]";
  return Repeats() ? text + "..." : text;
}

std::string Option::Description() const {
  return preset_.empty() ? about_ : about_ + " [" + preset_ + "]";
}

Option& OptionList::AddOption(std::string_view names, Option::Target target,
                              std::string_view about) {
  return options_.emplace_back(names, target, about);
}

Option& OptionList::Get(const std::string& name) {
  for (Option& option : options_) {
    if (option.LongName() == name) return option;
  }
  throw std::logic_error("no option is called " + name);
}

void OptionList::MakeCommon(size_t first) {
  for (size_t i = first; i < options_.size(); ++i) options_[i].common_ = true;
}

std::string Join(const std::vector<std::string>& words, const std::string& between) {
  std::string text;
  for (const std::string& word : words) text += (text.empty() ? "" : between) + word;
  return text;
}

}  // namespace vesk2_command
