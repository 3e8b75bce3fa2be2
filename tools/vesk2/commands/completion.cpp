// SPDX-License-Identifier: Apache-2.0
// completion.cpp: vesk2 completion: scripts that complete the command's words in a shell, written
// from the table of subcommands and what each of them declares.
#include <map>
#include <sstream>

#include "tools/vesk2/commands/parse.h"

namespace vesk2_command {
namespace {

// `text` in single quotes, for all three shells.
std::string Quoted(const std::string& text) {
  std::string out = "'";
  for (const char c : text) out += c == '\'' ? std::string("'\\''") : std::string(1, c);
  return out + "'";
}

// Calls visit(command) for the subcommands of a noun.
void ForVerbs(const Noun& noun, const std::function<void(const Command&)>& visit) {
  for (const Command& command : Commands()) {
    if (std::string_view(command.noun) == noun.name) visit(command);
  }
}

std::string NounNames() {
  std::vector<std::string> names;
  for (const Noun& noun : Nouns()) names.push_back(noun.name);
  return Join(names, " ");
}

std::string Verbs(const Noun& noun) {
  std::vector<std::string> names;
  ForVerbs(noun, [&](const Command& command) { names.push_back(command.verb); });
  return Join(names, " ");
}

bool IsDirectory(const Option& option) { return option.ValueName().starts_with("DIR"); }

// What a shell's `case` compares "NOUN WORD" with.
std::string Pattern(const Command& command) {
  return *command.verb == '\0' ? Quoted(std::string(command.noun) + " ") + "*"
                               : Quoted(CommandName(command));
}

// ---- bash ----

// What completes the value of an option: arguments of compgen.
std::string BashValues(const Option& option) {
  if (!option.choices().empty()) return "-W " + Quoted(Join(option.choices(), " "));
  if (option.Opens() == Access::kNone) return "-W ''";
  return IsDirectory(option) ? "-d" : "-f";
}

void BashCommand(const Command& command, std::ostream& out) {
  std::map<std::string, std::vector<std::string>> values;  // by what completes them
  std::string words;
  std::string operands = "-W ''";
  for (const Option& option : DescribeOptions(command)) {
    for (const std::string& name : option.Names()) words += name + " ";
    if (option.IsOperand()) operands = BashValues(option);
    if (option.IsOperand() || option.IsFlag()) continue;
    std::vector<std::string>& names = values[BashValues(option)];
    const std::vector<std::string> own = option.Names();
    names.insert(names.end(), own.begin(), own.end());
  }
  out << "    " << Pattern(command) << ")\n      case $previous in\n";
  for (const auto& [how, names] : values) {
    out << "        " << Join(names, "|") << ") _vesk2_take " << how << " ;;\n";
  }
  out << "        *) case $current in -*) _vesk2_take -W " << Quoted(words) << " ;; *) _vesk2_take "
      << operands << " ;; esac ;;\n      esac ;;\n";
}

void Bash(std::ostream& out) {
  out << R"(# bash completion for vesk2
_vesk2_take() {
  local IFS=$' \t\n' current=${COMP_WORDS[COMP_CWORD]} words
  case $1 in -f | -d) compopt -o filenames 2>/dev/null ;; esac
  words=$(compgen "$@" -- "$current")
  IFS=$'\n'
  COMPREPLY=($words)
}
_vesk2() {
  local current=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD-1]}
  COMPREPLY=()
  [ "$COMP_CWORD" -gt 1 ] || { _vesk2_take -W ')"
      << NounNames() << R"( --help --version'; return; }
  if [ "$COMP_CWORD" -eq 2 ]; then
    case ${COMP_WORDS[1]} in
)";
  for (const Noun& noun : Nouns()) {
    const std::string verbs = Verbs(noun);
    if (!verbs.empty())
      out << "      " << noun.name << ") _vesk2_take -W '" << verbs << " --help' ;;\n";
  }
  out << "    esac\n    [ ${#COMPREPLY[@]} -eq 0 ] || return\n  fi\n"
      << "  case \"${COMP_WORDS[1]} ${COMP_WORDS[2]}\" in\n";
  for (const Command& command : Commands()) BashCommand(command, out);
  out << "  esac\n}\ncomplete -F _vesk2 vesk2\n";
}

// ---- zsh ----

std::string ZshValues(const Option& option) {
  const std::string text = ":" + (option.choices().empty() ? option.ValueName() : "choice");
  if (!option.choices().empty()) return text + ":(" + Join(option.choices(), " ") + ")";
  if (option.Opens() == Access::kNone) return text + ": ";
  return text + (IsDirectory(option) ? ":_files -/" : ":_files");
}

// A description inside brackets, as _arguments takes it.
std::string ZshText(const std::string& text) {
  std::string out;
  for (const char c : text) {
    if (c == '[' || c == ']' || c == ':' || c == '\\') out += '\\';
    out += c;
  }
  return out;
}

void ZshCommand(const Command& command, std::ostream& out) {
  out << "    " << Pattern(command) << ")\n      shift " << (*command.verb == '\0' ? 1 : 2)
      << " words; (( CURRENT -= " << (*command.verb == '\0' ? 1 : 2) << " ))\n      _arguments -s";
  for (const Option& option : DescribeOptions(command)) {
    out << " \\\n        ";
    const std::string values = option.IsFlag() ? "" : ZshValues(option);
    if (option.IsOperand()) {
      out << Quoted((option.Repeats() ? "*" : option.required() ? "" : ":") + values);
      continue;
    }
    const std::vector<std::string> names = option.Names();
    const std::string once = option.Repeats() ? "*" : "(" + Join(names, " ") + ")";
    const std::string about = Quoted("[" + ZshText(option.Description()) + "]" + values);
    if (names.size() == 1) out << Quoted(once + names[0]) << about;
    if (names.size() > 1) out << Quoted(once) << "{" << Join(names, ",") << "}" << about;
  }
  out << " ;;\n";
}

void Zsh(std::ostream& out) {
  out << "#compdef vesk2\n_vesk2() {\n  local -a verbs\n  case $CURRENT in\n    2) verbs=(";
  for (const Noun& noun : Nouns()) {
    out << "\n        " << Quoted(std::string(noun.name) + ":" + noun.about);
  }
  out << ")\n      _describe group verbs; return ;;\n    3) case $words[2] in\n";
  for (const Noun& noun : Nouns()) {
    if (Verbs(noun).empty()) continue;
    out << "        " << noun.name << ") verbs=(";
    ForVerbs(noun, [&](const Command& command) {
      out << "\n          " << Quoted(std::string(command.verb) + ":" + command.about);
    });
    out << ")\n          _describe command verbs; return ;;\n";
  }
  out << "      esac ;;\n  esac\n  case \"$words[2] $words[3]\" in\n";
  for (const Command& command : Commands()) ZshCommand(command, out);
  out << "  esac\n}\nif [ \"$funcstack[1]\" = _vesk2 ]; then _vesk2; else compdef _vesk2 vesk2; "
         "fi\n";
}

// ---- fish ----

void FishOption(const Option& option, const std::string& head, std::ostream& out) {
  out << head;
  for (const std::string& name : option.Names()) {
    out << (name.starts_with("--") ? " -l " + name.substr(2) : " -s " + name.substr(1));
  }
  if (!option.choices().empty()) {
    out << " -x -a " << Quoted(Join(option.choices(), " "));
  } else if (!option.IsFlag() && !option.IsOperand()) {
    out << (option.Opens() == Access::kNone ? " -x"
            : IsDirectory(option)           ? " -x -a '(__fish_complete_directories)'"
                                            : " -r -F");
  }
  if (option.IsOperand() && option.Opens() != Access::kNone) out << " -F";
  out << " -d " << Quoted(option.Description()) << "\n";
}

void Fish(std::ostream& out) {
  out << R"(# fish completion for vesk2
function __vesk2_here
    set -l words (commandline -opc)
    test "$words[2..]" = "$argv"
end
function __vesk2_in
    set -l words (commandline -opc)
    string match -q -- "$argv *" "$words[2..] "
end
complete -c vesk2 -f
)";
  for (const Noun& noun : Nouns()) {
    out << "complete -c vesk2 -n __vesk2_here -a " << noun.name << " -d " << Quoted(noun.about)
        << "\n";
    ForVerbs(noun, [&](const Command& command) {
      if (*command.verb != '\0') {
        out << "complete -c vesk2 -n '__vesk2_here " << noun.name << "' -a " << command.verb
            << " -d " << Quoted(command.about) << "\n";
      }
      const std::string head = "complete -c vesk2 -n '__vesk2_in " + CommandName(command) + "'";
      for (const Option& option : DescribeOptions(command)) FishOption(option, head, out);
    });
  }
}

ExitCode Run(const std::string& shell) {
  std::ostringstream out;
  if (shell == "bash") Bash(out);
  if (shell == "zsh") Zsh(out);
  if (shell == "fish") Fish(out);
  std::string script = out.str();
  script.pop_back();
  Say(script);
  Result() = {{"script", Escape(script)}};
  return kYes;
}

}  // namespace

Action DefineCompletion(OptionList& list) {
  auto shell = std::make_shared<std::string>();
  list.Add("shell", *shell, "The shell whose language is wanted")
      .Choices({"bash", "zsh", "fish"})
      .Required();
  return [shell] { return Run(*shell); };
}

}  // namespace vesk2_command
