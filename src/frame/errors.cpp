// Version and error texts. The tables in vesk2.h hold number, name and text of every code; this
// file only looks things up in them.
#include <vesk2/context.h>

#include <iterator>

namespace ZvVesk2 {
namespace {

struct Row {
  int code;
  const char* text;
};

#define VESK2_ROW(number, name, text) {number, text},
constexpr Row kErrors[] = {VESK2_ERROR_TABLE(VESK2_ROW)};
constexpr Row kSpkiErrors[] = {VESK2_SPKI_ERROR_TABLE(VESK2_ROW)};
#undef VESK2_ROW

// The rows are found by index.
static_assert(kErrors[VESK2_MAX_ERROR].code == VESK2_MAX_ERROR);
static_assert(std::size(kErrors) == VESK2_MAX_ERROR + 1);
static_assert(std::size(kSpkiErrors) == 35);

}  // namespace

int V2Version() { return 10100; }

const char* V2VersionExtra() { return "r2441"; }

const char* V2VersionExtraA() { return V2VersionExtra(); }

const char* V2Error(int code) {
  // The table has a text for VESK2_MAX_ERROR too, but the range ends before it: callers compare the
  // answer for 77 with the fallback.
  if (code < 0 || code >= VESK2_MAX_ERROR) return "VESK_UNKNOWN_ERROR";
  return kErrors[code].text;
}

const char* V2SpkiError(int code) {
  for (const Row& row : kSpkiErrors) {
    if (row.code == code) return row.text;
  }
  return "VESK_UNKNOWN_SPKI_ERROR";
}

}  // namespace ZvVesk2
