// report.h: what the command says. The verdict goes to standard output, everything else to standard
// error, and no byte of a file name or of a signed object reaches the screen unescaped.
#ifndef VESK2_TOOLS_REPORT_H
#define VESK2_TOOLS_REPORT_H

#include <stdexcept>
#include <string>
#include <string_view>

#include "tools/vesk2/command.h"

namespace vesk2_command {

// Trouble ends the command with exit 2; its text is the one line that says why. Names and texts
// from outside must have been through Escape.
class Trouble : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

// Escape writes control bytes (ESC and DEL among them), invalid UTF-8 and the characters that
// reorder or break lines on a terminal as \xNN, and a backslash as "\\", so that the result is
// unambiguous.
std::string Escape(std::string_view text);

// Say writes a line to standard output, Note one to standard error.
void Say(const std::string& line);
void Note(const std::string& line);

// Finish flushes standard output: a verdict that could not be written is trouble.
ExitCode Finish(ExitCode code);

// The constant's name of a library or engine code, or "code N".
std::string CodeName(int code);
// What a code means, in words; empty for a code that no caller of the command meets.
std::string CodeWords(int code);
// Both: "words (NAME)".
std::string Reason(int code);

// The library's version, "1.1.0".
std::string LibraryVersion();

// Hexadecimal digits of `bytes`.
std::string Hex(std::string_view bytes);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_REPORT_H
