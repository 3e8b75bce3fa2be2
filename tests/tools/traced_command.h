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

struct Point {
  long n;            // of the calls that count
  int error = 0;     // what it fails with; 0: the child is killed before it
  bool all = false;  // whether every call counts
};
struct Outcome {
  bool reached = false;
  uint64_t call = 0;
  int exit = 0;
};
Outcome RunTo(const Task& task, const Point& point);

}  // namespace vesk2test

#endif  // VESK2_TESTS_TOOLS_TRACED_COMMAND_H
