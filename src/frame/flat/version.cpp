// Flat functions: the version and the texts of codes.
#include <vesk2/context.h>

int Vesk2VersionNumber(void) { return ZvVesk2::V2Version(); }

const char* Vesk2VersionExtra(void) { return ZvVesk2::V2VersionExtra(); }

const char* Vesk2VersionExtraA(void) { return ZvVesk2::V2VersionExtraA(); }

const char* Vesk2ErrorMessage(int code) { return ZvVesk2::V2Error(code); }
