// SPDX-License-Identifier: Apache-2.0
// What the command reads beside the library's objects; the first byte says which: keys of other
// programs, tags, times, patterns of ignored names, URIs of keys on tokens. A refusal is a Trouble.
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <span>
#include <vector>

#include "fuzz/fuzz_support.h"
#include "tools/vesk2/keys/foreign_key.h"
#include "tools/vesk2/keys/token_uri.h"
#include "tools/vesk2/objects/expression.h"
#include "tools/vesk2/objects/times.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/tree/ignore_pattern.h"

using namespace vesk2_command;

namespace {

void ReadKey(std::string_view input) {
  static const int file = memfd_create("key", MFD_CLOEXEC);
  FUZZ_CHECK(ftruncate(file, 0) == 0);
  FUZZ_CHECK(pwrite(file, input.data(), input.size(), 0) == static_cast<ssize_t>(input.size()));
  PassphraseOptions options;
  options.given = std::make_shared<const Secret>("word");
  const ForeignKey key = ReadForeignKey("/proc/self/fd/" + std::to_string(file), options);
  FUZZ_CHECK(key.publicKey && key.publicKey->First() != nullptr);
  FUZZ_CHECK(!key.privateKey || key.privateKey->Public()->IsEqual(key.publicKey.get()));
}

// Without anything that a terminal would take for more than text.
bool IsSafe(const std::string& line) {
  return std::ranges::none_of(line, [](unsigned char c) { return c < ' ' || c == 127; });
}

// The text of a tag reads back to it, unless a word holds what is written as an escape.
void ReadTag(const std::string& text) {
  const Ref<SExpression> tag = ParseTag(text);
  const std::string told = TagText(tag.get());
  if (told.find('\\') == told.npos) FUZZ_CHECK(ParseTag(told)->IsEqual(tag.get()));
  for (const std::string& line : TreeLines(*tag)) FUZZ_CHECK(IsSafe(line));
  static_cast<void>(ExpressionJson(*tag).dump());
}

// A moment begins before it ends, and its full stamp is itself.
void ReadTime(const std::string& text) {
  const Ref<TimeStamp> first = ParseTime(text, false);
  const Ref<TimeStamp> last = ParseTime(text, true);
  FUZZ_CHECK(text == "now" || first->IsBeforeOrEqual(last.get()));
  for (const auto* stamp : {&first, &last}) {
    const Ref<TimeStamp> again = ParseTime(StampText(**stamp), true);
    FUZZ_CHECK(again->IsEqual(stamp->get()) && again->ToTime() == (*stamp)->ToTime());
  }
}

bool Matches(std::string_view pattern, std::string_view name) {
  if (pattern.empty()) return name.empty();
  if (pattern[0] == '*') {
    return Matches(pattern.substr(1), name) || (!name.empty() && Matches(pattern, name.substr(1)));
  }
  if (name.empty()) return false;
  const bool any = pattern[0] == '?';
  if (pattern[0] == '\\') pattern.remove_prefix(1);
  return (any || pattern[0] == name[0]) && Matches(pattern.substr(1), name.substr(1));
}

std::vector<std::string_view> Split(std::string_view path) {
  std::vector<std::string_view> names;
  for (size_t end = path.find('/'); end != path.npos; end = path.find('/')) {
    names.push_back(path.substr(0, end));
    path.remove_prefix(end + 1);
  }
  names.push_back(path);
  return names;
}

bool MatchesPath(std::span<const std::string_view> pattern,
                 std::span<const std::string_view> path) {
  if (pattern.empty()) return path.empty();
  if (pattern[0] != "**") {
    return !path.empty() && Matches(pattern[0], path[0]) &&
           MatchesPath(pattern.subspan(1), path.subspan(1));
  }
  if (pattern.size() == 1) return !path.empty();
  return MatchesPath(pattern.subspan(1), path) ||
         (!path.empty() && MatchesPath(pattern, path.subspan(1)));
}

// A pattern, a line feed, and the path of a directory.
void ReadPattern(std::string_view input) {
  std::string_view text = input.substr(0, input.find('\n'));
  const std::string_view path = input.substr(std::min(text.size() + 1, input.size()));
  if (text.size() > 16 || path.size() > 16 || text.empty()) return;  // the oracle is slow
  const IgnorePattern pattern(std::string(text), "here");
  if (text.starts_with('!')) text.remove_prefix(1);
  if (text.ends_with('/')) text.remove_suffix(1);
  const bool anchored = text.find('/') != text.npos;
  if (text.starts_with('/')) text.remove_prefix(1);
  const bool expected = anchored ? MatchesPath(Split(text), Split(path))
                                 : Matches(text, path.substr(path.rfind('/') + 1));
  FUZZ_CHECK(pattern.Matches(path, true) == expected);
  FUZZ_CHECK(expected || !pattern.Matches(path, false));
}

void ReadUri(const std::string& text) {
  if (!text.starts_with(kTokenScheme)) return;  // it is then no URI for whoever asks
  FUZZ_CHECK(text.starts_with(ParseTokenUri(text).path));
}

void Read(char kind, const std::string& text) {
  if (kind == 'k') return ReadKey(text);
  if (kind == 't') return ReadTag(text);
  if (kind == 'd') return ReadTime(text);
  if (kind == 'i') return ReadPattern(text);
  if (kind == 'u') return ReadUri(text);
}

}  // namespace

FUZZ_TARGET(command) {
  if (input.empty()) return;
  try {
    Read(input[0], std::string(input.substr(1)));
  } catch (const Trouble& trouble) {
    FUZZ_CHECK(*trouble.what() != '\0' && IsSafe(trouble.what()));
  }
}
