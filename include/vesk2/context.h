// SPDX-License-Identifier: Apache-2.0
// context.h: the store roots, the version and the texts of error codes, for callers of the classes.
// The flat functions of vesk2.h do the same.
//
//   VeskConf::SetGlobalDirectory("/etc/vesk2");          once, before the first thread starts
#ifndef VESK2_CONTEXT_H
#define VESK2_CONTEXT_H

#include <vesk2.h>
#include <vesk2/limits.h>

namespace ZvVesk2 {

// VeskConf holds the two store roots, process-wide: there is one pair for all that a process does.
// Set them before any store is used and leave them alone while other calls run; nothing guards
// them. An empty root, which both are at first, means that there is no such store.
//
// A root is not checked: not whether it exists, who owns it, nor who may write it. Check owner and
// mode before it is set; whoever can write the global one decides what is trusted.
class VESK2_API VeskConf {
 public:
  // The text is copied and cut after 4096 bytes (Limits::kPathBuffer holds the terminator, too); a
  // root that was cut is no root, as no path below it can be opened. Null sets the empty root. The
  // home root has "cert" (chains), the global one "acl" (entries) and "cert" (lists).
  static void SetHomeDirectory(const char* directory);
  static void SetGlobalDirectory(const char* directory);
  // The current roots, never null, in static storage that the setters overwrite.
  static const char* GetHomeDirectory();
  static const char* GetGlobalDirectory();

 private:
  VESK2_LOCAL static char home_dir[Limits::kPathBuffer];
  VESK2_LOCAL static char global_dir[Limits::kPathBuffer];
};

// V2Version returns 10100, V2VersionExtra and V2VersionExtraA the tag "r2441".
[[nodiscard]] VESK2_API int V2Version();
VESK2_API const char* V2VersionExtra();
VESK2_API const char* V2VersionExtraA();

// V2Error returns the static text of a library code: 0 to 76; any other gives "VESK_UNKNOWN_ERROR".
VESK2_API const char* V2Error(int code);
// V2SpkiError returns the static text of an engine code; one without a text gives
// "VESK_UNKNOWN_SPKI_ERROR".
VESK2_API const char* V2SpkiError(int code);
// V2CodeName returns the constant's name of a code of either kind, static; null for a number that
// is none.
VESK2_API const char* V2CodeName(int code);
// V2CodeWords returns what a code means, for people, static; empty where that depends on who
// answered it. A negative code without words of its own tells of a credential that cannot be read.
VESK2_API const char* V2CodeWords(int code);

}  // namespace ZvVesk2

#endif  // VESK2_CONTEXT_H
