// SPDX-License-Identifier: Apache-2.0
// Copies, conversions, joins and number scanning over 0-terminated bytes. Nothing here throws or
// aborts: text that cannot be copied for lack of memory is null. File names are bytes: none of this
// knows an encoding, and comparing is byte by byte.
#include "src/platform/text.h"

#include <algorithm>
#include <cstring>
#include <new>
#include <string_view>

#include <vesk2/limits.h>

namespace ZVsysutil {
namespace {

constexpr char kSeparator = '/';
constexpr int kMaxDigits = 9;  // what an int always holds

char* CopyBytes(std::string_view text) {
  char* copy = new (std::nothrow) char[text.size() + 1];
  if (copy == nullptr) return nullptr;
  text.copy(copy, text.size());
  copy[text.size()] = '\0';
  return copy;
}

// The two parts of a joined path; one of them may be empty. One separator between the two, whatever
// they bring: results are compared as text, so that a/b and a//b must not both come about.
struct Join {
  Join(const char* a, const char* b) : head(a != nullptr ? a : ""), tail(b != nullptr ? b : "") {
    if (head.empty() || tail.empty()) return;
    if (head.back() == kSeparator) {
      while (tail.starts_with(kSeparator)) tail.remove_prefix(1);
    } else {
      separator = !tail.starts_with(kSeparator);
    }
  }
  size_t size() const { return head.size() + (separator ? 1 : 0) + tail.size(); }
  // Writes size() bytes and a terminator.
  void Write(char* out) const {
    out += head.copy(out, head.size());
    if (separator) *out++ = kSeparator;
    out += tail.copy(out, tail.size());
    *out = '\0';
  }

  std::string_view head;
  std::string_view tail;
  bool separator = false;
};

// "/" alone is a component, of which a store makes no file.
std::string_view LastComponent(std::string_view path) {
  while (path.size() > 1 && path.back() == kSeparator) path.remove_suffix(1);
  if (path.size() <= 1) return path;
  const size_t separator = path.rfind(kSeparator);
  return separator == path.npos ? path : path.substr(separator + 1);
}

bool IsDigit(unsigned char byte) { return byte >= '0' && byte <= '9'; }

}  // namespace

char* zv_strdup(const char* text) { return text != nullptr ? CopyBytes(text) : nullptr; }
char* zv_fstrdup(const char* text) { return zv_strdup(text); }
size_t zv_fstrlen(const char* text) { return text != nullptr ? std::strlen(text) : 0; }

// Tells whether it was cut, as a cut path is another file's.
bool zv_fstrcpy(char* out, size_t size, const char* text) {
  const std::string_view from = text != nullptr ? text : "";
  if (size == 0) return from.empty();
  out[from.copy(out, size - 1)] = '\0';
  return from.size() < size;
}

char* zv_atof(const char* text) { return zv_strdup(text); }
char* zv_ftoa(const char* text) { return zv_strdup(text); }
// A conversion that changes nothing may hand out its argument on other systems.
void zv_atof_free(const char* text, char* copy) {
  if (copy != text) delete[] copy;
}
void zv_ftoa_free(const char* text, char* copy) { zv_atof_free(text, copy); }
char* zv_atof_copy(const char* text) { return zv_strdup(text); }

char* zv_atof_copy_n(const void* text, size_t length) {
  if (text == nullptr) return nullptr;
  const char* bytes = static_cast<const char*>(text);
  return CopyBytes({bytes, strnlen(bytes, length)});
}
char* zv_ftoa_copy_n(const void* text, size_t length) { return zv_atof_copy_n(text, length); }

int zv_filenamecmp(const char* a, const char* b) { return std::strcmp(a, b); }
int zv_filenamencmp(const char* a, const char* b, size_t length) {
  return std::strncmp(a, b, length);
}

char* zv_concat_string(const char* a, const char* b) {
  if (a == nullptr) return zv_strdup(b);
  if (b == nullptr) return zv_strdup(a);
  const size_t head = std::strlen(a);
  const size_t tail = std::strlen(b);
  char* joined = new (std::nothrow) char[head + tail + 1];
  if (joined == nullptr) return nullptr;
  std::memcpy(joined, a, head);
  std::memcpy(joined + head, b, tail + 1);
  return joined;
}

char* zv_join_path(const char* a, const char* b) {
  const Join join(a, b);
  char* joined = new (std::nothrow) char[join.size() + 1];
  if (joined != nullptr) join.Write(joined);
  return joined;
}

// Nothing is written of what does not fit: a half path would lead elsewhere.
bool zv_concat_path_to(char* out, size_t size, const char* a, const char* b) {
  const Join join(a, b);
  if (size > 0) out[0] = '\0';
  if (join.size() >= size) return false;
  join.Write(out);
  return true;
}

bool zv_basename(const char* path, char* out, size_t size) {
  const std::string_view name = LastComponent(path != nullptr ? path : "");
  if (size == 0) return false;
  out[name.copy(out, size - 1)] = '\0';
  return name.size() < size;
}

char* zv_basename(const char* path) {
  return path != nullptr ? CopyBytes(LastComponent(path)) : nullptr;
}

// Of the last component only: a dot in a directory's name is none of the file's.
const char* zv_extname(const char* path) {
  if (path == nullptr) return nullptr;
  const char* separator = std::strrchr(path, kSeparator);
  return std::strrchr(separator != nullptr ? separator + 1 : path, '.');
}

void zv_binhex(char* out, const unsigned char* data, size_t length) {
  static constexpr char kDigits[] = "0123456789abcdef";
  for (size_t i = 0; i < length; ++i) {
    *out++ = kDigits[data[i] >> 4];
    *out++ = kDigits[data[i] & 15];
  }
  *out = '\0';
}

// Digits are counted before they are added up, so that no value overflows.
int zv_scan_numbers(const unsigned char* text, size_t length, int* values, int count) {
  const unsigned char* const end = text + length;
  int found = 0;
  while (found < count) {
    const unsigned char* const first = text;
    int value = 0;
    while (text != end && IsDigit(*text) && text - first < kMaxDigits) {
      value = value * 10 + (*text++ - '0');
    }
    const bool tooLong = text != end && IsDigit(*text);
    if (text == first || tooLong) break;
    values[found++] = value;
    if (text == end) break;
    ++text;  // the one separator
  }
  return found;
}

}  // namespace ZVsysutil
