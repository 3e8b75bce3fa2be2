// SPDX-License-Identifier: Apache-2.0
// options.h: what a subcommand takes from its command line, as data. The parser reads it, and the
// help, the manual pages, the shells' completion and the confinement tell from it.
#ifndef VESK2_TOOLS_OPTIONS_H
#define VESK2_TOOLS_OPTIONS_H

#include <deque>
#include <limits>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

namespace vesk2_command {

// What an option's value, or the option itself, lets the command do.
enum class Access {
  kNone,
  kReads,     // the value names what is read
  kWrites,    // or what is written
  kAnywhere,  // links are followed, wherever they lead
};

class Option {
 public:
  // Where what was given goes to. A flag takes no value; a list takes one a mention, and as an
  // operand all that is left.
  using Target = std::variant<bool*, int*, unsigned*, std::string*, std::vector<std::string>*>;

  Option(std::string_view names, Target target, std::string_view about)
      : names_(names), target_(target), about_(about) {}

  Option& Required(bool required = true);
  Option& Once();     // of a list: a second mention is refused
  Option& Several();  // of a list: a mention takes all words up to the next option
  Option& Choices(std::vector<std::string> choices);
  Option& Range(int lowest, int highest = std::numeric_limits<int>::max());
  // Preset says what holds unless the option is given; ShowPreset takes it from the target.
  Option& Preset(std::string preset);
  Option& ShowPreset();
  // Both cannot be given; `other` is one of the names of an option of the same command.
  Option& Excludes(const std::string& other);
  Option& Excludes(const Option& other) { return Excludes(other.LongName()); }
  const std::string& names() const { return names_; }
  const Target& target() const { return target_; }
  const std::string& about() const { return about_; }
  const std::vector<std::string>& choices() const { return choices_; }
  const std::string& preset() const { return preset_; }
  const std::vector<std::string>& excluded() const { return excluded_; }
  bool several() const { return several_; }
  bool required() const { return required_; }
  bool common() const { return common_; }
  bool limited() const { return lowest_ <= highest_; }
  int lowest() const { return lowest_; }
  int highest() const { return highest_; }

  bool IsFlag() const { return std::holds_alternative<bool*>(target_); }
  bool IsOperand() const { return !names_.starts_with('-'); }
  bool Repeats() const {
    return std::holds_alternative<std::vector<std::string>*>(target_) && !once_;
  }
  // "-o" and "--output"; none of an operand.
  std::vector<std::string> Names() const;
  // "--output"; the name of an operand.
  std::string LongName() const;
  // "FILE", "a|b"; empty for a flag.
  std::string ValueName() const;
  Access Opens() const;
  // "--output FILE", "[FILE]", "[--ignore PATH]..."
  std::string Synopsis() const;
  // What it is for, with the preset.
  std::string Description() const;

 private:
  friend class OptionList;

  std::string names_;  // "-o,--output"; a word without dashes is an operand
  Target target_;
  std::string about_;
  std::vector<std::string> choices_;
  std::string preset_;
  std::vector<std::string> excluded_;
  bool required_ = false;
  bool once_ = false;
  bool several_ = false;
  bool common_ = false;
  int lowest_ = 0;
  int highest_ = -1;
};

// The options of one subcommand in the order in which they are told, and a closing word.
class OptionList {
 public:
  // The target must outlive the list.
  template <typename T>
  Option& Add(std::string_view names, T& target, std::string_view about) {
    return AddOption(names, &target, about);
  }
  Option& Get(const std::string& name);
  // Those from the index `first` on are told among the options of every command.
  void MakeCommon(size_t first);
  void Footer(std::string text) { footer_ = std::move(text); }

  const std::deque<Option>& options() const { return options_; }
  const std::string& footer() const { return footer_; }

 private:
  Option& AddOption(std::string_view names, Option::Target target, std::string_view about);

  std::deque<Option> options_;  // whose elements stay where they are
  std::string footer_;
};

std::string Join(const std::vector<std::string>& words, const std::string& between);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_OPTIONS_H
