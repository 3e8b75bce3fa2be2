// report.cpp: escaping, the output for people and for machines, and the words for codes.
#include "tools/vesk2/say/report.h"

#include <array>
#include <cctype>
#include <cstdio>
#include <cstring>
#include <vector>

#include "tools/vesk2/say/line.h"

#include <vesk2.h>

namespace vesk2_command {
namespace {

// The length of the UTF-8 sequence at the start of `text` and its code point; 0 for none. Overlong
// forms, surrogates and what lies past U+10FFFF are none.
size_t DecodeUtf8(std::string_view text, char32_t& point) {
  const auto lead = static_cast<unsigned char>(text[0]);
  const size_t length = lead < 0x80 ? 1 : lead < 0xc2 ? 0 : lead < 0xe0 ? 2 : lead < 0xf0 ? 3 : 4;
  if (length == 0 || lead > 0xf4 || text.size() < length) return 0;
  point = length == 1 ? lead : lead & (0x7fU >> length);
  for (size_t i = 1; i < length; ++i) {
    const auto next = static_cast<unsigned char>(text[i]);
    if ((next & 0xc0U) != 0x80) return 0;
    point = (point << 6) | (next & 0x3fU);
  }
  constexpr std::array<char32_t, 5> kLeast = {0, 0, 0x80, 0x800, 0x10000};
  const bool surrogate = point >= 0xd800 && point < 0xe000;
  return point < kLeast[length] || point > 0x10ffff || surrogate ? 0 : length;
}

bool IsUnsafe(char32_t point) {
  constexpr struct {
    char32_t first, last;
  } kUnsafe[] = {
      {0x00, 0x1f},     {0x7f, 0x9f},      // control characters
      {0x200e, 0x200f}, {0x2028, 0x202e},  // line breaks, marks that turn the direction of text
      {0x2066, 0x2069},
  };
  for (const auto& range : kUnsafe) {
    if (point >= range.first && point <= range.last) return true;
  }
  return false;
}

constexpr const char* kGreen = "\033[32m";
constexpr const char* kRed = "\033[31m";

// What has been said so far; a process answers one question.
struct State {
  Style style;
  std::string command;
  std::string reason;
  int code = 0;
  std::string message;
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
  answer["result"] = report.result.is_null() ? Json::object() : report.result;
  // In ASCII: the words of a command line are as they are, and may turn a terminal's text.
  std::printf("%s\n", answer.dump(-1, ' ', true).c_str());
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

std::string Escape(std::string_view text) {
  std::string out;
  while (!text.empty()) {
    char32_t point = 0;
    size_t length = DecodeUtf8(text, point);
    const bool plain = length != 0 && !IsUnsafe(point);
    if (length == 0) length = 1;
    for (const char byte : text.substr(0, length)) {
      if (!plain) out += "\\x" + Hex(std::string_view(&byte, 1));
      if (plain) out += byte == '\\' ? std::string("\\\\") : std::string(1, byte);
    }
    text.remove_prefix(length);
  }
  return out;
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
  std::printf("%s\n", line.c_str());
}

void Note(const std::string& line) {
  report.notes.push_back(line);
  if (!report.style.quiet && !report.style.json) WriteError(line);
}

void Detail(const std::string& line) {
  if (report.style.verbose) Note(line);
}

Json& Result() { return report.result; }
Json OrNull(const std::string& text) { return text.empty() ? Json() : Json(text); }

ExitCode Yes(const std::string& text) {
  report.message = text;
  Say(Colored("yes", kGreen) + ": " + text);
  return kYes;
}

ExitCode No(int code, const std::string& text) {
  report.reason = ReasonWord(code);
  report.code = code;
  report.message = text;
  Say(Colored("no", kRed) + ": " + (text.empty() ? "" : text + " ") + "(" + CodeName(code) + ")");
  return kNo;
}

ExitCode No(const std::string& reason, const std::string& text) {
  report.reason = reason;
  report.message = text;
  Say(Colored("no", kRed) + ": " + text);
  return kNo;
}

ExitCode FinishReport(ExitCode code) {
  if (report.style.json) WriteJson(code);
  if (std::fflush(stdout) == 0 && std::ferror(stdout) == 0) return code;
  WriteError(std::string("vesk2: standard output: ") + std::strerror(errno));
  return kTrouble;
}

ExitCode FinishReport(const Trouble& trouble) {
  WriteError(std::string("vesk2: ") + trouble.what());
  report.reason = trouble.reason;
  report.code = trouble.code;
  report.message = trouble.what();
  report.file = trouble.file;
  report.byte = trouble.byte;
  return FinishReport(kTrouble);
}

std::string LibraryVersion() {
  const int number = Vesk2VersionNumber();
  return std::to_string(number / 10000) + "." + std::to_string(number / 100 % 100) + "." +
         std::to_string(number % 100);
}

std::string CodeName(int code) {
#define VESK2_NAME_ROW(number, name, text) \
  case number:                             \
    return #name;
  switch (code) {
    VESK2_ERROR_TABLE(VESK2_NAME_ROW)
    VESK2_SPKI_ERROR_TABLE(VESK2_NAME_ROW)
    default:
      return "code " + std::to_string(code);
  }
#undef VESK2_NAME_ROW
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

std::string CodeWords(int code) {
  constexpr struct {
    int code;
    const char* words;
  } kWords[] = {
      {VESK2_ERR_MEM_ALLOC, "out of memory"},
      {VESK2_ERR_FILE_OPEN, "cannot be opened"},
      {VESK2_ERR_FIND_DIR, "no such directory"},
      {VESK2_ERR_READ_FILE, "a file of a store is held by another process"},
      {VESK2_ERR_PARSE_FILE, "not in the expected form"},
      {VESK2_ERR_PRINCIPAL, "neither a key nor a hash where one must be"},
      {VESK2_ERR_INVALID_HASH, "a digest of the wrong length"},
      {VESK2_ERR_UNKNOWN_HASH_ID, "a file's digest is not a SHA-256"},
      {VESK2_ERR_HASH_ID, "an unknown hash algorithm"},
      {VESK2_ERR_MAX_BYTE_STRING, "a byte string longer than 8192 bytes"},
      {VESK2_ERR_SIGNATURE_ID, "an unknown signature algorithm"},
      {VESK2_ERR_NOT_IMPLEMENTED, "the signer is not a key"},
      {VESK2_ERR_OPEN_MANIFEST_FILE, "cannot be opened"},
      {VESK2_ERR_SIGNATURE, "the signature does not verify"},
      {VESK2_ERR_HASH_MISMATCH, "not what was signed"},
      {VESK2_ERR_UNEXPECTED_CHAR, "an unexpected character"},
      {VESK2_ERR_INVALID_S_EXPRESSION, "a list that is not closed, or nested too deeply"},
      {VESK2_ERR_NOT_AUTHORIZED, "nothing is granted"},
      {VESK2_ERR_HASH_MATCH, "the listing is not the one that was signed"},
      {VESK2_ERR_RANDOM_TOKEN, "the random token is not of 4 bytes"},
      {VESK2_ERR_TIME_STAMP, "not a time"},
      {VESK2_ERR_SIGNING_CERT_ORDER, "the second certificate is revoked, or not the signer's own"},
      {VESK2_ERR_MANIFEST_VERSION, "a manifest version other than 1"},
      {VESK2_ERR_MANIFEST_TYPE, "a manifest type other than plain"},
      {VESK2_ERR_CERT_REVOKED, "a certificate that is needed is revoked"},
      {VESK2_ERR_PACKAGE_NOT_GRANTED, "less than the asked tag is granted"},
      {VESK2_ERR_NOT_OBJECT_CERT, "the first certificate is not for a digest"},
      {VESK2_ERR_CRL_NOT_FOUND, "no current list tells whether a certificate is revoked"},
      {SPKI_ERR_NO_MEM, "the reduction ran out of memory or of its work budget"},
  };
  for (const auto& row : kWords) {
    if (row.code == code) return row.words;
  }
  return code < 0 ? "an ACL entry or certificate that the reduction cannot read" : "";
}

std::string Reason(int code) {
  const std::string words = CodeWords(code);
  return words.empty() ? CodeName(code) : words + " (" + CodeName(code) + ")";
}

}  // namespace vesk2_command
