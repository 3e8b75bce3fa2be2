// SPDX-License-Identifier: Apache-2.0
// manual.cpp: vesk2 manual: the manual pages, written from the table of subcommands and what each
// of them declares. docs/man/ holds what this writes.
#include <sstream>

#include "tools/vesk2/commands/parse.h"

namespace vesk2_command {
namespace {

constexpr const char* kExitStatus =
    R"(.SH EXIT STATUS
.TP
.B 0
Yes, or done.
.TP
.B 1
A clean no: the question was answered.
.TP
.B 2
Usage or trouble: the question could not be answered.
.PP
Anything but 0 is a refusal. The verdict is on standard output, everything else on standard error.
With
.B \-\-json
the answer is one object on standard output, with the same exit status.
)";

constexpr const char* kEnvironment =
    R"(.SH ENVIRONMENT
.TP
.BR VESK2_HOME ", " VESK2_GLOBAL
Roots of the user's and of the machine's store, unless
.B \-\-home
and
.B \-\-global
are given.
.TP
.B XDG_DATA_HOME
The user's store is vesk2 below it when neither is given; ~/.local/share stands in for it.
.TP
.BR NO_COLOR ", " TERM
No colour when the first is set or the second is dumb.
.SH FILES
.TP
.I /etc/vesk2
The machine's store, unless told otherwise.
.TP
.IR acl/ * .acl
Below the machine's store: the entries that say what it trusts.
.TP
.IR cert/ * .crl
Below the machine's store: the revocation lists that it took.
.TP
.IR cert/ * .cert
Below the user's store: chains of certificates.
)";

// Text that troff prints as it is.
std::string Roff(const std::string& text) {
  std::string out;
  for (const char c : text) {
    switch (c) {
      case '\\':
        out += "\\e";
        break;
      case '-':
        out += "\\-";
        break;
      case '\'':
        out += "\\(aq";
        break;
      case '`':
        out += "\\(ga";
        break;
      case '^':
        out += "\\(ha";
        break;
      case '~':
        out += "\\(ti";
        break;
      case '\n':
        out += "\n.PP\n";
        break;
      case '.':
        out += out.empty() || out.back() == '\n' ? "\\&." : ".";
        break;
      default:
        out += c;
    }
  }
  return out;
}

std::string Sentence(const std::string& about) {
  return Roff(about) + (about.ends_with('?') ? "\n" : ".\n");
}

std::string PageName(const Noun& noun) { return std::string("vesk2-") + noun.name; }

void Head(const std::string& page, std::string about, std::ostream& out) {
  std::string title = page;
  about[0] = static_cast<char>(std::tolower(about[0]));
  for (char& c : title) c = static_cast<char>(std::toupper(c));
  out << ".TH " << Roff(title) << " 1 \"\" \"vesk2 " << LibraryVersion() << "\" \"vesk2\"\n"
      << ".SH NAME\n"
      << Roff(page) << " \\- " << Roff(about) << "\n.SH SYNOPSIS\n.ad l\n";
}

void CommandLine(const Command& command, std::ostream& out) {
  out << ".HP\n.B vesk2 " << CommandName(command) << "\n";
  for (const bool positional : {false, true}) {
    for (const Option& option : DescribeOptions(command)) {
      if (option.IsOperand() == positional && !option.common())
        out << Roff(option.Synopsis()) << "\n";
    }
  }
}

void TellOption(const Option& option, std::ostream& out) {
  out << ".TP\n.B " << Roff(Join(option.Names(), ", "));
  if (!option.IsFlag()) out << (option.IsOperand() ? "" : " ") << Roff(option.ValueName());
  out << "\n" << Roff(option.Description()) << "\n";
}

void TellOptions(const Command& command, bool common, std::ostream& out) {
  for (const Option& option : DescribeOptions(command)) {
    if (option.common() == common) TellOption(option, out);
  }
}

void Examples(const std::vector<const Command*>& commands, std::ostream& out) {
  out << ".SH EXAMPLES\n.nf\n";
  for (const Command* command : commands) {
    std::istringstream lines(command->examples);
    for (std::string line; std::getline(lines, line);) out << Roff(line) << "\n";
  }
  out << ".fi\n";
}

void SeeAlso(const std::string& page, std::ostream& out) {
  out << ".SH SEE ALSO\n";
  if (page != "vesk2") out << ".BR vesk2 (1),\n";
  for (const Noun& noun : Nouns()) {
    if (PageName(noun) != page) out << ".BR " << Roff(PageName(noun)) << " (1),\n";
  }
  out << ".BR vesk2\\-formats (5)\n";
}

void CommandPage(std::ostream& out) {
  Head("vesk2", "signed manifests and certificates, checked offline", out);
  std::vector<const Command*> all;
  for (const Command& command : Commands()) all.push_back(&command);
  out << ".B vesk2\n.I GROUP COMMAND\n[options]\n.SH DESCRIPTION\n"
      << "Is this directory exactly what its signed manifest says, and was its signer authorized "
         "to "
         "say so? vesk2 answers from files on this machine; it opens no connection.\n"
         "A group is a kind of object, a command is what is done with it.\n.SH COMMANDS\n";
  for (const Command* command : all) {
    out << ".TP\n.B " << CommandName(*command) << "\n" << Sentence(command->about);
  }
  out << ".SH OPTIONS OF EVERY COMMAND\n";
  TellOptions(*all.front(), true, out);
  out << ".TP\n.B \\-\\-\nWhat follows is no option.\n" << kExitStatus << kEnvironment;
  Examples(all, out);
  SeeAlso("vesk2", out);
}

void NounPage(const Noun& noun, std::ostream& out) {
  Head(PageName(noun), noun.about, out);
  std::vector<const Command*> own;
  for (const Command& command : Commands()) {
    if (std::string_view(command.noun) == noun.name) own.push_back(&command);
  }
  for (const Command* command : own) CommandLine(*command, out);
  if (*noun.description != '\0') out << ".SH DESCRIPTION\n" << Roff(noun.description) << "\n";
  out << ".SH COMMANDS\n";
  for (const Command* command : own) {
    out << ".SS vesk2 " << CommandName(*command) << "\n" << Sentence(command->about);
    TellOptions(*command, false, out);
  }
  out << ".PP\nOptions that every command takes are in\n.BR vesk2 (1).\n"
      << kExitStatus << kEnvironment;
  Examples(own, out);
  SeeAlso(PageName(noun), out);
}

ExitCode Run(const std::string& group) {
  std::ostringstream out;
  if (group.empty()) CommandPage(out);
  for (const Noun& noun : Nouns()) {
    if (group == noun.name) NounPage(noun, out);
  }
  std::string page = out.str();
  if (page.empty()) throw Trouble("no group of commands: " + Escape(group), "usage");
  page.pop_back();
  Say(page);
  Result() = {{"page", Escape(page)}};
  return kYes;
}

}  // namespace

Action DefineManual(OptionList& list) {
  auto group = std::make_shared<std::string>();
  list.Add("group", *group, "Of these commands [of all]");
  return [group] { return Run(*group); };
}

}  // namespace vesk2_command
