// SPDX-License-Identifier: Apache-2.0
// main.cpp: the process around a command line.
#include <fcntl.h>
#include <unistd.h>

#include <csignal>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/confine/confine.h"

namespace {

// Keeps the three standard descriptors taken: a file opened in place of a closed standard output
// would receive the verdict. The stand-in cannot be written to, so the loss is noticed.
void HoldStandardDescriptors() {
  int descriptor = open("/dev/null", O_RDONLY);
  while (descriptor >= 0 && descriptor <= STDERR_FILENO) descriptor = open("/dev/null", O_RDONLY);
  if (descriptor >= 0) close(descriptor);
}

}  // namespace

int main(int argc, char** argv) {
  HoldStandardDescriptors();
  std::signal(SIGXFSZ, SIG_IGN);  // a file that grows too large is a failed write, cleaned up after
  vesk2_command::AllowConfinement();
  return vesk2_command::RunCommand(argc, argv);
}
