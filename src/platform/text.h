// SPDX-License-Identifier: Apache-2.0
// Text, paths and sorting of the platform layer. On Linux the file-name string is a byte string, so
// the conversions copy; they are kept because callers hold and free both forms separately.
//
// Every function that returns char* returns a new char[] (delete[] or Vesk2Free), or null when
// memory runs out or its text is null.
#ifndef VESK2_SRC_PLATFORM_TEXT_H
#define VESK2_SRC_PLATFORM_TEXT_H

#include <cstddef>

namespace ZVsysutil {

// ---- Copies and conversions ----
char* zv_strdup(const char* text);
char* zv_fstrdup(const char* text);
size_t zv_fstrlen(const char* text);
// Bounded copy: at most size - 1 bytes and a terminator. Returns false when the text was cut. Null
// copies as the empty text.
bool zv_fstrcpy(char* out, size_t size, const char* text);
// ASCII to file-name string (atof) and back (ftoa). The _free forms free `copy` unless it is
// `text`.
char* zv_atof(const char* text);
char* zv_ftoa(const char* text);
void zv_atof_free(const char* text, char* copy);
void zv_ftoa_free(const char* text, char* copy);
char* zv_atof_copy(const char* text);
// At most `length` bytes, up to a 0 byte, terminated.
char* zv_atof_copy_n(const void* text, size_t length);
char* zv_ftoa_copy_n(const void* text, size_t length);

// ---- Names and paths ----
// Bytewise and case-sensitive: "x.REQ" is not "x.req".
[[nodiscard]] int zv_filenamecmp(const char* a, const char* b);
[[nodiscard]] int zv_filenamencmp(const char* a, const char* b, size_t length);
char* zv_concat_string(const char* a, const char* b);
// "a/b" with one separator; an empty or null `a` gives `b`, a null `b` gives `a`. Of any length:
// what opens the path judges that.
char* zv_join_path(const char* a, const char* b);
// The same into `out` of `size` bytes; when it does not fit, `out` is empty and the result false.
bool zv_concat_path_to(char* out, size_t size, const char* a, const char* b);
// The last component, after trailing separators are taken off; "/" for the root itself. The
// two-argument form copies into `out` of `size` bytes and returns false when it was cut.
bool zv_basename(const char* path, char* out, size_t size);
char* zv_basename(const char* path);
// From the last "." of the last component, the dot included; null when there is none. Points into
// `path`.
const char* zv_extname(const char* path);

// ---- Bytes, numbers, order ----
// Lower-case hexadecimal of `length` bytes into `out` (2 * length + 1 bytes), terminated.
void zv_binhex(char* out, const unsigned char* data, size_t length);
// Reads up to `count` numbers of at most 9 digits, split at any single non-digit, from the front of
// `length` bytes. Returns how many were read.
[[nodiscard]] int zv_scan_numbers(const unsigned char* text, size_t length, int* values, int count);
// Sorts `count` elements of `size` bytes; equal elements keep their order.
void zv_sort(void* items, size_t count, size_t size, int (*compare)(const void*, const void*));

}  // namespace ZVsysutil

#endif  // VESK2_SRC_PLATFORM_TEXT_H
