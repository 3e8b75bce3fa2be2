// SPDX-License-Identifier: Apache-2.0
// Flat functions: the version and the texts of codes. All texts are static: none needs to be freed,
// and none changes.
#include <vesk2/context.h>

#include <cstring>

int Vesk2VersionNumber(void) { return ZvVesk2::V2Version(); }

const char* Vesk2VersionExtra(void) { return ZvVesk2::V2VersionExtra(); }

const char* Vesk2VersionExtraA(void) { return ZvVesk2::V2VersionExtraA(); }

const char* Vesk2ErrorMessage(int code) { return ZvVesk2::V2Error(code); }

// Never null, for programs that print it without a test.
const char* Vesk2ErrorName(int code) {
  const char* const name = ZvVesk2::V2CodeName(code);
  return name != nullptr ? name : ZvVesk2::V2Error(code);
}

// A text of the reduction that is more than a name says more than our words for all of them.
const char* Vesk2ErrorWords(int code) {
  const char* const name = ZvVesk2::V2CodeName(code);
  if (name == nullptr) return ZvVesk2::V2Error(code);
  const char* const text = code < 0 ? ZvVesk2::V2SpkiError(code) : name;
  if (std::strcmp(text, name) != 0) return text;
  const char* const words = ZvVesk2::V2CodeWords(code);
  return *words != 0 ? words : ZvVesk2::V2Error(code);
}
