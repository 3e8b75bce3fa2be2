// SPDX-License-Identifier: Apache-2.0
// report.cpp: escaping, the output for people and for machines, and the words for codes.
#include "tools/vesk2/say/report.h"

#include <cctype>
#include <cstdio>
#include <cstring>
#include <memory>
#include <vector>

#include "tools/vesk2/say/line.h"
#include "tools/vesk2/say/names.h"

#include <vesk2/context.h>
#include <vesk2/wording.h>

namespace vesk2_command {
namespace {

constexpr const char* kGreen = "\033[32m";
constexpr const char* kRed = "\033[31m";

// What has been said so far; a process answers one question.
struct State {
  Style style;
  bool collects = false;
  int unshown = 0;  // how many UnshownNotes there are
  std::string command;
  std::string reason;
  int code = 0;
  std::string message;
  std::string prefix;
  std::string file;
  std::optional<uint64_t> byte;
  std::vector<std::string> notes;
  Json result;
};
State report;

std::string Colored(const std::string& word, const char* color) {
  return report.style.color ? color + word + "\033[0m" : word;
}

void WriteError(const std::string& line) {
  EraseLine();
  std::fflush(stdout);  // keeps the order of lines where both go to one terminal
  std::fprintf(stderr, "%s\n", line.c_str());
}

void WriteJson(ExitCode code) {
  // In ASCII: the words of a command line are as they are, and may turn a terminal's text.
  std::printf("%s\n", MakeAnswer(code).dump(-1, ' ', true).c_str());
}

}  // namespace

std::string Hex(std::string_view bytes) {
  constexpr char kDigits[] = "0123456789abcdef";
  std::string out;
  for (const char byte : bytes) {
    out += kDigits[static_cast<unsigned char>(byte) >> 4];
    out += kDigits[static_cast<unsigned char>(byte) & 15];
  }
  return out;
}

std::string Owned(char* made) {
  const std::unique_ptr<char, decltype(&Vesk2Free)> text(made, &Vesk2Free);
  return text ? text.get() : throw std::bad_alloc();
}

std::string Escape(std::string_view text) {
  return Owned(ZvVesk2::Wording::Escape(text.data(), text.size()));
}

void StartReport(const std::string& command, const Style& style) {
  report = State();
  report.style = style;
  report.command = command;
}

const Style& GetStyle() { return report.style; }

void Say(const std::string& line) {
  if (report.style.json) return;
  EraseLine();
  std::printf("%s\n", WithNames(line).c_str());
}

void Note(const std::string& line) { NoteCommand(WithNames(line)); }

void NoteCommand(const std::string& line) {
  report.notes.push_back(line);
  if (!report.style.quiet && !report.style.json && report.unshown == 0) WriteError(line);
}

void Detail(const std::string& line) {
  if (report.style.verbose) Note(line);
}

UnshownNotes::UnshownNotes() { ++report.unshown; }
UnshownNotes::~UnshownNotes() { --report.unshown; }

void CollectFacts() { report.collects = true; }
bool CollectsFacts() { return report.collects || report.style.json; }

Json& Result() { return report.result; }
Json OrNull(const std::string& text) { return text.empty() ? Json() : Json(text); }

void SetVerdictPrefix(const std::string& words) { report.prefix = words; }
const std::string& VerdictPrefix() { return report.prefix; }

ExitCode Yes(const std::string& text) {
  report.message = WithNames(report.prefix + text);
  Say(Colored("yes", kGreen) + ": " + report.prefix + text);
  return kYes;
}

ExitCode No(int code, const std::string& text) {
  report.reason = ReasonWord(code);
  report.code = code;
  report.message = WithNames(report.prefix + text);
  const std::string said = report.prefix + text;
  Say(Colored("no", kRed) + ": " + (said.empty() ? "" : said + " ") + "(" + CodeName(code) + ")");
  return kNo;
}

ExitCode No(const std::string& reason, const std::string& text) {
  report.reason = reason;
  report.message = WithNames(report.prefix + text);
  Say(Colored("no", kRed) + ": " + report.prefix + text);
  return kNo;
}

Json MakeAnswer(ExitCode code) {
  constexpr const char* kVerdicts[] = {"yes", "no", "trouble"};
  constexpr const char* kReasons[] = {"ok", "no", "trouble"};
  Json answer = {
      {"schema", "vesk2.answer/2"},
      {"command", report.command},
      {"verdict", kVerdicts[code]},
      {"exit", static_cast<int>(code)},
      {"reason", report.reason.empty() ? kReasons[code] : report.reason},
      {"code", report.code},
      {"message", report.message},
  };
  answer["file"] = OrNull(report.file);
  answer["byte"] = report.byte ? Json(*report.byte) : Json();
  answer["notes"] = report.notes;
  Json& result = answer["result"] = report.result.is_null() ? Json::object() : report.result;
  AddNames(result);
  return answer;
}

void RecordTrouble(const Trouble& trouble) {
  report.reason = trouble.reason;
  report.code = trouble.code;
  report.message = WithNames(trouble.what());
  report.file = trouble.file;
  report.byte = trouble.byte;
}

ExitCode FinishReport(ExitCode code) {
  if (report.style.json) WriteJson(code);
  if (std::fflush(stdout) == 0 && std::ferror(stdout) == 0) return code;
  WriteError(std::string("vesk2: standard output: ") + std::strerror(errno));
  return kTrouble;
}

ExitCode FinishReport(const Trouble& trouble) {
  RecordTrouble(trouble);
  WriteError("vesk2: " + report.message);
  return FinishReport(kTrouble);
}

std::string LibraryVersion() {
  const int number = Vesk2VersionNumber();
  return std::to_string(number / 10000) + "." + std::to_string(number / 100 % 100) + "." +
         std::to_string(number % 100);
}

std::string Plural(size_t count, const std::string& what) {
  const std::string text = std::to_string(count) + " " + what;
  if (count == 1) return text;
  return what.ends_with("ry") ? text.substr(0, text.size() - 1) + "ies" : text + "s";
}

std::string CodeName(int code) {
  const char* name = ZvVesk2::V2CodeName(code);
  return name != nullptr ? name : "code " + std::to_string(code);
}

std::string ReasonWord(int code) {
  if (code == 0) return "ok";
  std::string word = CodeName(code);
  for (const std::string_view prefix : {"VESK2_ERR_", "VESK2_"}) {
    if (word.starts_with(prefix)) word.erase(0, prefix.size());
  }
  for (char& c : word) c = c == '_' || c == ' ' ? '-' : static_cast<char>(std::tolower(c));
  return word;
}

std::string CodeWords(int code) { return ZvVesk2::V2CodeWords(code); }

std::string Reason(int code) {
  const std::string words = CodeWords(code);
  return words.empty() ? CodeName(code) : words + " (" + CodeName(code) + ")";
}

}  // namespace vesk2_command
