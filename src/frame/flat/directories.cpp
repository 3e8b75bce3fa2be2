// SPDX-License-Identifier: Apache-2.0
// Flat functions: the two store roots. They only set them: whether a root exists, whose it is and
// who may write there is the program's to check.
#include <vesk2/context.h>

#include "src/frame/flat/ascii_text.h"

using ZvVesk2::AsciiText;
using ZvVesk2::VeskConf;

// Copied before the call returns; the program's text may go.
void Vesk2HomeDirectory(const char* directory) { VeskConf::SetHomeDirectory(directory); }

void Vesk2GlobalDirectory(const char* directory) { VeskConf::SetGlobalDirectory(directory); }

// Without memory for the conversion the root becomes empty: no store is better than the wrong one.
void Vesk2HomeDirectoryA(const char* directory) { Vesk2HomeDirectory(AsciiText(directory).get()); }

void Vesk2GlobalDirectoryA(const char* directory) {
  Vesk2GlobalDirectory(AsciiText(directory).get());
}
