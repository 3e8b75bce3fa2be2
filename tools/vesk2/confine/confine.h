// SPDX-License-Identifier: Apache-2.0
// confine.h: a command that only looks gives up what it does not need, before it reads the first
// byte that a stranger wrote. A fault in a reader is then worth little: no program can be started,
// no connection made, no file read or written but those that the question is about.
#ifndef VESK2_TOOLS_CONFINE_H
#define VESK2_TOOLS_CONFINE_H

#include <string>
#include <vector>

namespace vesk2_command {

// The files and directories, with all below them, that a command needs. What is not there is passed
// over.
struct Reach {
  std::vector<std::string> readable;
  std::vector<std::string> writable;
};

// AllowConfinement says that this process is the command's alone: what is given up never comes
// back. Without it Confine does nothing, as in a test that runs commands in its own process.
void AllowConfinement();

// Confine gives up, for this process and the threads that it starts from now on: new privileges;
// sockets, other programs and other processes (seccomp); all files but `reach` (Landlock). Where
// the kernel cannot enforce one of them, the others hold.
void Confine(const Reach& reach);

// "confined: no new privileges, files, system calls": what is in force.
std::string Confinement();

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_CONFINE_H
