// SPDX-License-Identifier: Apache-2.0
// fill.h: taking what is listed out of a source, and nothing else.
#ifndef VESK2_TOOLS_FILL_H
#define VESK2_TOOLS_FILL_H

#include <cstdint>
#include <map>
#include <optional>
#include <string>

#include "tools/vesk2/install/source.h"
#include "tools/vesk2/install/stage.h"
#include "tools/vesk2/install/wanted.h"
#include "tools/vesk2/options/options.h"
#include "tools/vesk2/say/report.h"

#include <vesk2.h>

namespace vesk2_command {

// Sizes are not signed: without a bound a source could fill the disk before its digests are asked.
// --max-bytes, a number that may end in K, M, G or T.
void AddSizeOption(OptionList& list, std::string& text);
// Trouble for another text.
uint64_t ParseSize(const std::string& text);

struct Filled {
  size_t passedOver = 0;  // files, links and the like that are not listed
  // The directory that all of these are in, empty when there is none.
  std::optional<std::string> common = {};
  std::map<std::string, std::string> problems;  // listed entries that are no files, and why
};

// Fill writes the listed files of a source into a stage. It returns the no that has been said, for
// a source that holds more than `most` bytes or names one file twice. What is missing, or is not as
// it was signed, is for the verification of the stage to say. `callbacks` may be null.
std::optional<ExitCode> Fill(Stage& stage, Source& source, const Wanted& wanted, uint64_t most,
                             const Vesk2FileCallbacks* callbacks, Filled& filled);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_FILL_H
