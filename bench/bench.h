// SPDX-License-Identifier: Apache-2.0
// The figures of this system, each beside a yardstick that was measured in the same run: the
// smallest honest program that does the same work (bench/floor/), or what people use today.
//
// To add a figure, write a function that measures it and a row in the table of its file; a new file
// has its table named in main.cpp.
#ifndef VESK2_BENCH_BENCH_H
#define VESK2_BENCH_BENCH_H

#include <cstddef>
#include <functional>
#include <span>
#include <string>
#include <vector>

namespace bench {

// How much is measured. Quick takes smaller inputs, which make some figures a little worse: what is
// paid once weighs more.
struct Effort {
  bool quick = false;
  int rounds = 9;  // of which the median counts
  size_t Of(size_t whole, size_t quickly) const { return quick ? quickly : whole; }
};

struct Outcome {
  enum Kind { kMeasured, kNotInstalled, kFailed } kind = kMeasured;
  double value = 0;
  std::string note;  // the program that is not installed, or what went wrong
};
Outcome Failed(std::string what);
Outcome NotInstalled(std::string program);

struct Figure {
  const char* id;
  const char* what;
  const char* yardstick;
  double goal;  // met by a value that is not above it
  std::function<Outcome(const Effort&)> measure;
};
using Figures = std::vector<Figure>;
Figures HashFigures();
Figures ExpressionFigures();
Figures TreeFigures();
Figures StoreFigures();
Figures ChainFigures();
Figures GrowthFigures();
Figures CommandFigures();
Figures SignatureFigures();

// ---- Measuring ---------------------------------------------------------------------------------

// One way of doing the work; false for a wrong result.
using Way = std::function<bool()>;

// The processor time of this process and of its children that ended, in seconds.
double Spent();
// The processor time of `ours` over that of `yardstick`: they take turns, so that a busy machine
// slows both, and the median of the rounds' ratios counts.
Outcome Ratio(const Effort& effort, const Way& ours, const Way& yardstick);
// The processor time of a way, in seconds: the least of five rounds. Negative for a wrong result.
double LeastSeconds(const Way& way);
// The ratio of the times on the clock, for what several processors share.
Outcome ClockRatio(const Effort& effort, const Way& ours, const Way& yardstick);

// The system calls that `work` makes in a process of its own; negative where nobody may watch.
long CountCalls(const Way& work);
// The bytes of memory that `work` adds to a process of its own at the most; negative for a failure.
double PeakMemory(const Way& work);
// The most memory that a program holds, in bytes; negative for a failure.
double PeakOfProgram(const std::vector<std::string>& words);

// ---- Other programs ----------------------------------------------------------------------------

// The path of a program, empty when it is not installed.
std::string FindProgram(const std::string& name);
// Runs a program with its output thrown away and returns its exit status.
int Run(const std::vector<std::string>& words);
// Makes this process that program, its output thrown away. It returns only where that fails.
void Become(const std::vector<std::string>& words);

// ---- Inputs ------------------------------------------------------------------------------------

// A directory for the inputs of a figure, empty, and gone with the object.
class Place {
 public:
  explicit Place(const char* name);
  ~Place();
  Place(const Place&) = delete;
  Place& operator=(const Place&) = delete;
  const std::string& Path() const { return path_; }
  // Writes a file, whose directory is there, and returns its path.
  std::string Write(const std::string& name, const std::string& bytes) const;

 private:
  std::string path_;
};

}  // namespace bench

#endif  // VESK2_BENCH_BENCH_H
