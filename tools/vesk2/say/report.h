// SPDX-License-Identifier: Apache-2.0
// report.h: what the command says.
//
// A key that has a pet name is told with it: names.h. For people, the verdict goes to standard
// output and everything else to standard error, and no byte of a file name or of a signed object
// reaches the screen unescaped. With --json one object says the same: the schema is
// docs/answer.schema.json, and escaped texts stay escaped in it.
#ifndef VESK2_TOOLS_REPORT_H
#define VESK2_TOOLS_REPORT_H

#include <nlohmann/json.hpp>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>

namespace vesk2_command {

using Json = nlohmann::ordered_json;

// What a script can rely on: anything but kYes is a refusal. Trouble means that the question could
// not be answered: wrong usage, a file that cannot be read or parsed, no store, no memory.
enum ExitCode : int { kYes = 0, kNo = 1, kTrouble = 2 };

// Trouble ends the command with exit 2; its text is the one line that says why. Names and texts
// from outside must have been through Escape.
class Trouble : public std::runtime_error {
 public:
  explicit Trouble(const std::string& text, std::string why = "trouble")
      : std::runtime_error(text), reason(std::move(why)) {}

  std::string reason;  // a stable word, for machines
  int code = 0;        // the library's code, where it was one
  // Where it was met, as far as that is known.
  std::string file = {};
  std::optional<uint64_t> byte = {};
};

// Owned takes over a text that the library made; it could not where there was no memory.
std::string Owned(char* made);
// Escape writes control bytes (ESC and DEL among them), invalid UTF-8 and the characters that
// reorder or break lines on a terminal as \xNN, and a backslash as "\\", so that the result is
// unambiguous.
std::string Escape(std::string_view text);

// ---- How the command was asked to speak ----

struct Style {
  bool json = false;
  bool quiet = false;
  bool verbose = false;
  bool color = false;     // the verdict's word is coloured
  bool progress = false;  // a progress line may be drawn on standard error
  bool brief = false;     // long lists are cut short: a person reads them on a terminal
};

// StartReport forgets what was said before. `command` is "noun verb".
void StartReport(const std::string& command, const Style& style);
const Style& GetStyle();

// ---- Speaking ----

// Say writes a line for people to standard output; with --json it says nothing, and what it would
// have said belongs into Result.
void Say(const std::string& line);
// Note writes a line to standard error unless --quiet; with --json it goes into "notes" instead.
void Note(const std::string& line);
// NoteCommand is a note of a command line, to be pasted as it is: no name of a key goes into it.
void NoteCommand(const std::string& line);
// Detail is a note that only --verbose asks for.
void Detail(const std::string& line);
// While one lives, notes are kept for machines and not shown: nobody asked for them.
class UnshownNotes {
 public:
  UnshownNotes();
  ~UnshownNotes();
  UnshownNotes(const UnshownNotes&) = delete;
  UnshownNotes& operator=(const UnshownNotes&) = delete;
};
// CollectFacts has a command find out for Result what else only --json asks for.
void CollectFacts();
bool CollectsFacts();
// The members that a command adds for machines.
Json& Result();

// A text, or null for none.
Json OrNull(const std::string& text);

// The verdict: "yes: TEXT" or "no: TEXT (NAME)" for people, with the reason's word for machines.
ExitCode Yes(const std::string& text);
ExitCode No(int code, const std::string& text);
// A no of the command's own, which no library code stands for.
ExitCode No(const std::string& reason, const std::string& text);

// What has been said so far, as --json writes it. RecordTrouble makes trouble of it.
Json MakeAnswer(ExitCode code);
void RecordTrouble(const Trouble& trouble);
// SetVerdictPrefix has every verdict of this answer begin with these words: what it supposes.
void SetVerdictPrefix(const std::string& words);
const std::string& VerdictPrefix();

// FinishReport writes the answer for machines and flushes standard output: a verdict that could not
// be written is trouble. Its result is the exit status.
ExitCode FinishReport(ExitCode code);
ExitCode FinishReport(const Trouble& trouble);

// ---- Words ----

// The constant's name of a library or engine code, or "code N".
std::string CodeName(int code);
// The stable word of a code: "not-authorized" for VESK2_ERR_NOT_AUTHORIZED, "ok" for 0.
std::string ReasonWord(int code);
// What a code means, in words; empty for a code that no caller of the command meets.
std::string CodeWords(int code);
// Both: "words (NAME)".
std::string Reason(int code);

// The library's version, "1.1.0".
std::string LibraryVersion();

// "1 file", "2 files", "3 entries".
std::string Plural(size_t count, const std::string& what);

// Hexadecimal digits of `bytes`.
std::string Hex(std::string_view bytes);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_REPORT_H
