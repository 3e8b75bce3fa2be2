// SPDX-License-Identifier: Apache-2.0
// The command, or another task, in a child that is traced: killed before the n-th of the system
// calls that change something, or with that call failed.
#ifndef VESK2_TESTS_TOOLS_TRACED_COMMAND_H
#define VESK2_TESTS_TOOLS_TRACED_COMMAND_H

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

namespace vesk2test {

using Words = std::vector<std::string>;
using Task = std::function<int()>;

// The command with these words, for a child.
Task CommandOf(const Words& words);

// The exit status of a task that runs in a child to its end; kKilled when something ended it.
constexpr int kKilled = -1;
int RunTask(const Task& task);
int RunCommand(const Words& words);

// Which calls count. What goes to standard output and error never does.
enum class Calls { kChanging, kOfFiles, kTransfers, kEvery };

// What befalls the n-th of them: an errno, or
constexpr int kKill = 0;   // the child is killed before it
constexpr int kHalf = -1;  // half of what is to be read or written is
struct Point {
  long n;
  int error = kKill;
  Calls calls = Calls::kChanging;
  bool lasting = false;  // whether all that follow of its kind fail, too
};
struct Outcome {
  bool reached = false;
  uint64_t call = 0;
  int exit = 0;
};
Outcome RunTo(const Task& task, const Point& point);

}  // namespace vesk2test

#endif  // VESK2_TESTS_TOOLS_TRACED_COMMAND_H
