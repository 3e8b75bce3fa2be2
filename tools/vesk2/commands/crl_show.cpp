// SPDX-License-Identifier: Apache-2.0
// crl_show.cpp: vesk2 crl show.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"

namespace vesk2_command {

Action DefineCrlShow(OptionList& list) {
  auto file = std::make_shared<std::string>();
  list.Add("file", *file, "A revocation list file").Required();
  return [file] {
    Present(DescribeCrl(*ReadCrl(*file)));
    return kYes;
  };
}

}  // namespace vesk2_command
