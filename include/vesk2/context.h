// SPDX-License-Identifier: Apache-2.0
// context.h: the store roots, the version and the texts of error codes, for callers of the classes.
#ifndef VESK2_CONTEXT_H
#define VESK2_CONTEXT_H

#include <vesk2.h>
#include <vesk2/limits.h>

namespace ZvVesk2 {

// VeskConf holds the two store roots, process-wide. Set them before any store is used and leave
// them alone while other calls run; nothing guards them. An empty root means that there is no such
// store.
class VESK2_API VeskConf {
 public:
  // The text is copied and cut after 4096 bytes; null sets the empty root.
  static void SetHomeDirectory(const char* directory);
  static void SetGlobalDirectory(const char* directory);
  // The current roots, static storage.
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

// V2Error returns the text of a library code: 0 to 76; any other gives "VESK_UNKNOWN_ERROR".
VESK2_API const char* V2Error(int code);
// V2SpkiError returns the text of an engine code; one without a text gives
// "VESK_UNKNOWN_SPKI_ERROR".
VESK2_API const char* V2SpkiError(int code);
// V2CodeName returns the constant's name of a code of either kind; null for a number that is none.
VESK2_API const char* V2CodeName(int code);
// V2CodeWords returns what a code means, for people; empty where that depends on who answered it.
VESK2_API const char* V2CodeWords(int code);

}  // namespace ZvVesk2

#endif  // VESK2_CONTEXT_H
